// The expert as a host sees it: raw interface pointers from the loaded plug-in.
#include <gtest/gtest.h>

#include <string>

#include "ExpertHost.h"

namespace kest::test::e2e {

namespace {

constexpr GUID kKestExpertClassId = {
    0x999d9aa4, 0x5475, 0x4ca7, {0xa5, 0x60, 0x93, 0xc5, 0x1b, 0x5b, 0xfc, 0xeb}};
constexpr IID kUnknownIdentifier = {
    0x01234567, 0x89ab, 0xcdef, {0x01, 0x23, 0x45, 0x67, 0x89, 0xab, 0xcd, 0xef}};

class ExpertObjectModelTest : public ::testing::Test {
  protected:
    void SetUp() override {
        ASSERT_EQ(S_OK, plugin.Factory()(&expert));
        ASSERT_NE(nullptr, expert);
    }
    void TearDown() override {
        if (expert != nullptr) {
            EXPECT_EQ(0u, expert->Release());
        }
    }

    // The interface `iid` of the expert, which must answer it.
    IUnknown* Query(IUnknown* from, const IID& iid) {
        void* result = nullptr;
        EXPECT_EQ(S_OK, from->QueryInterface(iid, &result));
        EXPECT_NE(nullptr, result);
        return static_cast<IUnknown*>(result);
    }

    kest::hostkit::Plugin plugin{KEST_PLUGIN_PATH};
    IuxSysExpert3* expert = nullptr;
};

TEST_F(ExpertObjectModelTest, FactoryRejectsANullResultPointer) {
    EXPECT_EQ(E_POINTER, plugin.Factory()(nullptr));
}

TEST_F(ExpertObjectModelTest, FactoryHandsOutExactlyOneReference) {
    EXPECT_EQ(2u, expert->AddRef());
    EXPECT_EQ(1u, expert->Release());
    EXPECT_EQ(0u, expert->Release());
    expert = nullptr;
}

TEST_F(ExpertObjectModelTest, PrimaryIdentifiersAndIUnknownYieldThePrimaryPointer) {
    for (const IID* iid :
         {&IID_IUnknown, &IID_IuxSysExpert, &IID_IuxSysExpert2, &IID_IuxSysExpert3}) {
        IUnknown* result = Query(expert, *iid);
        EXPECT_EQ(static_cast<void*>(expert), static_cast<void*>(result));
        EXPECT_EQ(3u, result->AddRef());
        EXPECT_EQ(2u, result->Release());
        EXPECT_EQ(1u, result->Release());
    }
}

TEST_F(ExpertObjectModelTest, SecondaryInterfacesShareTheIdentityAndTheCount) {
    uint32_t expected = 1;
    for (const IID* secondary : {&IID_IuxSysExpertPlugPlay, &IID_IuxSysExpertFirmware,
                                 &IID_IuxSysFrameworkNotificationHandler}) {
        SCOPED_TRACE(testing::Message() << "secondary " << std::hex << secondary->Data1);
        IUnknown* second = Query(expert, *secondary);
        EXPECT_NE(static_cast<void*>(expert), static_cast<void*>(second));
        EXPECT_EQ(++expected + 1, second->AddRef());
        EXPECT_EQ(expected, second->Release());
        for (const IID* iid :
             {&IID_IUnknown, &IID_IuxSysExpert, &IID_IuxSysExpert2, &IID_IuxSysExpert3}) {
            IUnknown* back = Query(second, *iid);
            EXPECT_EQ(static_cast<void*>(expert), static_cast<void*>(back));
            EXPECT_EQ(expected, back->Release());
        }
        IUnknown* again = Query(second, *secondary);
        EXPECT_EQ(static_cast<void*>(second), static_cast<void*>(again));
        again->Release();
    }
    // The three secondary references are still held: release them through the primary pointer.
    EXPECT_EQ(3u, expert->Release());
    EXPECT_EQ(2u, expert->Release());
    EXPECT_EQ(1u, expert->Release());
}

TEST_F(ExpertObjectModelTest, UnmappedIdentifiersGiveNoInterfaceAndNull) {
    for (const IID* iid :
         {&IID_IuxSysExpertImportExport, &IID_IuxSysExpertInfo, &kUnknownIdentifier}) {
        void* result = &result;
        EXPECT_EQ(E_NOINTERFACE, expert->QueryInterface(*iid, &result));
        EXPECT_EQ(nullptr, result);
    }
    IUnknown* firmware = Query(expert, IID_IuxSysExpertFirmware);
    void* result = &result;
    EXPECT_EQ(E_NOINTERFACE, firmware->QueryInterface(IID_IuxSysExpertImportExport, &result));
    EXPECT_EQ(nullptr, result);
    firmware->Release();
}

TEST_F(ExpertObjectModelTest, IdentityOperationsAnswerAtTheirSlots) {
    GUID classId{};
    ASSERT_EQ(S_OK, expert->GetExpertClassId(&classId));
    EXPECT_TRUE(classId == kKestExpertClassId);

    const struct {
        int slot;
        const wchar_t* text;
    } strings[] = {{4, L"KEST Configuration"}, {5, L"22.5"}, {6, L"vqsyscfg"}};
    for (const auto& entry : strings) {
        SCOPED_TRACE(entry.slot);
        CvqBStr text = nullptr;
        ASSERT_EQ(S_OK, CallSlot<HRESULT>(expert, entry.slot, &text));
        EXPECT_EQ(std::wstring(entry.text), TakeWideHostString(text));
        EXPECT_EQ(E_POINTER, CallSlot<HRESULT>(expert, entry.slot, static_cast<CvqBStr*>(nullptr)));
    }
    EXPECT_EQ(E_POINTER, expert->GetExpertClassId(nullptr));
}

TEST_F(ExpertObjectModelTest, UnsupportedSlotsAnswerTheirConstants) {
    EXPECT_EQ(E_NOTIMPL, CallSlot<HRESULT>(expert, 13));
    EXPECT_EQ(E_NOTIMPL, CallSlot<HRESULT>(expert, 14));
    EXPECT_EQ(S_FALSE, CallSlot<HRESULT>(expert, 17));

    auto* firmware = static_cast<IuxSysExpertFirmware*>(Query(expert, IID_IuxSysExpertFirmware));
    EXPECT_EQ(E_NOTIMPL, CallSlot<HRESULT>(firmware, 5));
    EXPECT_EQ(E_NOTIMPL, CallSlot<HRESULT>(firmware, 6));
    firmware->Release();

    auto* notifications = static_cast<IuxSysFrameworkNotificationHandler*>(
        Query(expert, IID_IuxSysFrameworkNotificationHandler));
    for (uint32_t code : {0u, 1u, 0xFFFFFFFFu}) {
        EXPECT_EQ(E_NOTIMPL, notifications->HandleFrameworkNotification(code, expert));
    }
    notifications->Release();
}

}  // namespace

}  // namespace kest::test::e2e
