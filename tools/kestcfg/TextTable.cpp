#include "TextTable.h"

#include <algorithm>
#include <stdexcept>

#include "hostkit/HostText.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

// The number of characters of UTF-8 text (bytes that do not continue a character).
size_t DisplayWidth(const std::string& text) {
    return static_cast<size_t>(std::count_if(text.begin(), text.end(), [](char c) {
        return (static_cast<unsigned char>(c) & 0xC0u) != 0x80u;
    }));
}

}  // namespace

TextTable::TextTable(std::vector<std::string> headings) {
    rows_.push_back(std::move(headings));
}

void TextTable::AddRow(std::vector<std::string> cells) {
    if (cells.size() != rows_.front().size()) {
        throw std::logic_error("a table row has the wrong number of cells");
    }
    for (std::string& cell : cells) {
        cell = PrintableText(cell);
    }
    rows_.push_back(std::move(cells));
}

void TextTable::Write(std::ostream& out, const std::string& indent) const {
    std::vector<size_t> widths(rows_.front().size(), 0);
    for (const std::vector<std::string>& row : rows_) {
        for (size_t column = 0; column < row.size(); ++column) {
            widths[column] = std::max(widths[column], DisplayWidth(row[column]));
        }
    }
    for (const std::vector<std::string>& row : rows_) {
        std::string line = indent;
        for (size_t column = 0; column < row.size(); ++column) {
            line += row[column];
            if (column + 1 < row.size()) {
                line.append(widths[column] - DisplayWidth(row[column]) + 2, ' ');
            }
        }
        out << line << "\n";
    }
}

}  // namespace kest::cfg
