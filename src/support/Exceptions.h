// The runtime library's exception classes: fixed texts and codes that never leave the plug-in as
// status codes (an entry point turns every one of them into E_FAIL).
#pragma once

#include <cstdint>
#include <exception>
#include <string>

namespace vq {
namespace dsc {
namespace exception {

// Root of the runtime library's exceptions: records where it was raised.
class Exception : public std::exception {
  public:
    explicit Exception(int32_t line = 0, const char* file = nullptr) noexcept;
    const char* what() const noexcept override;
    // The runtime library's error code of this exception class.
    virtual int32_t ErrorCode() const noexcept;
    int32_t Line() const noexcept { return line_; }
    const char* File() const noexcept { return file_; }

  private:
    int32_t line_;
    const char* file_;
};

// An exception whose text is built when it is raised; what() returns that text.
class MessageException : public Exception {
  public:
    explicit MessageException(std::string message) : message_(std::move(message)) {}
    const char* what() const noexcept override { return message_.c_str(); }

  private:
    std::string message_;
};

// Name and Base are a class name and its base class, which cannot stand in parentheses.
// NOLINTBEGIN(bugprone-macro-parentheses)
#define KEST_FIXED_EXCEPTION(Name, Base)             \
    class Name : public Base {                       \
      public:                                        \
        using Base::Base;                            \
        const char* what() const noexcept override;  \
        int32_t ErrorCode() const noexcept override; \
    }
// NOLINTEND(bugprone-macro-parentheses)

KEST_FIXED_EXCEPTION(OutOfRange, Exception);
KEST_FIXED_EXCEPTION(BoundExceeded, Exception);
KEST_FIXED_EXCEPTION(InvalidArgument, Exception);
KEST_FIXED_EXCEPTION(InvalidOperation, Exception);
KEST_FIXED_EXCEPTION(NonexistentException, Exception);
KEST_FIXED_EXCEPTION(ObjectAlreadyExists, Exception);
KEST_FIXED_EXCEPTION(FileReadFailed, Exception);
KEST_FIXED_EXCEPTION(FileWriteFailed, Exception);
KEST_FIXED_EXCEPTION(FileAlreadyExists, Exception);
KEST_FIXED_EXCEPTION(Timeout, Exception);
KEST_FIXED_EXCEPTION(InitializationFailure, Exception);
KEST_FIXED_EXCEPTION(NotImplemented, Exception);
KEST_FIXED_EXCEPTION(DeserializationError, Exception);
KEST_FIXED_EXCEPTION(BufferOverflow, Exception);
KEST_FIXED_EXCEPTION(InvalidSequence, Exception);
KEST_FIXED_EXCEPTION(InvalidLocale, Exception);
KEST_FIXED_EXCEPTION(UnableToConvert, Exception);
KEST_FIXED_EXCEPTION(BadGuidString, Exception);

#undef KEST_FIXED_EXCEPTION

// "Out of range: " followed by the given text.
class OutOfRange2 : public OutOfRange {
  public:
    explicit OutOfRange2(const std::string& text) : message_("Out of range: " + text) {}
    const char* what() const noexcept override { return message_.c_str(); }

  private:
    std::string message_;
};

// A bound was exceeded; the text is the given message.
class BoundExceeded2 : public BoundExceeded {
  public:
    explicit BoundExceeded2(std::string message) : message_(std::move(message)) {}
    const char* what() const noexcept override { return message_.c_str(); }

  private:
    std::string message_;
};

// "Invalid argument(s): " followed by the given text.
class InvalidArgument2 : public InvalidArgument {
  public:
    explicit InvalidArgument2(const std::string& text) : message_("Invalid argument(s): " + text) {}
    const char* what() const noexcept override { return message_.c_str(); }

  private:
    std::string message_;
};

// Access to a path was refused; the path helpers pass "Access denied: " and the path.
class AccessDenied : public MessageException {
  public:
    using MessageException::MessageException;
    int32_t ErrorCode() const noexcept override;
};

}  // namespace exception

namespace osdep {

// An operating-system failure with its error number.
class OSException : public exception::MessageException {
  public:
    OSException(std::string message, int32_t osErrorNumber)
        : MessageException(std::move(message)), osErrorNumber_(osErrorNumber) {}
    int32_t ErrorCode() const noexcept override;
    // The operating system's error number (errno value).
    virtual int32_t OSErrorNumber() const noexcept { return osErrorNumber_; }

  private:
    int32_t osErrorNumber_;
};

// A failed POSIX call: message is strerror of the error number unless one is given.
class PosixError : public OSException {
  public:
    // From the current errno.
    PosixError();
    // From the given error number.
    explicit PosixError(int errorNumber);
    PosixError(std::string message, int errorNumber);
    int32_t ErrorCode() const noexcept override;
};

// A network name or address could not be resolved.
class NotResolvedException : public exception::Exception {
  public:
    using Exception::Exception;
    const char* what() const noexcept override;
};

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
