// Crash safety of INI saving with safe replacement: a child process saves two complete documents
// in turn, over and over, and is killed with SIGKILL at a random moment of a save, or saves once
// and is killed at a fixed point of it; after each kill the target must hold exactly one of the
// documents, byte for byte, and the next save must succeed.
#include <gtest/gtest.h>
#include <signal.h>
#include <unistd.h>

#include <chrono>
#include <random>
#include <string>
#include <thread>

#include "common/ChildProcess.h"
#include "common/TempSysroot.h"
#include "config/IniText.h"
#include "config/IniTextPtr.h"
#include "config/IniWriter.h"

namespace kest::test::stress {

namespace {

constexpr int kKills = 60;
constexpr int kKeys = 4000;
constexpr int kMaxDelayMicroseconds = 3000;

// A document of `kKeys` keys whose values all carry `mark`, with the write options under test.
IniTextPtr Document(const std::string& mark, uint32_t writeFlags) {
    IniTextPtr ini(IniText_Create());
    for (int k = 0; k < kKeys; ++k) {
        IniText_SetRaw(ini.get(), "Data", ("Key" + std::to_string(k)).c_str(),
                       (mark + std::to_string(k)).c_str(), 0);
    }
    IniText_SetRaw(ini.get(), "End", "Mark", mark.c_str(), 0);
    IniText_SetWriteOptions(ini.get(), kIniNoMaxLineLength, 0, writeFlags);
    return ini;
}

// The parameter is the write flags.
class IniCrashSafetyTest : public ::testing::TestWithParam<uint32_t> {};

TEST_P(IniCrashSafetyTest, KilledSavesLeaveTheOldOrTheNewDocument) {
    kest::test::TempSysroot dir;
    const std::string target = dir.PathOf("/settings.ini");
    IniTextPtr oldDocument = Document("old", GetParam());
    IniTextPtr newDocument = Document("new", GetParam());
    ASSERT_EQ(0, IniText_Save(newDocument.get(), target.c_str()));
    const std::string newBytes = dir.ReadFile("/settings.ini");
    ASSERT_EQ(0, IniText_Save(oldDocument.get(), target.c_str()));
    const std::string oldBytes = dir.ReadFile("/settings.ini");
    ASSERT_NE(oldBytes, newBytes);

    std::mt19937 random(20240611);
    for (int kill = 0; kill < kKills; ++kill) {
        // The child saves the documents in turn without end, writing a byte as each save starts.
        int started[2];
        ASSERT_EQ(0, pipe(started));
        const pid_t child = kest::test::StartChild([&] {
            close(started[0]);
            for (int save = 0;; ++save) {
                const char mark = 's';
                if (write(started[1], &mark, 1) != 1 ||
                    IniText_Save(save % 2 == 0 ? newDocument.get() : oldDocument.get(),
                                 target.c_str()) != 0) {
                    return;
                }
            }
        });
        close(started[1]);
        ASSERT_GT(child, 0);
        // Let one to three saves begin, then kill the child some time into the last one.
        char marks[3];
        for (size_t wanted = 1 + random() % 3, received = 0; received < wanted;) {
            const ssize_t count = read(started[0], marks, wanted - received);
            ASSERT_GT(count, 0) << "the saving child stopped by itself";
            received += static_cast<size_t>(count);
        }
        std::this_thread::sleep_for(std::chrono::microseconds(random() % kMaxDelayMicroseconds));
        ASSERT_EQ(0, ::kill(child, SIGKILL));
        const int status = kest::test::WaitForChild(child);
        close(started[0]);
        ASSERT_TRUE(WIFSIGNALED(status)) << "the saving child failed a save";
        const std::string bytes = dir.ReadFile("/settings.ini");
        ASSERT_TRUE(bytes == oldBytes || bytes == newBytes)
            << "after kill " << kill << " the target holds " << bytes.size() << " bytes";
    }
}

INSTANTIATE_TEST_SUITE_P(SafeReplacement, IniCrashSafetyTest,
                         ::testing::Values(kIniWriteSafeReplacement,
                                           kIniWriteSafeReplacement | kIniWriteUniqueTemporary,
                                           kIniWriteSafeReplacement | kIniWriteSync),
                         [](const ::testing::TestParamInfo<uint32_t>& param) {
                             return (param.param & kIniWriteUniqueTemporary) != 0
                                        ? "UniqueTemporary"
                                    : (param.param & kIniWriteSync) != 0 ? "Synchronised"
                                                                         : "FixedTemporary";
                         });

// The point at which the saving child kills itself.
kest::ini::SaveStage killStage;

TEST(IniCrashSafetyStagesTest, SavesKilledAtFixedPointsLeaveOneWholeDocument) {
    using kest::ini::SaveStage;
    for (uint32_t flags : {kIniWriteSafeReplacement,
                           kIniWriteSafeReplacement | kIniWriteUniqueTemporary | kIniWriteSync}) {
        for (SaveStage stage :
             {SaveStage::kTemporaryCreated, SaveStage::kTemporaryWritten, SaveStage::kRenamed}) {
            for (bool existed : {false, true}) {
                kest::test::TempSysroot dir;
                const std::string target = dir.PathOf("/settings.ini");
                IniTextPtr oldDocument = Document("old", flags);
                IniTextPtr newDocument = Document("new", flags);
                ASSERT_EQ(0, IniText_Save(newDocument.get(), dir.PathOf("/new.ini").c_str()));
                const std::string newBytes = dir.ReadFile("/new.ini");
                if (existed) {
                    ASSERT_EQ(0, IniText_Save(oldDocument.get(), target.c_str()));
                }
                const std::string oldBytes = dir.ReadFile("/settings.ini");
                killStage = stage;
                const int status = kest::test::WaitForChild(kest::test::StartChild([&] {
                    kest::ini::SetSaveStageObserver([](SaveStage reached) {
                        if (reached == killStage) {
                            raise(SIGKILL);
                        }
                    });
                    IniText_Save(newDocument.get(), target.c_str());
                }));
                ASSERT_TRUE(WIFSIGNALED(status)) << "the save did not reach the point";
                const bool renamed = stage == SaveStage::kRenamed;
                const std::string context = "stage " + std::to_string(static_cast<int>(stage)) +
                                            (existed ? ", over a file" : ", no file before");
                EXPECT_EQ(existed || renamed, dir.Exists("/settings.ini")) << context;
                EXPECT_TRUE(dir.ReadFile("/settings.ini") == (renamed ? newBytes : oldBytes))
                    << context;
                // The temporary left behind does not block the next save.
                ASSERT_EQ(0, IniText_Save(oldDocument.get(), target.c_str())) << context;
                ASSERT_EQ(0, IniText_Save(newDocument.get(), target.c_str())) << context;
                EXPECT_TRUE(dir.ReadFile("/settings.ini") == newBytes) << context;
            }
        }
    }
}

}  // namespace

}  // namespace kest::test::stress
