// Differential test of the INI reader against inih (with its default build options) on the
// common subset of the two formats: sections, keys, values, comments and line ends. Each file is
// read by both, and the sections with their keys and values must agree. Where our format has a
// rule of its own, the table below names it; a file that uses such a construct is first brought
// into the common subset by that rule's normalisation, and then both readers must agree on it.
// A difference that no rule explains fails the test.
//
// Our reader runs with the options closest to inih's defaults: empty values kept, ':' as a
// separator with keys before the first header in an unnamed section (inih's section ""), no
// quote stripping, unique and case-sensitive names (inih reports every line; the last value of
// a name wins in both).
#include <ini.h>

#include <algorithm>
#include <cctype>
#include <filesystem>
#include <map>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "IniTestSupport.h"
#include "config/IniReader.h"

namespace kest::test::config {

using kest::test::TempSysroot;

namespace {

// Section name -> key -> value; sections without keys are left out (inih reports keys only).
using View = std::map<std::string, std::map<std::string, std::string>>;

constexpr uint32_t kReadFlags = kIniReadKeepEmptyValues | kIniReadColonsAndUnnamedSection;
// inih reads lines of at most 198 characters (its buffer holds 200 bytes with CR LF or LF and the
// terminating zero) and keeps at most 49 bytes of a section name.
constexpr size_t kInihMaxLine = 198;
constexpr size_t kInihMaxSectionName = 49;

View OurView(const std::string& path) {
    IniTextPtr ini(IniText_Create());
    IniText_SetNameOptions(ini.get(), true, true);
    IniText_SetReadOptions(ini.get(), kReadFlags);
    View view;
    if (IniText_Load(ini.get(), path.c_str()) != 0) {
        view["<load failed>"];
        return view;
    }
    const char* section = nullptr;
    for (int s = 1; IniText_GetSectionName(ini.get(), s, &section) == kIniFound; ++s) {
        const char* key = nullptr;
        const char* value = nullptr;
        for (int k = 1; IniText_GetKeyByIndex(ini.get(), section, k, &key, &value) == kIniFound;
             ++k) {
            const std::string name = std::string(section) == kIniUnnamedSection ? "" : section;
            view[name][key] = value;
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

bool IsSpace(char c) {
    return std::isspace(static_cast<unsigned char>(c)) != 0;
}

std::string Trim(const std::string& text) {
    size_t begin = 0;
    size_t end = text.size();
    while (begin < end && IsSpace(text[begin])) {
        ++begin;
    }
    while (end > begin && IsSpace(text[end - 1])) {
        --end;
    }
    return text.substr(begin, end - begin);
}

// The known differences: each rule of our format that inih does not share, with the
// normalisation that takes a file into the common subset. `skip` rules cannot be normalised:
// a file using them is not compared.
enum Rule {
    kWideByteOrderMark,       // a UTF-16 or UTF-32 byte-order mark: our reader refuses the file
    kZeroEndsLine,            // NUL ends a line for us; inih drops the rest of that line
    kCarriageReturnEndsLine,  // a lone CR, and LF CR, end a line for us; inih ends lines at LF
    kLongLine,                // inih splits lines longer than 198 characters (skip)
    kHashComment,             // '#' starts a comment line in inih only
    kIndentedContinuation,    // inih continues the previous value on an indented line
    kInlineComment,           // inih ends a line at ';' after whitespace
    kEmptySectionName,        // "[]" or "[ ]": we keep the previous section, inih starts a new one
    kSpacesInSectionHeader,   // we trim the name between the brackets, inih keeps the spaces
    kLongSectionName,         // inih keeps 49 bytes of a section name
    kUnnamedSectionName,      // a section literally named "(null)" is our unnamed section's name
    kEmptyKeyName,            // "=value": we ignore the line, inih reports a key ""
    kColonEquals,             // ":=" is one separator for us; inih's value starts with "="
    kLineKeys,                // we join keys named "x Line1", "x Line2", ... into "x"
    kRuleCount
};

const char* const kRuleNames[kRuleCount] = {
    "wide byte-order mark", "zero ends a line",     "CR ends a line",
    "long line (skipped)",  "'#' comment",          "indented continuation",
    "inline comment",       "empty section name",   "spaces in section header",
    "long section name",    "section named (null)", "empty key name",
    "':=' separator",       "numbered Line keys"};

struct Normalised {
    std::string text;
    std::set<Rule> rules;
    bool skip = false;
};

// Splits `text` into lines as our reader does and records the line-end rules it meets.
std::vector<std::string> SplitLines(const std::string& text, std::set<Rule>& rules) {
    std::vector<std::string> lines;
    size_t position = 0;
    while (position < text.size()) {
        size_t end = text.find_first_of(std::string("\n\r\0", 3), position);
        if (end == std::string::npos) {
            end = text.size();
        }
        lines.push_back(text.substr(position, end - position));
        if (end == text.size()) {
            break;
        }
        if (text[end] == '\0') {
            rules.insert(kZeroEndsLine);
        }
        position = end + 1;
        const bool pair = end + 1 < text.size() && text[end] != '\0' &&
                          (text[end + 1] == '\n' || text[end + 1] == '\r') &&
                          text[end + 1] != text[end];
        if (pair) {
            ++position;
        }
        const bool crlf = pair && text[end] == '\r';
        if (text[end] == '\r' && !crlf) {
            rules.insert(kCarriageReturnEndsLine);
        }
        if (pair && text[end] == '\n') {
            rules.insert(kCarriageReturnEndsLine);
        }
    }
    return lines;
}

// Where a line's name part ends: the first '=' or ':'.
size_t SeparatorOf(const std::string& line) {
    return line.find_first_of("=:");
}

bool EndsWithLineNumber(const std::string& name) {
    size_t digits = name.size();
    while (digits > 0 && std::isdigit(static_cast<unsigned char>(name[digits - 1]))) {
        --digits;
    }
    return digits < name.size() && digits >= 5 && name.compare(digits - 5, 5, " Line") == 0;
}

// One line in the common subset, or nothing when the line goes away; `afterKey` tells whether
// inih would continue a value on an indented line here.
bool NormaliseLine(std::string& line, bool& afterKey, std::set<Rule>& rules) {
    const bool indented = !line.empty() && IsSpace(line[0]);
    std::string text =
        line.substr(std::find_if_not(line.begin(), line.end(), IsSpace) - line.begin());
    if (text.empty() || text[0] == ';') {
        line = text;
        return true;
    }
    if (text[0] == '#') {
        rules.insert(kHashComment);
        line = ";" + text.substr(1);
        return true;
    }
    if (indented && afterKey) {
        rules.insert(kIndentedContinuation);
    }
    for (size_t i = 1; i < text.size(); ++i) {
        if (text[i] == ';' && IsSpace(text[i - 1])) {
            rules.insert(kInlineComment);
            text.erase(i - 1);
            break;
        }
    }
    if (text[0] == '[') {
        const size_t close = text.find(']');
        if (close != std::string::npos) {
            const std::string inside = text.substr(1, close - 1);
            std::string name = Trim(inside);
            if (name.empty()) {
                rules.insert(kEmptySectionName);
                return false;
            }
            if (name != inside) {
                rules.insert(kSpacesInSectionHeader);
            }
            if (name.size() > kInihMaxSectionName) {
                rules.insert(kLongSectionName);
                name = Trim(name.substr(0, kInihMaxSectionName));
            }
            if (name == kIniUnnamedSection) {
                rules.insert(kUnnamedSectionName);
                name += "_";
            }
            text = "[" + name + "]" + text.substr(close + 1);
            afterKey = false;
        }
        line = text;
        return true;
    }
    const size_t separator = SeparatorOf(text);
    if (separator != std::string::npos) {
        std::string name = Trim(text.substr(0, separator));
        std::string rest = text.substr(separator);
        if (name.empty()) {
            rules.insert(kEmptyKeyName);
            return false;
        }
        if (rest.compare(0, 2, ":=") == 0) {
            rules.insert(kColonEquals);
            rest.erase(0, 1);
        }
        if (EndsWithLineNumber(name)) {
            rules.insert(kLineKeys);
            name += "_";
        }
        text = name + rest;
        afterKey = true;
    }
    line = text;
    return true;
}

Normalised Normalise(const std::string& raw) {
    Normalised result;
    std::string text = raw;
    const int start = kest::ini::TextStart(text);
    if (start < 0) {
        result.rules.insert(kWideByteOrderMark);
        result.skip = true;
        return result;
    }
    // Both readers skip a UTF-8 mark; it stays, so that text after it that looks like a wide
    // mark is not taken for one.
    result.text = text.substr(0, static_cast<size_t>(start));
    text.erase(0, static_cast<size_t>(start));
    bool afterKey = false;
    for (std::string& line : SplitLines(text, result.rules)) {
        if (!NormaliseLine(line, afterKey, result.rules)) {
            continue;
        }
        if (line.size() > kInihMaxLine) {
            result.rules.insert(kLongLine);
            result.skip = true;
        }
        result.text += line + "\n";
    }
    return result;
}

// Compares one file; returns the rules it used, and records a failure for an unexplained
// difference.
class Comparison {
  public:
    explicit Comparison(const TempSysroot& dir) : dir_(dir) {}

    void Compare(const std::string& label, const std::string& raw) {
        const std::string rawPath = dir_.PathOf("/raw.ini");
        WriteBytes(rawPath, raw);
        const bool rawSame = OurView(rawPath) == InihView(rawPath);
        const Normalised normalised = Normalise(raw);
        if (!normalised.skip) {
            const std::string path = dir_.PathOf("/normalised.ini");
            WriteBytes(path, normalised.text);
            const View ours = OurView(path);
            const View theirs = InihView(path);
            ++compared;
            EXPECT_EQ(ours, theirs) << label << ": unexplained difference in\n"
                                    << ::testing::PrintToString(normalised.text);
            if (!rawSame && normalised.rules.empty()) {
                ADD_FAILURE() << label << ": differs although no rule applies";
            }
        }
        for (Rule rule : normalised.rules) {
            explained[rule] += rawSame ? 0 : 1;
        }
    }

    int compared = 0;
    std::map<Rule, int> explained;  // files using the rule whose raw readings differed

  private:
    const TempSysroot& dir_;
};

// Random files made of the constructs of both formats.
class FileGenerator {
  public:
    explicit FileGenerator(uint32_t seed) : random_(seed) {}

    std::string Next() {
        std::string text = Pick(12) == 0 ? "\xEF\xBB\xBF" : "";
        const char* lineEnd = Pick(4) == 0 ? "\r\n" : "\n";
        for (int lines = Number(0, 14); lines > 0; --lines) {
            text += Line();
            text += Pick(100) == 0 ? (Pick(2) == 0 ? "\r" : "\n\r") : lineEnd;
        }
        if (Pick(50) == 0) {
            text.insert(static_cast<size_t>(Number(0, static_cast<int>(text.size()))), 1, '\0');
        }
        if (Pick(100) == 0) {
            text = "\xFF\xFE" + text;
        }
        return text;
    }

  private:
    // Mostly lines of the common subset; now and then one that a rule of the table covers.
    std::string Line() {
        const int kind = Pick(100);
        if (kind < 14) {
            const bool padded = Pick(10) == 0;
            return (padded ? Blanks() : "") + "[" + (padded ? Blanks() : "") +
                   Name(Pick(25) == 0 ? 60 : 8) + (padded ? Blanks() : "") + "]" +
                   (Pick(10) == 0 ? " ; note" : "");
        }
        if (kind < 24) {
            return Blanks() + (Pick(4) == 0 ? "# " : "; ") + Name(10) + " = x";
        }
        if (kind < 30) {
            return Pick(2) == 0 ? "" : Blanks();
        }
        switch (kind) {
            case 30:
                return Pick(2) == 0 ? "[]" : "[ \t]";
            case 31:
                return Name(6) + " Line" + std::to_string(Number(1, 3)) + " = " + Value();
            case 32:
                return "[" + std::string(kIniUnnamedSection) + "]";
            case 33:
                return (Pick(2) == 0 ? "=" : " : ") + Value();
            case 34:
                return Name(6) + ":=" + Value();
            case 35:
            case 36:
                return Name(8);
            case 37:
                return "[" + Name(6);
            case 38:
                return Blanks() + " " + Name(8) + " = " + Value();
            default:
                return Name(8) + Blanks() + (Pick(3) == 0 ? ":" : "=") + Blanks() + Value() +
                       (Pick(20) == 0 ? std::string(" ;") + Name(4) : "") + Blanks();
        }
    }

    std::string Blanks() {
        static const char* const kBlanks[] = {"", "", "", " ", "\t", "  \v", "\f "};
        return kBlanks[Pick(7)];
    }
    std::string Name(int maxLength) {
        static const char kCharacters[] = "abcXYZ019_.- [;\"'\x80\xE9";
        std::string name(1, "kKsS"[Pick(4)]);
        for (int i = Number(0, maxLength); i > 0; --i) {
            name += kCharacters[Pick(sizeof(kCharacters) - 1)];
        }
        return name;
    }
    std::string Value() {
        static const char kCharacters[] = "abc 0123=:;#\"'[]\\\t\x01\xFF";
        std::string value;
        for (int i = Number(0, Pick(30) == 0 ? 230 : 12); i > 0; --i) {
            value += kCharacters[Pick(sizeof(kCharacters) - 1)];
        }
        return value;
    }
    int Number(int low, int high) { return std::uniform_int_distribution<int>(low, high)(random_); }
    int Pick(int count) { return Number(0, count - 1); }

    std::mt19937 random_;
};

TEST(IniInihDifferentialTest, GeneratedFilesDifferOnlyByTheKnownRules) {
    TempSysroot dir;
    Comparison comparison(dir);
    FileGenerator generator(20240611);
    for (int i = 0; i < 2000; ++i) {
        comparison.Compare("generated file " + std::to_string(i), generator.Next());
    }
    // Each rule of the table is a real difference: some file that uses it reads differently.
    for (int rule = 0; rule < kRuleCount; ++rule) {
        EXPECT_GT(comparison.explained[static_cast<Rule>(rule)], 0) << kRuleNames[rule];
    }
}

// The INI files the repository holds: the shipped data, and the load fuzzer's seed corpus
// without its two leading option bytes.
TEST(IniInihDifferentialTest, RepositoryFilesDifferOnlyByTheKnownRules) {
    TempSysroot dir;
    Comparison comparison(dir);
    const std::filesystem::path source(KEST_SOURCE_DIR);
    comparison.Compare("data/timezone.ini", ReadBytes(source / "data/timezone.ini"));
    for (const auto& entry :
         std::filesystem::directory_iterator(source / "fuzz/corpus/IniLoadFuzzer")) {
        comparison.Compare(entry.path(), ReadBytes(entry.path()).substr(2));
    }
    EXPECT_GE(comparison.compared, 4);
}

}  // namespace

}  // namespace kest::test::config
