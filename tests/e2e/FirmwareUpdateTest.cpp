// Firmware update as a host drives it: prepare, start with either kind of image source, follow
// the stand-in tool's progress, and the end of the worker at Uninitialize and destruction.
#include <dirent.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstring>
#include <functional>
#include <regex>
#include <thread>

#include "FirmwareHost.h"

namespace kest::test::e2e {
namespace {

constexpr char kImage[] = "new firmware image";

std::string NarrowText(const std::wstring& text) {
    return std::string(text.begin(), text.end());
}

ino_t InodeOf(const std::string& path) {
    struct stat status {};
    return lstat(path.c_str(), &status) == 0 ? status.st_ino : 0;
}

// The names in `directory` other than the staging file: temporaries left behind.
std::vector<std::string> LeftoverTemporaries(const std::string& directory) {
    std::vector<std::string> names;
    if (DIR* listing = opendir(directory.c_str())) {
        while (const dirent* entry = readdir(listing)) {
            const std::string name = entry->d_name;
            if (name != "." && name != ".." && name != "kestsysxp.fwupdate.cfg") {
                names.push_back(name);
            }
        }
        closedir(listing);
    }
    return names;
}

class FirmwareUpdateTest : public FirmwareHostTest {
  protected:
    // Runs `stop` on another thread while the tool waits: it must not return before the tool
    // has ended.
    void ExpectStopWaitsForTheTool(const std::function<void()>& stop) {
        std::atomic<bool> stopped{false};
        std::thread stopper([&] {
            stop();
            stopped = true;
        });
        std::this_thread::sleep_for(std::chrono::milliseconds(200));
        EXPECT_FALSE(stopped.load());
        ReleaseTool(0);
        stopper.join();
        EXPECT_TRUE(sysroot.Exists("/tool/finished"));
    }
};

TEST_F(FirmwareUpdateTest, InstallsImageBytesOverALongerStaleStagingFile) {
    sysroot.WriteFile(kStagingPath, std::string(4096, 'x'));
    const std::wstring id = Prepare(sizeof kImage - 1);
    EXPECT_TRUE(std::regex_match(NarrowText(id),
                                 std::regex("\\{[0-9A-F]{8}-[0-9A-F]{4}-[0-9A-F]{4}-[0-9A-F]{4}-"
                                            "[0-9A-F]{12}\\}")))
        << NarrowText(id);
    FirmwareStatus status = Poll();
    EXPECT_EQ(UX_FIRMWARE_STATE_PREPARED, status.state);
    EXPECT_EQ(20, status.percent);

    HostImage image(kImage, sizeof kImage - 1);
    ASSERT_EQ(S_OK, Start(id, image));
    EXPECT_EQ(1u, image.References());
    ReleaseTool(0);
    WaitForTool();

    status = Poll();
    EXPECT_EQ(S_OK, status.result);
    EXPECT_EQ(UX_FIRMWARE_STATE_INSTALLED, status.state);
    EXPECT_EQ(90, status.percent);
    EXPECT_EQ(kImage, sysroot.ReadFile("/tool/image"));
    EXPECT_EQ(sysroot.PathOf(kToolPath) + "\n" + sysroot.PathOf(kStagingPath) + "\n3\n",
              sysroot.ReadFile("/tool/args"));
    EXPECT_EQ(std::string::npos, sysroot.ReadFile("/tool/environment").find("KEST_SYSROOT"));
    EXPECT_TRUE(sysroot.Exists(kStagingPath));
    // An installed image keeps the expert busy for good.
    EXPECT_EQ(E_FAIL, PrepareStatus());
}

TEST_F(FirmwareUpdateTest, LinksAnImageFileToTheStagingPath) {
    sysroot.WriteFile("/images/firmware.bin", kImage);
    const std::string imagePath = sysroot.PathOf("/images/firmware.bin");
    HostImage image(std::wstring(imagePath.begin(), imagePath.end()));
    // The announced size is not compared with a linked file.
    ASSERT_EQ(S_OK, Start(Prepare(7), image));
    EXPECT_EQ(1u, image.References());
    EXPECT_EQ(InodeOf(imagePath), InodeOf(sysroot.PathOf(kStagingPath)));
    ReleaseTool(0);
    WaitForTool();
    EXPECT_EQ(UX_FIRMWARE_STATE_INSTALLED, Poll().state);
    EXPECT_EQ(kImage, sysroot.ReadFile("/tool/image"));
}

TEST_F(FirmwareUpdateTest, PrepareNeedsTwiceTheAnnouncedSizeFree) {
    // Without a staging directory there is no free space to measure.
    ASSERT_EQ(0, rmdir(sysroot.PathOf(kStagingDirectory).c_str()));
    EXPECT_EQ(E_FAIL, PrepareStatus());
    // A file system without free blocks: nothing but an empty image fits, also when twice the
    // size does not fit in 32 bits.
    struct statvfs proc {};
    ASSERT_EQ(0, statvfs("/proc", &proc));
    if (proc.f_bfree != 0) {
        GTEST_SKIP() << "/proc reports free blocks here";
    }
    ASSERT_EQ(0, symlink("/proc", sysroot.PathOf(kStagingDirectory).c_str()));
    for (uint32_t size : {1u, 0x80000000u, 0xFFFFFFFFu}) {
        SCOPED_TRACE(size);
        CvqBStr id = nullptr;
        EXPECT_EQ(E_FAIL, firmware->PrepareFirmwareUpdate(kSystemItemName, 0, size, &id));
        EXPECT_EQ(nullptr, id);
    }
    EXPECT_EQ(UX_FIRMWARE_STATE_IDLE, Poll().state);
    EXPECT_EQ(S_OK, PrepareStatus());
}

TEST_F(FirmwareUpdateTest, OnlyOnePreparedUpdateStartsAndNothingDisturbsItWhileItRuns) {
    HostImage image(kImage, sizeof kImage - 1);
    EXPECT_EQ(UX_E_FIRMWARE_BUSY, Start(L"{00000000-0000-0000-0000-000000000000}", image));
    EXPECT_EQ(UX_FIRMWARE_STATE_IDLE, Poll().state);

    const std::wstring id = Prepare(sizeof kImage - 1);
    EXPECT_EQ(E_FAIL, PrepareStatus());
    ASSERT_EQ(S_OK, Start(id, image));
    EXPECT_EQ(UX_E_FIRMWARE_BUSY, Start(id, image));
    EXPECT_EQ(E_FAIL, PrepareStatus());
    EXPECT_EQ(UX_FIRMWARE_STATE_RUNNING, Poll().state);
    ReleaseTool(0);
    WaitForTool();
    EXPECT_EQ(UX_FIRMWARE_STATE_INSTALLED, Poll().state);
    EXPECT_EQ(kImage, sysroot.ReadFile("/tool/image"));
}

TEST_F(FirmwareUpdateTest, RejectedStartsEndTheAttemptAndFreeTheExpert) {
    sysroot.WriteFile("/outside", "keep me");
    HostImage bytes(kImage, sizeof kImage - 1);
    HostImage shortImage(kImage, sizeof kImage - 2);
    HostImage failingPath(L"/nowhere", E_FAIL);
    HostImage missingFile(L"/nonexistent/firmware.bin");
    const std::string pipePath = sysroot.PathOf("/images/pipe");
    HostImage pipeFile(std::wstring(pipePath.begin(), pipePath.end()));
    sysroot.MakeDirectory("/images");
    const std::string staging = sysroot.PathOf(kStagingPath);
    const struct {
        const char* name;
        bool rightIdentifier;
        HostImage* image;  // null: no image source
        HRESULT expected;
        std::function<void()> prepareStaging;
    } cases[] = {
        {"wrong identifier", false, &bytes, UX_E_FIRMWARE_ID_MISMATCH, [] {}},
        {"wrong byte count", true, &shortImage, UX_E_FIRMWARE_STATUS_UNEXPECTED, [] {}},
        {"no image source", true, nullptr, E_POINTER, [] {}},
        {"image path refused", true, &failingPath, E_FAIL, [] {}},
        {"image file missing", true, &missingFile, E_FAIL, [] {}},
        // A pipe links like a file but would stall the tool.
        {"image file is a pipe", true, &pipeFile, E_FAIL,
         [&] { ASSERT_EQ(0, mkfifo(pipePath.c_str(), 0600)); }},
        {"staging path is a directory", true, &bytes, E_FAIL,
         [&] { ASSERT_EQ(0, mkdir(staging.c_str(), 0700)); }},
    };
    for (const auto& entry : cases) {
        SCOPED_TRACE(entry.name);
        unlink(staging.c_str());
        rmdir(staging.c_str());
        entry.prepareStaging();
        // Each Prepare succeeds only because the attempt before freed the expert.
        const std::wstring id = Prepare(sizeof kImage - 1);
        const std::wstring given = entry.rightIdentifier ? id : id + L"0";
        EXPECT_EQ(entry.expected, firmware->StartFirmwareUpdate(kSystemItemName, given.c_str(), 0,
                                                                nullptr, entry.image));
        if (entry.image != nullptr) {
            EXPECT_EQ(1u, entry.image->References());
        }
        const FirmwareStatus after = Poll();
        EXPECT_EQ(UX_FIRMWARE_STATE_FAILED, after.state);
        EXPECT_EQ(-1, after.percent);
        EXPECT_EQ(std::vector<std::string>{},
                  LeftoverTemporaries(sysroot.PathOf(kStagingDirectory)));
        unlink(pipePath.c_str());
    }
    EXPECT_FALSE(sysroot.Exists("/tool/args"));
}

// What stands at the staging path before an update, and where the host's image comes from.
struct StagingCase {
    const char* name;
    void (*prepare)(const kest::test::TempSysroot& sysroot);
    // The image file the host names; empty: the host hands over bytes.
    std::string (*imageFile)(const kest::test::TempSysroot& sysroot);
};

class FirmwareStagingTest : public FirmwareHostTest,
                            public testing::WithParamInterface<StagingCase> {};

// Whatever stood at the staging path is replaced, never written through, and the tool reads the
// host's image unchanged from its start to its end.
TEST_P(FirmwareStagingTest, TheToolReadsExactlyTheHostsImage) {
    sysroot.WriteFile("/outside", "keep me");
    GetParam().prepare(sysroot);
    const std::string imageFile = GetParam().imageFile ? GetParam().imageFile(sysroot) : "";
    HostImage bytes(kImage, sizeof kImage - 1);
    HostImage file(std::wstring(imageFile.begin(), imageFile.end()));
    ASSERT_EQ(S_OK, Start(Prepare(sizeof kImage - 1), imageFile.empty() ? bytes : file));
    ReleaseTool(0);
    WaitForTool();
    EXPECT_EQ(UX_FIRMWARE_STATE_INSTALLED, Poll().state);
    EXPECT_EQ(kImage, sysroot.ReadFile("/tool/image"));
    EXPECT_EQ(sysroot.ReadFile("/tool/sum.start"), sysroot.ReadFile("/tool/sum.end"));
    EXPECT_EQ("keep me", sysroot.ReadFile("/outside"));
    struct stat staged {};
    ASSERT_EQ(0, lstat(sysroot.PathOf(kStagingPath).c_str(), &staged));
    EXPECT_TRUE(S_ISREG(staged.st_mode));
    if (imageFile.empty()) {
        EXPECT_EQ(0600u, staged.st_mode & 07777);
        EXPECT_EQ(geteuid(), staged.st_uid);
    }
    EXPECT_EQ(std::vector<std::string>{}, LeftoverTemporaries(sysroot.PathOf(kStagingDirectory)));
}

std::string ImageInTheSysroot(const kest::test::TempSysroot& sysroot) {
    sysroot.WriteFile("/images/firmware.bin", kImage);
    return sysroot.PathOf("/images/firmware.bin");
}

INSTANTIATE_TEST_SUITE_P(
    Staging, FirmwareStagingTest,
    testing::Values(
        StagingCase{"PlantedSymbolicLink",
                    [](const kest::test::TempSysroot& sysroot) {
                        ASSERT_EQ(0, symlink(sysroot.PathOf("/outside").c_str(),
                                             sysroot.PathOf(kStagingPath).c_str()));
                    },
                    nullptr},
        StagingCase{"PlantedSecondNameOfAnotherFile",
                    [](const kest::test::TempSysroot& sysroot) {
                        ASSERT_EQ(0, link(sysroot.PathOf("/outside").c_str(),
                                          sysroot.PathOf(kStagingPath).c_str()));
                    },
                    nullptr},
        StagingCase{"PlantedPipe",
                    [](const kest::test::TempSysroot& sysroot) {
                        ASSERT_EQ(0, mkfifo(sysroot.PathOf(kStagingPath).c_str(), 0666));
                    },
                    nullptr},
        StagingCase{"LeftoverStagingFileBeforeALinkedImage",
                    [](const kest::test::TempSysroot& sysroot) {
                        sysroot.WriteFile(kStagingPath, "an earlier image");
                    },
                    &ImageInTheSysroot},
        StagingCase{"ImageNamedByARelativeSymbolicLink",
                    [](const kest::test::TempSysroot& sysroot) {
                        ImageInTheSysroot(sysroot);
                        ASSERT_EQ(
                            0, symlink("firmware.bin", sysroot.PathOf("/images/link.bin").c_str()));
                    },
                    [](const kest::test::TempSysroot& sysroot) {
                        return sysroot.PathOf("/images/link.bin");
                    }},
        // /dev/shm is a file system of its own on Linux; the image is copied from there.
        StagingCase{
            "ImageOnAnotherFileSystem",
            [](const kest::test::TempSysroot& sysroot) {
                const std::string shared = "/dev/shm/kest-image-" + std::to_string(getpid());
                FILE* file = fopen(shared.c_str(), "w");
                ASSERT_NE(nullptr, file);
                fputs(kImage, file);
                fclose(file);
                ASSERT_EQ(0, symlink(shared.c_str(), sysroot.PathOf("/images-elsewhere").c_str()));
            },
            [](const kest::test::TempSysroot& sysroot) {
                return sysroot.PathOf("/images-elsewhere");
            }}),
    [](const testing::TestParamInfo<StagingCase>& entry) { return entry.param.name; });

TEST_F(FirmwareUpdateTest, AStagingFilePlantedByAnotherUserAndRewrittenLaterIsNotInstalled) {
    // The sysroot is reachable for an unprivileged user and the staging directory is shared.
    ASSERT_EQ(0, chmod(sysroot.Root().c_str(), 0755));
    ASSERT_EQ(0, chmod(sysroot.PathOf(kStagingDirectory).c_str(), 01777));
    const std::string staging = sysroot.PathOf(kStagingPath);
    int planted[2];
    int rewrite[2];
    ASSERT_EQ(0, pipe(planted));
    ASSERT_EQ(0, pipe(rewrite));
    const pid_t user = fork();
    ASSERT_LE(0, user);
    if (user == 0) {
        // Only system calls between fork and _exit: the test process has other threads.
        char go = 0;
        if (setgid(65534) != 0 || setuid(65534) != 0) {
            _exit(2);
        }
        const int file = open(staging.c_str(), O_WRONLY | O_CREAT | O_EXCL, 0666);
        const bool written = file >= 0 && write(file, "planted", 7) == 7;
        if (write(planted[1], written ? "y" : "n", 1) != 1 || read(rewrite[0], &go, 1) != 1) {
            _exit(3);
        }
        static const char kEvil[] = "the user's own image";
        _exit(pwrite(file, kEvil, sizeof kEvil - 1, 0) == sizeof kEvil - 1 ? 0 : 4);
    }
    char answer = 0;
    ASSERT_EQ(1, read(planted[0], &answer, 1));
    ASSERT_EQ('y', answer);
    HostImage image(kImage, sizeof kImage - 1);
    ASSERT_EQ(S_OK, Start(Prepare(sizeof kImage - 1), image));
    WaitForToolStart();
    ASSERT_EQ(1, write(rewrite[1], "g", 1));
    int status = 0;
    ASSERT_EQ(user, waitpid(user, &status, 0));
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
    ReleaseTool(0);
    WaitForTool();
    EXPECT_EQ(UX_FIRMWARE_STATE_INSTALLED, Poll().state);
    EXPECT_EQ(kImage, sysroot.ReadFile("/tool/image"));
    EXPECT_EQ(sysroot.ReadFile("/tool/sum.start"), sysroot.ReadFile("/tool/sum.end"));
    EXPECT_EQ(kImage, sysroot.ReadFile(kStagingPath));
    for (int descriptor : {planted[0], planted[1], rewrite[0], rewrite[1]}) {
        close(descriptor);
    }
}

// A second expert of the same process stands for any other host: the controller runs one update.
TEST_F(FirmwareUpdateTest, TheUpdateLockAdmitsOneUpdatePerController) {
    const InterfaceRef<IuxSysExpert3> other = plugin.CreateExpert();
    ASSERT_EQ(S_OK, other->Initialize());
    InterfaceRef<IuxSysExpertFirmware> otherFirmware;
    ASSERT_EQ(S_OK, other->QueryInterface(IID_IuxSysExpertFirmware,
                                          reinterpret_cast<void**>(otherFirmware.Receive())));
    const auto otherPrepare = [&]() {
        CvqBStr id = nullptr;
        const HRESULT status =
            otherFirmware->PrepareFirmwareUpdate(kSystemItemName, 0, sizeof kImage - 1, &id);
        return std::make_pair(status, TakeWideHostString(id));
    };

    const std::wstring id = Prepare(sizeof kImage - 1);
    EXPECT_EQ(std::to_string(getpid()) + "\n", sysroot.ReadFile(kUpdateLockPath));
    EXPECT_EQ(E_FAIL, otherPrepare().first);
    // Uninitialize lets go of an update that was prepared but not started; starting it later
    // needs the lock back.
    ASSERT_EQ(S_OK, expert->Uninitialize());
    const auto [otherStatus, otherId] = otherPrepare();
    ASSERT_EQ(S_OK, otherStatus);
    HostImage image(kImage, sizeof kImage - 1);
    EXPECT_EQ(E_FAIL, Start(id, image));
    EXPECT_EQ(UX_FIRMWARE_STATE_FAILED, Poll().state);

    ASSERT_EQ(S_OK, otherFirmware->StartFirmwareUpdate(kSystemItemName, otherId.c_str(), 0, nullptr,
                                                       &image));
    WaitForToolStart();
    EXPECT_EQ(E_FAIL, PrepareStatus());
    ReleaseTool(0);
    ASSERT_EQ(S_OK, other->Uninitialize());
    EXPECT_EQ(sysroot.ReadFile("/tool/sum.start"), sysroot.ReadFile("/tool/sum.end"));
    // The tool has ended: the controller is free again, although the other expert stays busy.
    EXPECT_EQ(S_OK, PrepareStatus());
}

TEST_F(FirmwareUpdateTest, StatusFileStagesReportTheirPercentages) {
    HostImage image(kImage, sizeof kImage - 1);
    // A status file of an earlier run is removed before the tool starts.
    sysroot.WriteFile(kStatusFilePath, "d\n");
    ASSERT_EQ(S_OK, Start(Prepare(sizeof kImage - 1), image));
    const FirmwareStatus first = Poll();
    EXPECT_EQ(S_OK, first.result);
    EXPECT_EQ(UX_FIRMWARE_STATE_RUNNING, first.state);
    EXPECT_EQ(5, first.percent);
    WaitForToolStart();

    const std::string statusFile = sysroot.PathOf(kStatusFilePath);
    const struct {
        const char* content;  // "/": a directory in the file's place
        int32_t state;
        int32_t percent;
    } stages[] = {
        {"0\n", UX_FIRMWARE_STATE_RUNNING, 5},       {"1", UX_FIRMWARE_STATE_RUNNING, 20},
        {" \t\n2\n", UX_FIRMWARE_STATE_RUNNING, 30}, {"3x", UX_FIRMWARE_STATE_RUNNING, 40},
        {"4\n", UX_FIRMWARE_STATE_RUNNING, 50},      {"/", UX_FIRMWARE_STATE_RUNNING, 50},
        {"5\n", UX_FIRMWARE_STATE_RUNNING, 60},      {"5\n", UX_FIRMWARE_STATE_FINISHING, 70},
        {"x", UX_FIRMWARE_STATE_FINISHING, 70},
    };
    for (const auto& stage : stages) {
        SCOPED_TRACE(stage.content);
        unlink(statusFile.c_str());
        rmdir(statusFile.c_str());
        if (std::string(stage.content) == "/") {
            ASSERT_EQ(0, mkdir(statusFile.c_str(), 0700));
        } else {
            sysroot.WriteFile(kStatusFilePath, stage.content);
        }
        const FirmwareStatus status = Poll();
        EXPECT_EQ(S_OK, status.result);
        EXPECT_EQ(stage.state, status.state);
        EXPECT_EQ(stage.percent, status.percent);
    }
    ReleaseTool(0);
    WaitForTool();
    EXPECT_EQ(UX_FIRMWARE_STATE_INSTALLED, Poll().state);
}

struct FailingStatus {
    const char* name;
    const char* content;
    HRESULT result;
};

class FirmwareFailingStatusTest : public FirmwareHostTest,
                                  public testing::WithParamInterface<FailingStatus> {};

TEST_P(FirmwareFailingStatusTest, FailsTheUpdateUntilTheToolEnds) {
    HostImage image(kImage, sizeof kImage - 1);
    ASSERT_EQ(S_OK, Start(Prepare(sizeof kImage - 1), image));
    WaitForToolStart();
    sysroot.WriteFile(kStatusFilePath, GetParam().content);
    FirmwareStatus status = Poll();
    EXPECT_EQ(GetParam().result, status.result);
    EXPECT_EQ(UX_FIRMWARE_STATE_RUNNING, status.state);
    EXPECT_EQ(kUntouchedPercent, status.percent);
    status = Poll();
    EXPECT_EQ(S_OK, status.result);
    EXPECT_EQ(UX_FIRMWARE_STATE_FAILED, status.state);
    EXPECT_EQ(-1, status.percent);
    // The tool is not stopped, and how it ends decides the final state.
    EXPECT_EQ(E_FAIL, PrepareStatus());
    ReleaseTool(0);
    WaitForTool();
    EXPECT_EQ(UX_FIRMWARE_STATE_INSTALLED, Poll().state);
}

INSTANTIATE_TEST_SUITE_P(
    StatusCodes, FirmwareFailingStatusTest,
    testing::Values(FailingStatus{"CodeA", "a\n", E_FAIL},
                    FailingStatus{"CodeD", "d", UX_E_FIRMWARE_STATUS_FAILED},
                    FailingStatus{"CodeT", " t\n", UX_E_FIRMWARE_STATUS_FAILED},
                    FailingStatus{"UnknownCode", "x\n", UX_E_FIRMWARE_STATUS_UNEXPECTED},
                    FailingStatus{"Empty", "", UX_E_FIRMWARE_STATUS_UNEXPECTED},
                    FailingStatus{"OnlyBlanks", " \n\n", UX_E_FIRMWARE_STATUS_UNEXPECTED}),
    [](const testing::TestParamInfo<FailingStatus>& entry) { return entry.param.name; });

struct ToolEnding {
    const char* name;
    const char* script;
    int32_t state;
    bool hostIgnoresChildren = false;  // the host sets SIGCHLD to SIG_IGN
};

class FirmwareToolEndingTest : public FirmwareHostTest,
                               public testing::WithParamInterface<ToolEnding> {};

TEST_P(FirmwareToolEndingTest, DecidesTheOutcome) {
    InstallTool(GetParam().script);
    HostImage image(kImage, sizeof kImage - 1);
    struct sigaction previous {};
    if (GetParam().hostIgnoresChildren) {
        struct sigaction ignore {};
        ignore.sa_handler = SIG_IGN;
        ASSERT_EQ(0, sigaction(SIGCHLD, &ignore, &previous));
    }
    ASSERT_EQ(S_OK, Start(Prepare(sizeof kImage - 1), image));
    WaitForTool();
    if (GetParam().hostIgnoresChildren) {
        sigaction(SIGCHLD, &previous, nullptr);
    }
    const FirmwareStatus status = Poll();
    EXPECT_EQ(GetParam().state, status.state);
    const bool installed = GetParam().state == UX_FIRMWARE_STATE_INSTALLED;
    EXPECT_EQ(installed ? 90 : -1, status.percent);
    EXPECT_EQ(installed, sysroot.Exists(kStagingPath));
    EXPECT_EQ(installed ? E_FAIL : S_OK, PrepareStatus());
}

INSTANTIATE_TEST_SUITE_P(
    Endings, FirmwareToolEndingTest,
    testing::Values(ToolEnding{"ExitStatus0", "exit 0\n", UX_FIRMWARE_STATE_INSTALLED},
                    ToolEnding{"ExitStatus1", "exit 1\n", UX_FIRMWARE_STATE_FAILED},
                    ToolEnding{"Killed", "kill -KILL $$\n", UX_FIRMWARE_STATE_FAILED},
                    ToolEnding{"Terminated", "kill -TERM $$\n", UX_FIRMWARE_STATE_FAILED},
                    ToolEnding{"ExitStatus0HostIgnoringChildren", "exit 0\n",
                               UX_FIRMWARE_STATE_INSTALLED, true},
                    ToolEnding{"ExitStatus1HostIgnoringChildren", "exit 1\n",
                               UX_FIRMWARE_STATE_FAILED, true}),
    [](const testing::TestParamInfo<ToolEnding>& entry) { return entry.param.name; });

TEST_F(FirmwareUpdateTest, UninitializeWaitsForTheRunningTool) {
    HostImage image(kImage, sizeof kImage - 1);
    ASSERT_EQ(S_OK, Start(Prepare(sizeof kImage - 1), image));
    HRESULT uninitialized = E_FAIL;
    ExpectStopWaitsForTheTool([&] { uninitialized = expert->Uninitialize(); });
    EXPECT_EQ(S_OK, uninitialized);
    EXPECT_EQ(UX_FIRMWARE_STATE_INSTALLED, Poll().state);
}

TEST_F(FirmwareUpdateTest, DestroyingTheExpertWaitsForTheRunningTool) {
    // A host that uninitialises before it starts the update leaves only the destruction to wait
    // (and the process-wide tracer shut down for the tests that follow).
    ASSERT_EQ(S_OK, expert->Uninitialize());
    HostImage image(kImage, sizeof kImage - 1);
    ASSERT_EQ(S_OK, Start(Prepare(sizeof kImage - 1), image));
    ExpectStopWaitsForTheTool([&] {
        firmware.Reset();
        expert.Reset();
    });
}

}  // namespace
}  // namespace kest::test::e2e
