// The simulated controller's state file as an editable INI document. Lines the simulation does
// not change are written back byte for byte; a changed value rewrites its line as "Key=Value".
#pragma once

#include <string>
#include <utility>
#include <vector>

namespace kest::sim {

class StateDocument {
  public:
    // Parses INI text: "[Section]" headers and "Key = Value" entries; blank lines, comments
    // (";" or "#") and lines without "=" are kept verbatim. LF, CRLF and a UTF-8 byte-order mark
    // are accepted. Keys and values are trimmed of blanks and tabs, then values are unescaped.
    static StateDocument Parse(const std::string& text);

    // The value of `key` in the first section named `section` (names compare ASCII
    // case-insensitively), or null when either is absent.
    const std::string* Find(const std::string& section, const std::string& key) const;

    // Sets `key` in `section`, replacing its first entry or appending a new one (and the section
    // itself when it is missing).
    void Set(const std::string& section, const std::string& key, const std::string& value);

    // Names of the sections in file order.
    std::vector<std::string> SectionNames() const;

    // The (key, value) entries of the first section named `section`, in file order.
    std::vector<std::pair<std::string, std::string>> Entries(const std::string& section) const;

    // The document as text with LF line ends.
    std::string Serialize() const;

  private:
    struct Line {
        std::string raw;
        bool isEntry = false;
        std::string key;
        std::string value;
    };
    struct Section {
        std::string name;
        std::string headerRaw;  // empty for the lines before the first header
        std::vector<Line> lines;
    };

    // Index of the first section named `name`; 0 (the lines before any header) when absent.
    size_t FindSection(const std::string& name) const;

    std::vector<Section> sections_{Section{}};
};

// Escapes a value for one INI line: backslash, LF, CR and tab become "\\", "\n", "\r", "\t"; a
// blank at either end becomes "\s" so that trimming on reading keeps it.
std::string EscapeIniValue(const std::string& value);

// Reverses EscapeIniValue; an unknown escape keeps its backslash.
std::string UnescapeIniValue(const std::string& text);

// ASCII case-insensitive equality.
bool EqualsIgnoringCase(const std::string& a, const std::string& b);

}  // namespace kest::sim
