// State files of the simulated controller written from a base text and short overrides.
#pragma once

#include <regex>
#include <sstream>
#include <string>

namespace kest::test {

// `base` with each "Key = value" line of `overrides` replacing the line of that key or, for a new
// key, added at the end (so a "[Faults]" section can follow, too).
inline std::string WithOverrides(std::string base, const std::string& overrides) {
    std::istringstream lines(overrides);
    for (std::string line; std::getline(lines, line);) {
        const std::regex key("(^|\n)" + line.substr(0, line.find(' ')) + " = [^\n]*");
        base = std::regex_search(base, key) ? std::regex_replace(base, key, "$1" + line)
                                            : base + line + "\n";
    }
    return base;
}

}  // namespace kest::test
