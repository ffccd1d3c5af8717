// SPDX-License-Identifier: Apache-2.0
#include "shelf.h"

#include "quorelxmllib/field_table.h"
#include "support/diagnostics.h"
#include "support/fields.h"

namespace test {
namespace {

using Obj = Shelf;
constexpr quo::FieldTable kTable{
    "Shelf",
    QUO_FIELD(pages, "Pages", QUO_LENGTH(nBooks, 3)),
    QUO_FIELD(width, "ShelfWidth"),
    QUO_FIELD(boards, quo::bounds(1, 1000), quo::kOptional),
    QUO_FIELD(label),
    QUO_FIELD(code, quo::kXmlOnly),
    QUO_FIELD(corners, "Corners", quo::element("corner_m"), quo::kProfileOptional),
    QUO_FIELD(shape, QUO_LENGTH(nBooks)),
    QUO_FIELD(nBooks, "Books"),
    QUO_FIELD(weights, QUO_LENGTH(nBooks), quo::kOptional),
    QUO_FIELD(height, quo::bounds(0, 10)),  // a value behind the length
};

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
    nBooks = books;
    createBuffers();
    fill_fields(*this);
    nBooks = books;
}

bool Shelf::operator==(const Shelf& other) const { return differing_fields(*this, other).empty(); }

std::string Shelf::text() { return read_text(QUO_TEST_DATA "/headers/shelf.xml"); }

}  // namespace test
