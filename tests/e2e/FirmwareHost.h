// A host's side of a firmware update for end-to-end tests: the image source it hands over, and
// a fixture with an initialised expert, its firmware interface and a stand-in update tool in the
// sysroot. The stand-in records its arguments, its environment and the image it was given, then
// waits until the test releases it with an exit code (or ends the way a test installs).
#pragma once

#include <unistd.h>

#include <atomic>
#include <cstdio>
#include <string>
#include <utility>

#include "ExpertHost.h"

namespace kest::test::e2e {

constexpr char kToolPath[] = "/usr/local/korvane/bin/fwupdate";
constexpr char kStatusFilePath[] = "/var/run/firmware_update/status";
constexpr char kStagingDirectory[] = "/var/volatile/tmp";
constexpr char kStagingPath[] = "/var/volatile/tmp/kestsysxp.fwupdate.cfg";
// What GetFirmwareUpdateStatus leaves in a percentage it does not write.
constexpr int32_t kUntouchedPercent = 12345;

constexpr char kUpdateLockPath[] = "/var/run/firmware_update/update.lock";

// The stand-in tool's ending that waits for ReleaseTool, records the staging file's checksum
// again and exits with the code given there.
constexpr char kWaitForRelease[] =
    "while [ ! -e \"$root/tool/release\" ]; do sleep 0.02; done\n"
    "cksum < \"$1\" > \"$root/tool/sum.end\"\n"
    ": > \"$root/tool/finished\"\n"
    "exit \"$(cat \"$root/tool/release\")\"\n";

// A host's firmware image: bytes in memory, or a file (then it answers the image-file interface).
class HostImage : public IuxSysFirmwareImageFile {
  public:
    // Bytes in memory; GetImageSize reports `reportedSize`.
    HostImage(std::string bytes, uint32_t reportedSize)
        : bytes_(std::move(bytes)), reportedSize_(reportedSize) {}
    // A file at `path`; GetImageFilePath answers `pathStatus`.
    explicit HostImage(std::wstring path, HRESULT pathStatus = S_OK)
        : path_(std::move(path)), pathStatus_(pathStatus), isFile_(true) {}

    HRESULT QueryInterface(const IID& iid, void** object) override {
        if (iid == IID_IUnknown || iid == IID_IuxSysFirmwareImageSource ||
            (isFile_ && iid == IID_IuxSysFirmwareImageFile)) {
            AddRef();
            *object = this;
            return S_OK;
        }
        *object = nullptr;
        return E_NOINTERFACE;
    }
    uint32_t AddRef() override { return ++references_; }
    uint32_t Release() override { return --references_; }
    uint32_t GetImageSize() override { return reportedSize_; }
    const uint8_t* GetImageBytes() override {
        return reinterpret_cast<const uint8_t*>(bytes_.data());
    }
    HRESULT GetImageFilePath(CvqBStr* path) override {
        *path = SUCCEEDED(pathStatus_) ? CvqBStrAlloc(path_.c_str()) : nullptr;
        return pathStatus_;
    }

    // The references held, the test's own one included.
    uint32_t References() const { return references_; }

  private:
    std::string bytes_;
    uint32_t reportedSize_ = 0;
    std::wstring path_;
    HRESULT pathStatus_ = S_OK;
    bool isFile_ = false;
    std::atomic<uint32_t> references_{1};
};

// What one GetFirmwareUpdateStatus call answered.
struct FirmwareStatus {
    HRESULT result;
    int32_t state;
    int32_t percent;
};

class FirmwareHostTest : public ExpertHostTest {
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
        ASSERT_EQ(S_OK, expert->QueryInterface(IID_IuxSysExpertFirmware,
                                               reinterpret_cast<void**>(firmware.Receive())));
    }
    void TearDown() override {
        ReleaseTool(1);
        firmware.Reset();
        if (expert) {
            expert->Uninitialize();
        }
    }

    // Installs the stand-in tool: it records what it was given (the staging file's checksum
    // included), then runs `ending`. The tool gets an empty environment, so it names the sysroot
    // itself.
    void InstallTool(const std::string& ending) const {
        sysroot.WriteScript(kToolPath, "root='" + sysroot.Root() +
                                           "'\n"
                                           "printf '%s\\n' \"$0\" \"$@\" > \"$root/tool/args\"\n"
                                           "export -p > \"$root/tool/environment\"\n"
                                           "cat \"$1\" > \"$root/tool/image\"\n"
                                           "cksum < \"$1\" > \"$root/tool/sum.start\"\n"
                                           ": > \"$root/tool/started\"\n" +
                                           ending);
    }

    // Lets a waiting stand-in tool exit with `exitCode`.
    void ReleaseTool(int exitCode) const {
        sysroot.WriteFile("/tool/release.new", std::to_string(exitCode) + "\n");
        std::rename(sysroot.PathOf("/tool/release.new").c_str(),
                    sysroot.PathOf("/tool/release").c_str());
    }

    // Returns once the stand-in tool runs. The tool writes the status file, so a test writes it
    // only after this.
    void WaitForToolStart() const {
        while (!sysroot.Exists("/tool/started")) {
            usleep(10000);
        }
    }

    // A new update of `size` bytes; its identifier.
    std::wstring Prepare(uint32_t size) const {
        CvqBStr id = nullptr;
        EXPECT_EQ(S_OK, firmware->PrepareFirmwareUpdate(kSystemItemName, 0, size, &id));
        return TakeWideHostString(id);
    }

    HRESULT Start(const std::wstring& id, HostImage& image) const {
        return firmware->StartFirmwareUpdate(kSystemItemName, id.c_str(), 0, nullptr, &image);
    }

    FirmwareStatus Poll() const {
        FirmwareStatus status{S_OK, 0, kUntouchedPercent};
        status.result =
            firmware->GetFirmwareUpdateStatus(kSystemItemName, &status.state, &status.percent);
        return status;
    }

    // Uninitialize, which returns once the tool has ended and its outcome is recorded.
    void WaitForTool() const { ASSERT_EQ(S_OK, expert->Uninitialize()); }

    // The answer to one more PrepareFirmwareUpdate: E_FAIL while an update holds the expert;
    // S_OK otherwise, and the new update then holds it.
    HRESULT PrepareStatus() const {
        CvqBStr id = nullptr;
        const HRESULT status = firmware->PrepareFirmwareUpdate(kSystemItemName, 0, 0, &id);
        TakeWideHostString(id);
        return status;
    }

    InterfaceRef<IuxSysExpertFirmware> firmware;
};

}  // namespace kest::test::e2e
