#include "config/IniWriter.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <vector>

#include "config/IniReader.h"
#include "support/FileDescriptor.h"
#include "support/WholeTransfer.h"

namespace kest::ini {
namespace {

// Room taken on a split line by the name suffix and the separator.
constexpr int kSplitOverhead = 12;

// True when a piece of an unquoted value is read back exactly as written: the reader drops
// whitespace at its ends and strips quote characters that enclose it.
bool ReadsBackUnquoted(std::string_view piece) {
    if (piece.empty() || IsIniSpace(piece.front()) || IsIniSpace(piece.back())) {
        return false;
    }
    return piece.size() < 2 || piece.front() != piece.back() ||
           (piece.front() != '"' && piece.front() != '\'');
}

// Length of the next piece of `rest`: at most `limit` characters, ending just after the last
// split character within the limit when there is one. For unquoted values only cut points that
// read back unchanged are used; when there is none the rest goes out as one piece.
size_t PieceLength(std::string_view rest, size_t limit, char splitCharacter, bool quoted) {
    if (rest.size() <= limit) {
        return rest.size();
    }
    auto usable = [&](size_t cut) {
        if (quoted) {
            return true;
        }
        std::string_view remainder = rest.substr(cut);
        // The last piece ends with the value's last character, so a remainder starting with that
        // same quote character would be read back without its quotes once it is the last piece.
        bool enclosedLater = remainder.front() == rest.back() &&
                             (remainder.front() == '"' || remainder.front() == '\'');
        return ReadsBackUnquoted(rest.substr(0, cut)) && !IsIniSpace(remainder.front()) &&
               !enclosedLater && (remainder.size() > limit || ReadsBackUnquoted(remainder));
    };
    if (splitCharacter != 0) {
        for (size_t cut = limit; cut > 0; --cut) {
            if (rest[cut - 1] == splitCharacter && usable(cut)) {
                return cut;
            }
        }
    }
    for (size_t cut = limit; cut > 0; --cut) {
        if (usable(cut)) {
            return cut;
        }
    }
    return rest.size();
}

void AppendLines(const std::vector<std::string>& lines, std::string& out) {
    for (const std::string& line : lines) {
        out += line;
        out += '\n';
    }
}

void AppendKeyLine(std::string_view name, std::string_view separator, char quote,
                   std::string_view value, std::string& out) {
    out += name;
    out += separator;
    if (quote != 0) {
        out += quote;
    }
    out += value;
    if (quote != 0) {
        out += quote;
    }
    out += '\n';
}

// Writes the key line, split over numbered " Line" keys when it is too long. A key whose own name
// reads as a piece is always written with the suffix " Line0001", which the reader strips again:
// written plainly it would lose its own suffix or be joined to the key before it.
int AppendKey(const IniKey& key, const WriteOptions& options, std::string& out) {
    std::string_view separator = (options.flags & kIniWriteSpacedSeparator) != 0 ? " = " : "=";
    int quoteLength = key.quote != 0 ? 2 : 0;
    size_t lineLength = key.name.size() + separator.size() + key.value.size() + quoteLength;
    bool fits =
        options.maxLineLength <= 0 || lineLength <= static_cast<size_t>(options.maxLineLength);
    if (fits) {
        if (IsPieceName(key.name)) {
            out += key.name;
            AppendKeyLine(" Line0001", separator, key.quote, key.value, out);
        } else {
            AppendKeyLine(key.name, separator, key.quote, key.value, out);
        }
        return 0;
    }
    long long limit = static_cast<long long>(options.maxLineLength) - kSplitOverhead -
                      static_cast<long long>(key.name.size()) - quoteLength;
    if (limit <= 0) {
        return kIniNoRoomToSplit;
    }
    std::string_view rest = key.value;
    unsigned number = 1;
    char suffix[32];
    while (!rest.empty()) {
        size_t length =
            PieceLength(rest, static_cast<size_t>(limit), options.splitCharacter, key.quote != 0);
        std::snprintf(suffix, sizeof suffix, " Line%04u", number++);
        out += key.name;
        AppendKeyLine(suffix, separator, key.quote, rest.substr(0, length), out);
        rest.remove_prefix(length);
    }
    return 0;
}

std::atomic<void (*)(SaveStage)> saveStageObserver{nullptr};

void Reached(SaveStage stage) {
    if (void (*observer)(SaveStage) = saveStageObserver.load()) {
        observer(stage);
    }
}

int OpenRetrying(const char* path, int flags, mode_t mode = 0) {
    int descriptor;
    do {
        descriptor = open(path, flags, mode);
    } while (descriptor < 0 && errno == EINTR);
    return descriptor;
}

// Proves that an existing target can be written by opening it for update. A missing target is
// left alone: creating the temporary and the rename report whether the directory takes it.
bool TargetIsWritable(const char* path) {
    const kest::FileDescriptor target(
        OpenRetrying(path, O_RDWR | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
    return target.IsOpen() || errno == ENOENT;
}

// Six characters for a temporary's name, as mkstemp would pick them: different in every process
// and on every call.
std::string RandomSuffix() {
    static constexpr char kCharacters[] =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789";
    static std::atomic<uint64_t> calls{0};
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    uint64_t mixed = (static_cast<uint64_t>(getpid()) << 40) ^
                     (static_cast<uint64_t>(now.tv_sec) << 30) ^
                     static_cast<uint64_t>(now.tv_nsec) ^ (calls++ * 0x9E3779B97F4A7C15ULL);
    mixed = (mixed ^ (mixed >> 30)) * 0xBF58476D1CE4E5B9ULL;
    mixed = (mixed ^ (mixed >> 27)) * 0x94D049BB133111EBULL;
    mixed ^= mixed >> 31;
    std::string suffix;
    for (int i = 0; i < 6; ++i, mixed /= sizeof kCharacters - 1) {
        suffix += kCharacters[mixed % (sizeof kCharacters - 1)];
    }
    return suffix;
}

// Creates a new temporary in `directory` under `prefix` and six random characters. An existing
// name is never followed nor reused, so a temporary left by a killed save only costs a retry.
int CreateTemporary(int directory, const std::string& prefix, mode_t mode, std::string* name) {
    constexpr int kAttempts = 100;
    for (int attempt = 0; attempt < kAttempts; ++attempt) {
        *name = prefix + RandomSuffix();
        int descriptor;
        do {
            descriptor = openat(directory, name->c_str(),
                                O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, mode);
        } while (descriptor < 0 && errno == EINTR);
        if (descriptor >= 0 || errno != EEXIST) {
            return descriptor;
        }
    }
    return -1;
}

bool SyncUnlessInterrupted(int descriptor) {
    int result;
    do {
        result = fsync(descriptor);
    } while (result != 0 && errno == EINTR);
    return result == 0;
}

// Writes the target itself, truncating it; a failed write removes the half-written target.
int WriteInPlace(const char* path, std::string_view text, uint32_t writeFlags, FileStamp* stamp) {
    kest::FileDescriptor output(
        OpenRetrying(path, O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC | O_NOCTTY, 0666));
    if (!output.IsOpen()) {
        return kIniCannotOpenOutput;
    }
    struct stat written;
    bool complete = kest::WriteWhole(output.Get(), text) &&
                    ((writeFlags & kIniWriteSync) == 0 || SyncUnlessInterrupted(output.Get())) &&
                    fstat(output.Get(), &written) == 0;
    // Closing reports a failed delayed write too.
    if (output.Close() != 0 || !complete) {
        unlink(path);
        return kIniWriteFailed;
    }
    *stamp = FileStamp::Of(written);
    return 0;
}

// Writes a new temporary beside the target, syncs it and renames it over the target, so that a
// reader sees the old or the whole new document and a kill at any point leaves one of them.
int ReplaceSafely(const char* path, std::string_view text, uint32_t writeFlags, FileStamp* stamp) {
    if (!TargetIsWritable(path)) {
        return kIniCannotWriteTarget;
    }
    std::string_view target(path);
    size_t slash = target.rfind('/');
    std::string directoryPath = slash == std::string_view::npos ? std::string(".")
                                : slash == 0                    ? std::string("/")
                                             : std::string(target.substr(0, slash));
    std::string name(slash == std::string_view::npos ? target : target.substr(slash + 1));
    const kest::FileDescriptor directory(
        OpenRetrying(directoryPath.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!directory.IsOpen()) {
        return kIniCannotCreateTemporary;
    }
    struct stat previous;
    bool existed = fstatat(directory.Get(), name.c_str(), &previous, 0) == 0;
    bool unique = (writeFlags & kIniWriteUniqueTemporary) != 0;
    std::string prefix = TemporaryPathFor(target);
    prefix = unique ? std::string("ini$$.TMP") : prefix.substr(prefix.rfind('/') + 1);
    // Over an existing target the temporary is private until it has the target's owner and mode,
    // so none of the content shows to anyone the target keeps out.
    std::string temporary;
    kest::FileDescriptor output(
        CreateTemporary(directory.Get(), prefix, existed ? 0600 : 0666, &temporary));
    if (!output.IsOpen()) {
        return kIniCannotCreateTemporary;
    }
    Reached(SaveStage::kTemporaryCreated);
    if (existed) {
        // A process without the right to give files away still saves: a refused fchown is
        // tolerated. The mode is set after the owner, which may clear set-id bits.
        (void)!fchown(output.Get(), previous.st_uid, previous.st_gid);
        fchmod(output.Get(), previous.st_mode & 07777);
    } else if (unique) {
        fchmod(output.Get(), 0644);
    }
    struct stat written;
    bool complete = kest::WriteWhole(output.Get(), text) && SyncUnlessInterrupted(output.Get()) &&
                    fstat(output.Get(), &written) == 0;
    if (output.Close() != 0 || !complete) {
        unlinkat(directory.Get(), temporary.c_str(), 0);
        return kIniWriteFailed;
    }
    Reached(SaveStage::kTemporaryWritten);
    if (renameat(directory.Get(), temporary.c_str(), directory.Get(), name.c_str()) != 0) {
        unlinkat(directory.Get(), temporary.c_str(), 0);
        return kIniCannotWriteTarget;
    }
    Reached(SaveStage::kRenamed);
    // The new name reaches the disk only with its directory.
    if ((writeFlags & kIniWriteSync) != 0 && !SyncUnlessInterrupted(directory.Get())) {
        return kIniWriteFailed;
    }
    *stamp = FileStamp::Of(written);
    return 0;
}

}  // namespace

int FormatIni(const IniDocument& document, const WriteOptions& options, std::string& out) {
    bool comments = (options.flags & kIniWriteComments) != 0;
    const size_t start = out.size();
    for (size_t i = 0; i < document.SectionCount(); ++i) {
        const IniSection& section = document.SectionAt(i);
        if (comments) {
            AppendLines(section.comments, out);
        }
        if (!section.unnamed) {
            out += '[';
            out += section.name;
            out += "]\n";
        }
        for (size_t k = 0; k < section.keys.Size(); ++k) {
            const IniKey& key = section.keys.At(k);
            if (comments) {
                AppendLines(key.comments, out);
            }
            int result = AppendKey(key, options, out);
            if (result < 0) {
                return result;
            }
        }
        bool emptyUnnamed = section.unnamed && section.keys.Size() == 0;
        if (!emptyUnnamed && (!comments || section.line == 0)) {
            out += '\n';
        }
    }
    if (comments) {
        AppendLines(document.trailingComments, out);
    }
    // Text that itself starts like a byte-order mark (a name or comment of the unnamed section)
    // gets a UTF-8 mark in front, so that loading neither drops those bytes nor refuses the file.
    if ((options.flags & kIniWriteByteOrderMark) != 0 ||
        TextStart(std::string_view(out).substr(start)) != 0) {
        out.insert(start, "\xEF\xBB\xBF");
    }
    return 0;
}

std::string TemporaryPathFor(std::string_view target) {
    size_t slash = target.rfind('/');
    size_t dot = target.rfind('.');
    bool hasExtension = slash != std::string_view::npos && dot != std::string_view::npos &&
                        dot > slash && target.substr(dot + 1) != "TMP";
    std::string path(hasExtension ? target.substr(0, dot) : target);
    path += ".TMP";
    return path;
}

void SetSaveStageObserver(void (*observer)(SaveStage)) {
    saveStageObserver = observer;
}

int WriteIniFile(const char* path, std::string_view text, uint32_t writeFlags, FileStamp* stamp) {
    if (path == nullptr || *path == '\0') {
        return kIniInvalidArgument;
    }
    return (writeFlags & kIniWriteSafeReplacement) != 0
               ? ReplaceSafely(path, text, writeFlags, stamp)
               : WriteInPlace(path, text, writeFlags, stamp);
}

}  // namespace kest::ini
