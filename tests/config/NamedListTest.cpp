// The named list finds the first entry of a name the same way whether it searches in order
// (short lists) or through its index (long ones), across appends, prepends, removals and resets.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "config/NamedList.h"

namespace kest::ini {
namespace {

struct Named {
    std::string name;
    int id;
};

std::unique_ptr<Named> Make(const std::string& name, int id) {
    return std::make_unique<Named>(Named{name, id});
}

// The id of the entry found for `name`, or -1.
int IdOf(const NamedList<Named>& list, const std::string& name) {
    const Named* found = list.Find(name);
    return found == nullptr ? -1 : found->id;
}

class NamedListTest : public ::testing::TestWithParam<int> {
  protected:
    // Entries "Name0", "Name1", ... with their position as id.
    void SetUp() override {
        for (int i = 0; i < GetParam(); ++i) {
            list.Append(Make("Name" + std::to_string(i), i));
        }
    }

    NamedList<Named> list;
};

TEST_P(NamedListTest, FindsEveryNameIgnoringCaseAndSurroundingBlanks) {
    for (int i = 0; i < GetParam(); ++i) {
        EXPECT_EQ(IdOf(list, "  NAME" + std::to_string(i) + "\t"), i);
    }
    EXPECT_EQ(IdOf(list, "Name"), -1);
    EXPECT_EQ(IdOf(list, "Name" + std::to_string(GetParam())), -1);
}

TEST_P(NamedListTest, TheFirstEntryOfARepeatedNameIsFoundThroughChanges) {
    list.Append(Make("name0", 100));
    EXPECT_EQ(IdOf(list, "Name0"), 0);
    list.Prepend(Make("NAME0", 200));
    EXPECT_EQ(IdOf(list, "Name0"), 200);
    list.Remove(0);
    list.Remove(0);  // the original "Name0"
    EXPECT_EQ(IdOf(list, "Name0"), 100);
    list.Remove(list.Size() - 1);
    EXPECT_EQ(IdOf(list, "Name0"), -1);
    EXPECT_EQ(IdOf(list, "Name1"), GetParam() > 1 ? 1 : -1);
}

TEST_P(NamedListTest, ResetAppliesTheNewCaseRule) {
    list.Reset(list.Release(), NameRules(true));
    EXPECT_EQ(IdOf(list, "Name0"), 0);
    EXPECT_EQ(IdOf(list, "NAME0"), -1);
    EXPECT_EQ(IdOf(list, "Name" + std::to_string(GetParam() - 1)), GetParam() - 1);
    list.Append(Make("NAME0", 300));
    EXPECT_EQ(IdOf(list, "NAME0"), 300);
}

// Below, at and just above the length from which the list is indexed, and far above it.
INSTANTIATE_TEST_SUITE_P(Lengths, NamedListTest,
                         ::testing::Values(3, static_cast<int>(NamedList<Named>::kIndexedFrom),
                                           static_cast<int>(NamedList<Named>::kIndexedFrom) + 1,
                                           40));

}  // namespace
}  // namespace kest::ini
