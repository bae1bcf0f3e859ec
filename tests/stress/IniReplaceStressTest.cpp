// INI files replaced while they are read: writer processes save whole documents by safe
// replacement while reader threads load the same file, and the process-wide INI cache serves reads
// while another thread sets and flushes values. Every load must succeed and give one whole
// document, every cached read a value that was written.
#include <gtest/gtest.h>

#include <atomic>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "common/ChildProcess.h"
#include "common/TempSysroot.h"
#include "config/IniFileManager.h"
#include "config/IniText.h"
#include "config/IniTextPtr.h"
#include "uxsys/StatusCodes.h"

namespace kest::test::stress {

namespace {

constexpr int kVersions = 3;
constexpr int kSavesPerWriter = 150;
constexpr int kWriters = 3;
constexpr int kReaders = 3;
constexpr int kKeysPerVersion = 400;
constexpr int kFlushes = 100;

// Version `version` of the document: its keys all hold the version number, and a last key tells
// how many keys there are, so a torn or partial file is recognised.
IniTextPtr Version(int version, uint32_t writeFlags) {
    IniTextPtr ini(IniText_Create());
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, writeFlags);
    const int keys = kKeysPerVersion + version * 37;
    for (int k = 0; k < keys; ++k) {
        IniText_SetInt32(ini.get(), "Data", ("Key" + std::to_string(k)).c_str(), version);
    }
    IniText_SetInt32(ini.get(), "End", "Keys", keys);
    return ini;
}

// The version the file holds, or -1 when it is not one whole version.
int WholeVersion(const std::string& path) {
    IniTextPtr ini(IniText_Create());
    if (IniText_Load(ini.get(), path.c_str()) != 0) {
        return -1;
    }
    int32_t keys = 0;
    int32_t version = -1;
    if (IniText_GetInt32(ini.get(), "End", "Keys", &keys) != kIniFound ||
        IniText_GetKeyCount(ini.get(), "Data") != keys ||
        IniText_GetInt32(ini.get(), "Data", "Key0", &version) != kIniFound) {
        return -1;
    }
    for (int k = 0; k < keys; ++k) {
        int32_t value = -1;
        IniText_GetInt32(ini.get(), "Data", ("Key" + std::to_string(k)).c_str(), &value);
        if (value != version) {
            return -1;
        }
    }
    return keys == kKeysPerVersion + version * 37 ? version : -1;
}

// The parameter is the write flags.
class StressIniReplaceTest : public ::testing::TestWithParam<uint32_t> {};

TEST_P(StressIniReplaceTest, LoadsDuringReplacementSeeWholeDocuments) {
    kest::test::TempSysroot dir;
    const std::string path = dir.PathOf("/replaced.ini");
    std::vector<IniTextPtr> versions;
    for (int v = 0; v < kVersions; ++v) {
        versions.push_back(Version(v, GetParam()));
    }
    ASSERT_EQ(0, IniText_Save(versions[0].get(), path.c_str()));

    // The writers are forked before any reader thread starts.
    std::vector<pid_t> writers;
    for (int writer = 0; writer < kWriters; ++writer) {
        writers.push_back(kest::test::StartChild([&, writer] {
            for (int save = 0; save < kSavesPerWriter; ++save) {
                ASSERT_EQ(0, IniText_Save(
                                 versions[static_cast<size_t>((save + writer) % kVersions)].get(),
                                 path.c_str()));
            }
        }));
    }
    std::atomic<bool> writing{true};
    std::atomic<int> brokenLoads{0};
    std::atomic<int> loads{0};
    std::vector<std::thread> readers;
    for (int reader = 0; reader < kReaders; ++reader) {
        readers.emplace_back([&] {
            do {
                brokenLoads += WholeVersion(path) < 0;
                ++loads;
            } while (writing);
        });
    }
    for (const pid_t writer : writers) {
        EXPECT_TRUE(kest::test::ExitedCleanly(kest::test::WaitForChild(writer)))
            << "a writer failed a save";
    }
    writing = false;
    for (std::thread& thread : readers) {
        thread.join();
    }
    EXPECT_EQ(0, brokenLoads.load()) << "of " << loads.load() << " loads";
    EXPECT_GE(WholeVersion(path), 0);
}

INSTANTIATE_TEST_SUITE_P(StressReplacement, StressIniReplaceTest,
                         ::testing::Values(kIniWriteSafeReplacement,
                                           kIniWriteSafeReplacement | kIniWriteUniqueTemporary),
                         [](const ::testing::TestParamInfo<uint32_t>& param) {
                             return (param.param & kIniWriteUniqueTemporary) != 0
                                        ? "UniqueTemporaries"
                                        : "TemporaryNamedAfterTheTarget";
                         });

TEST(StressIniCacheTest, CachedReadsRaceSetsAndFlushes) {
    kest::test::TempSysroot dir;
    const std::string path = dir.PathOf("/cached.ini");
    const std::shared_ptr<IniFileManager> cache = IniFileManager::GetInstance();
    ASSERT_EQ(S_OK, cache->SetStringInIni(path, "S", "Value", "start"));
    ASSERT_EQ(S_OK, cache->FlushIniCache());
    std::set<std::string> written = {"start"};
    for (int i = 0; i < kFlushes; ++i) {
        written.insert("value " + std::to_string(i));
    }

    std::atomic<bool> writing{true};
    std::vector<std::thread> readers;
    for (int reader = 0; reader < kReaders; ++reader) {
        readers.emplace_back([&] {
            do {
                std::string value;
                EXPECT_EQ(S_OK, cache->GetStringFromIni(path, "S", "Value", value));
                EXPECT_EQ(1u, written.count(value)) << value;
            } while (writing);
        });
    }
    for (int i = 0; i < kFlushes; ++i) {
        EXPECT_EQ(S_OK, cache->SetStringInIni(path, "S", "Value", "value " + std::to_string(i)));
        EXPECT_EQ(S_OK, cache->FlushIniCache());
    }
    writing = false;
    for (std::thread& thread : readers) {
        thread.join();
    }
    IniTextPtr saved(IniText_Create());
    ASSERT_EQ(0, IniText_Load(saved.get(), path.c_str()));
    const char* value = nullptr;
    ASSERT_EQ(kIniFound, IniText_GetString(saved.get(), "S", "Value", &value));
    EXPECT_STREQ(value, ("value " + std::to_string(kFlushes - 1)).c_str());
}

}  // namespace

}  // namespace kest::test::stress
