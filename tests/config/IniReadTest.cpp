#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "IniTestSupport.h"

using kest::test::TempSysroot;
using std::string_literals::operator""s;

namespace {

struct EncodingCase {
    std::string bytes;
    int expected;
};

class IniByteOrderMarkTest : public ::testing::TestWithParam<EncodingCase> {};

TEST_P(IniByteOrderMarkTest, RefusesWideEncodingsAndSkipsUtf8Mark) {
    TempSysroot dir;
    int result = 1;
    IniTextPtr ini =
        LoadFromBytes(dir, GetParam().bytes + "[s]\nk=v\n", kIniDefaultReadFlags, &result);
    EXPECT_EQ(result, GetParam().expected);
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"),
              result == 0 ? std::optional<std::string>("v") : std::nullopt);
}

INSTANTIATE_TEST_SUITE_P(Marks, IniByteOrderMarkTest,
                         ::testing::Values(EncodingCase{"\xFF\xFE", kIniUnsupportedEncoding},
                                           EncodingCase{"\xFE\xFF", kIniUnsupportedEncoding},
                                           EncodingCase{"\xFF\xFE\0\0"s, kIniUnsupportedEncoding},
                                           EncodingCase{"\0\0\xFE\xFF"s, kIniUnsupportedEncoding},
                                           EncodingCase{"\xEF\xBB\xBF", 0}, EncodingCase{"", 0}));

TEST(IniLoadTest, FailedLoadLeavesDocumentAndFileUnchanged) {
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, "[s]\nk=v\n");
    std::string widePath = dir.PathOf("/wide.ini");
    WriteBytes(widePath, "\xFF\xFE[\0s\0]\0"s);
    EXPECT_EQ(IniText_Load(ini.get(), widePath.c_str()), kIniUnsupportedEncoding);
    EXPECT_EQ(IniText_Load(ini.get(), dir.PathOf("/missing.ini").c_str()), kIniInvalidArgument);
    EXPECT_EQ(IniText_Load(ini.get(), ""), kIniInvalidArgument);
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"), "v");
    EXPECT_EQ(IniText_HasFileChanged(ini.get()), 0);
}

TEST(IniLoadTest, ExistingFileThatCannotBeOpenedIsNotReportedMissing) {
    TempSysroot dir;
    // A socket exists in the file system but refuses to be opened, even for root.
    std::string socketPath = dir.PathOf("/socket.ini");
    int listener = socket(AF_UNIX, SOCK_STREAM, 0);
    ASSERT_GE(listener, 0);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    ASSERT_LT(socketPath.size(), sizeof address.sun_path);
    socketPath.copy(address.sun_path, socketPath.size());
    ASSERT_EQ(bind(listener, reinterpret_cast<sockaddr*>(&address), sizeof address), 0);
    IniTextPtr ini = NewIniText();
    EXPECT_EQ(IniText_Load(ini.get(), socketPath.c_str()), kIniCannotOpenForReading);
    EXPECT_EQ(IniText_Load(ini.get(), dir.Root().c_str()), kIniReadError);
    close(listener);
}

class IniLineEndTest : public ::testing::TestWithParam<std::string> {};

TEST_P(IniLineEndTest, EveryLineEndFormSeparatesLines) {
    const std::string& end = GetParam();
    TempSysroot dir;
    IniTextPtr ini =
        LoadFromBytes(dir, "[s]" + end + "a=1" + end + end + "b=2" + end + "[t]" + end + "c=3");
    EXPECT_EQ(ValueOf(ini.get(), "s", "a"), "1");
    EXPECT_EQ(ValueOf(ini.get(), "s", "b"), "2");
    EXPECT_EQ(ValueOf(ini.get(), "t", "c"), "3");
    EXPECT_EQ(IniText_GetKeyCount(ini.get(), "s"), 2);
}

INSTANTIATE_TEST_SUITE_P(Ends, IniLineEndTest,
                         ::testing::Values("\n", "\r", "\r\n", "\n\r", "\0"s));

TEST(IniParseTest, MixedLineEndsPairOnlyDifferentCharacters) {
    TempSysroot dir;
    // "\r\r" is two line ends: the "[t]" line stays separate from "a=1".
    IniTextPtr ini = LoadFromBytes(dir, "[s]\r\ra=1\n\n[t]\n\rb=2\r\n\r\nc=3");
    EXPECT_EQ(ValueOf(ini.get(), "s", "a"), "1");
    EXPECT_EQ(ValueOf(ini.get(), "t", "b"), "2");
    EXPECT_EQ(ValueOf(ini.get(), "t", "c"), "3");
}

TEST(IniParseTest, RepeatedSectionsAndKeysMergeIgnoringCaseAndBlanks) {
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, "[A]\nx=1\ny=2\n[ a ]\nX = 3\n[B]\nx=4\n");
    ASSERT_EQ(IniText_GetSectionCount(ini.get()), 2);
    EXPECT_EQ(IniText_GetKeyCount(ini.get(), " a"), 2);
    EXPECT_EQ(ValueOf(ini.get(), "a ", "x"), "3");
    const char* key = nullptr;
    const char* value = nullptr;
    ASSERT_EQ(IniText_GetKeyByIndex(ini.get(), "A", 1, &key, &value), kIniFound);
    EXPECT_STREQ(key, "x");
    EXPECT_EQ(IniText_GetKeyByIndex(ini.get(), "A", 3, &key, &value), kIniNotFound);
}

TEST(IniParseTest, RepeatedNamesStaySeparateWhenNotUniqueAndCaseCounts) {
    TempSysroot dir;
    IniTextPtr ini = NewIniText();
    IniText_SetNameOptions(ini.get(), false, true);
    WriteBytes(dir.PathOf("/n.ini"), "[A]\nx=1\nx=2\n[a]\nx=3\n[A]\nx=4\n");
    ASSERT_EQ(IniText_Load(ini.get(), dir.PathOf("/n.ini").c_str()), 0);
    EXPECT_EQ(IniText_GetSectionCount(ini.get()), 3);
    EXPECT_EQ(IniText_GetKeyCount(ini.get(), "A"), 2);
    EXPECT_EQ(ValueOf(ini.get(), "A", "x"), "1");
    EXPECT_EQ(ValueOf(ini.get(), "a", "x"), "3");
    EXPECT_EQ(ValueOf(ini.get(), "A", "X"), std::nullopt);
    // Deleting the first of two equal names makes the second one found.
    ASSERT_EQ(IniText_DeleteSection(ini.get(), "A"), kIniFound);
    EXPECT_EQ(ValueOf(ini.get(), "A", "x"), "4");
}

TEST(IniParseTest, MalformedLinesAndEmptyValuesFollowReadFlags) {
    const std::string text =
        "top=1\n[\n[]\n[open\n[s] trailing\nnoseparator\n=nameless\nempty=\n ; note=1\nk : v\n";
    TempSysroot dir;
    IniTextPtr plain = LoadFromBytes(dir, text);
    EXPECT_EQ(IniText_GetSectionCount(plain.get()), 1);
    EXPECT_EQ(IniText_GetKeyCount(plain.get(), "s"), 0);
    EXPECT_EQ(ValueOf(plain.get(), nullptr, "top"), std::nullopt);

    IniTextPtr lenient =
        LoadFromBytes(dir, text, kIniReadKeepEmptyValues | kIniReadColonsAndUnnamedSection);
    EXPECT_EQ(ValueOf(lenient.get(), nullptr, "top"), "1");
    EXPECT_EQ(ValueOf(lenient.get(), kIniUnnamedSection, "top"), "1");
    EXPECT_EQ(ValueOf(lenient.get(), "s", "empty"), "");
    EXPECT_EQ(ValueOf(lenient.get(), "s", "k"), "v");
    uint32_t number = 7;
    EXPECT_EQ(IniText_GetUInt32(lenient.get(), "s", "empty", &number), kIniNotFound);
    EXPECT_EQ(number, 7u);
}

TEST(IniParseTest, ColonFollowedByEqualsSignIsOneSeparator) {
    TempSysroot dir;
    IniTextPtr ini =
        LoadFromBytes(dir, "[s]\na:=1\nb=x:y\nc:d=e\n", kIniReadColonsAndUnnamedSection);
    EXPECT_EQ(ValueOf(ini.get(), "s", "a"), "1");
    EXPECT_EQ(ValueOf(ini.get(), "s", "b"), "x:y");
    EXPECT_EQ(ValueOf(ini.get(), "s", "c"), "d=e");
}

struct QuoteCase {
    uint32_t readFlags;
    std::string written;
    std::string stored;
    std::string savedBack;
};

class IniQuoteTest : public ::testing::TestWithParam<QuoteCase> {};

TEST_P(IniQuoteTest, StripsEnclosingQuotesAndWritesThemBack) {
    const QuoteCase& param = GetParam();
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, "[s]\nk=" + param.written + "\n",
                                   param.readFlags | kIniReadKeepEmptyValues);
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"), param.stored);
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, 0);
    std::string saved = dir.PathOf("/saved.ini");
    ASSERT_EQ(IniText_Save(ini.get(), saved.c_str()), 0);
    EXPECT_EQ(ReadBytes(saved), "[s]\nk=" + param.savedBack + "\n\n");
}

INSTANTIATE_TEST_SUITE_P(Quotes, IniQuoteTest,
                         ::testing::Values(QuoteCase{0x02, "\"a b\"", "a b", "\"a b\""},
                                           QuoteCase{0x02, "  \" a \"  ", " a ", "\" a \""},
                                           QuoteCase{0x02, "\"\"", "", "\"\""},
                                           QuoteCase{0x02, "\"", "\"", "\""},
                                           QuoteCase{0x02, "'a'", "'a'", "'a'"},
                                           QuoteCase{0x06, "'a'", "a", "'a'"},
                                           QuoteCase{0x06, "\"a'", "\"a'", "\"a'"},
                                           QuoteCase{0x00, "\"a\"", "\"a\"", "\"a\""}));

TEST(IniParseTest, RepeatedKeyReplacesValueAndQuoteMark) {
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, "[s]\nk=\"a\"\nk=b\n");
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, 0);
    std::string saved = dir.PathOf("/saved.ini");
    ASSERT_EQ(IniText_Save(ini.get(), saved.c_str()), 0);
    EXPECT_EQ(ReadBytes(saved), "[s]\nk=b\n\n");
}

struct JoinCase {
    std::string lines;
    std::vector<std::pair<std::string, std::string>> keys;
};

class IniLineJoinTest : public ::testing::TestWithParam<JoinCase> {};

TEST_P(IniLineJoinTest, JoinsRunsOfNumberedLineKeys) {
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, "[s]\n" + GetParam().lines);
    std::vector<std::pair<std::string, std::string>> keys;
    for (int i = 1; i <= IniText_GetKeyCount(ini.get(), "s"); ++i) {
        const char* key = nullptr;
        const char* value = nullptr;
        ASSERT_EQ(IniText_GetKeyByIndex(ini.get(), "s", i, &key, &value), kIniFound);
        keys.emplace_back(key, value);
    }
    EXPECT_EQ(keys, GetParam().keys);
    for (const auto& [name, value] : GetParam().keys) {
        EXPECT_EQ(ValueOf(ini.get(), "s", name.c_str()), value);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Runs, IniLineJoinTest,
    ::testing::Values(
        JoinCase{"x Line0001=ab\nx Line0002=cd\n", {{"x", "abcd"}}},
        JoinCase{"x Line1=a\ny Line7=b\nz=c\n", {{"x", "ab"}, {"z", "c"}}},
        JoinCase{"x Line0001=a\nx Line0001=b\n", {{"x", "b"}}},
        JoinCase{"x Line0001=a\ny Line0001=b\nx Line0002=c\n", {{"x", "a"}, {"y", "bc"}}},
        JoinCase{"x Line0002=a\nx Line0003=b\n", {{"x Line0002", "a"}, {"x Line0003", "b"}}},
        JoinCase{"x Line=a\nxLine1=b\n", {{"x Line", "a"}, {"xLine1", "b"}}},
        JoinCase{"x Line1=a\nx Line99999999999=b\n", {{"x", "a"}, {"x Line99999999999", "b"}}},
        JoinCase{"x Line0001=a\n", {{"x", "a"}}}));

TEST(IniParseTest, CommentsAreKeptOnlyWhenAskedForAndWrittenOnlyWhenAskedFor) {
    const std::string text = "; head\n[s]\n\n; about k\nk=1\nbad line\n; tail\n";
    TempSysroot dir;
    std::string saved = dir.PathOf("/saved.ini");

    IniTextPtr kept = LoadFromBytes(dir, text, kIniDefaultReadFlags | kIniReadKeepComments);
    IniText_SetWriteOptions(kept.get(), kIniNoMaxLineLength, 0, kIniWriteComments);
    ASSERT_EQ(IniText_Save(kept.get(), saved.c_str()), 0);
    EXPECT_EQ(ReadBytes(saved), text);

    IniText_SetWriteOptions(kept.get(), kIniNoMaxLineLength, 0, 0);
    ASSERT_EQ(IniText_Save(kept.get(), saved.c_str()), 0);
    EXPECT_EQ(ReadBytes(saved), "[s]\nk=1\n\n");

    // Sections read from a file get no extra blank line when comments are written: the blank
    // lines of the file travel as comments.
    IniTextPtr dropped = LoadFromBytes(dir, text);
    IniText_SetRaw(dropped.get(), "new", "n", "2", 0);
    IniText_SetWriteOptions(dropped.get(), kIniNoMaxLineLength, 0, kIniWriteComments);
    ASSERT_EQ(IniText_Save(dropped.get(), saved.c_str()), 0);
    EXPECT_EQ(ReadBytes(saved), "[s]\nk=1\n[new]\nn=2\n\n");
}

TEST(IniParseTest, DeletedKeyPassesItsCommentsOn) {
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, "[s]\n;a\nk=1\n;b\nm=2\n[t]\nn=3\n",
                                   kIniDefaultReadFlags | kIniReadKeepComments);
    ASSERT_EQ(IniText_DeleteKey(ini.get(), "s", "k"), kIniFound);
    ASSERT_EQ(IniText_DeleteKey(ini.get(), "s", "m"), kIniFound);
    EXPECT_EQ(IniText_DeleteKey(ini.get(), "s", "m"), kIniNotFound);
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, kIniWriteComments);
    std::string saved = dir.PathOf("/saved.ini");
    ASSERT_EQ(IniText_Save(ini.get(), saved.c_str()), 0);
    EXPECT_EQ(ReadBytes(saved), "[s]\n;a\n;b\n[t]\nn=3\n");
}

TEST(IniParseTest, LongLinesAreReadWhole) {
    TempSysroot dir;
    std::string value(100000, 'v');
    IniTextPtr ini = LoadFromBytes(dir, "[s]\nk=" + value);
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"), value);
}

}  // namespace
