// Differential test of the INI reader against inih (default build options). Our reader runs with
// the options closest to inih's: empty values kept, ':' as a separator with keys before the first
// header in an unnamed section (inih's section ""), no quote stripping, unique and case-sensitive
// names (the last value of a name wins in both). Files of the formats' common subset read alike;
// each rule of our own reads differently.
#include <ini.h>

#include <filesystem>
#include <map>
#include <string>

#include "IniTestSupport.h"

namespace kest::test::config {

using kest::test::TempSysroot;
using std::string_literals::operator""s;  // NOLINT(misc-unused-using-decls): used by "..."s

namespace {

// Section name -> key -> value; sections without keys are left out (inih reports keys only).
using View = std::map<std::string, std::map<std::string, std::string>>;

View OurView(const std::string& path) {
    IniTextPtr ini(IniText_Create());
    IniText_SetNameOptions(ini.get(), true, true);
    IniText_SetReadOptions(ini.get(), kIniReadKeepEmptyValues | kIniReadColonsAndUnnamedSection);
    View view;
    EXPECT_EQ(IniText_Load(ini.get(), path.c_str()), 0) << path;
    const char* section = nullptr;
    for (int s = 1; IniText_GetSectionName(ini.get(), s, &section) == kIniFound; ++s) {
        const char* key = nullptr;
        const char* value = nullptr;
        for (int k = 1; IniText_GetKeyByIndex(ini.get(), section, k, &key, &value) == kIniFound;
             ++k) {
            view[std::string(section) == kIniUnnamedSection ? "" : section][key] = value;
        }
    }
    return view;
}

int CollectInih(void* user, const char* section, const char* name, const char* value) {
    (*static_cast<View*>(user))[section][name] = value;
    return 1;
}

View InihView(const std::string& path) {
    View view;
    EXPECT_GE(ini_parse(path.c_str(), &CollectInih, &view), 0) << path;
    return view;
}

// Whether both readers read `text` alike; a failure names the text.
bool ReadAlike(const TempSysroot& dir, const std::string& text) {
    const std::string path = dir.PathOf("/compared.ini");
    WriteBytes(path, text);
    return OurView(path) == InihView(path);
}

// Every file made of two of these lines, with LF or CR LF line ends, is in the common subset.
const char* const kCommonLines[] = {"[s]",        "[T.x-1 y]", "k=v",         "key = a  value ",
                                    "k : v",      "K=other",   "e=",          "; k=c",
                                    "",           " \t ",      "q=\"a\" 'b'", "u=\xC3\xA9\x80",
                                    "k2\t=\tw;x", "[s]x",      "noseparator", "n=1=2:3"};

TEST(IniInihDifferentialTest, GeneratedCommonFilesReadAlike) {
    TempSysroot dir;
    for (const char* lineEnd : {"\n", "\r\n"}) {
        for (const char* first : kCommonLines) {
            for (const char* second : kCommonLines) {
                const std::string text = "\xEF\xBB\xBF"s.substr(0, *first == 'k' ? 3 : 0) + first +
                                         lineEnd + second + lineEnd + "k=v";
                EXPECT_TRUE(ReadAlike(dir, text)) << ::testing::PrintToString(text);
            }
        }
    }
}

// The shipped data and the load fuzzer's seed corpus without its two leading option bytes.
TEST(IniInihDifferentialTest, RepositoryFilesReadAlike) {
    TempSysroot dir;
    const std::filesystem::path source(KEST_SOURCE_DIR);
    EXPECT_TRUE(ReadAlike(dir, ReadBytes(source / "data/timezone.ini")));
    for (const char* name : {"duplicates", "integer-bounds", "sections-and-keys",
                             "key-named-like-utf16le-mark", "key-named-like-utf8-mark"}) {
        EXPECT_TRUE(
            ReadAlike(dir, ReadBytes(source / "fuzz/corpus/IniLoadFuzzer" / name).substr(2)))
            << name;
    }
}

// Each rule of our format that inih does not share changes the reading of a file using it.
TEST(IniInihDifferentialTest, EachRuleOfOurOwnReadsDifferently) {
    const std::pair<const char*, std::string> kRules[] = {
        {"NUL ends a line", "[s]\nk=v\0j=w\n"s},
        {"lone CR ends a line", "[s]\rk=v\r"},
        {"LF CR is one line end", "[s]\nk=a\n\rj=b"},
        {"'#' starts no comment", "[s]\n#k=v\n"},
        {"indented lines continue no value", "[s]\nk=a\n  more\n"},
        {"';' after blanks starts no comment", "[s]\nk=a ;c\n"},
        {"empty section name keeps the section", "[s]\n[ ]\nk=v\n"},
        {"section names are trimmed", "[ s ]\nk=v\n"},
        {"section names are not cut", "[" + std::string(60, 's') + "]\nk=v\n"},
        {"the unnamed section's name", "k=1\n[(null)]\nk=2\n"},
        {"empty key names are ignored", "[s]\n=v\n"},
        {"':=' is one separator", "[s]\nk:=v\n"},
        {"numbered Line keys join", "[s]\nx Line1=a\nx Line2=b\n"},
        {"lines are not cut", "[s]\nk=" + std::string(200, 'v') + "\n"},
    };
    TempSysroot dir;
    for (const auto& [rule, text] : kRules) {
        EXPECT_FALSE(ReadAlike(dir, text)) << rule;
    }
}

}  // namespace

}  // namespace kest::test::config
