// The plug-in as a host sees it: the factory as its only exported symbol, raw interface pointers
// from it, their identities and counts, and the operations at fixed slots of their tables.
#include <gtest/gtest.h>

#include <cstdio>
#include <regex>
#include <string>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

constexpr GUID kKestExpertClassId = {
    0x999d9aa4, 0x5475, 0x4ca7, {0xa5, 0x60, 0x93, 0xc5, 0x1b, 0x5b, 0xfc, 0xeb}};
constexpr IID kUnknownIdentifier = {
    0x01234567, 0x89ab, 0xcdef, {0x01, 0x23, 0x45, 0x67, 0x89, 0xab, 0xcd, 0xef}};
const IID* const kPrimaryIdentifiers[] = {&IID_IUnknown, &IID_IuxSysExpert, &IID_IuxSysExpert2,
                                          &IID_IuxSysExpert3};

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

    // The interface `iid` of `from`, which must answer it.
    IUnknown* Query(IUnknown* from, const IID& iid) {
        void* result = nullptr;
        EXPECT_EQ(S_OK, from->QueryInterface(iid, &result));
        EXPECT_NE(nullptr, result);
        return static_cast<IUnknown*>(result);
    }

    kest::hostkit::Plugin plugin{KEST_PLUGIN_PATH};
    IuxSysExpert3* expert = nullptr;
};

// The factory hands out exactly one reference, which the primary identifiers share.
TEST_F(ExpertObjectModelTest, PrimaryIdentifiersYieldThePrimaryPointer) {
    EXPECT_EQ(E_POINTER, plugin.Factory()(nullptr));
    for (const IID* iid : kPrimaryIdentifiers) {
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
        for (const IID* iid : kPrimaryIdentifiers) {
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

// Unmapped identifiers give no interface and null; the operations answer at their slots.
TEST_F(ExpertObjectModelTest, UnmappedIdentifiersAndOperationsAtTheirSlots) {
    GUID classId{};
    ASSERT_EQ(S_OK, expert->GetExpertClassId(&classId));
    EXPECT_TRUE(classId == kKestExpertClassId);
    EXPECT_EQ(E_POINTER, expert->GetExpertClassId(nullptr));
    const std::pair<int, const wchar_t*> strings[] = {
        {4, L"KEST Configuration"}, {5, L"22.5"}, {6, L"vqsyscfg"}};
    for (const auto& [slot, expectedText] : strings) {
        CvqBStr text = nullptr;
        ASSERT_EQ(S_OK, CallSlot<HRESULT>(expert, slot, &text)) << slot;
        EXPECT_EQ(expectedText, TakeWideHostString(text));
        EXPECT_EQ(E_POINTER, CallSlot<HRESULT>(expert, slot, static_cast<CvqBStr*>(nullptr)));
    }

    IUnknown* firmware = Query(expert, IID_IuxSysExpertFirmware);
    const std::pair<IUnknown*, const IID*> unmapped[] = {{expert, &IID_IuxSysExpertImportExport},
                                                         {expert, &IID_IuxSysExpertInfo},
                                                         {expert, &kUnknownIdentifier},
                                                         {firmware, &IID_IuxSysExpertImportExport}};
    for (const auto& [object, iid] : unmapped) {
        void* result = &result;
        EXPECT_EQ(E_NOINTERFACE, object->QueryInterface(*iid, &result));
        EXPECT_EQ(nullptr, result);
    }
    const struct {
        IUnknown* object;
        int slot;
        HRESULT answer;
    } unsupported[] = {{expert, 13, E_NOTIMPL},
                       {expert, 14, E_NOTIMPL},
                       {expert, 17, S_FALSE},
                       {firmware, 5, E_NOTIMPL},
                       {firmware, 6, E_NOTIMPL}};
    for (const auto& entry : unsupported) {
        EXPECT_EQ(entry.answer, CallSlot<HRESULT>(entry.object, entry.slot)) << entry.slot;
    }
    firmware->Release();

    auto* notifications = static_cast<IuxSysFrameworkNotificationHandler*>(
        Query(expert, IID_IuxSysFrameworkNotificationHandler));
    for (uint32_t code : {0u, 1u, 0xFFFFFFFFu}) {
        EXPECT_EQ(E_NOTIMPL, notifications->HandleFrameworkNotification(code, expert));
    }
    notifications->Release();
}

TEST(ExportedSymbolsTest, OnlyTheFactoryIsDefined) {
    const std::string command = std::string("nm -D --defined-only '") + KEST_PLUGIN_PATH + "'";
    FILE* pipe = popen(command.c_str(), "r");
    ASSERT_NE(nullptr, pipe) << command;
    std::string lines;
    char buffer[512];
    while (std::fgets(buffer, sizeof buffer, pipe) != nullptr) {
        lines += buffer;
    }
    pclose(pipe);
    EXPECT_TRUE(std::regex_match(lines, std::regex("[0-9a-f]+ T createKestSysApiChassisExpert\n")))
        << lines;
}

}  // namespace
}  // namespace kest::test::e2e
