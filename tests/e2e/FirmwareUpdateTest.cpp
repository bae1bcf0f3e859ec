// Firmware update as a host drives it: prepare, start with either kind of image source, follow
// the stand-in tool's progress, and the end of the worker at Uninitialize and destruction.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include <chrono>
#include <functional>
#include <regex>
#include <thread>

#include "FirmwareHost.h"

namespace e2e {
namespace {

constexpr char kImage[] = "new firmware image";

std::string NarrowText(const std::wstring& text) {
    return std::string(text.begin(), text.end());
}

ino_t InodeOf(const std::string& path) {
    struct stat status {};
    return lstat(path.c_str(), &status) == 0 ? status.st_ino : 0;
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
    const std::string outside = sysroot.PathOf("/outside");
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
        {"staging path is a symbolic link", true, &bytes, E_FAIL,
         [&] { ASSERT_EQ(0, symlink(outside.c_str(), staging.c_str())); }},
        {"staging path is a second name of another file", true, &bytes, E_FAIL,
         [&] { ASSERT_EQ(0, link(outside.c_str(), staging.c_str())); }},
        {"staging path is a pipe", true, &bytes, E_FAIL,
         [&] { ASSERT_EQ(0, mkfifo(staging.c_str(), 0600)); }},
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
    }
    EXPECT_EQ("keep me", sysroot.ReadFile("/outside"));
    EXPECT_FALSE(sysroot.Exists("/tool/args"));
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
};

class FirmwareToolEndingTest : public FirmwareHostTest,
                               public testing::WithParamInterface<ToolEnding> {};

TEST_P(FirmwareToolEndingTest, DecidesTheOutcome) {
    InstallTool(GetParam().script);
    HostImage image(kImage, sizeof kImage - 1);
    ASSERT_EQ(S_OK, Start(Prepare(sizeof kImage - 1), image));
    WaitForTool();
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
                    ToolEnding{"Terminated", "kill -TERM $$\n", UX_FIRMWARE_STATE_FAILED}),
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
        firmware->Release();
        expert->Release();
    });
    firmware = nullptr;
    expert = nullptr;
}

}  // namespace
}  // namespace e2e
