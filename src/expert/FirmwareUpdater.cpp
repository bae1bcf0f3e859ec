#include "expert/FirmwareUpdater.h"

#include <unistd.h>

#include <boost/bind/bind.hpp>
#include <optional>
#include <utility>

#include "expert/FirmwareImageStaging.h"
#include "expert/FirmwareStatusFile.h"
#include "expert/FirmwareToolRun.h"
#include "support/CurrentExceptionToStatus.h"
#include "support/FreeDiskSpace.h"
#include "support/Guid.h"
#include "support/Sysroot.h"
#include "support/TraceGate.h"
#include "uxsys/StatusCodes.h"

namespace nVQKESTSYSAPICHASSISEXPERT100 {
namespace {

// The status of the exception in flight; must be called inside a catch handler.
HRESULT StatusOfCurrentException() noexcept {
    try {
        return CurrentExceptionToStatus();
    } catch (...) {
        return E_FAIL;
    }
}

// The percentage reported for a state whose progress does not come from the status file.
int32_t PercentForState(FirmwareUpdateState state) {
    switch (state) {
        case FirmwareUpdateState::kPrepared:
            return 20;
        case FirmwareUpdateState::kFinishing:
            return 70;
        case FirmwareUpdateState::kInstalled:
            return 90;
        case FirmwareUpdateState::kFailed:
            return -1;
        default:
            return 100;
    }
}

}  // namespace

FirmwareUpdater::~FirmwareUpdater() {
    try {
        if (worker_.joinable()) {
            if (worker_.get_id() == boost::this_thread::get_id()) {
                worker_.detach();
            } else {
                worker_.join();
            }
        }
    } catch (...) {
        // Nothing is left to do for a worker that cannot be joined.
    }
}

void FirmwareUpdater::SetStagingPath(std::string stagingPath) {
    std::lock_guard<std::mutex> lock(startMutex_);
    stagingPath_ = std::move(stagingPath);
}

HRESULT FirmwareUpdater::Prepare(uint32_t imageSize, CvqBStr* updateId) noexcept {
    if (updateId == nullptr) {
        return E_POINTER;
    }
    uint32_t free = 0;
    if (!busy_.compare_exchange_strong(free, 1)) {
        return E_FAIL;
    }
    try {
        if (!TakeUpdateLock()) {
            TraceIfEnabled("Another firmware update of the controller is under way", kTraceErrors);
            busy_.store(0);
            return E_FAIL;
        }
        uint64_t freeBytes = 0;
        if (kest::GetFreeDiskSpace(kest::paths::FirmwareStagingDirectory().c_str(), nullptr,
                                   &freeBytes) != 0 ||
            freeBytes < 2 * static_cast<uint64_t>(imageSize)) {
            TraceIfEnabled("Not enough free space for the firmware image", kTraceErrors);
            ReleaseUpdateLock();
            busy_.store(0);
            return E_FAIL;
        }
        updateId_ = vq::dsc::GuidToString(vq::dsc::Guid::CreateTimeBased());
        *updateId = CvqBStrAlloc(updateId_.c_str());
        if (*updateId == nullptr) {
            ReleaseUpdateLock();
            busy_.store(0);
            return E_OUTOFMEMORY;
        }
        announcedSize_ = imageSize;
        state_.store(FirmwareUpdateState::kPrepared);
        return S_OK;
    } catch (...) {
        const HRESULT status = StatusOfCurrentException();
        TraceIfEnabled("Cannot prepare the firmware update", kTraceErrors);
        ReleaseUpdateLock();
        busy_.store(0);
        return FAILED(status) ? status : E_FAIL;
    }
}

bool FirmwareUpdater::TakeUpdateLock() {
    std::lock_guard<std::mutex> lock(lockMutex_);
    if (!updateLock_.IsHeld()) {
        updateLock_ =
            vq::dsc::osdep::ProcessLockFile::TryTake(kest::paths::FirmwareUpdateLockFile());
    }
    return updateLock_.IsHeld();
}

void FirmwareUpdater::ReleaseUpdateLock() noexcept {
    try {
        std::lock_guard<std::mutex> lock(lockMutex_);
        updateLock_.Release();
    } catch (...) {
        // Taking a standard mutex fails only when the system is out of resources.
    }
}

void FirmwareUpdater::ReleasePreparedUpdate() noexcept {
    if (state_.load() == FirmwareUpdateState::kPrepared) {
        ReleaseUpdateLock();
    }
}

HRESULT FirmwareUpdater::Start(const wchar_t* updateId, IUnknown* imageSource) noexcept {
    try {
        std::lock_guard<std::mutex> lock(startMutex_);
        // Without a prepared update the busy flag may belong to an update that is running.
        if (state_.load() != FirmwareUpdateState::kPrepared) {
            return UX_E_FIRMWARE_BUSY;
        }
        try {
            return StartPrepared(updateId, imageSource);
        } catch (...) {
            return FailUpdate(StatusOfCurrentException());
        }
    } catch (...) {
        // Only taking the lock can fail here.
        return E_FAIL;
    }
}

HRESULT FirmwareUpdater::StartPrepared(const wchar_t* updateId, IUnknown* imageSource) {
    if (updateId == nullptr) {
        return FailUpdate(E_POINTER);
    }
    if (updateId_ != updateId) {
        return FailUpdate(UX_E_FIRMWARE_ID_MISMATCH);
    }
    // A prepared update whose lock was let go (Uninitialize) needs it back before staging.
    if (!TakeUpdateLock()) {
        TraceIfEnabled("Another firmware update of the controller is under way", kTraceErrors);
        return FailUpdate(E_FAIL);
    }
    const HRESULT staged = StageFirmwareImage(imageSource, stagingPath_, announcedSize_);
    if (FAILED(staged)) {
        return FailUpdate(staged);
    }
    try {
        // A status file left by an earlier run must not be taken for this run's progress.
        unlink(kest::paths::FirmwareUpdateStatusFile().c_str());
        state_.store(FirmwareUpdateState::kRunning);
        // A worker of an earlier attempt has already recorded its outcome; it only has to end.
        if (worker_.joinable()) {
            worker_.join();
        }
        worker_ =
            boost::thread(boost::bind(&FirmwareUpdater::RunFirmwareUpdateTool, this, stagingPath_));
    } catch (...) {
        const HRESULT status = StatusOfCurrentException();
        unlink(stagingPath_.c_str());
        TraceIfEnabled("Cannot start the firmware update", kTraceErrors);
        return FailUpdate(FAILED(status) ? status : E_FAIL);
    }
    return S_OK;
}

HRESULT FirmwareUpdater::FailUpdate(HRESULT status) noexcept {
    state_.store(FirmwareUpdateState::kFailed);
    ReleaseUpdateLock();
    // Cleared last: a new update may begin as soon as it is.
    busy_.store(0);
    return status;
}

void FirmwareUpdater::RunFirmwareUpdateTool(const std::string& stagingPath) noexcept {
    bool installed = false;
    if (state_.load() == FirmwareUpdateState::kRunning) {
        try {
            // Held until the tool runs: then the tool's process alone keeps the update lock, so
            // that it lasts exactly as long as the tool, even when this process dies.
            std::unique_lock<std::mutex> handingOver(lockMutex_);
            installed = RunFirmwareTool(kest::paths::FirmwareUpdateTool(), stagingPath,
                                        updateLock_.Descriptor(), [&](pid_t tool) {
                                            updateLock_.RecordHolder(tool);
                                            updateLock_.Release();
                                            handingOver.unlock();
                                        });
        } catch (...) {
            installed = false;
        }
    }
    if (installed) {
        ReleaseUpdateLock();
        // The busy flag stays set: this expert installs no second image.
        state_.store(FirmwareUpdateState::kInstalled);
        return;
    }
    TraceIfEnabled("The firmware update tool failed", kTraceErrors);
    RemoveStagedImage(stagingPath);
    FailUpdate(E_FAIL);
}

void FirmwareUpdater::RemoveStagedImage(const std::string& stagingPath) noexcept {
    try {
        if (TakeUpdateLock()) {
            unlink(stagingPath.c_str());
        }
    } catch (...) {
        TraceIfEnabled("Cannot take the firmware update lock to remove the staged image",
                       kTraceErrors);
    }
}

HRESULT FirmwareUpdater::GetStatus(int32_t* state, int32_t* percent) noexcept {
    if (state == nullptr || percent == nullptr) {
        return E_FAIL;
    }
    FirmwareUpdateState current = state_.load();
    *state = static_cast<int32_t>(current);
    if (current != FirmwareUpdateState::kRunning) {
        *percent = PercentForState(current);
        return S_OK;
    }
    try {
        const FirmwareProgress progress =
            ReadFirmwareProgress(kest::paths::FirmwareUpdateStatusFile());
        if (progress.percent) {
            *percent = *progress.percent;
        }
        // Only from running: the worker's final state must never be overwritten by a reading
        // taken before the tool ended.
        if (progress.newState) {
            state_.compare_exchange_strong(current, *progress.newState);
        }
        return progress.status;
    } catch (...) {
        return StatusOfCurrentException();
    }
}

HRESULT FirmwareUpdater::WaitForWorker() noexcept {
    try {
        boost::thread worker;
        {
            std::lock_guard<std::mutex> lock(startMutex_);
            if (worker_.joinable() && worker_.get_id() == boost::this_thread::get_id()) {
                return E_FAIL;
            }
            worker = std::move(worker_);
        }
        if (worker.joinable()) {
            worker.join();
        }
        return S_OK;
    } catch (...) {
        return E_FAIL;
    }
}

}  // namespace nVQKESTSYSAPICHASSISEXPERT100
