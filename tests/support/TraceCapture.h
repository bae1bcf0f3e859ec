// Fixture that installs a capturing trace writer and restores the silent gate (mask 0) after.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/TraceGate.h"

namespace kest::test::support {

class TraceCaptureTest : public ::testing::Test {
  protected:
    // The texts written since the last CaptureWithMask, in order.
    static std::vector<std::string>& Texts() {
        static std::vector<std::string> texts;
        return texts;
    }
    static void CaptureWithMask(uint32_t mask) {
        Texts().clear();
        SetTraceGate(mask, [](char, const char* text, bool) { Texts().push_back(text); });
    }
    void TearDown() override { SetTraceGate(0, nullptr); }
};

}  // namespace kest::test::support
