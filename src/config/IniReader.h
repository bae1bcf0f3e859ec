// Reading INI text: byte-order marks, line ends, sections, keys, quote stripping, comment
// retention and the joining of values that the writer split into numbered " Line" keys.
// Thread safety: keeps no state; may run concurrently on distinct documents.
#pragma once

#include <sys/stat.h>

#include <cstdint>
#include <ctime>
#include <string_view>

#include "config/IniDocument.h"

namespace kest::ini {

// True when the reader treats a key of this name as a piece of a split value: its name ends in
// " Line" and a number that fits 32 bits.
bool IsPieceName(std::string_view keyName);

// Parses `text` (already past any byte-order mark) into `document`, which must be empty.
void ParseIni(std::string_view text, uint32_t readFlags, IniDocument& document);

// Where the text starts after a UTF-8 byte-order mark (0 without one), or -3 when `bytes` start
// with a UTF-16 or UTF-32 byte-order mark.
int TextStart(std::string_view bytes);

// What tells one version of a file from another: a replacement by rename gives a new inode even
// within one tick of the file-system clock, a rewrite in place a new modification time or size.
struct FileStamp {
    dev_t device = 0;
    ino_t inode = 0;
    off_t size = 0;
    timespec modified{};

    static FileStamp Of(const struct stat& status) {
        return FileStamp{status.st_dev, status.st_ino, status.st_size, status.st_mtim};
    }
    bool operator==(const FileStamp& other) const {
        return device == other.device && inode == other.inode && size == other.size &&
               modified.tv_sec == other.modified.tv_sec &&
               modified.tv_nsec == other.modified.tv_nsec;
    }
};

// Reads and parses the file at `path` into `document` (which must be empty) and gives the stamp
// of the version read. The file is opened without blocking and must be a regular file: a FIFO or
// a device gives -5001 rather than a hang. Returns 0 or an engine failure.
int ReadIniFile(const char* path, uint32_t readFlags, IniDocument& document, FileStamp* stamp);

}  // namespace kest::ini
