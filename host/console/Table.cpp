#include "host/console/Table.hpp"

#include <algorithm>
#include <cstddef>

#include "host/TerminalText.hpp"

namespace velkor::host {

namespace {

constexpr std::size_t gap = 2;

using Row = std::vector<std::string>;

std::vector<std::size_t> columnWidths(const std::vector<Row>& rows) {
    std::vector<std::size_t> widths;
    for (const Row& row : rows) {
        widths.resize(std::max(widths.size(), row.size()));
        for (std::size_t column = 0; column < row.size(); ++column) {
            widths[column] = std::max(widths[column], characterCount(row[column]));
        }
    }
    return widths;
}

}  // namespace

std::string formatTable(const std::vector<Row>& rows) {
    const auto widths = columnWidths(rows);
    std::string text;
    for (const Row& row : rows) {
        std::size_t missingBlanks = 0;
        for (std::size_t column = 0; column < row.size(); ++column) {
            if (!row[column].empty()) {
                text.append(missingBlanks, ' ') += row[column];
                missingBlanks = 0;
            }
            missingBlanks += widths[column] - characterCount(row[column]) + gap;
        }
        text += '\n';
    }
    return text;
}

}  // namespace velkor::host
