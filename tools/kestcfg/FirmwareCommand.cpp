// kestcfg firmware ITEM IMAGE: installs a firmware image as a host does. It announces the image,
// hands it over, follows the update with a progress bar until the plug-in reports it installed
// or failed, and then waits for the update tool to end before it reports the final state.
#include <fcntl.h>
#include <stdlib.h>
#include <sys/file.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <optional>
#include <string>

#include "Commands.h"
#include "ExitCodes.h"
#include "FirmwareFiles.h"
#include "HostFirmwareImage.h"
#include "Interruption.h"
#include "ItemAccess.h"
#include "StatusNames.h"
#include "hostkit/HostText.h"
#include "hostkit/InterfaceRef.h"
#include "support/FileDescriptor.h"
#include "uxsys/HostString.h"
#include "uxsys/StatusCodes.h"

namespace kest::cfg {

using namespace kest::hostkit;

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

// Polls the update until it is installed or failed, showing its progress on `err`: a bar on a
// terminal, plain lines otherwise, nothing when `quiet`. Returns the last failure status the
// plug-in reported while polling, if any.
std::optional<HRESULT> FollowUpdate(IuxSysExpertFirmware* firmware, const std::wstring& item,
                                    bool quiet, std::ostream& err) {
    const bool terminal = isatty(STDERR_FILENO) != 0;
    UpdateStatus status;
    std::optional<HRESULT> failure;
    std::string shown;
    bool barDrawn = false;
    for (;;) {
        UpdateStatus now = status;
        const HRESULT polled =
            firmware->GetFirmwareUpdateStatus(item.c_str(), &now.state, &now.percent);
        status = now;
        if (polled < 0) {
            failure = polled;
            err << (barDrawn ? "\n" : "") << "kestcfg: the update tool reports a failure ("
                << StatusWithName(polled) << ")\n";
            barDrawn = false;
        } else if (!quiet && ProgressBar(status) != shown) {
            shown = ProgressBar(status);
            if (terminal) {
                err << "\r" << shown << std::flush;
                barDrawn = true;
            } else if (status.state != UX_FIRMWARE_STATE_INSTALLED) {
                err << "kestcfg: " << std::clamp(status.percent, 0, 100) << "% "
                    << StateName(status.state) << "\n";
            }
        }
        if (IsFinal(status.state)) {
            break;
        }
        usleep(kPollInterval);
    }
    if (barDrawn) {
        err << "\n";
    }
    return failure;
}

// Why the update failed, as far as kestcfg can tell.
std::string FailureReason(std::optional<HRESULT> reported) {
    const std::optional<char> code = StatusFileCode();
    if (reported && code) {
        return "the update tool reported " + StatusCodeMeaning(*code) + " in its status file (" +
               StatusWithName(*reported) + ")";
    }
    return "the update tool ended with a failure (a nonzero exit status, or it could not start)";
}

// The process id recorded in the controller's firmware update lock when some process holds the
// lock; empty when it is free or cannot be examined.
std::string UpdateLockHolder() {
    const char* root = getenv("KEST_SYSROOT");
    const std::string path =
        std::string(root != nullptr && root[0] == '/' ? root : "") + kUpdateLockFile;
    const kest::FileDescriptor file(
        open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
    if (!file.IsOpen()) {
        return std::string();
    }
    std::string holder;
    if (flock(file.Get(), LOCK_SH | LOCK_NB) != 0 && errno == EWOULDBLOCK) {
        char text[32] = {};
        const ssize_t count = pread(file.Get(), text, sizeof text - 1, 0);
        holder = count > 0 ? std::string(text, static_cast<size_t>(count)) : "?";
        holder.erase(holder.find_last_not_of(" \n") + 1);
    }
    return holder;
}

}  // namespace

void RunFirmware(CommandContext& context) {
    const std::wstring item = ItemArgument(context.arguments[0]);
    HostFirmwareImage image(context.arguments[1]);
    RequireItem(context.expert, item);
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
                                     holder + "; see kestcfg firmware-status)",
                                 prepared);
        }
        throw CommandFailure(kExitFailure,
                             "the plug-in refused to prepare the update (" +
                                 StatusWithName(prepared) +
                                 "): not enough free space for twice the image, or an update "
                                 "is under way",
                             prepared);
    }
    // From here the update belongs to the tool; kestcfg only follows it.
    GuardFirmwareUpdate();
    const HRESULT started =
        firmware->StartFirmwareUpdate(item.c_str(), updateId.Get(), 0, nullptr, &image);
    if (started < 0) {
        throw CommandFailure(
            kExitFailure,
            "the plug-in could not start the update (" + StatusWithName(started) + ")", started);
    }
    // The plug-in's update lock now keeps other updates out; other kestcfg commands may go on.
    if (context.turn != nullptr) {
        context.turn->End();
    }

    const std::optional<HRESULT> reported =
        FollowUpdate(firmware.Get(), item, context.options.json, context.err);
    // The tool may still run after a failure read from its status file; Uninitialize waits for
    // it, and its ending decides the final state.
    context.expert->Uninitialize();
    UpdateStatus final;
    firmware->GetFirmwareUpdateStatus(item.c_str(), &final.state, &final.percent);

    const std::string id = TakeHostString(updateId.Release());
    const bool installed = final.state == UX_FIRMWARE_STATE_INSTALLED;
    context.document = {{"item", ItemText(item)},
                        {"update", id},
                        {"state", StateName(final.state)},
                        {"percent", installed ? 100 : final.percent}};
    if (installed && !reported) {
        if (!context.options.json) {
            context.out << "firmware update " << PrintableText(id) << " of "
                        << PrintableText(ItemText(item)) << ": installed\n"
                        << "Restart the controller to run the new firmware.\n";
        }
        return;
    }
    const std::string reason =
        installed ? FailureReason(reported) +
                        ", but then exited with status 0: the new firmware may not be installed"
                  : FailureReason(reported);
    context.document["reason"] = reason;
    if (!context.options.json) {
        context.out << "firmware update " << PrintableText(id) << " of "
                    << PrintableText(ItemText(item)) << ": failed\n";
    }
    throw CommandFailure(kExitFailure, reason, reported);
}

void RunFirmwareStatus(CommandContext& context) {
    const UpdateLock lock = ReadUpdateLock();
    const std::optional<char> code = StatusFileCode();
    context.document = {{"running", lock.held},
                        {"pid", lock.pid ? Json(*lock.pid) : Json(nullptr)},
                        {"statusCode", code ? Json(std::string(1, *code)) : Json(nullptr)},
                        {"stage", code ? Json(StatusCodeMeaning(*code)) : Json(nullptr)}};
    if (context.options.json) {
        return;
    }
    if (lock.held) {
        context.out << "A firmware update is running"
                    << (lock.pid ? " (started by process " + std::to_string(*lock.pid) + ")"
                                 : std::string())
                    << ".\n";
    } else {
        context.out << "No firmware update is running.\n";
    }
    context.out << "Status file: "
                << (code ? PrintableText(std::string(1, *code)) + ", " + StatusCodeMeaning(*code)
                         : std::string("none"))
                << "\n";
}

}  // namespace kest::cfg
