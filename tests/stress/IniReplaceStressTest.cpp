// INI files replaced while they are read: writers save whole documents by safe replacement while
// readers load the same file, and the process-wide INI cache serves reads while another thread
// sets and flushes values. Every load must succeed and give one whole document, every cached read
// a value that was written.
#include <gtest/gtest.h>

#include <atomic>
#include <ostream>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "common/TempSysroot.h"
#include "config/IniFileManager.h"
#include "config/IniText.h"
#include "config/IniTextPtr.h"
#include "uxsys/StatusCodes.h"

namespace kest::test::stress {

namespace {

constexpr int kVersions = 3;
constexpr int kSavesPerWriter = 150;
constexpr int kReaders = 3;
constexpr int kKeysPerVersion = 400;
constexpr int kFlushes = 100;

// Version `version` of the document: its keys all hold the version number, and a last key tells
// how many keys there are, so a torn or partial file is recognised.
IniTextPtr Version(int version) {
    IniTextPtr ini(IniText_Create());
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

struct ReplaceCase {
    const char* name;
    uint32_t writeFlags;
    int writers;
};

// Test names show the case's name rather than its bytes.
void PrintTo(const ReplaceCase& c, std::ostream* out) {
    *out << c.name;
}

class StressIniReplaceTest : public ::testing::TestWithParam<ReplaceCase> {};

TEST_P(StressIniReplaceTest, LoadsDuringReplacementSeeWholeDocuments) {
    kest::test::TempSysroot dir;
    const std::string path = dir.PathOf("/replaced.ini");
    IniTextPtr first = Version(0);
    IniText_SetWriteOptions(first.get(), kIniNoMaxLineLength, 0, GetParam().writeFlags);
    ASSERT_EQ(0, IniText_Save(first.get(), path.c_str()));

    std::atomic<int> writersRunning{GetParam().writers};
    std::atomic<int> failedSaves{0};
    std::atomic<int> brokenLoads{0};
    std::atomic<int> loads{0};
    std::vector<std::thread> threads;
    for (int writer = 0; writer < GetParam().writers; ++writer) {
        threads.emplace_back([&, writer] {
            std::vector<IniTextPtr> versions;
            for (int v = 0; v < kVersions; ++v) {
                versions.push_back(Version(v));
                IniText_SetWriteOptions(versions.back().get(), kIniNoMaxLineLength, 0,
                                        GetParam().writeFlags);
            }
            for (int save = 0; save < kSavesPerWriter; ++save) {
                IniText* next = versions[static_cast<size_t>((save + writer) % kVersions)].get();
                failedSaves += IniText_Save(next, path.c_str()) != 0;
            }
            --writersRunning;
        });
    }
    for (int reader = 0; reader < kReaders; ++reader) {
        threads.emplace_back([&] {
            while (writersRunning > 0) {
                brokenLoads += WholeVersion(path) < 0;
                ++loads;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(0, failedSaves.load());
    EXPECT_EQ(0, brokenLoads.load()) << "of " << loads.load() << " loads";
    EXPECT_GE(WholeVersion(path), 0);
}

INSTANTIATE_TEST_SUITE_P(
    StressReplacement, StressIniReplaceTest,
    ::testing::Values(ReplaceCase{"TemporaryNamedAfterTheTarget", kIniWriteSafeReplacement, 3},
                      ReplaceCase{"UniqueTemporaries",
                                  kIniWriteSafeReplacement | kIniWriteUniqueTemporary, 3}),
    [](const ::testing::TestParamInfo<ReplaceCase>& param) {
        return std::string(param.param.name);
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
    std::atomic<int> badReads{0};
    std::vector<std::thread> readers;
    for (int reader = 0; reader < kReaders; ++reader) {
        readers.emplace_back([&] {
            while (writing) {
                std::string value;
                badReads += cache->GetStringFromIni(path, "S", "Value", value) != S_OK ||
                            written.count(value) == 0;
            }
        });
    }
    int failedWrites = 0;
    for (int i = 0; i < kFlushes; ++i) {
        failedWrites +=
            cache->SetStringInIni(path, "S", "Value", "value " + std::to_string(i)) != S_OK;
        failedWrites += cache->FlushIniCache() != S_OK;
    }
    writing = false;
    for (std::thread& thread : readers) {
        thread.join();
    }
    EXPECT_EQ(0, failedWrites);
    EXPECT_EQ(0, badReads.load());
    IniTextPtr saved(IniText_Create());
    ASSERT_EQ(0, IniText_Load(saved.get(), path.c_str()));
    const char* value = nullptr;
    ASSERT_EQ(kIniFound, IniText_GetString(saved.get(), "S", "Value", &value));
    EXPECT_STREQ(value, ("value " + std::to_string(kFlushes - 1)).c_str());
}

}  // namespace

}  // namespace kest::test::stress
