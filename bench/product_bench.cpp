// SPDX-License-Identifier: Apache-2.0
/* A whole product beside libxml2 alone: GSread beside a parse with a walk over every node, GSwrite beside building
 * the same tree and saving it. The product has 100 state vectors and six lists of polynomials; their number is the
 * argument, so that the growth shows too. */

#include <benchmark/benchmark.h>
#include <libxml/parser.h>
#include <libxml/tree.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>

#include "quo_base/generalSAR.h"
#include "ratio_reporter.h"
#include "temporary_folder.h"

namespace {

using bench::folder;

double any_number() {
    static double value = -5123456.789;
    return value += 17.31943;
}

template <typename List>
void fill(const List& list, int count) {
    for (int i = 0; i < count; ++i) {
        for (double& c : list[i].pol) c = any_number();
        list[i].trg0 = any_number();
        list[i].taz0 = any_number();
    }
}

void fill_states(GeneralSAR& product) {
    constexpr int kVectors = 100;
    product.orbit.SVCreate(803457.3, 10.0, kVectors);
    product.stateVectors.SVCreate(803457.3, 10.0, kVectors);
    for (int i = 0; i < 3 * kVectors; ++i) {
        product.stateVectors.pSV_m[i] = product.orbit.pSV_m[i] = 4.5e6 + 7123.4567891 * i;
        product.stateVectors.vSV_mOs[i] = product.orbit.vSV_mOs[i] = 7123.4567891 - 0.0123456789 * i;
    }
    product.orbit.computeApproximateSV();
}

std::unique_ptr<GeneralSAR> make_product(int polynomials) {
    auto product = std::make_unique<GeneralSAR>();
    polySAR& p = product->polynomials;
    p.CreatePolys(polynomials, polynomials, polynomials, polynomials, polynomials, polynomials);
    fill(p.DC, p.ndc);
    fill(p.FR, p.nfr);
    fill(p.SL2GR, p.nsl2gr);
    fill(p.GR2SL, p.ngr2sl);
    fill(p.SL2THETA, p.nsl2theta);
    fill(p.SL2PHI, p.nsl2phi);
    fill_states(*product);
    for (int i = 0; i < GeneralSAR::kObjects; ++i) product->GSenable(static_cast<GSObject>(i));
    return product;
}

std::string header(int polynomials) {
    std::string file = folder().file("product" + std::to_string(polynomials) + ".hdr");
    if (!std::filesystem::exists(file)) make_product(polynomials)->GSwrite(file.c_str());
    return file;
}

xmlDoc* parse(const std::string& file) {
    return xmlReadFile(file.c_str(), nullptr, XML_PARSE_NOBLANKS | XML_PARSE_COMPACT | XML_PARSE_NONET);
}

/** Visits every node and takes the number of every text. */
double walk(const xmlNode* node) {
    double sum = 0.0;
    for (; node; node = node->next) {
        if (node->type == XML_TEXT_NODE) sum += std::strtod(reinterpret_cast<const char*>(node->content), nullptr);
        sum += walk(node->children);
    }
    return sum;
}

/** Makes the same elements, attributes and texts anew, below `parent`. */
void build(xmlNode* parent, const xmlNode* model) {
    for (; model; model = model->next) {
        if (model->type == XML_TEXT_NODE) {
            xmlAddChild(parent, xmlNewText(model->content));
        } else if (model->type == XML_ELEMENT_NODE) {
            xmlNode* node = xmlNewChild(parent, nullptr, model->name, nullptr);
            for (const xmlAttr* mark = model->properties; mark; mark = mark->next)
                xmlNewProp(node, mark->name, mark->children->content);
            build(node, model->children);
        }
    }
}

void read_product(benchmark::State& state) {
    const std::string file = header(static_cast<int>(state.range(0)));
    GeneralSAR product;
    for ([[maybe_unused]] auto _ : state) benchmark::DoNotOptimize(product.GSread(file.c_str()));
    if (product.polynomials.nsl2phi != state.range(0)) state.SkipWithError("product not read");
}

void parse_and_walk(benchmark::State& state) {
    const std::string file = header(static_cast<int>(state.range(0)));
    for ([[maybe_unused]] auto _ : state) {
        xmlDoc* tree = parse(file);
        benchmark::DoNotOptimize(walk(tree->children));
        xmlFreeDoc(tree);
    }
}

void write_product(benchmark::State& state) {
    const std::string file = folder().file("written.hdr");
    const auto product = make_product(static_cast<int>(state.range(0)));
    for ([[maybe_unused]] auto _ : state) {
        state.PauseTiming();
        std::filesystem::remove(file);
        state.ResumeTiming();
        benchmark::DoNotOptimize(product->GSwrite(file.c_str()));
    }
}

void build_and_save(benchmark::State& state) {
    const std::string file = folder().file("built.hdr");
    xmlDoc* model = parse(header(static_cast<int>(state.range(0))));
    const xmlNode* root = xmlDocGetRootElement(model);
    for ([[maybe_unused]] auto _ : state) {
        xmlDoc* tree = xmlNewDoc(reinterpret_cast<const xmlChar*>("1.0"));
        xmlNode* made = xmlNewDocNode(tree, nullptr, root->name, nullptr);
        xmlDocSetRootElement(tree, made);
        build(made, root->children);
        xmlSaveFormatFileEnc(file.c_str(), tree, "UTF-8", 1);
        xmlFreeDoc(tree);
    }
    xmlFreeDoc(model);
}

void counts(benchmark::internal::Benchmark* job) {
    for (const int count : {100, 1000}) job->Arg(count)->Unit(benchmark::kMicrosecond);
}

BENCHMARK(read_product)->Apply(counts);
BENCHMARK(parse_and_walk)->Apply(counts);
BENCHMARK(write_product)->Apply(counts);
BENCHMARK(build_and_save)->Apply(counts);

}  // namespace

int main(int argc, char** argv) {
    return bench::run(
        argc, argv,
        {{"read, 600 polynomials / parse and walk", "read_product/100", "parse_and_walk/100", 3.0},
         {"read, 6000 polynomials / parse and walk", "read_product/1000", "parse_and_walk/1000", 3.0},
         {"write, 600 polynomials / build and save", "write_product/100", "build_and_save/100", 4.0},
         {"write, 6000 polynomials / build and save", "write_product/1000", "build_and_save/1000", 4.0}});
}
