// Import matching and plug-and-play registration as a host reaches them. The interface map does
// not hand out the import interface, so a host calls those operations at the slots that follow
// the primary chain in the expert's own table.
#include <gtest/gtest.h>

#include <atomic>
#include <string>
#include <vector>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

constexpr int kGetImportableTagsSlot = 21;
constexpr int kGetMatchingItemsSlot = 22;
constexpr int kUnsupportedImportSlot = 23;

// A host's plug-and-play callback that only counts its references.
class CountingCallback : public IUnknown {
  public:
    HRESULT QueryInterface(const IID& /*iid*/, void** object) override {
        *object = nullptr;
        return E_NOINTERFACE;
    }
    uint32_t AddRef() override { return ++references_; }
    uint32_t Release() override { return --references_; }
    uint32_t References() const { return references_; }

  private:
    std::atomic<uint32_t> references_{1};
};

class ImportAndPlugPlayTest : public ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(StateWithDevice(1, "eth0"));
        ExpertHostTest::SetUp();
    }

    HRESULT GetImportableTags(const wchar_t* item, IuxSysEnumPropertyTag** tags) {
        return CallSlot<HRESULT>(expert.Get(), kGetImportableTagsSlot, item, tags);
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

    InterfaceRef<IuxSysExpertPlugPlay> PlugPlay() {
        InterfaceRef<IuxSysExpertPlugPlay> plugPlay;
        EXPECT_EQ(S_OK, expert->QueryInterface(IID_IuxSysExpertPlugPlay,
                                               reinterpret_cast<void**>(plugPlay.Receive())));
        return plugPlay;
    }
};

TEST_F(ImportAndPlugPlayTest, NoItemHasImportableTags) {
    for (const wchar_t* item : {kSystemItemName, L"eth0", L"ETH0"}) {
        IuxSysEnumPropertyTag* tags = reinterpret_cast<IuxSysEnumPropertyTag*>(&tags);
        EXPECT_EQ(S_FALSE, GetImportableTags(item, &tags));
        EXPECT_EQ(nullptr, tags);
    }
    IuxSysEnumPropertyTag* tags = reinterpret_cast<IuxSysEnumPropertyTag*>(&tags);
    EXPECT_EQ(UX_E_ITEM_NOT_FOUND, GetImportableTags(L"eth7", &tags));
    EXPECT_EQ(nullptr, tags);
    EXPECT_EQ(E_POINTER, GetImportableTags(L"eth0", nullptr));
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
        if (entry.exactName != nullptr) {
            EXPECT_EQ(std::wstring(entry.exactName), TakeWideHostString(exactName));
        }
    }
}

TEST_F(ImportAndPlugPlayTest, MatchingItemsRejectsMissingArgumentsAndUnnamedDescriptions) {
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
    CountingCallback callback;
    InterfaceRef<IuxSysExpertPlugPlay> plugPlay = PlugPlay();
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
