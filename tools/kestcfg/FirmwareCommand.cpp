// kestcfg firmware ITEM IMAGE: installs a firmware image as a host does. It announces the image,
// hands it over, follows the update with a progress bar until the plug-in reports it installed
// or failed, and then waits for the update tool to end before it reports the final state.
#include <fcntl.h>
#include <stdlib.h>
#include <sys/file.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <string>

#include "Commands.h"
#include "ExitCodes.h"
#include "HostFirmwareImage.h"
#include "HostText.h"
#include "InterfaceRef.h"
#include "Interruption.h"
#include "ItemAccess.h"
#include "StatusNames.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace {

constexpr useconds_t kPollInterval = 200000;
constexpr char kUpdateLockFile[] = "/var/run/firmware_update/update.lock";
constexpr int kBarWidth = 20;

struct UpdateStatus {
    int32_t state = UX_FIRMWARE_STATE_IDLE;
    int32_t percent = 0;
};

std::string StateName(int32_t state) {
    switch (state) {
        case UX_FIRMWARE_STATE_IDLE:
            return "idle";
        case UX_FIRMWARE_STATE_PREPARED:
            return "prepared";
        case UX_FIRMWARE_STATE_RUNNING:
            return "running";
        case UX_FIRMWARE_STATE_FINISHING:
            return "finishing";
        case UX_FIRMWARE_STATE_INSTALLED:
            return "installed";
        case UX_FIRMWARE_STATE_FAILED:
            return "failed";
        default:
            return "state " + std::to_string(state);
    }
}

bool IsFinal(int32_t state) {
    return state == UX_FIRMWARE_STATE_INSTALLED || state == UX_FIRMWARE_STATE_FAILED;
}

// "[##########          ]  50% running": one mark per five percent.
std::string ProgressBar(const UpdateStatus& status) {
    const int percent = std::clamp(status.percent, 0, 100);
    const int marks = percent * kBarWidth / 100;
    std::string percentText = std::to_string(percent) + "%";
    percentText.insert(0, 4 - std::min<size_t>(4, percentText.size()), ' ');
    return "[" + std::string(marks, '#') + std::string(kBarWidth - marks, ' ') + "] " +
           percentText + " " + StateName(status.state);
}

// Fails unless the plug-in knows `item`, so that a mistyped name is not taken for the chassis.
void RequireItem(IuxSysExpert3* expert, const std::wstring& item) {
    InterfaceRef<IuxSysPropertyBag2> properties;
    const HRESULT status = CurrentProperties(expert, item, &properties);
    if (status == UX_E_ITEM_NOT_FOUND) {
        throw Failure("there is no item " + ItemText(item) + " (" + StatusWithName(status) + ")");
    }
}

// Polls the update, drawing the progress bar on `err` unless `quiet`, until it is installed or
// failed. A status-file failure the plug-in reports is noted once.
UpdateStatus FollowUpdate(IuxSysExpertFirmware* firmware, const std::wstring& item, bool quiet,
                          std::ostream& err) {
    UpdateStatus status;
    std::string drawn;
    for (;;) {
        UpdateStatus now = status;
        const HRESULT polled =
            firmware->GetFirmwareUpdateStatus(item.c_str(), &now.state, &now.percent);
        status = now;
        if (polled < 0) {
            err << (drawn.empty() ? "" : "\n") << "kestcfg: the update tool reports a failure ("
                << StatusWithName(polled) << ")\n";
            drawn.clear();
        } else if (!quiet && ProgressBar(status) != drawn) {
            drawn = ProgressBar(status);
            err << "\r" << drawn << std::flush;
        }
        if (IsFinal(status.state)) {
            break;
        }
        usleep(kPollInterval);
    }
    if (!drawn.empty()) {
        err << "\n";
    }
    return status;
}

// The process id recorded in the controller's firmware update lock when some process holds the
// lock; empty when it is free or cannot be examined.
std::string UpdateLockHolder() {
    const char* root = getenv("KEST_SYSROOT");
    const std::string path =
        std::string(root != nullptr && root[0] == '/' ? root : "") + kUpdateLockFile;
    const int file = open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
    if (file < 0) {
        return std::string();
    }
    std::string holder;
    if (flock(file, LOCK_SH | LOCK_NB) != 0 && errno == EWOULDBLOCK) {
        char text[32] = {};
        const ssize_t count = pread(file, text, sizeof text - 1, 0);
        holder = count > 0 ? std::string(text, static_cast<size_t>(count)) : "?";
        holder.erase(holder.find_last_not_of(" \n") + 1);
    }
    close(file);
    return holder;
}

}  // namespace

void RunFirmware(CommandContext& context) {
    const std::wstring item = ItemArgument(context.arguments[0]);
    const std::string& imagePath = context.arguments[1];
    RequireItem(context.expert, item);
    HostFirmwareImage image(imagePath);
    const InterfaceRef<IuxSysExpertFirmware> firmware =
        QueryInterfaceAs<IuxSysExpertFirmware>(context.expert, IID_IuxSysExpertFirmware);
    if (!firmware) {
        throw Failure("the plug-in offers no firmware update");
    }

    CvqBStrHolder updateId;
    const HRESULT prepared =
        firmware->PrepareFirmwareUpdate(item.c_str(), 0, image.GetImageSize(), updateId.Receive());
    if (prepared < 0) {
        const std::string holder = UpdateLockHolder();
        if (!holder.empty()) {
            throw CommandFailure(kExitBusy,
                                 "another firmware update of the controller is under way "
                                 "(process " +
                                     holder + ")");
        }
        throw Failure("the plug-in refused to prepare the update (" + StatusWithName(prepared) +
                      "): not enough free space for twice the image, or an update is under way");
    }
    // From here the update belongs to the tool; kestcfg only follows it.
    GuardFirmwareUpdate();
    const HRESULT started =
        firmware->StartFirmwareUpdate(item.c_str(), updateId.Get(), 0, nullptr, &image);
    if (started < 0) {
        throw Failure("the plug-in could not start the update (" + StatusWithName(started) + ")");
    }
    // The plug-in's update lock now keeps other updates out; other kestcfg commands may go on.
    if (context.turn != nullptr) {
        context.turn->End();
    }

    FollowUpdate(firmware.Get(), item, context.json, context.err);
    // The tool may still run after a failure read from its status file; Uninitialize waits for
    // it, and its ending decides the final state.
    context.expert->Uninitialize();
    UpdateStatus final;
    firmware->GetFirmwareUpdateStatus(item.c_str(), &final.state, &final.percent);

    const std::string id = TakeHostString(updateId.Release());
    if (context.json) {
        context.out << "{\"item\":" << JsonQuoted(ItemText(item))
                    << ",\"update\":" << JsonQuoted(id)
                    << ",\"state\":" << JsonQuoted(StateName(final.state))
                    << ",\"percent\":" << final.percent << "}\n";
    } else {
        context.out << "firmware update " << id << " of " << ItemText(item) << ": "
                    << StateName(final.state) << "\n";
    }
    if (final.state != UX_FIRMWARE_STATE_INSTALLED) {
        throw CommandFailure(kExitFailure, "");
    }
}
