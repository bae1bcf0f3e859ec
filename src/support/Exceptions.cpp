#include "support/Exceptions.h"

#include <cerrno>
#include <cstring>

namespace vq {
namespace dsc {
namespace exception {
namespace {
const char kRuntimeSourceFile[] = "vqdsc/exception.cpp";
}

Exception::Exception(int32_t line, const char* file) noexcept
    : line_(line), file_(file != nullptr ? file : kRuntimeSourceFile) {}

const char* Exception::what() const noexcept {
    return "unspecified exception";
}
int32_t Exception::ErrorCode() const noexcept {
    return -1;
}

#define KEST_FIXED_EXCEPTION_TEXT(Name, text, code) \
    const char* Name::what() const noexcept {       \
        return text;                                \
    }                                               \
    int32_t Name::ErrorCode() const noexcept {      \
        return static_cast<int32_t>(code##u);       \
    }

KEST_FIXED_EXCEPTION_TEXT(OutOfRange, "Out of range", 0x8ABC7007)
KEST_FIXED_EXCEPTION_TEXT(BoundExceeded, "A request was made that would exceed the bounds",
                          0x8ABC7007)
KEST_FIXED_EXCEPTION_TEXT(InvalidArgument, "Invalid argument(s)", 0x8ABC700F)
KEST_FIXED_EXCEPTION_TEXT(InvalidOperation, "Invalid operation", 0x8ABC700E)
KEST_FIXED_EXCEPTION_TEXT(NonexistentException, "The object does not exist", 0x8ABC700A)
KEST_FIXED_EXCEPTION_TEXT(ObjectAlreadyExists, "Object already exists", 0x8ABC7009)
KEST_FIXED_EXCEPTION_TEXT(FileReadFailed, "Read file operation failed", 0x8ABC7012)
KEST_FIXED_EXCEPTION_TEXT(FileWriteFailed, "Write file operation failed", 0x8ABC7011)
KEST_FIXED_EXCEPTION_TEXT(FileAlreadyExists, "File already exists", 0x8ABC701B)
KEST_FIXED_EXCEPTION_TEXT(Timeout, "Operation timed out", 0x8ABC7003)
KEST_FIXED_EXCEPTION_TEXT(InitializationFailure, "Initialization failed", 0x8ABC7010)
KEST_FIXED_EXCEPTION_TEXT(NotImplemented, "Not implemented", 0x80004001)
KEST_FIXED_EXCEPTION_TEXT(DeserializationError, "Failed to deserialize", 0x8ABC7014)
KEST_FIXED_EXCEPTION_TEXT(BufferOverflow, "Buffer overflowed", 0x8ABC7017)
KEST_FIXED_EXCEPTION_TEXT(InvalidSequence, "Invalid UTF8 encoding sequence", 0x8ABC7030)
KEST_FIXED_EXCEPTION_TEXT(InvalidLocale, "Invalid locale", 0x8ABC7024)
KEST_FIXED_EXCEPTION_TEXT(UnableToConvert, "Unable to convert.", 0x8ABC7034)
KEST_FIXED_EXCEPTION_TEXT(BadGuidString, "Badly formatted Guid string.", 0x8ABC7032)

#undef KEST_FIXED_EXCEPTION_TEXT

int32_t AccessDenied::ErrorCode() const noexcept {
    return static_cast<int32_t>(0x8ABC7019u);
}

}  // namespace exception

namespace osdep {

int32_t OSException::ErrorCode() const noexcept {
    return 42;
}

PosixError::PosixError() : PosixError(errno) {}
PosixError::PosixError(int errorNumber) : OSException(std::strerror(errorNumber), errorNumber) {}
PosixError::PosixError(std::string message, int errorNumber)
    : OSException(std::move(message), errorNumber) {}

int32_t PosixError::ErrorCode() const noexcept {
    if (OSErrorNumber() == 0) {
        return 0;
    }
    return OSErrorNumber() == ENOENT ? 7 : 42;
}

const char* NotResolvedException::what() const noexcept {
    return "Not able to resolve the network name or address";
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
