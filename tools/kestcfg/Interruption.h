// How kestcfg meets SIGINT, SIGTERM, SIGHUP, SIGQUIT and SIGPIPE while it changes the
// controller. Handlers are installed, never an ignored disposition or a blocked mask: programs
// that the plug-in starts meanwhile begin with default signals.
#pragma once

namespace kest::cfg {

// From now until EndInterruptionHandling, the signals are only recorded: the first one says on
// standard error that kestcfg is finishing the interface restart, and kestcfg ends with
// ExitCodeAfterSignal once the plug-in has finished (Uninitialize has returned).
void DeferInterruptions();

// During a firmware update: a first SIGINT says that the update cannot be cancelled and goes on
// in the update tool; a second SIGINT, SIGTERM or SIGHUP ends kestcfg at once with
// ExitCodeAfterSignal, and the tool goes on in its own session.
void GuardFirmwareUpdate();

// Gives the signals their default dispositions again; a recorded signal stays recorded.
void EndInterruptionHandling();

// The first signal recorded by DeferInterruptions, or 0.
int RecordedInterruption();

}  // namespace kest::cfg
