// Firmware update as a host drives it: prepare, start with either kind of image source, follow
// the progress of a stand-in update tool, and the end of the worker at Uninitialize and
// destruction. The stand-in records its arguments, environment and image, then runs its ending.
#include <gtest/gtest.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstddef>
#include <cstdlib>
#include <functional>
#include <regex>
#include <thread>
#include <tuple>
#include <utility>

#include "ExpertHost.h"

namespace kest::test::e2e {
namespace {

constexpr char kToolPath[] = "/usr/local/korvane/bin/fwupdate";
constexpr char kStatusFilePath[] = "/var/run/firmware_update/status";
constexpr char kStagingDirectory[] = "/var/volatile/tmp";
constexpr char kStagingPath[] = "/var/volatile/tmp/kestsysxp.fwupdate.cfg";
constexpr char kImage[] = "new firmware image";
constexpr uint32_t kImageSize = sizeof kImage - 1;
constexpr int32_t kUntouchedPercent = 12345;
constexpr int32_t kRunning = UX_FIRMWARE_STATE_RUNNING;
constexpr int32_t kInstalled = UX_FIRMWARE_STATE_INSTALLED;
constexpr int32_t kFailed = UX_FIRMWARE_STATE_FAILED;

constexpr char kToolRecords[] = R"(printf '%s\n' "$0" "$@" > "$root/tool/args"
export -p > "$root/tool/environment"
cat "$1" > "$root/tool/image"
cksum < "$1" > "$root/tool/sum.start"
: > "$root/tool/started"
)";

// The stand-in's ending that waits for ReleaseTool, checksums the image again and exits.
constexpr char kWaitForRelease[] =
    "while [ ! -e \"$root/tool/release\" ]; do sleep 0.02; done\n"
    "cksum < \"$1\" > \"$root/tool/sum.end\"\n"
    ": > \"$root/tool/finished\"\n"
    "exit \"$(cat \"$root/tool/release\")\"\n";

// A host's firmware image: bytes in memory, or a file (then it answers the image-file interface).
class HostImage : public IuxSysFirmwareImageFile {
  public:
    HostImage(std::string bytes, uint32_t reportedSize)
        : bytes_(std::move(bytes)), size_(reportedSize) {}
    // A file at `path`; GetImageFilePath answers `pathStatus`.
    explicit HostImage(const std::string& path, HRESULT pathStatus = S_OK)
        : path_(path.begin(), path.end()), pathStatus_(pathStatus) {}

    HRESULT QueryInterface(const IID& iid, void** object) override {
        const bool offered = iid == IID_IUnknown || iid == IID_IuxSysFirmwareImageSource ||
                             (!path_.empty() && iid == IID_IuxSysFirmwareImageFile);
        *object = offered ? this : nullptr;
        return offered ? (AddRef(), S_OK) : E_NOINTERFACE;
    }
    uint32_t AddRef() override { return ++references_; }
    uint32_t Release() override { return --references_; }
    uint32_t GetImageSize() override { return size_; }
    const uint8_t* GetImageBytes() override {
        return reinterpret_cast<const uint8_t*>(bytes_.data());
    }
    HRESULT GetImageFilePath(CvqBStr* path) override {
        *path = SUCCEEDED(pathStatus_) ? CvqBStrAlloc(path_.c_str()) : nullptr;
        return pathStatus_;
    }
    uint32_t References() const { return references_; }  // the test's own one included

  private:
    std::string bytes_;
    uint32_t size_ = 0;
    std::wstring path_;
    HRESULT pathStatus_ = S_OK;
    std::atomic<uint32_t> references_{1};
};

using FirmwareStatus = std::tuple<HRESULT, int32_t, int32_t>;

// The file `path` names (links followed) by device and inode; zeros when there is none.
std::pair<dev_t, ino_t> FileIdOf(const std::string& path) {
    struct stat status {};
    return stat(path.c_str(), &status) == 0 ? std::make_pair(status.st_dev, status.st_ino)
                                            : std::make_pair(dev_t{0}, ino_t{0});
}

// Runs `action` on a thread of its own on which every fsync fails with EIO. False when the
// system refuses the filter (an emulator may).
bool RunWithFailingSync(const std::function<void()>& action) {
    bool filtered = false;
    std::thread([&] {
        sock_filter program[] = {BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
                                 BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, __NR_fsync, 0, 1),
                                 BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EIO),
                                 BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW)};
        const sock_fprog filter{4, program};
        filtered = prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
                   prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &filter) == 0;
        if (filtered) {
            action();
        }
    }).join();
    return filtered;
}

class FirmwareUpdateTest : public ExpertHostTest {
  protected:
    void SetUp() override {
        WriteControllerState(kSystemState);
        // The tracer keeps the first log location it is given for the whole process: without
        // outputs, these in-process sessions leave it to the tests that check the log.
        sysroot.WriteFile("/etc/korvane/share/vqsysdiag.ini", "[vqsyscfg]\nTarget = 0\n");
        sysroot.MakeDirectory(kStagingDirectory);
        sysroot.MakeDirectory("/var/run/firmware_update");
        sysroot.MakeDirectory("/tool");
        InstallTool(kWaitForRelease);
        ExpertHostTest::SetUp();
        ASSERT_EQ(S_OK, expert->Initialize());
        firmware = kest::hostkit::QueryInterfaceAs<IuxSysExpertFirmware>(expert.Get(),
                                                                         IID_IuxSysExpertFirmware);
        ASSERT_TRUE(firmware);
    }
    void TearDown() override {
        unlink(shmImage.c_str());
        ReleaseTool(1);
        firmware.Reset();
        if (expert) {
            expert->Uninitialize();
        }
    }

    // The tool gets an empty environment, so it names the sysroot itself.
    void InstallTool(const std::string& ending) const {
        sysroot.WriteScript(kToolPath, "root='" + sysroot.Root() + "'\n" + kToolRecords + ending);
    }

    // Runs shell `commands` in the sysroot, with the staging path relative to it in $S.
    void Shell(const std::string& commands) const {
        const std::string script = "cd '" + sysroot.Root() + "' && export S=" + (kStagingPath + 1) +
                                   " && {\n" + commands + "\n}";
        ASSERT_EQ(0, std::system(script.c_str())) << commands;
    }

    void ReleaseTool(int exitCode) const {
        Shell("echo " + std::to_string(exitCode) + " > tool/new && mv tool/new tool/release");
    }

    // No temporary is left beside the staging file.
    void ExpectNoTemporaries() const { Shell("! ls -A var/volatile/tmp | grep -vx ${S##*/}"); }

    // Shell commands that wait until the test `condition` holds, failing after a minute.
    static std::string WaitUntil(const std::string& condition) {
        return "for i in $(seq 6000); do [ " + condition + " ] && break; sleep 0.01; done; [ " +
               condition + " ]";
    }

    // Returns once the tool runs; it removes the status file first, so write that only after.
    void WaitForToolStart() const { Shell(WaitUntil("-e tool/started")); }

    std::wstring Prepare(uint32_t size) const {
        CvqBStr id = nullptr;
        EXPECT_EQ(S_OK, firmware->PrepareFirmwareUpdate(kSystemItemName, 0, size, &id));
        return TakeWideHostString(id);
    }

    // E_FAIL while an update holds the expert; S_OK otherwise, and the new update then holds it.
    HRESULT PrepareStatus() const {
        CvqBStr id = nullptr;
        const HRESULT status = firmware->PrepareFirmwareUpdate(kSystemItemName, 0, 0, &id);
        TakeWideHostString(id);
        return status;
    }

    HRESULT Start(const std::wstring& id, HostImage& image) const {
        return firmware->StartFirmwareUpdate(kSystemItemName, id.c_str(), 0, nullptr, &image);
    }

    FirmwareStatus Poll() const {
        int32_t state = 0;
        int32_t percent = kUntouchedPercent;
        const HRESULT result = firmware->GetFirmwareUpdateStatus(kSystemItemName, &state, &percent);
        return {result, state, percent};
    }
    int32_t State() const { return std::get<1>(Poll()); }

    // Returns once the tool has ended and its outcome is recorded.
    void WaitForTool() const { ASSERT_EQ(S_OK, expert->Uninitialize()); }

    // Runs `stop` on another thread while the tool waits: it returns only after the tool ended.
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

    InterfaceRef<IuxSysExpertFirmware> firmware;
    const std::string shmImage = "/dev/shm/kest-image-" + std::to_string(getpid());
};

// What a shell in the sysroot puts at the staging path ($S) before an update, and the image
// file the host names (null: the host hands over bytes).
struct StagingCase {
    const char* name;
    const char* setup;
    const char* imageFile;
    bool linked;  // the staging file is the image file itself
};

class FirmwareStagingTest : public FirmwareUpdateTest,
                            public testing::WithParamInterface<StagingCase> {};

// One update from start to end: whatever stood at the staging path is replaced, never written
// through, and the tool reads the host's image unchanged from its start to its end.
TEST_P(FirmwareStagingTest, InstallsExactlyTheHostsImage) {
    sysroot.WriteFile("/outside", "keep me");
    sysroot.WriteFile("/images/firmware.bin", kImage);
    Shell(GetParam().setup);
    const char* imageFile = GetParam().imageFile;
    const std::string imagePath = imageFile ? sysroot.PathOf(imageFile) : "";
    HostImage bytes(kImage, kImageSize);
    HostImage file(imagePath);
    HostImage& image = imageFile ? file : bytes;
    EXPECT_EQ(UX_E_FIRMWARE_BUSY, Start(L"{00000000-0000-0000-0000-000000000000}", image));
    EXPECT_EQ(UX_FIRMWARE_STATE_IDLE, State());

    // The size announced for a file is not compared with it.
    const std::wstring id = Prepare(imageFile ? 7 : kImageSize);
    EXPECT_TRUE(std::regex_match(std::string(id.begin(), id.end()),
                                 std::regex("\\{[0-9A-F]{8}-[0-9A-F]{4}-[0-9A-F]{4}-[0-9A-F]{4}-"
                                            "[0-9A-F]{12}\\}")));
    EXPECT_EQ(std::make_tuple(S_OK, UX_FIRMWARE_STATE_PREPARED, 20), Poll());
    EXPECT_EQ(E_FAIL, PrepareStatus());
    ASSERT_EQ(S_OK, Start(id, image));
    EXPECT_EQ(1u, image.References());
    EXPECT_EQ(UX_E_FIRMWARE_BUSY, Start(id, image));
    EXPECT_EQ(E_FAIL, PrepareStatus());
    EXPECT_EQ(kRunning, State());
    ReleaseTool(0);
    WaitForTool();

    EXPECT_EQ(std::make_tuple(S_OK, kInstalled, 90), Poll());
    EXPECT_EQ(kImage, sysroot.ReadFile("/tool/image"));
    EXPECT_EQ(sysroot.ReadFile("/tool/sum.start"), sysroot.ReadFile("/tool/sum.end"));
    EXPECT_EQ(sysroot.PathOf(kToolPath) + "\n" + sysroot.PathOf(kStagingPath) + "\n3\n",
              sysroot.ReadFile("/tool/args"));
    EXPECT_EQ(std::string::npos, sysroot.ReadFile("/tool/environment").find("KEST_SYSROOT"));
    EXPECT_EQ("keep me", sysroot.ReadFile("/outside"));
    struct stat staged {};
    ASSERT_EQ(0, lstat(sysroot.PathOf(kStagingPath).c_str(), &staged));
    EXPECT_TRUE(S_ISREG(staged.st_mode));
    EXPECT_EQ(GetParam().linked, FileIdOf(sysroot.PathOf(kStagingPath)) == FileIdOf(imagePath));
    if (!imageFile) {
        EXPECT_EQ(0600u, staged.st_mode & 07777);
        EXPECT_EQ(geteuid(), staged.st_uid);
    }
    ExpectNoTemporaries();
    // An installed image keeps the expert busy for good.
    EXPECT_EQ(E_FAIL, PrepareStatus());
}

INSTANTIATE_TEST_SUITE_P(
    Staging, FirmwareStagingTest,
    testing::Values(
        StagingCase{"BytesOverALongerStaleFile", "printf '%4096s' x > $S", nullptr, false},
        StagingCase{"PlantedSymbolicLink", "ln -s \"$PWD/outside\" $S", nullptr, false},
        StagingCase{"PlantedSecondNameOfAnotherFile", "ln outside $S", nullptr, false},
        StagingCase{"PlantedPipe", "mkfifo -m 666 $S", nullptr, false},
        StagingCase{"ImageFileLinkedOverALeftoverStagingFile", "echo an earlier image > $S",
                    "/images/firmware.bin", true},
        StagingCase{"ImageNamedByARelativeSymbolicLink", "ln -s firmware.bin images/link.bin",
                    "/images/link.bin", true},
        // /dev/shm is a file system of its own on Linux: the image is copied from there.
        StagingCase{"ImageOnAnotherFileSystem",
                    "cp images/firmware.bin /dev/shm/kest-image-$PPID && "
                    "ln -s /dev/shm/kest-image-$PPID images/elsewhere.bin",
                    "/images/elsewhere.bin", false}),
    [](const testing::TestParamInfo<StagingCase>& entry) { return entry.param.name; });

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
        CvqBStr id = nullptr;
        EXPECT_EQ(E_FAIL, firmware->PrepareFirmwareUpdate(kSystemItemName, 0, size, &id)) << size;
        EXPECT_EQ(nullptr, id);
    }
    EXPECT_EQ(UX_FIRMWARE_STATE_IDLE, State());
    EXPECT_EQ(S_OK, PrepareStatus());
}

TEST_F(FirmwareUpdateTest, RejectedStartsEndTheAttemptAndLeaveTheStagingPath) {
    HostImage bytes(kImage, kImageSize);
    HostImage shortImage(kImage, kImageSize - 1);
    HostImage failingPath("/nowhere", E_FAIL);
    HostImage missingFile("/nonexistent/firmware.bin");
    HostImage pipeFile(sysroot.PathOf("/images/pipe"));
    HostImage copiedFile(shmImage);
    const std::string staging = sysroot.PathOf(kStagingPath);
    const struct {
        const char* name;
        bool rightIdentifier;
        HostImage* image;  // null: no image source
        HRESULT expected;
        const char* setup;
        bool syncFails = false;  // every fsync of the starting thread fails
    } cases[] = {
        {"wrong identifier", false, &bytes, UX_E_FIRMWARE_ID_MISMATCH, ":"},
        {"wrong byte count", true, &shortImage, UX_E_FIRMWARE_STATUS_UNEXPECTED, ":"},
        {"no image source", true, nullptr, E_POINTER, ":"},
        {"image path refused", true, &failingPath, E_FAIL, ":"},
        {"image file missing", true, &missingFile, E_FAIL, ":"},
        // A pipe links like a file but would stall the tool.
        {"image file is a pipe", true, &pipeFile, E_FAIL, "mkdir -p images && mkfifo images/pipe"},
        {"staging path is a directory", true, &bytes, E_FAIL, "mkdir $S"},
        // A copied image is synced before it replaces the staging file.
        {"copied image cannot be synced", true, &copiedFile, E_FAIL,
         "echo an earlier image > $S && echo image > /dev/shm/kest-image-$PPID", true},
    };
    for (const auto& entry : cases) {
        SCOPED_TRACE(entry.name);
        Shell(std::string("rm -rf $S images && ") + entry.setup);
        const auto before = FileIdOf(staging);
        // Each Prepare succeeds only because the attempt before freed the expert.
        const std::wstring id = Prepare(kImageSize);
        const std::wstring given = entry.rightIdentifier ? id : id + L"0";
        HRESULT started = S_OK;
        const auto start = [&] {
            started = firmware->StartFirmwareUpdate(kSystemItemName, given.c_str(), 0, nullptr,
                                                    entry.image);
        };
        if (!entry.syncFails) {
            start();
        } else if (!RunWithFailingSync(start)) {
            continue;  // the system refuses the filter (an emulator may); the last row
        }
        EXPECT_EQ(entry.expected, started);
        if (entry.image != nullptr) {
            EXPECT_EQ(1u, entry.image->References());
        }
        EXPECT_EQ(std::make_tuple(S_OK, kFailed, -1), Poll());
        EXPECT_EQ(before, FileIdOf(staging));
        ExpectNoTemporaries();
    }
    EXPECT_FALSE(sysroot.Exists("/tool/args"));
}

TEST_F(FirmwareUpdateTest, AStagingFilePlantedByAnotherUserAndRewrittenLaterIsNotInstalled) {
    // The sysroot is reachable for an unprivileged user and the staging directory is shared.
    ASSERT_EQ(0, chmod(sysroot.Root().c_str(), 0755));
    ASSERT_EQ(0, chmod(sysroot.PathOf(kStagingDirectory).c_str(), 01777));
    // The user plants the staging file and keeps it open; once the update has put another file
    // in its place, the user writes its own image through the planted one and says so.
    Shell(
        "setpriv --reuid=65534 --regid=65534 --clear-groups sh -c '"
        "exec 3>$S && echo planted >&3 && : >$S.planted || exit; "
        "while [ $S -ef /proc/$$/fd/3 ]; do sleep 0.01; done; "
        "echo the users own image >&3 && : >$S.rewritten' & " +
        WaitUntil("-e $S.planted"));
    HostImage image(kImage, kImageSize);
    ASSERT_EQ(S_OK, Start(Prepare(kImageSize), image));
    WaitForToolStart();
    Shell(WaitUntil("-e $S.rewritten"));
    ReleaseTool(0);
    WaitForTool();
    EXPECT_EQ(kInstalled, State());
    EXPECT_EQ(kImage, sysroot.ReadFile("/tool/image"));
    EXPECT_EQ(sysroot.ReadFile("/tool/sum.start"), sysroot.ReadFile("/tool/sum.end"));
    EXPECT_EQ(kImage, sysroot.ReadFile(kStagingPath));
}

// A second expert of the same process stands for any other host: the controller runs one update
// at a time. Uninitialize and the destruction of an expert wait for its running tool.
TEST_F(FirmwareUpdateTest, TheUpdateLockAdmitsOneUpdatePerControllerAndExpertsWaitForTheirTool) {
    const InterfaceRef<IuxSysExpert3> other = plugin.CreateExpert();
    ASSERT_EQ(S_OK, other->Initialize());
    const auto otherFirmware = kest::hostkit::QueryInterfaceAs<IuxSysExpertFirmware>(
        other.Get(), IID_IuxSysExpertFirmware);
    CvqBStr otherId = nullptr;
    const auto otherPrepare = [&] {
        return otherFirmware->PrepareFirmwareUpdate(kSystemItemName, 0, kImageSize, &otherId);
    };

    const std::wstring id = Prepare(kImageSize);
    EXPECT_EQ(std::to_string(getpid()) + "\n",
              sysroot.ReadFile("/var/run/firmware_update/update.lock"));
    EXPECT_EQ(E_FAIL, otherPrepare());
    // Uninitialize lets go of an update that was prepared but not started; starting it later
    // needs the lock back.
    ASSERT_EQ(S_OK, expert->Uninitialize());
    ASSERT_EQ(S_OK, otherPrepare());
    HostImage image(kImage, kImageSize);
    EXPECT_EQ(E_FAIL, Start(id, image));
    EXPECT_EQ(kFailed, State());

    ASSERT_EQ(S_OK, otherFirmware->StartFirmwareUpdate(
                        kSystemItemName, TakeWideHostString(otherId).c_str(), 0, nullptr, &image));
    WaitForToolStart();
    EXPECT_EQ(E_FAIL, PrepareStatus());
    ExpectStopWaitsForTheTool([&] { EXPECT_EQ(S_OK, other->Uninitialize()); });
    EXPECT_EQ(sysroot.ReadFile("/tool/sum.start"), sysroot.ReadFile("/tool/sum.end"));

    // The tool has ended: the controller is free again, although the other expert stays busy.
    // This expert was uninitialised before its update starts: only its destruction waits.
    Shell("rm tool/release tool/finished");
    ASSERT_EQ(S_OK, Start(Prepare(kImageSize), image));
    ExpectStopWaitsForTheTool([&] {
        firmware.Reset();
        expert.Reset();
    });
}

// A status file content written while the tool runs (null: none written, "/": a directory in
// the file's place), and what the poll that follows answers.
struct Stage {
    const char* content;
    HRESULT result;
    int32_t state;
    int32_t percent;
};

// How the tool ends, and the stages it goes through first (then it is released with 0).
struct ToolRun {
    const char* name;
    const char* ending;
    std::vector<Stage> stages;
    int32_t state;  // at the end
};

class FirmwareToolRunTest : public FirmwareUpdateTest,
                            public testing::WithParamInterface<ToolRun> {};

TEST_P(FirmwareToolRunTest, DecidesTheOutcome) {
    InstallTool(GetParam().ending);
    HostImage image(kImage, kImageSize);
    // A status file of an earlier run is removed before the tool starts.
    sysroot.WriteFile(kStatusFilePath, "d\n");
    ASSERT_EQ(S_OK, Start(Prepare(kImageSize), image));
    if (!GetParam().stages.empty()) {
        EXPECT_EQ(std::make_tuple(S_OK, kRunning, 5), Poll());
        WaitForToolStart();
        for (const Stage& stage : GetParam().stages) {
            if (stage.content != nullptr) {
                Shell("rm -rf var/run/firmware_update/status");
                if (std::string(stage.content) == "/") {
                    sysroot.MakeDirectory(kStatusFilePath);
                } else {
                    sysroot.WriteFile(kStatusFilePath, stage.content);
                }
            }
            EXPECT_EQ(std::make_tuple(stage.result, stage.state, stage.percent), Poll())
                << (stage.content ? stage.content : "(unchanged)");
        }
        // The tool is not stopped by a failure code; how it ends decides the final state.
        EXPECT_EQ(E_FAIL, PrepareStatus());
        ReleaseTool(0);
    }
    WaitForTool();
    const bool installed = GetParam().state == kInstalled;
    EXPECT_EQ(std::make_tuple(S_OK, GetParam().state, installed ? 90 : -1), Poll());
    EXPECT_EQ(installed, sysroot.Exists(kStagingPath));
    EXPECT_EQ(installed ? E_FAIL : S_OK, PrepareStatus());
}

// A failure code fails the update at once, leaving the percentage alone.
std::vector<Stage> FailsWith(const char* code, HRESULT result) {
    return {{code, result, kRunning, kUntouchedPercent}, {nullptr, S_OK, kFailed, -1}};
}

INSTANTIATE_TEST_SUITE_P(
    Endings, FirmwareToolRunTest,
    testing::Values(ToolRun{"ExitStatus0", "exit 0\n", {}, kInstalled},
                    ToolRun{"ExitStatus1", "exit 1\n", {}, kFailed},
                    ToolRun{"Killed", "kill -KILL $$\n", {}, kFailed},
                    ToolRun{"Terminated", "kill -TERM $$\n", {}, kFailed},
                    ToolRun{"StagesReportTheirPercentages",
                            kWaitForRelease,
                            {{"0\n", S_OK, kRunning, 5},
                             {"1", S_OK, kRunning, 20},
                             {" \t\n2\n", S_OK, kRunning, 30},
                             {"3x", S_OK, kRunning, 40},
                             {"4\n", S_OK, kRunning, 50},
                             {"/", S_OK, kRunning, 50},
                             {"5\n", S_OK, kRunning, 60},
                             {nullptr, S_OK, UX_FIRMWARE_STATE_FINISHING, 70},
                             {"x", S_OK, UX_FIRMWARE_STATE_FINISHING, 70}},
                            kInstalled},
                    ToolRun{"StatusCodeA", kWaitForRelease, FailsWith("a\n", E_FAIL), kInstalled},
                    ToolRun{"StatusCodeD", kWaitForRelease,
                            FailsWith("d", UX_E_FIRMWARE_STATUS_FAILED), kInstalled},
                    ToolRun{"StatusCodeT", kWaitForRelease,
                            FailsWith(" t\n", UX_E_FIRMWARE_STATUS_FAILED), kInstalled},
                    ToolRun{"UnknownStatusCode", kWaitForRelease,
                            FailsWith("x\n", UX_E_FIRMWARE_STATUS_UNEXPECTED), kInstalled},
                    ToolRun{"EmptyStatus", kWaitForRelease,
                            FailsWith("", UX_E_FIRMWARE_STATUS_UNEXPECTED), kInstalled},
                    ToolRun{"BlankStatus", kWaitForRelease,
                            FailsWith(" \n\n", UX_E_FIRMWARE_STATUS_UNEXPECTED), kInstalled}),
    [](const testing::TestParamInfo<ToolRun>& entry) { return entry.param.name; });

}  // namespace
}  // namespace kest::test::e2e
