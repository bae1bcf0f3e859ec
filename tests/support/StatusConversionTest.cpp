#include <gtest/gtest.h>

#include <iterator>
#include <new>
#include <stdexcept>
#include <string>
#include <vector>

#include "TraceCapture.h"
#include "support/ConvertStatusCode.h"
#include "support/CurrentExceptionToStatus.h"
#include "support/EntryGuard.h"
#include "support/Exceptions.h"
#include "support/StatusHolder.h"

namespace kest::test::support {

namespace {

using Lines = std::vector<std::string>;
using StatusConversion = TraceCaptureTest;

TEST_F(StatusConversion, LibraryCodesMapAndOthersAreTracedAsFail) {
    CaptureWithMask(kTraceErrors);
    const int32_t codes[] = {0,       -375500, -375501, -375502, -375523,
                             -375563, -375623, 1,       -1,      -375499};
    const HRESULT statuses[] = {
        S_OK,         E_OUTOFMEMORY,    E_UNEXPECTED, E_NOTIMPL, UX_E_VALUE_INVALID,
        E_INVALIDARG, UX_E_STATUS_0420, E_FAIL,       E_FAIL,    E_FAIL};
    for (size_t i = 0; i < std::size(codes); ++i) {
        EXPECT_EQ(statuses[i], ConvertStatusCode(codes[i])) << codes[i];
    }
    EXPECT_EQ(Lines({"ConvertStatusCode passed a miscellaneous error: 1 (0x00000001)",
                     "ConvertStatusCode passed a miscellaneous error: -1 (0xFFFFFFFF)",
                     "ConvertStatusCode passed a miscellaneous error: -375499 (0xFFFA4535)"}),
              Texts());
    CaptureWithMask(0xFF & ~kTraceErrors);
    EXPECT_EQ(E_FAIL, ConvertStatusCode(7));
    EXPECT_TRUE(Texts().empty());
}

TEST(StatusHolder, StoresSuccessAndThrowsFailureAsLong) {
    StatusHolder holder;
    holder = S_FALSE;
    EXPECT_EQ(S_FALSE, holder.Get());
    try {
        holder = UX_E_PROPERTY_NOT_FOUND;
        FAIL() << "a negative status must be thrown";
    } catch (long status) {
        EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, status);
    }
}

struct ThrowRow {
    const char* name;
    void (*thrower)();
    HRESULT status;
    Lines trace;
};

HRESULT ConvertThrown(void (*thrower)()) {
    try {
        thrower();
    } catch (...) {
        return CurrentExceptionToStatus();
    }
    return S_OK;
}

TEST_F(StatusConversion, CurrentExceptionMapsEachKindWithItsTrace) {
    const Lines stdTrace = {"std::exception(-2147467259)"};
    const ThrowRow rows[] = {
        {"status", [] { throw static_cast<long>(UX_E_ITEM_NOT_FOUND); }, UX_E_ITEM_NOT_FOUND, {}},
        {"bad_alloc", [] { throw std::bad_alloc(); }, E_OUTOFMEMORY, {}},
        {"range", [] { throw std::out_of_range("x"); }, E_FAIL, {"out of range(-2147467259)"}},
        {"runtime_error", [] { throw std::runtime_error("x"); }, E_FAIL, stdTrace},
        {"dsc", [] { throw vq::dsc::exception::NotImplemented(); }, E_FAIL, stdTrace},
        {"dsc out of range", [] { throw vq::dsc::exception::OutOfRange(); }, E_FAIL, stdTrace}};
    for (const ThrowRow& row : rows) {
        CaptureWithMask(kTraceErrors);
        EXPECT_EQ(row.status, ConvertThrown(row.thrower)) << row.name;
        EXPECT_EQ(row.trace, Texts()) << row.name;
    }
    EXPECT_THROW(ConvertThrown([] { throw 42; }), int);
}

TEST_F(StatusConversion, EntryGuardConvertsEveryExceptionWithItsTrace) {
    const ThrowRow rows[] = {
        {"status",
         [] { throw static_cast<long>(UX_E_VALUE_INVALID); },
         UX_E_VALUE_INVALID,
         {"Failure(-2147220609)"}},
        {"bad_alloc", [] { throw std::bad_alloc(); }, E_OUTOFMEMORY, {"Error allocating memory"}},
        {"dsc",
         [] { throw vq::dsc::exception::NotImplemented(); },
         E_FAIL,
         {"Uncaught dsc Exception"}},
        {"standard", [] { throw std::out_of_range("x"); }, E_FAIL, {"Uncaught exception"}},
        {"foreign", [] { throw 3; }, E_FAIL, {"Uncaught exception"}}};
    for (const ThrowRow& row : rows) {
        CaptureWithMask(kTraceErrors);
        EXPECT_EQ(row.status, GuardEntryPoint("Failure",
                                              [&row]() -> HRESULT {
                                                  row.thrower();
                                                  return S_OK;
                                              }))
            << row.name;
        EXPECT_EQ(row.trace, Texts()) << row.name;
    }
    EXPECT_EQ(S_FALSE, GuardEntryPoint("x", [] { return S_FALSE; }));
    SetTraceGate(kTraceErrors, [](char, const char*, bool) { throw std::runtime_error("disk"); });
    EXPECT_EQ(E_FAIL, GuardEntryPoint("x", []() -> HRESULT { throw static_cast<long>(E_FAIL); }));
    EXPECT_EQ(E_FAIL, ConvertStatusCode(5));
}

}  // namespace

}  // namespace kest::test::support
