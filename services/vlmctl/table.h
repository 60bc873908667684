// Table: rows under headings, each column as wide as its widest cell.
//
// Shapes:   two spaces between columns, none at the end of a line. A cell without text shows as
// "-".
//           Cells are made harmless, so that a text from a card cannot forge a row.
// In tests: tests/unit/vlmctl/table_test.cpp

#pragma once

#include <string>
#include <vector>

#include "services/vlmctl/output.h"

namespace vlm::control {

class Table {
public:
    explicit Table(std::vector<std::string> headings) : _headings(std::move(headings)) {}

    // As many cells as there are headings.
    void add(std::vector<std::string> cells);

    // Prints the rows. With a legend, the headings come first; without rows, `nothing` instead.
    void print(Output& output, bool withLegend, std::string_view nothing) const;

private:
    std::vector<std::string> _headings;
    std::vector<std::vector<std::string>> _rows;
};

}  // namespace vlm::control
