#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>

#include "support/Exceptions.h"

namespace kest::test::support {

using namespace vq::dsc;

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

}  // namespace kest::test::support
