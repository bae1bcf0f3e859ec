#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "property/ItemNameEnumerator.h"

using namespace kest::property;

namespace kest::test::property {

namespace {

// The names an enumerator yields from its position to the end, one Next at a time.
std::vector<std::wstring> DrainNames(IuxSysEnumStringList* names) {
    std::vector<std::wstring> drained;
    CvqBStrHolder name;
    while (names->Next(1, name.Receive(), nullptr) == S_OK) {
        drained.emplace_back(name.Get());
    }
    return drained;
}

TEST(EnumeratorTest, NextReportsCountsAndEndsWithSFalse) {
    CountedPtr<IuxSysEnumStringList> names = CreateItemNameEnumerator({L"System", L"eth0"});
    CvqBStr out[5] = {};
    uint32_t fetched = 99;
    EXPECT_EQ(E_POINTER, names->Next(2, out, nullptr));
    EXPECT_EQ(E_POINTER, names->Next(0, out, nullptr));
    EXPECT_EQ(E_POINTER, names->Next(1, nullptr, &fetched));
    EXPECT_EQ(S_FALSE, names->Next(5, out, &fetched));
    ASSERT_EQ(2u, fetched);
    EXPECT_STREQ(L"System", out[0]);
    EXPECT_STREQ(L"eth0", out[1]);
    CvqBStrFree(out[0]);
    CvqBStrFree(out[1]);
    EXPECT_EQ(S_FALSE, names->Next(1, out, &fetched));
    EXPECT_EQ(0u, fetched);
    EXPECT_EQ(S_OK, names->Reset());
    EXPECT_EQ(S_OK, names->Next(0, out, &fetched));
    EXPECT_EQ(0u, fetched);
    EXPECT_EQ(std::vector<std::wstring>({L"System", L"eth0"}), DrainNames(names.Get()));

    CountedPtr<IuxSysEnumStringList> empty = CreateItemNameEnumerator({});
    EXPECT_EQ(S_FALSE, empty->Next(1, out, &fetched));
    EXPECT_EQ(0u, fetched);
}

TEST(EnumeratorTest, SkipStopsAtTheEndAndClonesContinueIndependently) {
    CountedPtr<IuxSysEnumStringList> names = CreateItemNameEnumerator({L"a", L"b", L"c"});
    EXPECT_EQ(S_OK, names->Skip(0));
    EXPECT_EQ(S_FALSE, names->Skip(4));
    EXPECT_EQ(S_OK, names->Reset());
    ASSERT_EQ(S_OK, names->Skip(1));
    CountedPtr<IuxSysEnumStringList> clone;
    EXPECT_EQ(E_POINTER, names->Clone(nullptr));
    ASSERT_EQ(S_OK, names->Clone(clone.Receive()));
    CountedPtr<IuxSysEnumStringList> cloneOfClone;
    ASSERT_EQ(S_OK, clone->Clone(cloneOfClone.Receive()));
    EXPECT_EQ(std::vector<std::wstring>({L"b", L"c"}), DrainNames(names.Get()));
    EXPECT_EQ(S_FALSE, names->Skip(1));
    names.Reset();
    EXPECT_EQ(std::vector<std::wstring>({L"b", L"c"}), DrainNames(clone.Get()));
    clone.Reset();
    EXPECT_EQ(S_OK, cloneOfClone->Reset());
    EXPECT_EQ(std::vector<std::wstring>({L"a", L"b", L"c"}), DrainNames(cloneOfClone.Get()));
}

// Copies names like the real enumerator but fails on the name "fail", as an exhausted heap would.
struct FailingNameCopy {
    static bool Copy(CvqBStr* to, const std::wstring& from) noexcept {
        return from != L"fail" && HostStringCopy::Copy(to, from);
    }
    static void Destroy(CvqBStr* str) noexcept { HostStringCopy::Destroy(str); }
};

class FailingNames : public CVQComEnumOnSTL<IuxSysEnumStringList, &IID_IuxSysEnumStringList,
                                            CvqBStr, ItemNameList, FailingNameCopy> {
  public:
    explicit FailingNames(ItemNameList names)
        : CVQComEnumOnSTL(nullptr, &names_, {}), names_(std::move(names)) {
        Reset();
    }

  private:
    ItemNameList names_;
};

TEST(EnumeratorTest, FailedNameCopyFreesTheCallsStringsAndLosesNoName) {
    CountedPtr<IuxSysEnumStringList> names =
        CreateCountedComObject<FailingNames>(ItemNameList{L"a", L"b", L"fail"});
    CvqBStr out[3] = {};
    uint32_t fetched = 99;
    EXPECT_EQ(E_OUTOFMEMORY, names->Next(3, out, &fetched));
    EXPECT_EQ(0u, fetched);
    EXPECT_EQ(nullptr, out[0]) << "a freed string was left for the caller";
    EXPECT_EQ(nullptr, out[1]);
    EXPECT_EQ(S_OK, names->Next(2, out, &fetched)) << "names before the failure were skipped";
    EXPECT_STREQ(L"a", out[0]);
    CvqBStrFree(out[0]);
    CvqBStrFree(out[1]);
}

}  // namespace

}  // namespace kest::test::property
