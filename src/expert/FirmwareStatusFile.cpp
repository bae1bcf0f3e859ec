#include "expert/FirmwareStatusFile.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>

#include "support/FileDescriptor.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

// The reading of the status file: its first non-blank character, none in an empty file, or a
// read error.
struct StatusCode {
    bool readFailed = false;
    std::optional<char> character;
};

bool IsBlank(char c) {
    return c == ' ' || c == '\t' || c == '\n' || c == '\r' || c == '\v' || c == '\f';
}

StatusCode ReadStatusCode(const std::string& statusFile) {
    // Non-blocking, so that a pipe put in the file's place cannot hold the caller.
    kest::FileDescriptor file(
        open(statusFile.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY | O_NONBLOCK));
    if (!file.IsOpen()) {
        return StatusCode{false, '0'};
    }
    char buffer[64];
    while (true) {
        const ssize_t count = read(file.Get(), buffer, sizeof buffer);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count < 0) {
            return StatusCode{true, std::nullopt};
        }
        if (count == 0) {
            return StatusCode{false, std::nullopt};
        }
        for (ssize_t i = 0; i < count; ++i) {
            if (!IsBlank(buffer[i])) {
                return StatusCode{false, buffer[i]};
            }
        }
    }
}

FirmwareProgress ProgressForCode(std::optional<char> code) {
    switch (code.value_or('\0')) {
        case '0':
            return {5, std::nullopt, S_OK};
        case '1':
            return {20, std::nullopt, S_OK};
        case '2':
            return {30, std::nullopt, S_OK};
        case '3':
            return {40, std::nullopt, S_OK};
        case '4':
            return {50, std::nullopt, S_OK};
        case '5':
            return {60, FirmwareUpdateState::kFinishing, S_OK};
        case 'a':
            return {std::nullopt, FirmwareUpdateState::kFailed, E_FAIL};
        case 'd':
        case 't':
            return {std::nullopt, FirmwareUpdateState::kFailed, UX_E_FIRMWARE_STATUS_FAILED};
        default:
            return {std::nullopt, FirmwareUpdateState::kFailed, UX_E_FIRMWARE_STATUS_UNEXPECTED};
    }
}

}  // namespace

FirmwareProgress ReadFirmwareProgress(const std::string& statusFile) {
    const StatusCode code = ReadStatusCode(statusFile);
    if (code.readFailed) {
        return {50, std::nullopt, S_OK};
    }
    return ProgressForCode(code.character);
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
