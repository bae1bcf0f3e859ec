#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <iterator>
#include <new>
#include <stdexcept>
#include <string>
#include <vector>

#include "support/ConvertStatusCode.h"
#include "support/CurrentExceptionToStatus.h"
#include "support/EntryGuard.h"
#include "support/Exceptions.h"
#include "support/TraceGate.h"

namespace kest::test::support {

namespace {

using Lines = std::vector<std::string>;
namespace exception = vq::dsc::exception;
namespace osdep = vq::dsc::osdep;

// Captures the trace texts; the silent gate (mask 0) comes back after each test.
class StatusConversion : public ::testing::Test {
  protected:
    // The texts written since the last CaptureWithMask, in order.
    static Lines& Texts() {
        static Lines texts;
        return texts;
    }
    static void CaptureWithMask(uint32_t mask) {
        Texts().clear();
        SetTraceGate(mask, [](char, const char* text, bool) { Texts().push_back(text); });
    }
    void TearDown() override { SetTraceGate(0, nullptr); }
};

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

HRESULT ConvertThrown(void (*thrower)()) {
    try {
        thrower();
    } catch (...) {
        return CurrentExceptionToStatus();
    }
    return S_OK;
}

// Each kind of exception as the current-exception conversion and the entry guard see it.
TEST_F(StatusConversion, EveryKindOfExceptionWithItsTrace) {
    const Lines standard = {"std::exception(-2147467259)"}, uncaught = {"Uncaught exception"};
    const struct {
        void (*thrower)();
        HRESULT status;
        Lines trace, guardTrace;
    } rows[] = {
        {[] { throw long{UX_E_VALUE_INVALID}; }, UX_E_VALUE_INVALID, {}, {"Failure(-2147220609)"}},
        {[] { throw std::bad_alloc(); }, E_OUTOFMEMORY, {}, {"Error allocating memory"}},
        {[] { throw std::out_of_range("x"); }, E_FAIL, {"out of range(-2147467259)"}, uncaught},
        {[] { throw std::runtime_error("x"); }, E_FAIL, standard, uncaught},
        {[] { throw exception::NotImplemented(); }, E_FAIL, standard, {"Uncaught dsc Exception"}},
        {[] { throw exception::OutOfRange(); }, E_FAIL, standard, {"Uncaught dsc Exception"}}};
    for (size_t i = 0; i < std::size(rows); ++i) {
        CaptureWithMask(kTraceErrors);
        EXPECT_EQ(rows[i].status, ConvertThrown(rows[i].thrower)) << i;
        EXPECT_EQ(rows[i].trace, Texts()) << i;
        CaptureWithMask(kTraceErrors);
        const auto entry = [&rows, i]() -> HRESULT {
            rows[i].thrower();
            return S_OK;
        };
        EXPECT_EQ(rows[i].status, GuardEntryPoint("Failure", entry)) << i;
        EXPECT_EQ(rows[i].guardTrace, Texts()) << i;
    }
    EXPECT_THROW(ConvertThrown([] { throw 42; }), int);
    CaptureWithMask(kTraceErrors);
    EXPECT_EQ(E_FAIL, GuardEntryPoint("Failure", []() -> HRESULT { throw 3; }));
    EXPECT_EQ(uncaught, Texts());
    EXPECT_EQ(S_FALSE, GuardEntryPoint("x", [] { return S_FALSE; }));
    SetTraceGate(kTraceErrors, [](char, const char*, bool) { throw std::runtime_error("disk"); });
    EXPECT_EQ(E_FAIL, GuardEntryPoint("x", []() -> HRESULT { throw static_cast<long>(E_FAIL); }));
    EXPECT_EQ(E_FAIL, ConvertStatusCode(5));
}

TEST(Exceptions, FixedTextsAndCodes) {
    struct Row {
        const exception::Exception& e;
        const char* text;
        uint32_t code;
    };
    const Row rows[] = {
        {exception::Exception(), "unspecified exception", 0xFFFFFFFFu},
        {exception::OutOfRange(), "Out of range", 0x8ABC7007u},
        {exception::OutOfRange2("String offset out of range"),
         "Out of range: String offset out of range", 0x8ABC7007u},
        {exception::InvalidArgument2("x"), "Invalid argument(s): x", 0x8ABC700Fu},
        {exception::InvalidOperation(), "Invalid operation", 0x8ABC700Eu},
        {exception::Timeout(), "Operation timed out", 0x8ABC7003u},
        {exception::NotImplemented(), "Not implemented", 0x80004001u},
        {exception::UnableToConvert(), "Unable to convert.", 0x8ABC7034u},
        {exception::AccessDenied("Access denied: /x"), "Access denied: /x", 0x8ABC7019u},
        {osdep::NotResolvedException(), "Not able to resolve the network name or address",
         0xFFFFFFFFu},
    };
    for (const Row& row : rows) {
        EXPECT_STREQ(row.text, row.e.what());
        EXPECT_EQ(row.code, static_cast<uint32_t>(row.e.ErrorCode())) << row.text;
    }
}

TEST(Exceptions, PosixErrorCodesFollowTheErrorNumber) {
    const osdep::PosixError missing(ENOENT);
    EXPECT_EQ(7, missing.ErrorCode());
    EXPECT_EQ(2, missing.OSErrorNumber());
    EXPECT_STREQ(std::strerror(ENOENT), missing.what());
    EXPECT_EQ(0, osdep::PosixError(0).ErrorCode());
    EXPECT_EQ(42, osdep::PosixError(EACCES).ErrorCode());
    const osdep::PosixError custom("custom text", ENOTDIR);
    EXPECT_STREQ("custom text", custom.what());
    EXPECT_EQ(ENOTDIR, custom.OSErrorNumber());
    errno = EPERM;
    EXPECT_EQ(EPERM, osdep::PosixError().OSErrorNumber());
    EXPECT_THROW(throw exception::OutOfRange2("cut"), exception::OutOfRange);
}

}  // namespace

}  // namespace kest::test::support
