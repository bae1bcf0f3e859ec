// Values and documents that fuzzing found not to read back as they were written; each case is
// saved and loaded again under the default read options.
#include <string>

#include "IniTestSupport.h"

using kest::test::TempSysroot;

namespace {

struct SplitCase {
    const char* name;
    const char* value;  // stored raw, without quote marks
    int maxLineLength;
    char splitCharacter;
};

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
    ::testing::Values(SplitCase{"QuoteRunsNearTheEnd",
                                "AAOOeLLA\"\"\"NA\"\"\"\"\"\"\"\"\"?\"\"N\"-\"j\"\"", 33, '\\'},
                      SplitCase{"ShortPieces", "cccacca\"a\"\"b\"\"a\"a\"\"cbc\"b\"\"b\"a\"\"\"",
                                17, 0}),
    [](const ::testing::TestParamInfo<SplitCase>& param) { return std::string(param.param.name); });

}  // namespace
