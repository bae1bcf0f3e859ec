// Import matching and plug-and-play registration as a host reaches them. The interface map does
// not hand out the import interface, so a host calls those operations at the slots that follow
// the primary chain in the expert's own table.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

constexpr int kGetImportableTagsSlot = 21;
constexpr int kGetMatchingItemsSlot = 22;
constexpr int kUnsupportedImportSlot = 23;

class ImportAndPlugPlayTest : public ExpertHostTest {
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

TEST_F(ImportAndPlugPlayTest, NoItemHasImportableTags) {
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

TEST_F(ImportAndPlugPlayTest, MatchingItemsFollowTheDescribedName) {
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

TEST_F(ImportAndPlugPlayTest, PlugPlayCallbackIsHeldOnceUntilReplacedOrTheExpertGoes) {
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
