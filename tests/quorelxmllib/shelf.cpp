#include "shelf.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

#include "header_files.h"
#include "quorelxmllib/field_table.h"

namespace test {
namespace {

using Obj = Shelf;
constexpr quo::FieldTable kTable{
    "Shelf",
    QUO_FIELD(pages, "Pages", QUO_LENGTH(nBooks, 3)),
    QUO_FIELD(width, "ShelfWidth"),
    QUO_FIELD(height, quo::bounds(0, 10)),
    QUO_FIELD(boards, quo::bounds(1, 1000), quo::kOptional),
    QUO_FIELD(label),
    QUO_FIELD(code, quo::kXmlOnly),
    QUO_FIELD(corners, "Corners", quo::element("corner_m"), quo::kProfileOptional),
    QUO_FIELD(shape, QUO_LENGTH(nBooks)),
    QUO_FIELD(nBooks, "Books"),
    QUO_FIELD(weights, QUO_LENGTH(nBooks), quo::kOptional),
};

template <typename T>
bool same(const T* a, const T* b, std::size_t count) {
    return (a == nullptr) == (b == nullptr) && (!a || std::memcmp(a, b, count * sizeof(T)) == 0);
}

}  // namespace

Shelf::Shelf() { createElementsVector(kTable.size()); }
Shelf::~Shelf() { kTable.destroy_buffers(*this); }
void Shelf::refreshParameters() { kTable.register_all(*this); }
int Shelf::createBuffers() { return kTable.create_buffers(*this); }
int Shelf::destroyBuffers() { return kTable.destroy_buffers(*this); }
int Shelf::clone(Shelf* to) const { return kTable.copy(*this, *to); }
int Shelf::writehdr(const char* file) { return writeAuxiliaryFile(file, 1, kTable.section()); }
int Shelf::readhdr(const char* file) {
    return readAuxiliaryFile(file, 1, kTable.section()) ? 0 : kTable.read_profile(*this, file);
}

void Shelf::fill(int books) {
    width = 1.0 / 3.0;
    height = 0.7F;
    boards = 17;
    std::snprintf(label, sizeof label, "Poems & <plays>, %d", books);
    std::snprintf(code, sizeof code, "P-%d", books);
    for (int i = 0; i < 4; ++i) corners[i] = 803.5 * i - 1e-7;
    nBooks = books;
    createBuffers();
    for (int i = 0; i < 3 * books; ++i) pages[static_cast<std::size_t>(i)] = 100.25 + i;
    for (int i = 0; i < books; ++i) {
        shape[static_cast<std::size_t>(i)] = 40 - i;
        weights[i] = 0.5F * static_cast<float>(i) + 0.125F;
    }
}

bool Shelf::operator==(const Shelf& other) const {
    const auto books = static_cast<std::size_t>(std::max(nBooks, 0));
    return same(&width, &other.width, 1) && same(&height, &other.height, 1) && boards == other.boards &&
           std::string{label} == other.label && std::string{code} == other.code &&
           same(corners, other.corners, 4) && nBooks == other.nBooks &&
           same(pages.get(), other.pages.get(), 3 * books) && shape == other.shape &&
           same(weights, other.weights, books);
}

std::string Shelf::text() {
    return header_text(R"(    <Shelf>
      <pages>
        <val N="1">1.5</val>
        <val N="2">2.5</val>
        <val N="3">3.5</val>
        <val N="4">4.5</val>
        <val N="5">5.5</val>
        <val N="6">6.5</val>
      </pages>
      <width>2.25</width>
      <height>0.5</height>
      <boards>3</boards>
      <label>Novels</label>
      <code>N-1</code>
      <corner_m>1.5, 2.5, 3.5, 4.5</corner_m>
      <shape>
        <val N="1">1</val>
        <val N="2">2</val>
      </shape>
      <nBooks>2</nBooks>
      <ConfigurationFile>/etc/shelf.conf</ConfigurationFile>
    </Shelf>
)");
}

}  // namespace test
