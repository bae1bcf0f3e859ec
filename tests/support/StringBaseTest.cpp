#include <gtest/gtest.h>

#include <clocale>
#include <cstdint>
#include <cstring>
#include <functional>
#include <string>
#include <thread>

#include "support/Exceptions.h"
#include "vq/dsc/SafeInteger.h"
#include "vq/dsc/StringBase.h"
#include "vq/dsc/Vector.h"

using vq::dsc::NarrowString;
using vq::dsc::SafeInteger;
using vq::dsc::Vector;
using vq::dsc::WideString;
using vq::dsc::exception::OutOfRange;
using vq::dsc::exception::OutOfRange2;

namespace {

// The three pointers of a string or vector as stored in the object.
template <class Object>
struct StoredPointers {
    const void* begin;
    const void* end;
    const void* capacityEnd;
};
template <class Object>
StoredPointers<Object> PointersOf(const Object& object) {
    StoredPointers<Object> pointers;
    static_assert(sizeof(pointers) == sizeof(object), "three pointers");
    std::memcpy(&pointers, &object, sizeof(pointers));
    return pointers;
}

template <class String>
void ExpectLayoutHolds(const String& text) {
    using Char = typename String::value_type;
    const auto pointers = PointersOf(text);
    const Char* begin = static_cast<const Char*>(pointers.begin);
    const Char* end = static_cast<const Char*>(pointers.end);
    ASSERT_EQ(text.c_str(), begin);
    ASSERT_EQ(text.length(), static_cast<size_t>(end - begin));
    EXPECT_EQ(Char(), *end);
    EXPECT_GT(static_cast<const Char*>(pointers.capacityEnd), end);
}

TEST(StringBaseLayout, ThreePointersWithTheZeroAtTheEnd) {
    EXPECT_EQ(3 * sizeof(void*), sizeof(NarrowString));
    EXPECT_EQ(3 * sizeof(void*), sizeof(WideString));
    ExpectLayoutHolds(NarrowString());
    ExpectLayoutHolds(WideString());
    ExpectLayoutHolds(NarrowString("text"));
    ExpectLayoutHolds(WideString(L"text"));
    ExpectLayoutHolds(NarrowString(static_cast<const char*>(nullptr)));
}

TEST(StringBaseLayout, GrowingKeepsTheTerminatorAndContents) {
    WideString text;
    std::wstring expected;
    for (int i = 0; i < 300; ++i) {
        const wchar_t c = static_cast<wchar_t>(L'a' + i % 26);
        text += c;
        expected += c;
        ExpectLayoutHolds(text);
    }
    EXPECT_EQ(expected, text.str());
}

TEST(StringBase, ConstructionAndAssignment) {
    const char bytes[] = {'a', '\0', 'b'};
    const NarrowString withZero(bytes, 3);
    EXPECT_EQ(3u, withZero.length());
    EXPECT_EQ(std::string(bytes, 3), withZero.str());

    NarrowString text(std::string("first"));
    NarrowString copy(text);
    text = "second";
    EXPECT_STREQ("first", copy.c_str());
    EXPECT_STREQ("second", text.c_str());
    copy = copy;
    EXPECT_STREQ("first", copy.c_str());
    text.assign(text.c_str() + 2, 3);
    EXPECT_STREQ("con", text.c_str());

    NarrowString moved(std::move(text));
    EXPECT_STREQ("con", moved.c_str());
    EXPECT_TRUE(text.empty());
    ExpectLayoutHolds(text);
}

TEST(StringBase, AppendIncludingItsOwnText) {
    WideString text(L"abc");
    text.append(text);
    EXPECT_EQ(L"abcabc", text.str());
    text.append(text.c_str() + 1, 2);
    EXPECT_EQ(L"abcabcbc", text.str());
    text.append(3, L'-').append(L"!");
    EXPECT_EQ(L"abcabcbc---!", text.str());
    text.append(L"", 0).append(0, L'x');
    EXPECT_EQ(12u, text.length());
}

TEST(StringBase, Find) {
    const WideString text(L"hello world");
    const struct {
        const wchar_t* needle;
        size_t from;
        size_t expected;
    } rows[] = {
        {L"o", 0, 4},
        {L"o", 5, 7},
        {L"world", 0, 6},
        {L"world", 6, 6},
        {L"world", 7, WideString::npos},
        {L"xyz", 0, WideString::npos},
        {L"", 3, 3},
        {L"", 11, 11},
        {L"", 12, WideString::npos},
        {L"d", 11, WideString::npos},
        {L"hello world!", 0, WideString::npos},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(row.expected, text.find(row.needle, row.from)) << row.from;
    }
}

TEST(StringBase, SubstringAndEraseCheckTheOffset) {
    const struct {
        size_t position;
        size_t count;
        const wchar_t* erased;
        const wchar_t* substring;
    } rows[] = {
        {0, WideString::npos, L"", L"hello world"},
        {5, 100, L"hello", L" world"},
        {2, 2, L"heo world", L"ll"},
        {11, 1, L"hello world", L""},
        {0, 0, L"hello world", L""},
    };
    for (const auto& row : rows) {
        WideString text(L"hello world");
        EXPECT_EQ(row.substring, text.substr(row.position, row.count).str());
        EXPECT_EQ(row.erased, text.erase(row.position, row.count).str());
        ExpectLayoutHolds(text);
    }
    WideString wide(L"hello");
    try {
        wide.erase(6, 1);
        FAIL() << "an offset beyond the length must raise";
    } catch (const OutOfRange2& e) {
        EXPECT_STREQ("Out of range: String offset out of range", e.what());
    }
    EXPECT_EQ(L"hello", wide.str());
    NarrowString narrow("abc");
    EXPECT_THROW(narrow.erase(4), OutOfRange2);
    EXPECT_THROW(narrow.substr(4), OutOfRange2);
}

TEST(StringBase, CompareIsCodeUnitWise) {
    const struct {
        NarrowString a;
        NarrowString b;
        int order;
    } rows[] = {
        {"a", "b", -1}, {"b", "a", 1},       {"ab", "abc", -1}, {"abc", "ab", 1},
        {"", "", 0},    {"same", "same", 0}, {"\xE9", "a", 1},  {"", "a", -1},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(row.order, row.a.compare(row.b)) << row.a.c_str() << " " << row.b.c_str();
        EXPECT_EQ(row.order == 0, row.a == row.b);
        EXPECT_EQ(row.order < 0, row.a < row.b);
    }
}

TEST(StringBase, LengthsBeyondThirtyTwoBitSizesRaiseBeforeAllocating) {
    const wchar_t wide[] = L"x";
    const char narrow[] = "x";
    EXPECT_THROW(WideString(wide, 0x40000000u), OutOfRange);      // 4 bytes each: 2^32 bytes
    EXPECT_THROW(NarrowString(narrow, 0xFFFFFFFFu), OutOfRange);  // plus one overflows
    EXPECT_THROW(NarrowString(narrow, SIZE_MAX), OutOfRange);
    NarrowString text("ab");
    EXPECT_THROW(text.append(narrow, 0xFFFFFFFEu), OutOfRange);
    EXPECT_THROW(text.append(narrow, SIZE_MAX), OutOfRange);
    EXPECT_THROW(text.append(SIZE_MAX - 1, 'x'), OutOfRange);
    EXPECT_STREQ("ab", text.c_str());
}

// Conversions in the C locale, which is ASCII: anything else becomes '?'.
TEST(StringBaseConversion, AsciiLocaleReplacesWhatItCannotConvert) {
    EXPECT_STREQ("plain text", NarrowString(L"plain text").c_str());
    EXPECT_EQ(L"plain text", WideString("plain text").str());
    EXPECT_STREQ("a?b", NarrowString(L"a\u00E9b").c_str());
    EXPECT_EQ(L"a?b?", WideString("a\xE9"
                                  "b\xFF")
                           .str());
    EXPECT_STREQ("", NarrowString(static_cast<const wchar_t*>(nullptr)).c_str());
    EXPECT_EQ(L"back", WideString(NarrowString(WideString(L"back"))).str());
    WideString assigned(L"old");
    assigned.assign("new");
    EXPECT_EQ(L"new", assigned.str());
    EXPECT_EQ(L"std", WideString(std::string("std")).str());
}

// Runs `check` on a fresh thread under the C.UTF-8 locale (conversion state is per thread and
// bound to the locale in force when the thread first converts); false when there is no such
// locale.
bool RunUnderUtf8Locale(const std::function<void()>& check) {
    const std::string previous = std::setlocale(LC_ALL, nullptr);
    if (std::setlocale(LC_ALL, "C.UTF-8") == nullptr) {
        return false;
    }
    std::thread worker(check);
    worker.join();
    std::setlocale(LC_ALL, previous.c_str());
    return true;
}

TEST(StringBaseConversion, Utf8LocaleConvertsAndReplacesInvalidBytes) {
    const bool ran = RunUnderUtf8Locale([] {
        EXPECT_EQ(L"caf\u00E9", WideString("caf\xC3\xA9").str());
        EXPECT_STREQ("caf\xC3\xA9", NarrowString(L"caf\u00E9").c_str());
        EXPECT_EQ(L"a?b", WideString("a\xFF"
                                     "b")
                              .str());
        EXPECT_EQ(L"a?(", WideString("a\xC3(").str());
        EXPECT_EQ(L"end??", WideString("end\xE2\x82").str());
        EXPECT_STREQ("a?b",
                     NarrowString(std::wstring{L'a', static_cast<wchar_t>(0xD800), L'b'}).c_str());
    });
    if (!ran) {
        GTEST_SKIP() << "no C.UTF-8 locale on this machine";
    }
}

TEST(SafeInteger, RaisesWhereTheTypeOverflows) {
    using U32 = SafeInteger<uint32_t>;
    using I32 = SafeInteger<int32_t>;
    EXPECT_EQ(0xFFFFFFFFu, (U32(0xFFFFFFFEu) + 1).Value());
    EXPECT_EQ(0xFFFFFFFCu, (U32(0x3FFFFFFFu) * 4).Value());
    EXPECT_EQ(INT32_MIN, (I32(INT32_MIN + 1) - 1).Value());
    EXPECT_THROW(U32(0xFFFFFFFFu) + 1, OutOfRange);
    EXPECT_THROW(U32(0x40000000u) * 4, OutOfRange);
    EXPECT_THROW(U32(0u) - 1, OutOfRange);
    EXPECT_THROW(I32(INT32_MIN) - 1, OutOfRange);
    EXPECT_THROW(I32(INT32_MAX) * 2, OutOfRange);
    EXPECT_THROW(U32(uint64_t{1} << 32), OutOfRange);
    EXPECT_THROW(U32(-1), OutOfRange);
    EXPECT_THROW(I32(0x80000000u), OutOfRange);
    U32 value(10u);
    EXPECT_THROW(value *= 0x20000000u, OutOfRange);
    EXPECT_EQ(10u, value.Value());
}

TEST(Vector, LayoutAndGrowth) {
    Vector<NarrowString> names;
    EXPECT_EQ(3 * sizeof(void*), sizeof(names));
    EXPECT_TRUE(names.empty());
    for (int i = 0; i < 100; ++i) {
        names.push_back(NarrowString(std::to_string(i)));
        const auto pointers = PointersOf(names);
        ASSERT_EQ(static_cast<const void*>(names.begin()), pointers.begin);
        ASSERT_EQ(static_cast<const void*>(names.end()), pointers.end);
        ASSERT_EQ(static_cast<const void*>(names.begin() + names.capacity()), pointers.capacityEnd);
    }
    ASSERT_EQ(100u, names.size());
    int expected = 0;
    for (const NarrowString& name : names) {
        EXPECT_EQ(std::to_string(expected++), name.str());
    }
}

TEST(Vector, PushingOwnElementAcrossGrowthAndCopies) {
    Vector<WideString> list;
    list.push_back(WideString(L"first"));
    while (list.size() != list.capacity()) {
        list.push_back(WideString(L"filler"));
    }
    list.push_back(list[0]);
    EXPECT_EQ(L"first", list[list.size() - 1].str());

    Vector<WideString> copy(list);
    list.clear();
    EXPECT_TRUE(list.empty());
    EXPECT_GT(list.capacity(), 0u);
    EXPECT_EQ(L"first", copy[0].str());
    Vector<WideString> moved(std::move(copy));
    EXPECT_TRUE(copy.empty());
    EXPECT_EQ(0u, copy.capacity());
    list = moved;
    EXPECT_EQ(moved.size(), list.size());
    EXPECT_EQ(L"filler", list[1].str());
}

}  // namespace
