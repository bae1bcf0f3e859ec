// Crash safety of INI saving with safe replacement: a child process saves two complete documents
// in turn, over and over, and is killed with SIGKILL at a random moment of a save, or saves once
// and is killed at a fixed point of it; after each kill the target must hold exactly one of the
// documents, byte for byte, and the next save must succeed.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <fstream>
#include <ostream>
#include <random>
#include <sstream>
#include <string>
#include <thread>

#include "common/TempSysroot.h"
#include "config/IniText.h"
#include "config/IniTextPtr.h"
#include "config/IniWriter.h"

namespace kest::test::stress {

namespace {

constexpr int kKills = 60;
constexpr int kKeys = 4000;
constexpr int kMaxDelayMicroseconds = 3000;

std::string ReadAll(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream content;
    content << file.rdbuf();
    return content.str();
}

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

// Forks a child that saves `first` and `second` to `path` in turn without end, writing one byte
// to the returned pipe as each save starts.
pid_t StartSaver(IniText* first, IniText* second, const std::string& path, int* startedSaves) {
    int ends[2];
    if (pipe(ends) != 0) {
        return -1;
    }
    const pid_t child = fork();
    if (child == 0) {
        close(ends[0]);
        for (int save = 0;; ++save) {
            const char started = 's';
            if (write(ends[1], &started, 1) != 1 ||
                IniText_Save(save % 2 == 0 ? first : second, path.c_str()) != 0) {
                _exit(1);
            }
        }
    }
    close(ends[1]);
    *startedSaves = ends[0];
    return child;
}

struct CrashCase {
    const char* name;
    uint32_t writeFlags;
};

// Test names show the case's name rather than its bytes.
void PrintTo(const CrashCase& c, std::ostream* out) {
    *out << c.name;
}

class IniCrashSafetyTest : public ::testing::TestWithParam<CrashCase> {};

TEST_P(IniCrashSafetyTest, KilledSavesLeaveTheOldOrTheNewDocument) {
    kest::test::TempSysroot dir;
    const std::string target = dir.PathOf("/settings.ini");
    IniTextPtr oldDocument = Document("old", GetParam().writeFlags);
    IniTextPtr newDocument = Document("new", GetParam().writeFlags);
    ASSERT_EQ(0, IniText_Save(newDocument.get(), target.c_str()));
    const std::string newBytes = ReadAll(target);
    ASSERT_EQ(0, IniText_Save(oldDocument.get(), target.c_str()));
    const std::string oldBytes = ReadAll(target);
    ASSERT_NE(oldBytes, newBytes);

    std::mt19937 random(20240611);
    int oldSeen = 0;
    int newSeen = 0;
    for (int kill = 0; kill < kKills; ++kill) {
        int startedSaves = -1;
        const pid_t child = StartSaver(newDocument.get(), oldDocument.get(), target, &startedSaves);
        ASSERT_GT(child, 0);
        // Let one to three saves begin, then kill the child some time into the last one.
        char started[3];
        const size_t saves = 1 + random() % 3;
        size_t received = 0;
        while (received < saves) {
            const ssize_t count = read(startedSaves, started, saves - received);
            ASSERT_GT(count, 0) << "the saving child stopped by itself";
            received += static_cast<size_t>(count);
        }
        std::this_thread::sleep_for(std::chrono::microseconds(random() % kMaxDelayMicroseconds));
        ASSERT_EQ(0, ::kill(child, SIGKILL));
        int status = 0;
        ASSERT_EQ(child, waitpid(child, &status, 0));
        close(startedSaves);
        ASSERT_TRUE(WIFSIGNALED(status)) << "the saving child failed a save";

        const std::string bytes = ReadAll(target);
        ASSERT_TRUE(bytes == oldBytes || bytes == newBytes)
            << "after kill " << kill << " the target holds " << bytes.size() << " bytes";
        (bytes == oldBytes ? oldSeen : newSeen) += 1;
    }
    std::cout << "old document seen " << oldSeen << " times, new " << newSeen << " times\n";
}

INSTANTIATE_TEST_SUITE_P(
    SafeReplacement, IniCrashSafetyTest,
    ::testing::Values(CrashCase{"FixedTemporary", kIniWriteSafeReplacement},
                      CrashCase{"UniqueTemporary",
                                kIniWriteSafeReplacement | kIniWriteUniqueTemporary},
                      CrashCase{"Synchronised", kIniWriteSafeReplacement | kIniWriteSync}),
    [](const ::testing::TestParamInfo<CrashCase>& param) { return std::string(param.param.name); });

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
                const std::string newBytes = ReadAll(dir.PathOf("/new.ini"));
                if (existed) {
                    ASSERT_EQ(0, IniText_Save(oldDocument.get(), target.c_str()));
                }
                const std::string oldBytes = ReadAll(target);
                killStage = stage;
                const pid_t child = fork();
                if (child == 0) {
                    kest::ini::SetSaveStageObserver([](SaveStage reached) {
                        if (reached == killStage) {
                            raise(SIGKILL);
                        }
                    });
                    _exit(IniText_Save(newDocument.get(), target.c_str()) == 0 ? 0 : 1);
                }
                int status = 0;
                ASSERT_EQ(child, waitpid(child, &status, 0));
                ASSERT_TRUE(WIFSIGNALED(status)) << "the save did not reach the point";
                const bool renamed = stage == SaveStage::kRenamed;
                const std::string context = "stage " + std::to_string(static_cast<int>(stage)) +
                                            (existed ? ", over a file" : ", no file before");
                EXPECT_EQ(existed || renamed, access(target.c_str(), F_OK) == 0) << context;
                EXPECT_TRUE(ReadAll(target) == (renamed ? newBytes : oldBytes)) << context;
                // The temporary left behind does not block the next save.
                ASSERT_EQ(0, IniText_Save(oldDocument.get(), target.c_str())) << context;
                ASSERT_EQ(0, IniText_Save(newDocument.get(), target.c_str())) << context;
                EXPECT_TRUE(ReadAll(target) == newBytes) << context;
            }
        }
    }
}

}  // namespace

}  // namespace kest::test::stress
