#include <sys/stat.h>

#include <string>
#include <utility>
#include <vector>

#include "IniTestSupport.h"

namespace kest::test::config {

using kest::test::TempSysroot;
using std::string_literals::operator""s;  // NOLINT(misc-unused-using-decls): used by "..."s

namespace {

using KeyList = std::vector<std::pair<std::string, std::string>>;

KeyList KeysOf(const IniText* ini, const char* section) {
    KeyList keys;
    const char* key = nullptr;
    const char* value = nullptr;
    for (int i = 1; IniText_GetKeyByIndex(ini, section, i, &key, &value) == kIniFound; ++i) {
        keys.emplace_back(key, value);
    }
    return keys;
}

TEST(IniReadTest, WideByteOrderMarksAreRefusedAndTheUtf8MarkIsSkipped) {
    TempSysroot dir;
    for (const std::string& mark : {"\xFF\xFE"s, "\xFE\xFF"s, "\xFF\xFE\0\0"s, "\0\0\xFE\xFF"s}) {
        int result = 0;
        IniTextPtr ini = LoadFromBytes(dir, mark + "[s]\nk=v\n", kIniDefaultReadFlags, &result);
        EXPECT_EQ(result, kIniUnsupportedEncoding);
        EXPECT_EQ(IniText_GetSectionCount(ini.get()), 0);
    }
    IniTextPtr ini = LoadFromBytes(dir, "\xEF\xBB\xBF[s]\nk=v\n");
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"), "v");
    // A failed load leaves the document as it was.
    EXPECT_EQ(IniText_Load(ini.get(), dir.PathOf("/missing.ini").c_str()), kIniInvalidArgument);
    // Only a regular file loads: a directory or a FIFO (which would block a reader) is refused.
    EXPECT_EQ(IniText_Load(ini.get(), dir.Root().c_str()), kIniCannotOpenForReading);
    const std::string fifo = dir.PathOf("/fifo.ini");
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    EXPECT_EQ(IniText_Load(ini.get(), fifo.c_str()), kIniCannotOpenForReading);
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"), "v");
}

TEST(IniReadTest, EveryLineEndFormSeparatesLines) {
    TempSysroot dir;
    for (const std::string& end : {"\n"s, "\r"s, "\r\n"s, "\n\r"s, "\0"s}) {
        IniTextPtr ini =
            LoadFromBytes(dir, "[s]" + end + "a=1" + end + end + "b=2" + end + "[t]" + end + "c=3");
        EXPECT_EQ(KeysOf(ini.get(), "s"), (KeyList{{"a", "1"}, {"b", "2"}}));
        EXPECT_EQ(ValueOf(ini.get(), "t", "c"), "3");
    }
    // Equal end characters in a row are two line ends, so "[t]" is a line of its own.
    IniTextPtr mixed = LoadFromBytes(dir, "[s]\r\ra=1\n\n[t]\n\rb=2\r\n\r\nc=3");
    EXPECT_EQ(KeysOf(mixed.get(), "t"), (KeyList{{"b", "2"}, {"c", "3"}}));
}

TEST(IniReadTest, RepeatedSectionsAndKeysMergeIgnoringCaseAndBlanks) {
    TempSysroot dir;
    const std::string text = "[A]\nx=1\ny=2\n[ a ]\nX = 3\n[B]\nx=4\n[A]\nx=5\n";
    IniTextPtr ini = LoadFromBytes(dir, text);
    EXPECT_EQ(IniText_GetSectionCount(ini.get()), 2);
    EXPECT_EQ(KeysOf(ini.get(), " a"), (KeyList{{"x", "5"}, {"y", "2"}}));

    IniTextPtr separate(IniText_Create());
    IniText_SetNameOptions(separate.get(), false, true);
    WriteBytes(dir.PathOf("/n.ini"), text);
    ASSERT_EQ(IniText_Load(separate.get(), dir.PathOf("/n.ini").c_str()), 0);
    EXPECT_EQ(IniText_GetSectionCount(separate.get()), 4);
    EXPECT_EQ(ValueOf(separate.get(), "A", "x"), "1");
    EXPECT_EQ(ValueOf(separate.get(), "A", "X"), std::nullopt);
    ASSERT_EQ(IniText_DeleteSection(separate.get(), "A"), kIniFound);
    EXPECT_EQ(ValueOf(separate.get(), "A", "x"), "5");
}

TEST(IniReadTest, MalformedLinesEmptyValuesAndKeysBeforeTheFirstHeader) {
    const std::string text =
        "top=1\n[\n[]\n[open\n[s] trailing\nnoseparator\n=nameless\nempty=\n ; c=1\nk : v\n"
        "a:=1\n";
    TempSysroot dir;
    IniTextPtr plain = LoadFromBytes(dir, text);
    EXPECT_EQ(IniText_GetSectionCount(plain.get()), 1);
    EXPECT_EQ(KeysOf(plain.get(), "s"), (KeyList{{"a:", "1"}}));

    IniTextPtr lenient =
        LoadFromBytes(dir, text, kIniReadKeepEmptyValues | kIniReadColonsAndUnnamedSection);
    EXPECT_EQ(KeysOf(lenient.get(), nullptr), (KeyList{{"top", "1"}}));
    EXPECT_EQ(KeysOf(lenient.get(), "s"), (KeyList{{"empty", ""}, {"k", "v"}, {"a", "1"}}));
    uint32_t number = 7;
    EXPECT_EQ(IniText_GetUInt32(lenient.get(), "s", "empty", &number), kIniNotFound);
}

struct QuoteCase {
    uint32_t readFlags;
    std::string written;
    std::string stored;
    std::string savedBack;
};

class IniQuoteTest : public ::testing::TestWithParam<QuoteCase> {};

TEST_P(IniQuoteTest, EnclosingQuotesAreStrippedAndWrittenBack) {
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, "[s]\nk=" + GetParam().written + "\n",
                                   GetParam().readFlags | kIniReadKeepEmptyValues);
    EXPECT_EQ(ValueOf(ini.get(), "s", "k"), GetParam().stored);
    EXPECT_EQ(SavedText(dir, ini.get()), "[s]\nk=" + GetParam().savedBack + "\n\n");
}

INSTANTIATE_TEST_SUITE_P(Quotes, IniQuoteTest,
                         ::testing::Values(QuoteCase{0x02, " \" a b \" ", " a b ", "\" a b \""},
                                           QuoteCase{0x02, "\"\"", "", "\"\""},
                                           QuoteCase{0x02, "\"", "\"", "\""},
                                           QuoteCase{0x02, "'a'", "'a'", "'a'"},
                                           QuoteCase{0x06, "'a'", "a", "'a'"},
                                           QuoteCase{0x06, "\"a'", "\"a'", "\"a'"},
                                           QuoteCase{0x00, "\"a\"", "\"a\"", "\"a\""}));

struct JoinCase {
    std::string lines;
    KeyList keys;
    bool uniqueNames = true;
};

class IniLineJoinTest : public ::testing::TestWithParam<JoinCase> {};

// With unique names a joined run that takes the name of another key merges with it, the later
// value winning as for a repeated key line; without unique names both keys stay.
TEST_P(IniLineJoinTest, RunsOfNumberedLineKeysBecomeOneKey) {
    TempSysroot dir;
    const std::string path = dir.PathOf("/joined.ini");
    WriteBytes(path, "[s]\n" + GetParam().lines);
    IniTextPtr ini(IniText_Create());
    IniText_SetNameOptions(ini.get(), GetParam().uniqueNames, false);
    ASSERT_EQ(IniText_Load(ini.get(), path.c_str()), 0);
    EXPECT_EQ(KeysOf(ini.get(), "s"), GetParam().keys);
}

INSTANTIATE_TEST_SUITE_P(
    Runs, IniLineJoinTest,
    ::testing::Values(
        JoinCase{"x Line0001=ab\nx Line0002=cd\n", {{"x", "abcd"}}},
        JoinCase{"x Line1=a\ny Line7=b\nz=c\n", {{"x", "ab"}, {"z", "c"}}},
        JoinCase{"x Line0001=a\ny Line0001=b\nx Line0002=c\n", {{"x", "a"}, {"y", "bc"}}},
        JoinCase{"x Line0002=a\nx Line0003=b\n", {{"x Line0002", "a"}, {"x Line0003", "b"}}},
        JoinCase{"x Line=a\nxLine1=b\n", {{"x Line", "a"}, {"xLine1", "b"}}},
        JoinCase{"x Line1=a\nx Line99999999999=b\n", {{"x", "a"}, {"x Line99999999999", "b"}}},
        JoinCase{"x=first\nx Line1=second\ny=1\n", {{"x", "second"}, {"y", "1"}}},
        JoinCase{"x Line1=a\nx Line2=b\ny=1\nx=c\n", {{"x", "c"}, {"y", "1"}}},
        JoinCase{
            "x=first\nx Line1=second\ny=1\n", {{"x", "first"}, {"x", "second"}, {"y", "1"}}, false},
        JoinCase{
            "x Line1=a\nx Line2=b\ny=1\nx=c\n", {{"x", "ab"}, {"y", "1"}, {"x", "c"}}, false}));

TEST(IniReadTest, CommentsAreKeptAndWrittenOnlyWhenAskedFor) {
    const std::string text = "; head\n[s]\n\n; about k\nk=1\nbad line\n; tail\n";
    TempSysroot dir;
    IniTextPtr kept = LoadFromBytes(dir, text, kIniDefaultReadFlags | kIniReadKeepComments);
    EXPECT_EQ(SavedText(dir, kept.get(), kIniWriteComments), text);
    EXPECT_EQ(SavedText(dir, kept.get()), "[s]\nk=1\n\n");
    ASSERT_EQ(IniText_DeleteKey(kept.get(), "s", "k"), kIniFound);
    EXPECT_EQ(SavedText(dir, kept.get(), kIniWriteComments),
              "; head\n[s]\n\n; about k\nbad line\n; tail\n");
}

}  // namespace

}  // namespace kest::test::config
