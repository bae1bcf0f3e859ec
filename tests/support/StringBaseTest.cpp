#include <gtest/gtest.h>

#include <clocale>
#include <cstdint>
#include <cstring>
#include <string>

#include "support/Exceptions.h"
#include "support/IntegerText.h"
#include "support/TextConversion.h"
#include "vq/dsc/SafeInteger.h"
#include "vq/dsc/StringBase.h"
#include "vq/dsc/Vector.h"

namespace kest::test::support {

using vq::dsc::IntegerToString;
using vq::dsc::NarrowString;
using vq::dsc::WideString;
using vq::dsc::exception::OutOfRange;
using vq::dsc::exception::OutOfRange2;
using vq::dsc::exception::UnableToConvert;

namespace {

struct ThreePointers {
    const char* begin;
    const char* end;
    const char* capacityEnd;
};

// Checks the stored pointers: start, end at the terminating zero, end of allocation beyond it.
template <class String>
void ExpectLayoutHolds(const String& text) {
    ThreePointers stored;
    static_assert(sizeof(stored) == sizeof(text), "three pointers");
    // The binary layout is what the test reads.
    // NOLINTNEXTLINE(bugprone-undefined-memory-manipulation)
    std::memcpy(&stored, &text, sizeof(stored));
    const size_t unit = sizeof(typename String::value_type);
    ASSERT_EQ(static_cast<const void*>(text.c_str()), stored.begin);
    ASSERT_EQ(text.length() * unit, static_cast<size_t>(stored.end - stored.begin));
    EXPECT_EQ(typename String::value_type(), text.c_str()[text.length()]);
    EXPECT_GE(stored.capacityEnd, stored.end + unit);
}

TEST(StringBase, LayoutHoldsWhileGrowingAndAfterMoves) {
    ExpectLayoutHolds(NarrowString());
    ExpectLayoutHolds(NarrowString(static_cast<const char*>(nullptr)));
    WideString text;
    for (int i = 0; i < 300; ++i) {
        text += static_cast<wchar_t>(L'a' + i % 26);
        ExpectLayoutHolds(text);
    }
    WideString moved(std::move(text));
    EXPECT_EQ(L"abcdefghijklmn", moved.substr(286).str());
    ExpectLayoutHolds(text);  // NOLINT(bugprone-use-after-move): the moved-from state is tested
    EXPECT_TRUE(text.empty());
}

TEST(StringBase, AssignAndAppendAlsoFromItsOwnText) {
    const char bytes[] = {'a', '\0', 'b'};
    EXPECT_EQ(std::string(bytes, 3), NarrowString(bytes, 3).str());
    NarrowString text("abc");
    text.append(text);
    text.append(text.c_str() + 1, 2).append(3, '-').append("!");
    EXPECT_STREQ("abcabcbc---!", text.c_str());
    text.assign(text.c_str() + 3, 3);
    EXPECT_STREQ("abc", text.c_str());
    const NarrowString copy(text);
    text = std::string("other");
    EXPECT_STREQ("abc", copy.c_str());
}

TEST(StringBase, FindSubstringAndEraseWithOffsets) {
    const WideString text(L"hello world");
    const size_t npos = WideString::npos;
    const struct {
        const wchar_t* needle;
        size_t from, expected;
    } finds[] = {{L"o", 0, 4},      {L"o", 5, 7},  {L"world", 6, 6}, {L"world", 7, npos},
                 {L"xyz", 0, npos}, {L"", 11, 11}, {L"", 12, npos},  {L"hello world!", 0, npos}};
    for (const auto& row : finds) {
        EXPECT_EQ(row.expected, text.find(row.needle, row.from)) << row.from;
    }
    const struct {
        size_t position, count;
        const wchar_t *erased, *substring;
    } cuts[] = {{0, npos, L"", L"hello world"},
                {5, 100, L"hello", L" world"},
                {2, 2, L"heo world", L"ll"},
                {11, 1, L"hello world", L""}};
    for (const auto& row : cuts) {
        WideString copy(text);
        EXPECT_EQ(row.substring, copy.substr(row.position, row.count).str());
        EXPECT_EQ(row.erased, copy.erase(row.position, row.count).str());
        ExpectLayoutHolds(copy);
    }
    WideString wide(L"hello");
    try {
        wide.erase(6, 1);
        FAIL() << "an offset beyond the length must raise";
    } catch (const OutOfRange2& e) {
        EXPECT_STREQ("Out of range: String offset out of range", e.what());
    }
    NarrowString narrow("abc");
    EXPECT_THROW(narrow.erase(4), OutOfRange2);
    EXPECT_THROW(narrow.substr(4), OutOfRange2);
}

TEST(StringBase, CompareIsCodeUnitWise) {
    const struct {
        const char *a, *b;
        int order;
    } rows[] = {{"a", "b", -1},      {"b", "a", 1}, {"ab", "abc", -1}, {"abc", "ab", 1},
                {"same", "same", 0}, {"", "", 0},   {"\xE9", "a", 1}};
    for (const auto& row : rows) {
        EXPECT_EQ(row.order, NarrowString(row.a).compare(row.b)) << row.a << " " << row.b;
        EXPECT_EQ(row.order == 0, NarrowString(row.a) == NarrowString(row.b));
        EXPECT_EQ(row.order < 0, NarrowString(row.a) < NarrowString(row.b));
    }
}

TEST(StringBase, LengthsBeyondThirtyTwoBitSizesRaiseBeforeAllocating) {
    EXPECT_THROW(WideString(L"x", 0x40000000u), OutOfRange);   // 2^32 bytes
    EXPECT_THROW(NarrowString("x", 0xFFFFFFFFu), OutOfRange);  // count plus one overflows
    NarrowString text("ab");
    EXPECT_THROW(text.append("x", 0xFFFFFFFEu), OutOfRange);
    EXPECT_THROW(text.append(SIZE_MAX - 1, 'x'), OutOfRange);
    EXPECT_STREQ("ab", text.c_str());
}

TEST(StringBaseConversion, AsciiLocaleTurnsOtherCharactersIntoQuestionMarks) {
    EXPECT_STREQ("a?b", NarrowString(L"a\u00E9b").c_str());
    EXPECT_EQ(L"a?|?", WideString(std::string("a\xE9|\xFF")).str());
    EXPECT_EQ(L"back", WideString(NarrowString(WideString(L"back"))).str());
}

TEST(StringBaseConversion, Utf8LocaleConvertsAndReplacesInvalidBytes) {
    const std::string previous = std::setlocale(LC_ALL, nullptr);
    if (std::setlocale(LC_ALL, "C.UTF-8") == nullptr) {
        GTEST_SKIP() << "no C.UTF-8 locale";
    }
    // Convert under the C locale first: the later change must still be honoured on this thread.
    std::setlocale(LC_ALL, "C");
    EXPECT_STREQ("a?b", NarrowString(L"a\u00E9b").c_str());
    ASSERT_NE(nullptr, std::setlocale(LC_ALL, "C.UTF-8"));
    {
        EXPECT_EQ(L"caf\u00E9", WideString("caf\xC3\xA9").str());
        EXPECT_STREQ("caf\xC3\xA9", NarrowString(L"caf\u00E9").c_str());
        EXPECT_EQ(L"a?(b", WideString("a\xC3(b").str());
        EXPECT_EQ(L"end??", WideString("end\xE2\x82").str());
        EXPECT_STREQ("a?b", NarrowString(std::wstring{L'a', wchar_t(0xD800), L'b'}).c_str());
        // Characters beyond U+10FFFF have no encoding: one '?' each, alone and in a run that
        // would overflow four bytes per character if they came out as five- or six-byte forms.
        for (uint32_t beyond : {0x110000u, 0x7FFFFFFFu, 0xFFFFFFFFu}) {
            const std::wstring one{wchar_t(beyond)};
            EXPECT_STREQ("?", NarrowString(one).c_str()) << std::hex << beyond;
            EXPECT_EQ(std::string(64, '?'), vq::dsc::NarrowFromWide(std::wstring(64, one[0])));
        }
        EXPECT_STREQ("\xF4\x8F\xBF\xBF", NarrowString(std::wstring{wchar_t(0x10FFFF)}).c_str());
        // Sequences that decode beyond U+10FFFF become '?' too; the largest valid one stays.
        for (const char* beyond : {"\xF4\x90\x80\x80", "\xF7\xBF\xBF\xBF", "\xFB\xBF\xBF\xBF\xBF",
                                   "\xFD\xBF\xBF\xBF\xBF\xBF"}) {
            const std::wstring wide = WideString(beyond).str();
            EXPECT_NE(std::wstring::npos, wide.find(L'?')) << beyond;
            for (wchar_t character : wide) {
                EXPECT_EQ(L'?', character) << beyond;
            }
        }
        EXPECT_EQ(std::wstring{wchar_t(0x10FFFF)}, WideString("\xF4\x8F\xBF\xBF").str());
    }
    std::setlocale(LC_ALL, previous.c_str());
}

TEST(SafeInteger, RaisesWhereTheTypeOverflows) {
    using U32 = vq::dsc::SafeInteger<uint32_t>;
    EXPECT_EQ(0xFFFFFFFCu, (U32(0x3FFFFFFFu) * 4).Value());
    EXPECT_THROW(U32(0xFFFFFFFFu) + 1, OutOfRange);
    EXPECT_THROW(U32(0x40000000u) * 4, OutOfRange);
    EXPECT_THROW(vq::dsc::SafeInteger<int32_t>(INT32_MAX) * 2, OutOfRange);
    EXPECT_THROW(U32(uint64_t{1} << 32), OutOfRange);
    U32 value(10u);
    EXPECT_THROW(value *= 0x20000000u, OutOfRange);
    EXPECT_EQ(10u, value.Value());
}

TEST(Vector, ThreePointerLayoutGrowthAndOwnElements) {
    vq::dsc::Vector<NarrowString> names;
    for (int i = 0; i < 100; ++i) {
        names.push_back(NarrowString(std::to_string(i)));
        ThreePointers stored;
        // NOLINTNEXTLINE(bugprone-undefined-memory-manipulation): the binary layout is tested
        std::memcpy(&stored, &names, sizeof(stored));
        ASSERT_EQ(static_cast<const void*>(names.begin()), stored.begin);
        ASSERT_EQ(static_cast<const void*>(names.end()), stored.end);
        ASSERT_EQ(static_cast<const void*>(names.begin() + names.capacity()), stored.capacityEnd);
    }
    while (names.size() != names.capacity()) {
        names.push_back(NarrowString("filler"));
    }
    names.push_back(names[0]);  // its own element, while the storage moves
    EXPECT_STREQ("0", names[names.size() - 1].c_str());
    EXPECT_STREQ("42", names[42].c_str());
    vq::dsc::Vector<NarrowString> moved(std::move(names));
    EXPECT_TRUE(names.empty());  // NOLINT(bugprone-use-after-move): the moved-from state is tested
    names = moved;
    moved.clear();
    EXPECT_TRUE(moved.empty());
    EXPECT_STREQ("99", names[99].c_str());
}

// Parsing is checked against an independent reference by the integer-text fuzz target, whose
// seed corpus holds the bounds of each width, strictness, signs and prefixes.
TEST(IntegerToString, DigitsInEachBase) {
    EXPECT_EQ(L"-2147467259", IntegerToString(int32_t{-2147467259}));
    EXPECT_EQ(L"-2147483648", IntegerToString(INT32_MIN));
    EXPECT_EQ(L"80004005", IntegerToString(int32_t{-2147467259}, 16));
    EXPECT_EQ(L"FF", IntegerToString(255u, 16));
    EXPECT_EQ(L"0", IntegerToString(0u));
    EXPECT_EQ(std::wstring(32, L'1'), IntegerToString(int32_t{-1}, 2));
    EXPECT_EQ(L"1Z141Z3", IntegerToString(UINT32_MAX, 36));
    for (uint32_t base : {0u, 1u, 37u}) {
        EXPECT_THROW(IntegerToString(5u, base), UnableToConvert) << base;
    }
}

}  // namespace

}  // namespace kest::test::support
