// SPDX-License-Identifier: Apache-2.0
/* Header documents beside libxml2 alone: reading one array of doubles beside a parse and a walk over its elements,
 * writing one beside building the same tree by hand and saving it once, and a product of many objects beside one.
 */

#include <benchmark/benchmark.h>
#include <libxml/parser.h>
#include <libxml/tree.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <numeric>
#include <stdexcept>
#include <string>
#include <vector>

#include "quo_base/quorelxml_v2.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/header_session.h"
#include "ratio_reporter.h"
#include "sarutillib/ground/number_text.h"
#include "temporary_folder.h"

namespace {

using bench::folder;

constexpr const char* kField = "StateVectorData/pSV_m";

std::vector<double> numbers(std::int64_t count) {
    std::vector<double> values(static_cast<std::size_t>(count));
    double value = -5123456.789;
    for (double& entry : values) entry = value += 17.31943;
    return values;
}

/** A header file that holds `count` numbers. */
std::string header(std::int64_t count) {
    std::string file = folder().file(std::to_string(count) + ".xml");
    if (std::filesystem::exists(file)) return file;
    const std::vector<double> values = numbers(count);
    quorelxml document{file.c_str()};
    if (document.writeDouble(1, kField, values.data(), static_cast<int>(count)) || document.write())
        throw std::runtime_error("no header file");
    return file;
}

const char* text(const xmlNode* node) {
    return node->children ? reinterpret_cast<const char*>(node->children->content) : "";
}

void read_header(benchmark::State& state) {
    const std::string file = header(state.range(0));
    std::vector<double> values(static_cast<std::size_t>(state.range(0)));
    while (state.KeepRunning()) {
        quorelxml document{file.c_str()};
        benchmark::DoNotOptimize(document.readDouble(1, kField, values.data(), static_cast<int>(values.size())));
    }
}

void parse_and_walk(benchmark::State& state) {
    const std::string file = header(state.range(0));
    std::vector<double> values(static_cast<std::size_t>(state.range(0)));
    while (state.KeepRunning()) {
        xmlDoc* tree =
            xmlReadFile(file.c_str(), nullptr, XML_PARSE_NOBLANKS | XML_PARSE_COMPACT | XML_PARSE_NONET);
        // Root, channel, section, field: the last child each time.
        const xmlNode* node = xmlDocGetRootElement(tree);
        for (int level = 0; level < 3; ++level) node = node->last;
        double* value = values.data();
        for (const xmlNode* child = node->children; child; child = child->next)
            *value++ = quo::scan_double(text(child)).value;
        xmlFreeDoc(tree);
        benchmark::DoNotOptimize(values.data());
    }
}

void write_header(benchmark::State& state) {
    const std::string file = folder().file("written.xml");
    const std::vector<double> values = numbers(state.range(0));
    while (state.KeepRunning()) {
        state.PauseTiming();
        std::filesystem::remove(file);  // only the document made here is to be saved
        state.ResumeTiming();
        quorelxml document{file.c_str()};
        document.writeDouble(1, kField, values.data(), static_cast<int>(values.size()));
        benchmark::DoNotOptimize(document.write());
    }
}

const xmlChar* xml(const char* plain) { return reinterpret_cast<const xmlChar*>(plain); }

void build_and_save(benchmark::State& state) {
    const std::string file = folder().file("built.xml");
    const std::vector<double> values = numbers(state.range(0));
    while (state.KeepRunning()) {
        xmlDoc* tree = xmlNewDoc(xml("1.0"));
        xmlNode* node = xmlNewDocNode(tree, nullptr, xml("QuorelXmlDoc"), nullptr);
        xmlDocSetRootElement(tree, node);
        for (const char* name : {"Channel", "StateVectorData", "pSV_m"})
            node = xmlNewChild(node, nullptr, xml(name), nullptr);
        std::int64_t number = 0;
        for (const double value : values) {
            xmlNode* child = xmlNewTextChild(node, nullptr, xml("val"), xml(quo::format_general(value, 15).data));
            xmlNewProp(child, xml("N"), xml(quo::format_int(++number).data));
        }
        xmlSaveFormatFileEnc(file.c_str(), tree, "UTF-8", 1);
        xmlFreeDoc(tree);
    }
}

/** An object of ten numbers; a product has many. */
class Ten : public GeneralSAR_Base {
public:
    Ten();
    double a = 1.5, b = 2.5, c = 3.5, d = 4.5, e = 5.5, f = 6.5, g = 7.5, h = 8.5, i = 9.5, j = 10.5;

protected:
    void refreshParameters() override;
};
using Obj = Ten;
constexpr quo::FieldTable kTable{"Ten",        QUO_FIELD(a), QUO_FIELD(b), QUO_FIELD(c),
                                 QUO_FIELD(d), QUO_FIELD(e), QUO_FIELD(f), QUO_FIELD(g),
                                 QUO_FIELD(h), QUO_FIELD(i), QUO_FIELD(j)};
Ten::Ten() { createElementsVector(kTable.size()); }
void Ten::refreshParameters() { kTable.register_all(*this); }

constexpr int kObjects = 14;

std::string section(int number) { return "Object" + std::to_string(number); }

void write_product(const std::string& file) {
    quo::HeaderSession session{file.c_str()};
    Ten object;
    for (int number = 0; number < kObjects; ++number)
        object.writeAuxiliaryFile(file.c_str(), 1, section(number).c_str());
    if (session.commit() != 0) throw std::runtime_error("product not written");
}

void read_product(const std::string& file) {
    Ten object;
    for (int number = 0; number < kObjects; ++number)
        if (!object.readAuxiliaryFile(file.c_str(), 1, section(number).c_str()))
            throw std::runtime_error("product not read");
}

void read_product_in_a_session(benchmark::State& state) {
    const std::string file = folder().file("product.xml");
    write_product(file);
    while (state.KeepRunning()) {
        const quo::HeaderSession session{file.c_str()};
        read_product(file);
    }
}

void parse_product(benchmark::State& state) {
    const std::string file = folder().file("product.xml");
    write_product(file);
    while (state.KeepRunning())
        xmlFreeDoc(xmlReadFile(file.c_str(), nullptr, XML_PARSE_NOBLANKS | XML_PARSE_COMPACT | XML_PARSE_NONET));
}

constexpr std::int64_t kCounts[] = {1000, 10000, 100000};

void all_counts(benchmark::internal::Benchmark* job) {
    for (const std::int64_t count : kCounts) job->Arg(count);
}

BENCHMARK(read_header)->Apply(all_counts);
BENCHMARK(parse_and_walk)->Apply(all_counts);
BENCHMARK(write_header)->Apply(all_counts);
BENCHMARK(build_and_save)->Apply(all_counts);
BENCHMARK(read_product_in_a_session);
BENCHMARK(parse_product);

}  // namespace

int main(int argc, char** argv) {
    return bench::run(
        argc, argv,
        {{"read 1000 / parse and walk", "read_header/1000", "parse_and_walk/1000", 1.2},
         {"read 10000 / parse and walk", "read_header/10000", "parse_and_walk/10000", 1.2},
         {"read 100000 / parse and walk", "read_header/100000", "parse_and_walk/100000", 1.2},
         {"write 1000 / build and save", "write_header/1000", "build_and_save/1000", 2.2},
         {"write 10000 / build and save", "write_header/10000", "build_and_save/10000", 2.2},
         {"write 100000 / build and save", "write_header/100000", "build_and_save/100000", 2.2},
         {"read a product of 14 objects / parse it", "read_product_in_a_session", "parse_product", 2.5}});
}
