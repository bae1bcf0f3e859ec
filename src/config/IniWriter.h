// Writing INI text: the layout of sections and keys, values split over numbered " Line" keys
// when a line would be too long, and the file replacement that never truncates the target.
#pragma once

#include <cstdint>
#include <ctime>
#include <string>
#include <string_view>

#include "config/IniDocument.h"
#include "config/IniText.h"

namespace kest_ini {

struct WriteOptions {
    int maxLineLength = kIniDefaultMaxLineLength;  // <= 0: no limit
    char splitCharacter = 0;                       // 0: none
    uint32_t flags = kIniDefaultWriteFlags;
};

// Appends the document as INI text to `out`. Returns 0, or -2 when the maximum line length
// leaves no room for a piece of a value that must be split.
int FormatIni(const IniDocument& document, const WriteOptions& options, std::string& out);

// The temporary file used for safe replacement without a unique name: the extension of the last
// path component replaced by "TMP", or ".TMP" appended when there is none, when it already is
// "TMP" or when the path has no '/'.
std::string TemporaryPathFor(std::string_view target);

// Writes `text` to `path` according to the write flags and gives the new file's modification
// time. Returns 0 or an engine failure.
int WriteIniFile(const char* path, std::string_view text, uint32_t writeFlags, timespec* modified);

}  // namespace kest_ini
