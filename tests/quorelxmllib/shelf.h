// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SHELF_H
#define QUO_TESTS_SHELF_H

#include "quo_base/quorelxml_v2.h"
#include "support/prelude.h"

namespace test {

/** A header object with a field of every kind. Section "Shelf". */
class Shelf : public GeneralSAR_Base {
public:
    Shelf();
    ~Shelf() override;
    int createBuffers() override;
    int destroyBuffers() override;
    int readhdr(const char* file) override;
    int writehdr(const char* file) override;
    int clone(Shelf* to) const;
    /** Gives every field a value of its own, which 15 digits hold, and the arrays this length. */
    void fill(int books);
    /** Whether every field holds the same. */
    bool operator==(const Shelf& other) const;
    /** A header file with a shelf of two books. */
    static std::string text();

    std::unique_ptr<double[]> pages;  // 3 * nBooks, before the length in the table
    double width = -999.0;
    float height = 2.5F;
    std::int32_t boards = -999;  // optional
    char label[512] = "NOT_AVAILABLE";
    char code[8] = "none";                 // only in XML
    double corners[4] = {};                // optional in parameter files
    std::vector<std::int32_t> shape = {};  // nBooks
    std::int32_t nBooks = 0;
    float* weights = nullptr;  // nBooks, optional

protected:
    void refreshParameters() override;
};

}  // namespace test

#endif
