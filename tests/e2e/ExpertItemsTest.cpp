// The item entry points as a host drives them: which items the controller yields, lookups by
// name, refresh and search results, and the item manager that experts of one process share.
#include <gtest/gtest.h>

#include <utility>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

using Names = std::vector<std::wstring>;

struct DeviceCase {
    const char* name;
    std::string state;
    Names items;
};

class ItemDiscoveryTest : public ExpertHostTest,
                          public ::testing::WithParamInterface<DeviceCase> {};

TEST_P(ItemDiscoveryTest, SystemItemComesFirstThenEth0InAnyCase) {
    WriteControllerState(GetParam().state);
    EXPECT_EQ(GetParam().items, ItemNames(expert.Get()));
}

INSTANTIATE_TEST_SUITE_P(
    Devices, ItemDiscoveryTest,
    ::testing::Values(
        DeviceCase{"NoStateFile", "", {kSystemItemName}},
        DeviceCase{"NoDevice", kSystemState, {kSystemItemName}},
        DeviceCase{"Eth0", StateWithDevice(1, "eth0"), {kSystemItemName, L"eth0"}},
        DeviceCase{"UpperCaseEth0", StateWithDevice(1, "ETH0"), {kSystemItemName, L"ETH0"}},
        DeviceCase{"OtherEthernetName", StateWithDevice(1, "eth1"), {kSystemItemName}},
        DeviceCase{"Eth0OfAnotherType", StateWithDevice(2, "eth0"), {kSystemItemName}},
        DeviceCase{
            "Eth0AfterEth1",
            StateWithDevice(1, "eth1") + "[Device1]\nType = 1\nInterfaceName = Eth0\nIndex = 4\n",
            {kSystemItemName, L"Eth0"}}),
    [](const ::testing::TestParamInfo<DeviceCase>& param) { return param.param.name; });

class ExpertItemsTest : public ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(StateWithDevice(1, "eth0"));
        ExpertHostTest::SetUp();
    }
};

TEST_F(ExpertItemsTest, PropertiesAreFoundByNameIgnoringCase) {
    const std::pair<const wchar_t*, const wchar_t*> lookups[] = {
        {L"ETH0", L"eth0"}, {L"eth0", L"eth0"}, {L"vq kest chassis", kSystemItemName}};
    for (const auto& [asked, itemName] : lookups) {
        InterfaceRef<IuxSysPropertyBag> bag;
        ASSERT_EQ(S_OK, expert->GetPropertiesOfItem(asked, bag.Receive())) << asked;
        ASSERT_TRUE(bag);
        EXPECT_EQ(itemName, ItemNameIn(bag.Get()));
    }
    EXPECT_EQ(1, ControllerCalls("GetDeviceHandlers"));
}

TEST_F(ExpertItemsTest, UnknownItemIsNotFound) {
    IuxSysPropertyBag* bag = reinterpret_cast<IuxSysPropertyBag*>(this);
    EXPECT_EQ(UX_E_ITEM_NOT_FOUND, expert->GetPropertiesOfItem(L"eth1", &bag));
    EXPECT_EQ(nullptr, bag);
}

TEST_F(ExpertItemsTest, RefreshWithoutTagsFindsNothing) {
    const uint32_t tag = kItemNameTag;
    IuxSysPropertyBag* bag = reinterpret_cast<IuxSysPropertyBag*>(this);
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND, expert->PopulateOrRefreshProperties(L"eth0", 0, &tag, &bag));
    EXPECT_EQ(nullptr, bag);
    EXPECT_EQ(E_POINTER, expert->PopulateOrRefreshProperties(L"eth0", 1, nullptr, &bag));
}

TEST_F(ExpertItemsTest, RefreshFindingSomeTagsReturnsTheBagWithFalse) {
    const uint32_t tags[] = {kItemNameTag, 0x7FFFF000};
    InterfaceRef<IuxSysPropertyBag> bag;
    ASSERT_EQ(S_FALSE,
              expert->PopulateOrRefreshProperties(L"vq kest chassis", 2, tags, bag.Receive()));
    ASSERT_TRUE(bag);
    EXPECT_EQ(kSystemItemName, ItemNameIn(bag.Get()));
}

TEST_F(ExpertItemsTest, ValidatingNoChangeReturnsFalseAndNoEnumerator) {
    InterfaceRef<IuxSysPropertyBag> current;
    ASSERT_EQ(S_OK, expert->GetPropertiesOfItem(kSystemItemName, current.Receive()));
    InterfaceRef<IuxSysPropertyBag> unchanged;
    ASSERT_EQ(S_OK, current->Clone(unchanged.Receive()));
    IuxSysEnumPropertyTag* validated = reinterpret_cast<IuxSysEnumPropertyTag*>(this);
    EXPECT_EQ(S_FALSE, expert->ValidatePropertyChanges(kSystemItemName, unchanged.Get(), &validated,
                                                       nullptr));
    EXPECT_EQ(nullptr, validated);
}

TEST_F(ExpertItemsTest, SearchDeliversEveryItemToTheSink) {
    RecordingSink sink(S_OK);
    EXPECT_EQ(S_OK, expert->SearchForItemsAndProperties(&sink));
    EXPECT_EQ((Names{kSystemItemName, L"eth0"}), sink.names);
}

TEST_F(ExpertItemsTest, SearchEndsWithTheStatusOfARefusingSink) {
    const HRESULT refusal = static_cast<HRESULT>(0x80041234u);
    RecordingSink sink(refusal);
    EXPECT_EQ(refusal, expert->SearchForItemsAndProperties(&sink));
    EXPECT_EQ((Names{kSystemItemName}), sink.names);
    EXPECT_EQ(E_POINTER, expert->SearchForItemsAndProperties(nullptr));
}

TEST_F(ExpertItemsTest, PersistingANetworkChangeRestartsTheInterfaceAfterwards) {
    WriteControllerState(StateWithDevice(1, "eth0") +
                         "Mode = 2\nRequestMode = 2\n[Network]\nPrimaryDeviceIndex = 9\n");
    InterfaceRef<IuxSysPropertyBag> current;
    ASSERT_EQ(S_OK, expert->GetPropertiesOfItem(L"eth0", current.Receive()));
    InterfaceRef<IuxSysPropertyBag> changes;
    ASSERT_EQ(S_OK, current->Clone(changes.Receive()));
    ASSERT_EQ(S_OK, changes->SetBool(0x0D126000, 1));

    int32_t restartRequired = -1;
    EXPECT_EQ(S_OK, expert->PersistPropertyChanges(L"eth0", changes.Get(), &restartRequired));
    changes.Reset();
    EXPECT_EQ(0, restartRequired);
    EXPECT_EQ(1, ControllerCalls("SetPrimaryDeviceByIndex"));

    // The last reference waits for the pending restart: down, then up again.
    EXPECT_EQ(0u, expert.Detach()->Release());
    EXPECT_EQ(2, ControllerCalls("SetNetworkInterfaceState"));
}

TEST_F(ExpertItemsTest, ExpertsShareOneItemManagerUntilTheLastIsReleased) {
    InterfaceRef<IuxSysExpert3> second = plugin.CreateExpert();
    EXPECT_EQ((Names{kSystemItemName, L"eth0"}), ItemNames(expert.Get()));
    EXPECT_EQ((Names{kSystemItemName, L"eth0"}), ItemNames(second.Get()));
    EXPECT_EQ(1, ControllerCalls("GetDeviceHandlers"));

    EXPECT_EQ(0u, expert.Detach()->Release());
    EXPECT_EQ((Names{kSystemItemName, L"eth0"}), ItemNames(second.Get()));
    EXPECT_EQ(1, ControllerCalls("GetDeviceHandlers"));

    EXPECT_EQ(0u, second.Detach()->Release());
    expert = plugin.CreateExpert();
    EXPECT_EQ((Names{kSystemItemName, L"eth0"}), ItemNames(expert.Get()));
    EXPECT_EQ(2, ControllerCalls("GetDeviceHandlers"));
}

}  // namespace
}  // namespace kest::test::e2e
