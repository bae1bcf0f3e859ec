// A temporary sysroot for the simulated controller library, with helpers for its state file and
// call log.
#pragma once

#include <gtest/gtest.h>

#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include "common/TempSysroot.h"
#include "vq/targetcfg/TargetConfig.h"

namespace kest::test::sim {

using vq::targetcfg::IPAddress;
using vq::targetcfg::NarrowString;

constexpr char kStatePath[] = "/var/lib/vqtargetcfg/state.ini";
constexpr char kCallLogPath[] = "/var/lib/vqtargetcfg/calls.log";

inline IPAddress Address(const std::string& text) {
    IPAddress address;
    address.Parse(text);
    return address;
}

// A temporary sysroot with the simulated controller's files.
class SimSysroot {
  public:
    void WriteState(const std::string& text) const { sysroot_.WriteFile(kStatePath, text); }
    std::string State() const { return sysroot_.ReadFile(kStatePath); }

    // The call-log lines with their leading "MS.mmm<TAB>" removed; each line's stamp is checked.
    std::vector<std::string> CallLog() const {
        static const std::regex stamp("^[0-9]+\\.[0-9]{3}\t");
        std::vector<std::string> lines;
        std::istringstream log(sysroot_.ReadFile(kCallLogPath));
        for (std::string line; std::getline(log, line);) {
            std::smatch match;
            EXPECT_TRUE(std::regex_search(line, match, stamp)) << line;
            lines.push_back(match.suffix());
        }
        return lines;
    }

    kest::test::TempSysroot sysroot_;
};

class SimTest : public ::testing::Test, public SimSysroot {};

}  // namespace kest::test::sim
