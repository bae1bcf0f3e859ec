// The item entry points as a host drives them: which items the controller yields, lookups and
// refreshes by name, validation answers and search results.
#include <gtest/gtest.h>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

using Names = std::vector<std::wstring>;

class ExpertItemsTest : public ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(StateWithDevice(1, "eth0"));
        ExpertHostTest::SetUp();
    }
};

// The system item comes first, then eth0 written in any case; each new expert (with a new item
// manager) reads the devices again.
TEST_F(ExpertItemsTest, SystemItemComesFirstThenEth0InAnyCase) {
    const std::pair<std::string, Names> cases[] = {
        {"", {kSystemItemName}},
        {kSystemState, {kSystemItemName}},
        {StateWithDevice(1, "eth0"), {kSystemItemName, L"eth0"}},
        {StateWithDevice(1, "ETH0"), {kSystemItemName, L"ETH0"}},
        {StateWithDevice(1, "eth1"), {kSystemItemName}},
        {StateWithDevice(2, "eth0"), {kSystemItemName}},
        {StateWithDevice(1, "eth1") + "[Device1]\nType = 1\nInterfaceName = Eth0\nIndex = 4\n",
         {kSystemItemName, L"Eth0"}},
    };
    for (const auto& [state, items] : cases) {
        WriteControllerState(state);
        expert.Reset();
        expert = plugin.CreateExpert();
        IuxSysEnumStringList* names = nullptr;
        ASSERT_EQ(S_OK, expert->SearchForItemNames(&names));
        EXPECT_EQ(items, TakeNames(names)) << state;
    }
}

TEST_F(ExpertItemsTest, LookupsAndRefreshesFindItemsByNameIgnoringCase) {
    const uint32_t tags[] = {kItemNameTag, 0x7FFFF000};
    const struct {
        const wchar_t* asked;
        int tagCount;  // -1: GetPropertiesOfItem; else PopulateOrRefreshProperties with `tags`
        const uint32_t* tags;
        HRESULT status;
        const wchar_t* itemName;  // of the bag handed out; null: none
    } cases[] = {
        {L"ETH0", -1, nullptr, S_OK, L"eth0"},
        {L"eth0", -1, nullptr, S_OK, L"eth0"},
        {L"vq kest chassis", -1, nullptr, S_OK, kSystemItemName},
        {L"vq kest chassis", 2, tags, S_FALSE, kSystemItemName},
        {L"eth0", 0, tags, UX_E_PROPERTY_NOT_FOUND, nullptr},
        {L"eth0", 1, nullptr, E_POINTER, nullptr},
        {L"eth1", -1, nullptr, UX_E_ITEM_NOT_FOUND, nullptr},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message() << c.asked << " " << c.tagCount);
        IuxSysPropertyBag* bag = nullptr;
        EXPECT_EQ(c.status, c.tagCount < 0 ? expert->GetPropertiesOfItem(c.asked, &bag)
                                           : expert->PopulateOrRefreshProperties(
                                                 c.asked, c.tagCount, c.tags, &bag));
        const InterfaceRef<IuxSysPropertyBag> held(bag);
        ASSERT_EQ(c.itemName != nullptr, bag != nullptr);
        if (bag != nullptr) {
            EXPECT_EQ(c.itemName, ItemNameIn(bag));
        }
    }
    EXPECT_EQ(1u, ControllerCalls("GetDeviceHandlers\t").size());
}

// Validation hands out no enumerator when nothing changed or a value is refused; persisting
// without validating first refuses the value too.
TEST_F(ExpertItemsTest, ValidationAnswersWithStatusAndMessage) {
    const struct {
        const wchar_t* hostName;  // null: nothing modified
        HRESULT status;
        const wchar_t* message;
        HRESULT persisted;
    } cases[] = {{nullptr, S_FALSE, L"", S_OK},
                 {L"kest_2", UX_E_HOSTNAME_INVALID,
                  L"Hostname must contain only alphanumeric characters and hyphens.",
                  UX_E_HOSTNAME_INVALID}};
    for (const auto& c : cases) {
        InterfaceRef<IuxSysPropertyBag> current;
        ASSERT_EQ(S_OK, expert->GetPropertiesOfItem(kSystemItemName, current.Receive()));
        InterfaceRef<IuxSysPropertyBag> changes;
        ASSERT_EQ(S_OK, current->Clone(changes.Receive()));
        if (c.hostName != nullptr) {
            ASSERT_EQ(S_OK, changes->SetString(0x0101F000, c.hostName));
        }
        IuxSysEnumPropertyTag* validated = reinterpret_cast<IuxSysEnumPropertyTag*>(this);
        CvqBStr message = nullptr;
        EXPECT_EQ(c.status, expert->ValidatePropertyChanges(kSystemItemName, changes.Get(),
                                                            &validated, &message));
        EXPECT_EQ(nullptr, validated);
        EXPECT_EQ(c.message, TakeWideHostString(message));
        int32_t restart = -1;
        EXPECT_EQ(c.persisted,
                  expert->PersistPropertyChanges(kSystemItemName, changes.Get(), &restart));
    }
    EXPECT_EQ(std::vector<std::string>{}, ControllerCalls("Set"));
}

TEST_F(ExpertItemsTest, SearchDeliversItemsToTheSinkUntilItRefuses) {
    RecordingSink all(S_OK);
    EXPECT_EQ(S_OK, expert->SearchForItemsAndProperties(&all));
    EXPECT_EQ((Names{kSystemItemName, L"eth0"}), all.names);
    const HRESULT refusal = static_cast<HRESULT>(0x80041234u);
    RecordingSink refusing(refusal);
    EXPECT_EQ(refusal, expert->SearchForItemsAndProperties(&refusing));
    EXPECT_EQ((Names{kSystemItemName}), refusing.names);
    EXPECT_EQ(E_POINTER, expert->SearchForItemsAndProperties(nullptr));
}

}  // namespace
}  // namespace kest::test::e2e
