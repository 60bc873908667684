#include "services/vlmctl/table.h"

#include <algorithm>

#include "services/vlmctl/display_width.h"
#include "services/vlmctl/shown.h"

namespace vlm::control {

namespace {

using Row = std::vector<std::string>;

void widen(std::vector<std::size_t>& widths, const Row& row) {
    for (std::size_t i = 0; i < row.size(); ++i)
        widths[i] = std::max(widths[i], displayWidth(row[i]));
}

std::string lineOf(const Row& row, const std::vector<std::size_t>& widths) {
    std::string line;
    for (std::size_t i = 0; i < row.size(); ++i) {
        line += row[i];
        if (i + 1 < row.size()) line.append(widths[i] - displayWidth(row[i]) + 2, ' ');
    }
    return line;
}

}  // namespace

void Table::add(Row cells) {
    cells.resize(_headings.size());
    for (auto& cell : cells) cell = cell.empty() ? "-" : shown(cell);
    _rows.push_back(std::move(cells));
}

void Table::print(Output& output, bool withLegend, std::string_view nothing) const {
    if (_rows.empty()) {
        if (withLegend) output.print(nothing);
        return;
    }
    std::vector<std::size_t> widths(_headings.size());
    if (withLegend) widen(widths, _headings);
    for (const auto& row : _rows) widen(widths, row);

    if (withLegend) output.print(lineOf(_headings, widths));
    for (const auto& row : _rows) output.print(lineOf(row, widths));
}

}  // namespace vlm::control
