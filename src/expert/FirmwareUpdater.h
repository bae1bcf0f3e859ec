// The firmware update of one expert: the state machine the host drives through
// IuxSysExpertFirmware, the staging of the image and the worker thread that runs the tool.
#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>

#include <boost/thread/thread.hpp>

#include "expert/FirmwareUpdateState.h"
#include "support/ProcessLockFile.h"
#include "uxsys/HostString.h"
#include "uxsys/IUnknown.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {

// Thread safety: any host thread may call at once, beside the worker thread. startMutex_
// serialises Start, SetStagingPath and the worker handle; lockMutex_ guards the update lock;
// the state and the busy mark are atomic.
class FirmwareUpdater {
  public:
    FirmwareUpdater() = default;
    // Waits for a worker that still runs (a worker never destroys its own updater).
    ~FirmwareUpdater();
    FirmwareUpdater(const FirmwareUpdater&) = delete;
    FirmwareUpdater& operator=(const FirmwareUpdater&) = delete;

    // The file Start places the image in; Initialize sets it.
    void SetStagingPath(std::string stagingPath);

    // Announces an image of `imageSize` bytes and stores its new identifier ("{...}", upper-case)
    // in *updateId. E_FAIL while another update holds the updater or the controller's update
    // lock (another expert or process), when the lock cannot be set up, or when the staging
    // directory has less than twice `imageSize` free; E_POINTER for a null result.
    HRESULT Prepare(uint32_t imageSize, CvqBStr* updateId) noexcept;

    // Stages the image of `imageSource` for the prepared update `updateId`, then runs the tool on
    // the worker thread and returns at once. UX_E_FIRMWARE_BUSY when no update is prepared;
    // otherwise a failure ends the update (failed state, updater free again): identifier
    // mismatch UX_E_FIRMWARE_ID_MISMATCH, staging failures as StageFirmwareImage returns them.
    HRESULT Start(const wchar_t* updateId, IUnknown* imageSource) noexcept;

    // The state and its percentage; while the tool runs, the percentage, a state change and the
    // status come from the tool's status file. E_FAIL for a null result pointer.
    HRESULT GetStatus(int32_t* state, int32_t* percent) noexcept;

    // Waits until a started worker has ended. E_FAIL when called on the worker itself.
    HRESULT WaitForWorker() noexcept;

    // Lets other updates of the controller begin when this one was prepared but not started;
    // a later Start takes the update lock again or fails.
    void ReleasePreparedUpdate() noexcept;

  private:
    // The worker's body: runs the tool and records how it ended.
    void RunFirmwareUpdateTool(const std::string& stagingPath) noexcept;
    // Ends the update attempt as failed and frees the updater; returns `status`.
    HRESULT FailUpdate(HRESULT status) noexcept;
    HRESULT StartPrepared(const wchar_t* updateId, IUnknown* imageSource);
    // Takes the controller's update lock unless this updater holds it; false when another does.
    bool TakeUpdateLock();
    void ReleaseUpdateLock() noexcept;
    // Removes the staged image after a failed run, unless another update has taken the
    // controller since the tool ended (the staging file is then that update's).
    void RemoveStagedImage(const std::string& stagingPath) noexcept;

    std::atomic<FirmwareUpdateState> state_{FirmwareUpdateState::kIdle};
    uint32_t announcedSize_ = 0;
    std::wstring updateId_;
    std::string stagingPath_;
    // Held from a successful Prepare until the attempt fails; after an installation for good.
    std::atomic<uint32_t> busy_{0};
    // Serialises Start, SetStagingPath and the handling of the worker handle.
    std::mutex startMutex_;
    boost::thread worker_;
    // The controller-wide update lock, held from Prepare until the attempt ends or the tool runs
    // (the tool's process then holds it).
    std::mutex lockMutex_;
    vq::dsc::osdep::ProcessLockFile updateLock_;
};

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
