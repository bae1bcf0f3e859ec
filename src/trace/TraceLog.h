// The per-process trace log file: opened by the first line written to it, closed for good when
// the free space of its file system falls below the low-disk threshold or when the file at its
// path belongs to another user.
// Thread safety: none of its own; the tracer uses its one log only under the trace lock.
#pragma once

#include <cstdint>
#include <string>

#include "support/FileDescriptor.h"

namespace kest::trace {

// The last line of a log whose file system ran short of space.
extern const char* const kAbortMessage;

// Longest directory (with its final separator) and log path the tracer keeps.
constexpr size_t kMaxLogPathLength = 255;

class TraceLog {
  public:
    TraceLog() = default;
    ~TraceLog() { Close(); }
    TraceLog(const TraceLog&) = delete;
    TraceLog& operator=(const TraceLog&) = delete;

    // Places the log file `fileName` in `directory` (a '/' is appended unless it ends in '/' or
    // '\'). False, leaving file output off, when the directory or the path would be longer than
    // kMaxLogPathLength bytes.
    bool SetLocation(std::string directory, const std::string& fileName);
    bool HasLocation() const { return !path_.empty(); }
    const std::string& Path() const { return path_; }

    // Appends `line` and a line feed, opening the file first when needed. With a non-zero
    // threshold the free space is measured before opening and before each line; when it is
    // short the log is stopped for good, with the abort message as its last line when the file
    // was open. Returns what the other outputs should write: the line, or the abort message
    // that replaced it. A file that cannot be opened costs only the line; one that belongs to
    // another user stops the log for good.
    const char* Append(const char* line, uint32_t threshold);
    // Appends two lines with one write, as two Appends without a threshold would: nothing when
    // the log has no location, was stopped or cannot be opened.
    void AppendTwoLines(const char* first, const char* second);

    // Closes the file if open; a later Append opens it again unless the log was stopped.
    void Close();

  private:
    // Opens the file, stopping the log when it belongs to another user.
    void Open();
    bool SpaceIsShort(uint32_t threshold) const;

    std::string directory_;  // where free space is measured: the directory part of the path
    std::string path_;
    kest::FileDescriptor descriptor_;
    bool aborted_ = false;
};

}  // namespace kest::trace
