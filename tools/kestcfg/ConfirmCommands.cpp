// kestcfg confirm, pending and rollback: the pending change that set or apply with
// --confirm-within saved, and the rollback that restores its settings at the deadline (run by
// the watcher, rollback --watch) or at once.
#include <stdio.h>
#include <sys/file.h>
#include <time.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <sstream>

#include "Commands.h"
#include "ControllerTurn.h"
#include "ExitCodes.h"
#include "ExpertSession.h"
#include "InstalledLibraries.h"
#include "PendingChange.h"
#include "SettingsDocument.h"
#include "hostkit/HostText.h"
#include "support/Sysroot.h"
#include "trace/Tracer.h"

namespace kest::cfg {

using namespace kest::hostkit;

namespace {

constexpr useconds_t kWatchInterval = 200000;

// The pending record while a rollback runs: renaming the record here claims it, so that a
// confirm that comes later finds nothing to remove.
std::string RunningRollbackPath() {
    return PendingRollbackPath() + ".running";
}

int64_t MonotonicSeconds() {
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    return static_cast<int64_t>(now.tv_sec);
}

// Adds `text` to the log the plug-in's tracer writes.
void LogLine(const std::string& text) {
    try {
        const std::string directory = kest::paths::PrimaryLogDirectory();
        InitializeTracing(UINT32_MAX, kTraceToLogFile,
                          std::wstring(directory.begin(), directory.end()), 0);
        TraceLine('I', ("kestcfg: " + text).c_str(), true);
        ShutdownTracing();
    } catch (...) {
    }
}

// The result of applying the saved settings, as the last-rollback record holds it.
Json ApplySaved(const CommandOptions& options, const Json& saved) {
    Json result = {{"result", "restored"}};
    try {
        const SimulatorLibrary simulator(options.simulator);
        const Plugin plugin(options.plugin.empty() ? DefaultPluginPath() : options.plugin);
        const InterfaceRef<IuxSysExpert3> expert = plugin.CreateExpert();
        const std::vector<std::string> noArguments;
        CommandOptions applyOptions;
        applyOptions.json = true;
        Json document = Json::object();
        std::ostringstream out;
        std::ostringstream err;
        CommandContext context{expert.Get(), noArguments, applyOptions, document, out, err};
        {
            const ExpertSession session(expert.Get());
            ApplySettings(context, {{"items", saved}}, "the saved settings");
        }
        result["changes"] = document.value("applied", Json::object());
    } catch (const CommandFailure& failure) {
        result["result"] = failure.Code() == kExitRejectedValue ? "rejected"
                           : failure.Code() == kExitPartlyDone  ? "partly restored"
                                                                : "failed";
        result["reason"] = failure.what();
    } catch (const std::exception& failure) {
        result["result"] = "failed";
        result["reason"] = failure.what();
    }
    return result;
}

// Claims the pending record open as `file` (still at its path: the caller holds the controller
// turn), restores its settings once and records the outcome; false when a confirm came first.
bool RollBack(const CommandOptions& options, int file, std::ostream& err) {
    const std::string path = PendingRollbackPath();
    Json pending = ReadRecordFrom(file, path);
    if (!StillAt(file, path) || rename(path.c_str(), RunningRollbackPath().c_str()) != 0) {
        return false;
    }
    Json record = ApplySaved(options, pending["items"]);
    record["id"] = pending["id"];
    record["deadline"] = pending["deadline"];
    record["at"] = UtcText(time(nullptr));
    record["items"] = pending["items"];
    const std::string result = record["result"].get<std::string>();
    LogLine("rollback of the change pending until " + pending.value("deadline", "?") + ": " +
            result +
            (record.contains("reason") ? " (" + record["reason"].get<std::string>() + ")" : ""));
    try {
        WriteRecord(LastRollbackPath(), record);
    } catch (const std::exception& failure) {
        err << "kestcfg: " << failure.what() << "\n";
    }
    // Never retried: the saved settings leave the pending record whatever the outcome.
    unlink(RunningRollbackPath().c_str());
    return true;
}

// Waits, without the controller turn, until the deadline of pending change `id`, and rolls it
// back then unless it was confirmed meanwhile.
void Watch(const CommandContext& context, const std::string& id) {
    const std::string path = PendingRollbackPath();
    const kest::FileDescriptor file = OpenRecord(path);
    if (!file.IsOpen() || flock(file.Get(), LOCK_EX | LOCK_NB) != 0 ||
        ReadRecordFrom(file.Get(), path).value("id", "") != id) {
        return;
    }
    // The wait is measured on the monotonic clock, so that setting the controller's clock
    // meanwhile neither hastens nor delays the rollback.
    const int64_t deadline = ReadRecordFrom(file.Get(), path)["deadlineSeconds"];
    const int64_t end = MonotonicSeconds() + (deadline - static_cast<int64_t>(time(nullptr)));
    while (MonotonicSeconds() < end) {
        if (!StillAt(file.Get(), path)) {
            return;  // confirmed
        }
        usleep(kWatchInterval);
    }
    const ControllerTurn turn(false, context.err);
    RollBack(context.options, file.Get(), context.err);
}

// The saved settings as lines "  ITEM: NAME = VALUE".
void PrintSettings(std::ostream& out, const Json& items) {
    for (const auto& [item, settings] : items.items()) {
        for (const auto& [name, value] : settings.items()) {
            out << "  " << PrintableText(item) << ": " << name << " = "
                << PrintableText(value.is_string() ? value.get<std::string>() : value.dump())
                << "\n";
        }
    }
}

}  // namespace

void RunConfirm(CommandContext& context) {
    const std::string path = PendingRollbackPath();
    const kest::FileDescriptor file = OpenRecord(path);
    if (!file.IsOpen() || unlink(path.c_str()) != 0) {
        if (ReadRecord(RunningRollbackPath())) {
            throw Failure("too late: the rollback of the change is running");
        }
        if (const std::optional<Json> last = ReadRecord(LastRollbackPath())) {
            throw Failure("no change is pending; the last one was rolled back at " +
                          last->value("at", "") + " (" + last->value("result", "") + ")");
        }
        throw Failure("no change is pending");
    }
    const Json pending = ReadRecordFrom(file.Get(), path);
    // The watcher notices the removal within its polling interval and ends.
    for (int waited = 0; waited < 100 && HeldByAnother(file.Get()); ++waited) {
        usleep(kWatchInterval / 2);
    }
    context.document = {{"confirmed", true}, {"deadline", pending.value("deadline", "")}};
    if (!context.options.json) {
        context.out << "Confirmed: the change stays.\n";
    }
}

void RunPending(CommandContext& context) {
    const std::string path = PendingRollbackPath();
    const kest::FileDescriptor file = OpenRecord(path);
    context.document = Json::object();
    if (file.IsOpen()) {
        Json pending = ReadRecordFrom(file.Get(), path);
        const bool watched = HeldByAnother(file.Get());
        context.document["pending"] = {{"deadline", pending["deadline"]},
                                       {"watcher", watched},
                                       {"restores", pending["items"]}};
        if (!context.options.json) {
            context.out << "A change is pending until " << pending.value("deadline", "?") << ".\n"
                        << (watched ? "Its watcher restores these settings then unless "
                                      "'kestcfg confirm' is run first:\n"
                                    : "Its watcher has died: 'kestcfg rollback' restores these "
                                      "settings now, 'kestcfg confirm' keeps the change:\n");
            PrintSettings(context.out, pending["items"]);
        }
    }
    const kest::FileDescriptor running = OpenRecord(RunningRollbackPath());
    if (running.IsOpen()) {
        const bool underWay = HeldByAnother(running.Get());
        context.document["rollback"] = {{"underWay", underWay}, {"record", RunningRollbackPath()}};
        if (!context.options.json) {
            context.out << (underWay ? "A rollback is under way.\n"
                                     : "A rollback was interrupted; 'kestcfg apply " +
                                           PrintableText(RunningRollbackPath()) +
                                           "' restores its saved settings.\n");
        }
    }
    if (const std::optional<Json> last = ReadRecord(LastRollbackPath())) {
        context.document["lastRollback"] = *last;
        if (!context.options.json) {
            context.out << "Last rollback: " << last->value("at", "") << ", "
                        << last->value("result", "")
                        << (last->contains("reason")
                                ? " (" + PrintableText((*last)["reason"].get<std::string>()) + ")"
                                : std::string())
                        << "; the change had been pending until " << last->value("deadline", "")
                        << "\n";
        }
    }
    if (context.document.empty() && !context.options.json) {
        context.out << "No change is pending.\n";
    }
}

void RunRollback(CommandContext& context) {
    if (!context.options.watch.empty()) {
        Watch(context, context.options.watch);
        return;
    }
    const ControllerTurn turn(context.options.noWait, context.err);
    const kest::FileDescriptor file = OpenRecord(PendingRollbackPath());
    if (!file.IsOpen() || !RollBack(context.options, file.Get(), context.err)) {
        throw Failure("no change is pending");
    }
    const Json last = ReadRecord(LastRollbackPath()).value_or(Json::object());
    context.document = {{"rollback", last}};
    if (!context.options.json) {
        context.out << "Rollback: " << last.value("result", "")
                    << (last.contains("reason")
                            ? " (" + PrintableText(last["reason"].get<std::string>()) + ")"
                            : std::string())
                    << "\n";
    }
    if (last.value("result", "") != "restored") {
        throw CommandFailure(kExitFailure, "the saved settings were not restored");
    }
}

}  // namespace kest::cfg
