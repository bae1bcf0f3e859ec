// Writing INI text: the layout of sections and keys, values split over numbered " Line" keys
// when a line would be too long, and the file replacement that never truncates the target.
// Thread safety: may run concurrently on distinct documents and paths; the save-stage observer is
// an atomic pointer, and processes saving one path at once each replace it whole.
#pragma once

#include <cstdint>
#include <ctime>
#include <string>
#include <string_view>

#include "config/IniDocument.h"
#include "config/IniReader.h"
#include "config/IniText.h"

namespace kest::ini {

struct WriteOptions {
    int maxLineLength = kIniDefaultMaxLineLength;  // <= 0: no limit
    char splitCharacter = kIniNoSplitCharacter;
    uint32_t flags = kIniDefaultWriteFlags;
};

// Appends the document as INI text to `out`. Returns 0, or -2 when the maximum line length
// leaves no room for a piece of a value that must be split.
int FormatIni(const IniDocument& document, const WriteOptions& options, std::string& out);

// The stem of the temporary's name for safe replacement without the "ini$$.TMP" stem: the
// extension of the last path component replaced by "TMP", or ".TMP" appended when there is none,
// when it already is "TMP" or when the path has no '/'. Six random characters follow it.
std::string TemporaryPathFor(std::string_view target);

// Points of a safe replacement: the temporary exists but holds nothing yet; it is complete and
// synced but not renamed; it has replaced the target.
enum class SaveStage { kTemporaryCreated, kTemporaryWritten, kRenamed };

// Calls `observer` (null: nothing) at each point of every safe replacement in this process, so a
// test can stop a save at a fixed point.
void SetSaveStageObserver(void (*observer)(SaveStage));

// Writes `text` to `path` according to the write flags and gives the stamp of the new file.
// Safe replacement always goes through a new, uniquely named temporary in the target's
// directory, synced before the rename; with kIniWriteSync the directory is synced after it.
// Returns 0 or an engine failure.
int WriteIniFile(const char* path, std::string_view text, uint32_t writeFlags, FileStamp* stamp);

}  // namespace kest::ini
