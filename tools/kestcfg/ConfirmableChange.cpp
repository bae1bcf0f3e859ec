#include "ConfirmableChange.h"

#include <fcntl.h>
#include <limits.h>
#include <stdlib.h>
#include <time.h>
#include <unistd.h>

#include <iostream>

#include "ExitCodes.h"
#include "ItemAccess.h"
#include "PendingChange.h"
#include "ProgramLocation.h"
#include "PropertyCatalogue.h"
#include "SettingsDocument.h"
#include "hostkit/HostText.h"
#include "support/ExternalApplication.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

// The environment the watcher starts with.
const std::vector<std::string> kWatcherEnvironment = {"PATH=/usr/sbin:/usr/bin:/sbin:/bin"};

std::wstring Wide(const std::string& text) {
    return WideFromUtf8(text).value_or(std::wstring());
}

// The watcher's arguments: this kestcfg's controller and plug-in, and the change to await.
std::vector<std::wstring> WatcherArguments(const CommandOptions& options, const std::string& id) {
    std::vector<std::wstring> arguments;
    if (const char* root = getenv("KEST_SYSROOT"); root != nullptr && *root != '\0') {
        arguments.insert(arguments.end(), {L"--sysroot", Wide(root)});
    }
    if (!options.plugin.empty()) {
        char absolute[PATH_MAX];
        const std::string plugin =
            realpath(options.plugin.c_str(), absolute) != nullptr ? absolute : options.plugin;
        arguments.insert(arguments.end(), {L"--plugin", Wide(plugin)});
    }
    if (options.simulator) {
        arguments.push_back(L"--simulator");
    }
    arguments.insert(arguments.end(), {L"rollback", L"--watch", Wide(id)});
    return arguments;
}

// Starts the watcher as a fresh kestcfg in its own session, with its standard descriptors (and
// its starter's) on /dev/null, so that it holds nothing of this process's caller: a remote
// shell waiting for the end of this kestcfg's output returns at once.
void StartWatcher(const CommandOptions& options, const std::string& id) {
    const int null = open("/dev/null", O_RDWR | O_CLOEXEC);
    if (null < 0) {
        throw Failure("cannot open /dev/null");
    }
    std::cout.flush();
    std::cerr.flush();
    int saved[3];
    for (int descriptor = 0; descriptor < 3; ++descriptor) {
        saved[descriptor] = fcntl(descriptor, F_DUPFD_CLOEXEC, 3);
        dup2(null, descriptor);
    }
    close(null);
    std::string problem;
    try {
        vq::dsc::osdep::ExternalApplication watcher;
        watcher.SetEnvironment(kWatcherEnvironment);
        watcher.Start(Wide(ProgramDirectory() + "kestcfg"), WatcherArguments(options, id));
    } catch (const std::exception& error) {
        problem = error.what();
    } catch (...) {
        problem = "the program could not be started";
    }
    for (int descriptor = 0; descriptor < 3; ++descriptor) {
        if (saved[descriptor] >= 0) {
            dup2(saved[descriptor], descriptor);
            close(saved[descriptor]);
        } else {
            close(descriptor);
        }
    }
    if (!problem.empty()) {
        throw Failure("cannot start the rollback watcher: " + problem);
    }
}

// What cannot be rolled back: the clock, and the primary role, which the plug-in never removes.
void RefuseWhatCannotBeRolledBack(const std::vector<ItemRequest>& requests) {
    const uint32_t clock = FindPropertyByName("current-time")->tag;
    const uint32_t primary = FindPropertyByName("primary-adapter")->tag;
    for (const ItemRequest& request : requests) {
        for (const auto& [tag, value] : request.values) {
            if (tag == clock) {
                throw UsageError(
                    "current-time cannot be rolled back; set the clock without --confirm-within");
            }
            const bool* makesPrimary = std::get_if<bool>(&value);
            if (tag == primary && makesPrimary != nullptr && *makesPrimary) {
                throw UsageError("making " + ItemText(request.item) +
                                 " the primary adapter (primary-adapter) cannot be rolled back: "
                                 "the primary role is never removed; set it without "
                                 "--confirm-within");
            }
        }
    }
}

}  // namespace

ConfirmWatch::ConfirmWatch(CommandContext* context, std::string id, int64_t deadline)
    : context_(context), id_(std::move(id)), deadline_(deadline) {}

ConfirmWatch::~ConfirmWatch() {
    if (context_ == nullptr) {
        return;
    }
    const std::string deadline = UtcText(deadline_);
    try {
        StartWatcher(context_->options, id_);
    } catch (const std::exception& error) {
        context_->err << "kestcfg: " << error.what()
                      << "; the old settings return only with kestcfg rollback\n";
        context_->document["pending"] = {{"deadline", deadline}, {"watcher", false}};
        return;
    }
    context_->document["pending"] = {{"deadline", deadline}, {"watcher", true}};
    if (!context_->options.json) {
        context_->out << "Run 'kestcfg confirm' before " << deadline
                      << " to keep this change; otherwise the old settings return then.\n";
    }
}

ConfirmWatch PrepareConfirmableChange(CommandContext& context,
                                      const std::vector<ItemRequest>& requests) {
    if (!context.options.confirmWithin) {
        std::optional<Json> pending;
        try {
            pending = ReadRecord(PendingRollbackPath());
        } catch (const CommandFailure&) {
        }
        for (const ItemRequest& request : requests) {
            const std::string item = ItemText(request.item);
            if (pending && pending->value("items", Json::object()).contains(item)) {
                context.err << "kestcfg: warning: " << PrintableText(item)
                            << " has a pending change; unless it is confirmed, its rollback at "
                            << pending->value("deadline", "?") << " undoes this change too\n";
            }
        }
        return ConfirmWatch();
    }
    RefuseWhatCannotBeRolledBack(requests);
    if (std::optional<Json> pending = ReadRecord(PendingRollbackPath())) {
        throw CommandFailure(kExitBusy, "a change is already pending until " +
                                            pending->value("deadline", "?") +
                                            ": confirm it first (kestcfg confirm), or roll it "
                                            "back (kestcfg rollback)");
    }
    std::vector<std::wstring> items;
    for (const ItemRequest& request : requests) {
        items.push_back(request.item);
    }
    const int64_t deadline = static_cast<int64_t>(time(nullptr)) + *context.options.confirmWithin;
    const std::string id = NewChangeId();
    WriteRecord(PendingRollbackPath(), {{"id", id},
                                        {"deadline", UtcText(deadline)},
                                        {"deadlineSeconds", deadline},
                                        {"items", ExportSettings(context.expert, items)["items"]}});
    return ConfirmWatch(&context, id, deadline);
}

}  // namespace kest::cfg
