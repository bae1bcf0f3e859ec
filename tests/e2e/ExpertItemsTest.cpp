// The item entry points as a host drives them: discovery, lookups, refreshes, validation, search,
// persisting an address, import matching (at the slots after the primary chain, as the interface
// map does not hand out the import interface) and plug-and-play registration.
#include <gtest/gtest.h>
#include <time.h>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

using Names = std::vector<std::wstring>;

constexpr int kGetImportableTagsSlot = 21;
constexpr int kGetMatchingItemsSlot = 22;
constexpr int kUnsupportedImportSlot = 23;
constexpr uint32_t kIPAddressTag = 0x0D107000;
constexpr wchar_t kEth0[] = L"eth0";

double MonotonicMs() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<double>(now.tv_sec) * 1000.0 + static_cast<double>(now.tv_nsec) / 1e6;
}

class ExpertItemsTest : public ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(StateWithDevice(1, "eth0"));
        ExpertHostTest::SetUp();
    }

    HRESULT GetMatchingItems(IuxSysPropertyBag* description, CvqBStr* exactName,
                             IuxSysEnumStringList** names, void** reserved) {
        return CallSlot<HRESULT>(expert.Get(), kGetMatchingItemsSlot, description, exactName, names,
                                 reserved);
    }

    // An item description: the adapter's own properties with the item name `name`.
    InterfaceRef<IuxSysPropertyBag> DescriptionNaming(const wchar_t* name) {
        InterfaceRef<IuxSysPropertyBag> bag;
        EXPECT_EQ(S_OK, expert->GetPropertiesOfItem(L"eth0", bag.Receive()));
        EXPECT_EQ(S_OK, bag->SetString(kItemNameTag, name));
        return bag;
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

// Validation hands out no enumerator when nothing changed or a value is refused.
TEST_F(ExpertItemsTest, ValidationAnswersWithStatusAndMessage) {
    const struct {
        const wchar_t* hostName;  // null: nothing modified
        HRESULT status;
        const wchar_t* message;
    } cases[] = {{nullptr, S_FALSE, L""},
                 {L"kest_2", UX_E_HOSTNAME_INVALID,
                  L"Hostname must contain only alphanumeric characters and hyphens."}};
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
    }
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

// A new static address of eth0 is written at once while the interface restarts on its own thread
// after the answer, and a second persist waits for the restart that is still running.
TEST_F(ExpertItemsTest, NewEthernetAddressesAreWrittenAtOnceAndEachRestartFollowsTheAnswer) {
    WriteControllerState(std::string(kSystemState) +
                         "[Network]\nPrimaryDeviceIndex = 0\n[Device0]\nType = 1\n"
                         "InterfaceName = eth0\nIndex = 0\nMACAddress = 00:80:2F:12:34:56\n"
                         "Mode = 2\nSupportedModes = 3\nRequestMode = 1\n"
                         "SupportedRequestModes = 3\nIPAddress = 192.168.1.10\n"
                         "SubnetMask = 255.255.255.0\nGateway = 192.168.1.1\n"
                         "DNSServer = 192.168.1.2\nCurrentMediaMode = 4\n"
                         "PreferredMediaMode = 4\n");
    InterfaceRef<IuxSysPropertyBag> properties;
    ASSERT_EQ(S_OK, expert->GetPropertiesOfItem(kEth0, properties.Receive()));
    const auto bag = kest::hostkit::QueryInterfaceAs<IuxSysPropertyBag2>(properties.Get(),
                                                                         IID_IuxSysPropertyBag2);
    ASSERT_TRUE(bag);
    bag->ClearAllModified();
    ASSERT_EQ(S_OK, bag->SetString(kIPAddressTag, L"10.0.0.5"));
    ASSERT_EQ(S_OK, bag->SetString(0x0D109000, L"255.255.0.0"));
    ASSERT_EQ(S_OK, bag->SetString(0x0D10A000, L"10.0.0.1"));
    int32_t restart = -1;
    ASSERT_EQ(S_OK, expert->PersistPropertyChanges(kEth0, bag.Get(), &restart));
    const double returnedMs = MonotonicMs();
    EXPECT_EQ(0, restart);
    EXPECT_EQ(1u, ControllerCalls("Set").size());
    // The second address comes after the first restart ended; the second restart runs on until
    // the expert is released.
    ASSERT_EQ(S_OK, bag->SetString(kIPAddressTag, L"10.0.0.6"));
    ASSERT_EQ(S_OK, expert->PersistPropertyChanges(kEth0, bag.Get(), &restart));
    expert.Reset();

    std::vector<double> times;
    const std::string address = "SetDeviceIPConfigByIndex\t0\t0\t0\t1\t2\t10.0.0.";
    const std::string rest = "\t255.255.0.0\t10.0.0.1\t192.168.1.2";
    const std::vector<std::string> expected = {address + "5" + rest,
                                               "SetNetworkInterfaceState\t0\teth0\t0",
                                               "SetNetworkInterfaceState\t0\teth0\t1",
                                               "SetDeviceSettings\t0\t0\t4\t0\t0",
                                               address + "6" + rest,
                                               "SetNetworkInterfaceState\t0\teth0\t0",
                                               "SetNetworkInterfaceState\t0\teth0\t1",
                                               "SetDeviceSettings\t0\t0\t4\t0\t0"};
    EXPECT_EQ(expected, ControllerCalls("Set", &times));
    ASSERT_EQ(8u, times.size());
    // The log keeps three decimals, so a logged time may lie up to 1 µs before the call.
    EXPECT_GE(times[1] + 0.001, returnedMs);
}

TEST_F(ExpertItemsTest, NoItemHasImportableTags) {
    const std::pair<const wchar_t*, HRESULT> cases[] = {{kSystemItemName, S_FALSE},
                                                        {L"eth0", S_FALSE},
                                                        {L"ETH0", S_FALSE},
                                                        {L"eth7", UX_E_ITEM_NOT_FOUND}};
    for (const auto& [item, status] : cases) {
        IuxSysEnumPropertyTag* tags = reinterpret_cast<IuxSysEnumPropertyTag*>(&tags);
        EXPECT_EQ(status, CallSlot<HRESULT>(expert.Get(), kGetImportableTagsSlot, item, &tags));
        EXPECT_EQ(nullptr, tags);
    }
    EXPECT_EQ(E_POINTER, CallSlot<HRESULT>(expert.Get(), kGetImportableTagsSlot, L"eth0",
                                           static_cast<IuxSysEnumPropertyTag**>(nullptr)));
    EXPECT_EQ(E_NOTIMPL, CallSlot<HRESULT>(expert.Get(), kUnsupportedImportSlot));
}

TEST_F(ExpertItemsTest, MatchingItemsFollowTheDescribedName) {
    const struct {
        const wchar_t* described;
        std::vector<std::wstring> names;
        const wchar_t* exactName;  // null: no exact match
    } cases[] = {
        {L"eth0", {L"eth0"}, L"eth0"}, {L"ETH0", {L"eth0"}, L"eth0"},
        {L"eth1", {L"eth0"}, nullptr}, {L"Eth1", {}, nullptr},
        {L"et", {}, nullptr},          {kSystemItemName, {}, nullptr},
    };
    for (const auto& entry : cases) {
        SCOPED_TRACE(testing::Message() << "described " << entry.described);
        const InterfaceRef<IuxSysPropertyBag> description = DescriptionNaming(entry.described);
        CvqBStr exactName = nullptr;
        IuxSysEnumStringList* names = nullptr;
        void* reserved = &reserved;
        ASSERT_EQ(S_OK, GetMatchingItems(description.Get(), &exactName, &names, &reserved));
        EXPECT_EQ(nullptr, reserved);
        ASSERT_NE(nullptr, names);
        EXPECT_EQ(entry.names, TakeNames(names));
        EXPECT_EQ(entry.exactName != nullptr, exactName != nullptr);
        EXPECT_EQ(entry.exactName ? entry.exactName : L"", TakeWideHostString(exactName));
    }

    // Missing arguments, and a description without an item name.
    const InterfaceRef<IuxSysPropertyBag> description = DescriptionNaming(L"eth0");
    CvqBStr exactName = nullptr;
    IuxSysEnumStringList* names = nullptr;
    void* reserved = nullptr;
    EXPECT_EQ(E_POINTER, GetMatchingItems(description.Get(), &exactName, &names, nullptr));
    EXPECT_EQ(E_POINTER, GetMatchingItems(nullptr, &exactName, &names, &reserved));
    ASSERT_EQ(S_OK, description->RemoveTag(kItemNameTag));
    EXPECT_EQ(UX_E_PROPERTY_NOT_FOUND,
              GetMatchingItems(description.Get(), &exactName, &names, &reserved));
    EXPECT_EQ(nullptr, names);
    EXPECT_EQ(nullptr, exactName);
}

TEST_F(ExpertItemsTest, PlugPlayCallbackIsHeldOnceUntilReplacedOrTheExpertGoes) {
    RecordingSink callback(S_OK);
    auto plugPlay = kest::hostkit::QueryInterfaceAs<IuxSysExpertPlugPlay>(expert.Get(),
                                                                          IID_IuxSysExpertPlugPlay);
    EXPECT_EQ(S_OK, plugPlay->SetPlugPlayCallback(&callback));
    EXPECT_EQ(S_OK, plugPlay->SetPlugPlayCallback(&callback));
    EXPECT_EQ(2u, callback.References());
    EXPECT_EQ(S_OK, plugPlay->SetPlugPlayCallback(nullptr));
    EXPECT_EQ(1u, callback.References());

    EXPECT_EQ(S_OK, plugPlay->SetPlugPlayCallback(&callback));
    EXPECT_EQ(2u, callback.References());
    plugPlay.Reset();
    expert.Reset();
    EXPECT_EQ(1u, callback.References());
}

}  // namespace
}  // namespace kest::test::e2e
