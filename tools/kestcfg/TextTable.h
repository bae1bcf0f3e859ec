// Aligned columns of text for people: a heading row and data rows, columns separated by two
// blanks, the last column left unpadded.
#pragma once

#include <ostream>
#include <string>
#include <vector>

namespace kest::cfg {

class TextTable {
  public:
    explicit TextTable(std::vector<std::string> headings);

    // Adds a row; it must have as many cells as there are headings. Control characters in the
    // cells are shown as escapes.
    void AddRow(std::vector<std::string> cells);

    // Writes the headings and the rows, each line starting with `indent`.
    void Write(std::ostream& out, const std::string& indent) const;

  private:
    std::vector<std::vector<std::string>> rows_;  // the headings first
};

}  // namespace kest::cfg
