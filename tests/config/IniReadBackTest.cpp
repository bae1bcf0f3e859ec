// Values and documents that fuzzing found not to read back as they were written; each case is
// saved and loaded again.
#include <ostream>
#include <string>
#include <utility>

#include "IniTestSupport.h"

namespace kest::test::config {

using kest::test::TempSysroot;

namespace {

struct SplitCase {
    const char* name;
    const char* value;  // stored raw, without quote marks
    int maxLineLength;
    char splitCharacter;
};

// Test names show the case's name rather than its bytes.
void PrintTo(const SplitCase& c, std::ostream* out) {
    *out << c.name;
}

class IniReadBackTest : public ::testing::TestWithParam<SplitCase> {
  protected:
    TempSysroot dir_;
};

// An unquoted value whose pieces would start with the quote mark that ends it: the last piece
// must not come out enclosed in quotes, or loading strips them.
TEST_P(IniReadBackTest, SplitValueReadsBackUnchanged) {
    const SplitCase& c = GetParam();
    IniTextPtr ini(IniText_Create());
    ASSERT_EQ(IniText_SetRaw(ini.get(), "S", "Raw", c.value, 0), kIniFound);
    const std::string saved = SavedText(dir_, ini.get(), 0, c.maxLineLength, c.splitCharacter);
    ASSERT_NE(saved.find("Raw Line0002="), std::string::npos) << "the value is split";
    IniTextPtr loaded = LoadFromBytes(dir_, saved);
    EXPECT_EQ(ValueOf(loaded.get(), "S", "Raw"), c.value) << saved;
}

INSTANTIATE_TEST_SUITE_P(
    QuotesAtPieceEnds, IniReadBackTest,
    ::testing::Values(SplitCase{"ShortPieces", "cccacca\"a\"\"b\"\"a\"a\"\"cbc\"b\"\"b\"a\"\"\"",
                                17, 0}),
    [](const ::testing::TestParamInfo<SplitCase>& param) { return std::string(param.param.name); });

}  // namespace

// Keys whose own names read as pieces of a split value (" Line" and a number) come back under
// their own names, whether they follow a split value or fit on one line, with or without a
// maximum line length.
TEST(IniReadBackPiecesTest, KeysNamedLikePiecesStayKeys) {
    TempSysroot dir;
    const std::string longValue(60, 'v');
    const std::pair<const char*, std::string> keys[] = {
        {"a", longValue},          {"b Line2", "other key"},  {"c", longValue},
        {"d", longValue},          {"d Line0009", "literal"}, {"e Line0001", "short"},
        {"e Line0001 Line7", "x"}, {"f Line1", longValue},
    };
    for (int maxLineLength : {kIniNoMaxLineLength, 40}) {
        IniTextPtr ini(IniText_Create());
        for (const auto& key : keys) {
            ASSERT_EQ(IniText_SetRaw(ini.get(), "S", key.first, key.second.c_str(), 0), kIniFound);
        }
        const std::string saved = SavedText(dir, ini.get(), 0, maxLineLength);
        EXPECT_NE(saved.find("\ne Line0001 Line0001=short\n"), std::string::npos) << saved;
        IniTextPtr loaded = LoadFromBytes(dir, saved);
        ASSERT_EQ(IniText_GetKeyCount(loaded.get(), "S"), 8) << saved;
        for (int k = 1; k <= 8; ++k) {
            const char* name = nullptr;
            const char* value = nullptr;
            ASSERT_EQ(IniText_GetKeyByIndex(loaded.get(), "S", k, &name, &value), kIniFound);
            EXPECT_STREQ(name, keys[k - 1].first) << saved;
            EXPECT_EQ(value, keys[k - 1].second) << saved;
        }
    }
}

// The setters' promise under the cache's read flags: every value and quote mark they accept
// reads back as given, whatever the line length; what they refuse (-22) would not have.
TEST(IniReadBackPromiseTest, AcceptedValuesReadBackAndRefusedOnesWouldNot) {
    TempSysroot dir;
    constexpr uint32_t kCacheReadFlags = kIniReadKeepEmptyValues | kIniReadStripDoubleQuotes;
    const std::string values[] = {
        "",     "plain", "\"enclosed\"", "'apostrophes'", "\"",
        "\"\"", "''",    "a\"b",         "\"a",           "a\"",
        "'a",   "x=y;z", "\"a\" \"b\"",  "\" padded \"",  "\"" + std::string(50, 'l') + "\""};
    for (char quote : {'\0', '"', '\'', '`'}) {
        for (const std::string& value : values) {
            for (int maxLineLength : {kIniNoMaxLineLength, 30}) {
                IniTextPtr ini(IniText_Create());
                const int set = IniText_SetRaw(ini.get(), "S", "k", value.c_str(), quote);
                std::string saved;
                if (set == kIniFound) {
                    saved = SavedText(dir, ini.get(), kIniWriteSpacedSeparator, maxLineLength);
                } else {
                    EXPECT_EQ(set, kIniInvalidArgument);
                    // What the line would have been.
                    saved = "[S]\nk = " + (quote != 0 ? quote + value + quote : value) + "\n";
                }
                IniTextPtr loaded = LoadFromBytes(dir, saved, kCacheReadFlags);
                EXPECT_EQ(ValueOf(loaded.get(), "S", "k") == value, set == kIniFound)
                    << "quote " << int(quote) << ": " << saved;
            }
        }
    }
}

}  // namespace kest::test::config
