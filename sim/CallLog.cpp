#include "CallLog.h"

#include <cinttypes>
#include <cstdio>

namespace kest::sim {

CallArguments& CallArguments::Text(const std::string& text) {
    fields_ += '\t';
    fields_ += EscapeLogText(text);
    return *this;
}

CallArguments& CallArguments::Unsigned(uint32_t value) {
    fields_ += '\t';
    fields_ += std::to_string(value);
    return *this;
}

CallArguments& CallArguments::Flag(bool value) {
    fields_ += value ? "\t1" : "\t0";
    return *this;
}

CallArguments& CallArguments::Address(const vq::dsc::osdep::IPAddress& address) {
    fields_ += '\t';
    fields_ += address.ToString();
    return *this;
}

std::string EscapeLogText(const std::string& text) {
    std::string out;
    for (const char c : text) {
        switch (c) {
            case '\t':
                out += "\\t";
                break;
            case '\n':
                out += "\\n";
                break;
            case '\\':
                out += "\\\\";
                break;
            default:
                out += c;
                break;
        }
    }
    return out;
}

std::string FormatMonotonicMs(const timespec& monotonic) {
    const int64_t microseconds =
        static_cast<int64_t>(monotonic.tv_sec) * 1000000 + monotonic.tv_nsec / 1000;
    char buffer[32];
    std::snprintf(buffer, sizeof buffer, "%" PRId64 ".%03" PRId64, microseconds / 1000,
                  microseconds % 1000);
    return buffer;
}

std::string CallLogLine(const timespec& monotonic, const char* callName, int32_t status,
                        const CallArguments& arguments) {
    return FormatMonotonicMs(monotonic) + '\t' + callName + '\t' + std::to_string(status) +
           arguments.Fields() + '\n';
}

}  // namespace kest::sim
