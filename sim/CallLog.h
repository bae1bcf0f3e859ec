// Lines of the call log: "MONOTONIC_MS<TAB>CallName<TAB>STATUS" followed by one "<TAB>ARG" per
// input argument. Texts are escaped (tab, newline, backslash), integers decimal, flags 0 or 1,
// addresses dotted text (empty when unset).
#pragma once

#include <cstdint>
#include <ctime>
#include <string>

#include "vq/dsc/IPAddress.h"

namespace kest::sim {

// The input arguments of one call, formatted for its log line.
class CallArguments {
  public:
    CallArguments& Text(const std::string& text);
    CallArguments& Unsigned(uint32_t value);
    CallArguments& Flag(bool value);
    CallArguments& Address(const vq::dsc::osdep::IPAddress& address);

    // Each argument preceded by a tab.
    const std::string& Fields() const { return fields_; }

  private:
    std::string fields_;
};

// Text with tab, newline and backslash written as "\t", "\n" and "\\".
std::string EscapeLogText(const std::string& text);

// Milliseconds of `monotonic` with three decimals, for example "1234.567".
std::string FormatMonotonicMs(const timespec& monotonic);

// One complete log line, ending in a newline.
std::string CallLogLine(const timespec& monotonic, const char* callName, int32_t status,
                        const CallArguments& arguments);

}  // namespace kest::sim
