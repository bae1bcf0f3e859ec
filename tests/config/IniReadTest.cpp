#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <string>

#include "IniTestSupport.h"
#include "config/IniReader.h"

namespace kest::test::config {

using kest::test::TempSysroot;
using std::string_literals::operator""s;  // NOLINT(misc-unused-using-decls): used by "..."s

namespace {

constexpr uint32_t kLenient = kIniReadKeepEmptyValues | kIniReadColonsAndUnnamedSection;
constexpr uint32_t kQuotes = kIniReadStripDoubleQuotes | kIniReadKeepEmptyValues;
const std::string kLineEnds = "[s]%a=1%%b=2%[t]%c=3";
const std::string kMalformed =
    "top=1\n[\n[]\n[open\n[s] trailing\nnoseparator\n=nameless\nempty=\n ; c=1\nk : v\na:=1\n";
const std::string kRepeated = "[A]\nx=1\ny=2\n[ a ]\nX = 3\n[B]\nx=4\n[A]\nx=5\n";

std::string WithLineEnd(const std::string& end) {
    std::string text = kLineEnds;
    for (size_t at = text.find('%'); at != std::string::npos; at = text.find('%', at)) {
        text.replace(at, 1, end);
    }
    return text;
}

struct ReadCase {
    std::string text;
    const char* document;  // as Dump shows it; nothing when only `saved` is checked
    uint32_t readFlags = kIniDefaultReadFlags;
    const char* saved = nullptr;  // what saving writes, when given
    bool uniqueNames = true;
    int result = 0;
};

const ReadCase kReadCases[] = {
    {WithLineEnd("\n"), "[s] a=1 b=2 [t] c=3"},
    {WithLineEnd("\r"), "[s] a=1 b=2 [t] c=3"},
    {WithLineEnd("\r\n"), "[s] a=1 b=2 [t] c=3"},
    {WithLineEnd("\n\r"), "[s] a=1 b=2 [t] c=3"},
    {WithLineEnd("\0"s), "[s] a=1 b=2 [t] c=3"},
    // Equal end characters in a row are two line ends, so "[t]" is a line of its own.
    {"[s]\r\ra=1\n\n[t]\n\rb=2\r\n\r\nc=3", "[s] a=1 [t] b=2 c=3"},
    {"\xEF\xBB\xBF[s]\nk=v\n", "[s] k=v"},
    {"\xFF\xFE[s]\nk=v\n", "", kIniDefaultReadFlags, nullptr, true, kIniUnsupportedEncoding},
    {"\xFE\xFF[s]\nk=v\n", "", kIniDefaultReadFlags, nullptr, true, kIniUnsupportedEncoding},
    {"\xFF\xFE\0\0[s]\nk=v\n"s, "", kIniDefaultReadFlags, nullptr, true, kIniUnsupportedEncoding},
    {"\0\0\xFE\xFF[s]\nk=v\n"s, "", kIniDefaultReadFlags, nullptr, true, kIniUnsupportedEncoding},
    // Repeated sections and keys merge ignoring case and blanks, unless names need not be unique.
    {kRepeated, "[A] x=5 y=2 [B] x=4"},
    {kRepeated, nullptr, kIniDefaultReadFlags,
     "[A]\nx=1\ny=2\n\n[a]\nX=3\n\n[B]\nx=4\n\n[A]\nx=5\n\n", false},
    {kMalformed, "[s] a:=1"},
    {kMalformed, "[(null)] top=1 [s] empty= k=v a=1", kLenient},
    // Enclosing quotes are stripped as the flags ask, and written back.
    {"[s]\nk= \" a b \" ", "[s] k= a b ", kQuotes, "[s]\nk=\" a b \"\n\n"},
    {"[s]\nk=\"\"", "[s] k=", kQuotes, "[s]\nk=\"\"\n\n"},
    {"[s]\nk=\"", "[s] k=\"", kQuotes, "[s]\nk=\"\n\n"},
    {"[s]\nk='a'", "[s] k='a'", kQuotes, "[s]\nk='a'\n\n"},
    {"[s]\nk='a'", "[s] k=a", kQuotes | kIniReadStripApostrophes, "[s]\nk='a'\n\n"},
    {"[s]\nk=\"a'", "[s] k=\"a'", kQuotes | kIniReadStripApostrophes, "[s]\nk=\"a'\n\n"},
    {"[s]\nk=\"a\"", "[s] k=\"a\"", kIniReadKeepEmptyValues, "[s]\nk=\"a\"\n\n"},
    // Runs of numbered Line keys become one key. With unique names a joined run that takes the
    // name of another key merges with it, the later value winning; otherwise both stay.
    {"[s]\nx Line0001=ab\nx Line0002=cd\n", "[s] x=abcd"},
    {"[s]\nx Line1=a\ny Line7=b\nz=c\n", "[s] x=ab z=c"},
    {"[s]\nx Line0001=a\ny Line0001=b\nx Line0002=c\n", "[s] x=a y=bc"},
    {"[s]\nx Line0002=a\nx Line0003=b\n", "[s] x Line0002=a x Line0003=b"},
    {"[s]\nx Line=a\nxLine1=b\n", "[s] x Line=a xLine1=b"},
    {"[s]\nx Line1=a\nx Line99999999999=b\n", "[s] x=a x Line99999999999=b"},
    {"[s]\nx=first\nx Line1=second\ny=1\n", "[s] x=second y=1"},
    {"[s]\nx Line1=a\nx Line2=b\ny=1\nx=c\n", "[s] x=c y=1"},
    {"[s]\nx=first\nx Line1=second\ny=1\n", "[s] x=first x=second y=1", kIniDefaultReadFlags,
     nullptr, false},
    {"[s]\nx Line1=a\nx Line2=b\ny=1\nx=c\n", "[s] x=ab y=1 x=c", kIniDefaultReadFlags, nullptr,
     false},
};

TEST(IniReadTest, TextsReadAsDocuments) {
    TempSysroot dir;
    for (const ReadCase& c : kReadCases) {
        SCOPED_TRACE(::testing::PrintToString(c.text));
        const std::string path = dir.PathOf("/read.ini");
        WriteBytes(path, c.text);
        IniTextPtr ini(IniText_Create());
        IniText_SetNameOptions(ini.get(), c.uniqueNames, false);
        IniText_SetReadOptions(ini.get(), c.readFlags);
        EXPECT_EQ(IniText_Load(ini.get(), path.c_str()), c.result);
        if (c.document != nullptr) {
            EXPECT_EQ(Dump(ini.get()), c.document);
        }
        if (c.saved != nullptr) {
            EXPECT_EQ(SavedText(dir, ini.get()), c.saved);
        }
    }
}

// The parser reads nothing past the end of its text, which need not end in a zero: here the text
// ends where an unreadable page begins.
TEST(IniReadTest, ParsingReadsNothingPastTheText) {
    const size_t page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
    void* pages =
        mmap(nullptr, 2 * page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    ASSERT_NE(pages, MAP_FAILED);
    char* guard = static_cast<char*>(pages) + page;
    ASSERT_EQ(mprotect(guard, page, PROT_NONE), 0);
    const std::string text = "[s]\nk=v";
    std::copy(text.begin(), text.end(), guard - text.size());
    kest::ini::IniDocument document(true, false);
    kest::ini::ParseIni(std::string_view(guard - text.size(), text.size()), 0, document);
    ASSERT_NE(document.FindKey("s", "k"), nullptr);
    EXPECT_EQ(document.FindKey("s", "k")->value, "v");
    munmap(pages, 2 * page);
}

// A failed load leaves the document as it was; only a regular file loads (a FIFO would block).
TEST(IniReadTest, FailedLoadKeepsTheDocument) {
    TempSysroot dir;
    IniTextPtr ini = LoadFromBytes(dir, "[s]\nk=v\n");
    const std::string fifo = dir.PathOf("/fifo.ini");
    ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
    EXPECT_EQ(IniText_Load(ini.get(), dir.PathOf("/missing.ini").c_str()), kIniInvalidArgument);
    EXPECT_EQ(IniText_Load(ini.get(), dir.Root().c_str()), kIniCannotOpenForReading);
    EXPECT_EQ(IniText_Load(ini.get(), fifo.c_str()), kIniCannotOpenForReading);
    EXPECT_EQ(Dump(ini.get()), "[s] k=v");
}

// Lines that are not sections or keys (an empty header among them) are kept as comments.
TEST(IniReadTest, CommentsAreKeptAndWrittenOnlyWhenAskedFor) {
    const std::string text = "; head\n[s]\n\n; about k\n[ ]\nk=1\nbad line\n; tail\n";
    TempSysroot dir;
    IniTextPtr kept = LoadFromBytes(dir, text, kIniDefaultReadFlags | kIniReadKeepComments);
    EXPECT_EQ(SavedText(dir, kept.get(), kIniWriteComments), text);
    EXPECT_EQ(SavedText(dir, kept.get()), "[s]\nk=1\n\n");
    ASSERT_EQ(IniText_DeleteKey(kept.get(), "s", "k"), kIniFound);
    EXPECT_EQ(SavedText(dir, kept.get(), kIniWriteComments),
              "; head\n[s]\n\n; about k\n[ ]\nbad line\n; tail\n");
    // A CR LF or LF CR pair ends one line; two CRs end two.
    IniTextPtr crlf = LoadFromBytes(dir, "; a\r\n[s]\n\r\r\rk=1\r\n", kIniReadKeepComments);
    EXPECT_EQ(SavedText(dir, crlf.get(), kIniWriteComments), "; a\n[s]\n\n\nk=1\n");
}

}  // namespace

}  // namespace kest::test::config
