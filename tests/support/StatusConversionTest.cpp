#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <new>
#include <stdexcept>
#include <string>

#include "TraceCapture.h"
#include "support/ConvertStatusCode.h"
#include "support/CurrentExceptionToStatus.h"
#include "support/EntryGuard.h"
#include "support/Exceptions.h"
#include "support/StatusHolder.h"

using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

class ConvertStatusCodeTest : public TraceCaptureTest {};

TEST_F(ConvertStatusCodeTest, KnownLibraryCodesMapWithoutTrace) {
    CaptureWithMask(0xFF);
    const struct {
        int32_t library;
        HRESULT status;
    } rows[] = {
        {0, S_OK},
        {-375500, E_OUTOFMEMORY},
        {-375501, E_UNEXPECTED},
        {-375502, E_NOTIMPL},
        {-375523, UX_E_VALUE_INVALID},
        {-375563, E_INVALIDARG},
        {-375623, UX_E_STATUS_0420},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(row.status, ConvertStatusCode(row.library)) << row.library;
    }
    EXPECT_THAT(Texts(), IsEmpty());
}

TEST_F(ConvertStatusCodeTest, OtherCodesBecomeFailWithDecimalAndHexTrace) {
    CaptureWithMask(kTraceErrors);
    EXPECT_EQ(E_FAIL, ConvertStatusCode(1));
    EXPECT_EQ(E_FAIL, ConvertStatusCode(-1));
    EXPECT_EQ(E_FAIL, ConvertStatusCode(-375499));
    EXPECT_EQ(E_FAIL, ConvertStatusCode(INT32_MIN));
    EXPECT_THAT(Texts(),
                ElementsAre("ConvertStatusCode passed a miscellaneous error: 1 (0x00000001)",
                            "ConvertStatusCode passed a miscellaneous error: -1 (0xFFFFFFFF)",
                            "ConvertStatusCode passed a miscellaneous error: -375499 (0xFFFA4535)",
                            "ConvertStatusCode passed a miscellaneous error: -2147483648 "
                            "(0x80000000)"));
    EXPECT_TRUE(CapturedTraceRecords().front().withStamp);
}

TEST_F(ConvertStatusCodeTest, TraceNeedsTheErrorBit) {
    CaptureWithMask(0xFF & ~kTraceErrors);
    EXPECT_EQ(E_FAIL, ConvertStatusCode(7));
    EXPECT_THAT(Texts(), IsEmpty());
}

TEST(StatusHolder, StoresSuccessAndThrowsFailureAsLong) {
    StatusHolder holder;
    holder = S_FALSE;
    EXPECT_EQ(S_FALSE, holder.Get());
    try {
        holder = UX_E_PROPERTY_NOT_FOUND;
        FAIL() << "a negative status must be thrown";
    } catch (long status) {
        EXPECT_EQ(static_cast<long>(UX_E_PROPERTY_NOT_FOUND), status);
    }
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, holder.Get());
}

class ExceptionToStatusTest : public TraceCaptureTest {
  protected:
    template <class Thrower>
    HRESULT Convert(Thrower thrower) {
        try {
            thrower();
        } catch (...) {
            return CurrentExceptionToStatus();
        }
        ADD_FAILURE() << "nothing was thrown";
        return S_OK;
    }
};

TEST_F(ExceptionToStatusTest, MapsEachKindWithItsTrace) {
    struct Row {
        const char* name;
        void (*thrower)();
        HRESULT status;
        std::vector<std::string> trace;
    };
    const Row rows[] = {
        {"status", [] { throw static_cast<long>(UX_E_ITEM_NOT_FOUND); }, UX_E_ITEM_NOT_FOUND, {}},
        {"success status", [] { throw static_cast<long>(S_FALSE); }, S_FALSE, {}},
        {"bad_alloc", [] { throw std::bad_alloc(); }, E_OUTOFMEMORY, {}},
        {"out_of_range",
         [] { throw std::out_of_range("x"); },
         E_FAIL,
         {"out of range(-2147467259)"}},
        {"runtime_error",
         [] { throw std::runtime_error("x"); },
         E_FAIL,
         {"std::exception(-2147467259)"}},
        {"dsc exception",
         [] { throw vq::dsc::exception::NotImplemented(); },
         E_FAIL,
         {"std::exception(-2147467259)"}},
        {"dsc out of range",
         [] { throw vq::dsc::exception::OutOfRange(); },
         E_FAIL,
         {"std::exception(-2147467259)"}},
    };
    for (const Row& row : rows) {
        CaptureWithMask(kTraceErrors);
        EXPECT_EQ(row.status, Convert(row.thrower)) << row.name;
        EXPECT_EQ(row.trace, Texts()) << row.name;
    }
}

TEST_F(ExceptionToStatusTest, OtherTypesPropagate) {
    EXPECT_THROW(Convert([] { throw 42; }), int);
    EXPECT_THROW(Convert([] { throw std::string("text"); }), std::string);
}

class EntryGuardTest : public TraceCaptureTest {};

TEST_F(EntryGuardTest, ConvertsEveryExceptionWithItsTrace) {
    struct Row {
        const char* name;
        HRESULT (*body)();
        HRESULT status;
        std::vector<std::string> trace;
    };
    const Row rows[] = {
        {"success", [] { return S_FALSE; }, S_FALSE, {}},
        {"returned failure", [] { return E_POINTER; }, E_POINTER, {}},
        {"thrown status",
         []() -> HRESULT { throw static_cast<long>(UX_E_VALUE_INVALID); },
         UX_E_VALUE_INVALID,
         {"Failure to persist property changes(-2147220609)"}},
        {"bad_alloc",
         []() -> HRESULT { throw std::bad_alloc(); },
         E_OUTOFMEMORY,
         {"Error allocating memory"}},
        {"dsc exception keeps E_FAIL",
         []() -> HRESULT { throw vq::dsc::exception::NotImplemented(); },
         E_FAIL,
         {"Uncaught dsc Exception"}},
        {"posix error",
         []() -> HRESULT { throw vq::dsc::osdep::PosixError(2); },
         E_FAIL,
         {"Uncaught dsc Exception"}},
        {"standard exception",
         []() -> HRESULT { throw std::out_of_range("x"); },
         E_FAIL,
         {"Uncaught exception"}},
        {"foreign type", []() -> HRESULT { throw 3; }, E_FAIL, {"Uncaught exception"}},
    };
    for (const Row& row : rows) {
        CaptureWithMask(kTraceErrors);
        EXPECT_EQ(row.status, GuardEntryPoint("Failure to persist property changes", row.body))
            << row.name;
        EXPECT_EQ(row.trace, Texts()) << row.name;
    }
}

TEST_F(EntryGuardTest, WritesNothingWithoutTheErrorBit) {
    CaptureWithMask(kTraceEntry);
    EXPECT_EQ(E_FAIL,
              GuardEntryPoint("text", []() -> HRESULT { throw static_cast<long>(E_FAIL); }));
    EXPECT_EQ(E_OUTOFMEMORY, GuardEntryPoint("text", []() -> HRESULT { throw std::bad_alloc(); }));
    EXPECT_THAT(Texts(), IsEmpty());
}

TEST_F(EntryGuardTest, AThrowingTraceWriterDoesNotChangeTheStatus) {
    SetTraceGate(kTraceErrors, [](char, const char*, bool) { throw std::runtime_error("disk"); });
    EXPECT_EQ(UX_E_VALUE_INVALID, GuardEntryPoint("text", []() -> HRESULT {
                  throw static_cast<long>(UX_E_VALUE_INVALID);
              }));
    EXPECT_EQ(E_FAIL, ConvertStatusCode(5));
}

}  // namespace
