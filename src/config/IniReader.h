// Reading INI text: byte-order marks, line ends, sections, keys, quote stripping, comment
// retention and the joining of values that the writer split into numbered " Line" keys.
#pragma once

#include <cstdint>
#include <ctime>
#include <string_view>

#include "config/IniDocument.h"

namespace kest_ini {

// True when the reader treats a key of this name as a piece of a split value: its name ends in
// " Line" and a number that fits 32 bits.
bool IsPieceName(std::string_view keyName);

// Parses `text` (already past any byte-order mark) into `document`, which must be empty.
void ParseIni(std::string_view text, uint32_t readFlags, IniDocument& document);

// Where the text starts after a UTF-8 byte-order mark (0 without one), or -3 when `bytes` start
// with a UTF-16 or UTF-32 byte-order mark.
int TextStart(std::string_view bytes);

// Reads and parses the file at `path` into `document` (which must be empty) and gives its
// modification time. Returns 0 or an engine failure.
int ReadIniFile(const char* path, uint32_t readFlags, IniDocument& document, timespec* modified);

}  // namespace kest_ini
