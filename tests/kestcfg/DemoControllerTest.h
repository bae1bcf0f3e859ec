// A test fixture with a fresh demo controller made by "kestcfg sim init" in a temporary sysroot;
// KEST_SYSROOT names it for the test's lifetime, so kestcfg finds it through the environment
// unless a test passes --sysroot.
#pragma once

#include <gtest/gtest.h>

#include <string>

#include "common/TempSysroot.h"
#include "hostkit/DemoController.h"
#include "kestcfg/KestcfgRunner.h"

namespace kest::test::cfg {

class DemoControllerTest : public testing::Test {
  protected:
    static constexpr const char* kStatePath = kest::hostkit::kControllerStatePath;
    static constexpr const char* kCallLog = kest::hostkit::kControllerCallLogPath;

    void SetUp() override {
        const RunResult created = RunKestcfg({"sim", "init", sysroot_.Root()});
        ASSERT_EQ(0, created.exitCode) << created.err;
    }

    // The simulated controller's state file as it stands.
    std::string State() const { return sysroot_.ReadFile(kStatePath); }

    kest::test::TempSysroot sysroot_;
};

}  // namespace kest::test::cfg
