// Test fixture that installs a capturing trace writer with a chosen mask and restores the
// silent gate (mask 0, no writer) afterwards.
#pragma once

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/TraceGate.h"

struct CapturedTraceRecord {
    std::string text;
    bool withStamp;
};

inline std::vector<CapturedTraceRecord>& CapturedTraceRecords() {
    static std::vector<CapturedTraceRecord> records;
    return records;
}

inline void CaptureTraceRecord(char, const char* text, bool withStamp) {
    CapturedTraceRecords().push_back({text, withStamp});
}

class TraceCaptureTest : public ::testing::Test {
  protected:
    void CaptureWithMask(uint32_t mask) {
        CapturedTraceRecords().clear();
        SetTraceGate(mask, &CaptureTraceRecord);
    }
    void TearDown() override {
        SetTraceGate(0, nullptr);
        CapturedTraceRecords().clear();
    }
    // The texts written so far, in order.
    std::vector<std::string> Texts() const {
        std::vector<std::string> texts;
        for (const CapturedTraceRecord& record : CapturedTraceRecords()) {
            texts.push_back(record.text);
        }
        return texts;
    }
};
