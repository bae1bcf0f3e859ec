#include "Interruption.h"

#include <signal.h>
#include <unistd.h>

#include <csignal>

#include "ExitCodes.h"

namespace kest::cfg {

namespace {

constexpr int kHandledSignals[] = {SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGPIPE};

volatile sig_atomic_t recordedSignal = 0;
volatile sig_atomic_t firmwareInterrupts = 0;

// Writes a fixed text to standard error from a signal handler; a failure is of no consequence.
template <size_t N>
void SayFromHandler(const char (&text)[N]) {
    const ssize_t written = write(STDERR_FILENO, text, N - 1);
    static_cast<void>(written);
}

void RecordInterruption(int signalNumber) {
    if (recordedSignal == 0) {
        recordedSignal = signalNumber;
        SayFromHandler("\nkestcfg: interrupted; finishing the interface restart\n");
    }
}

void InterruptFirmwareFollowing(int signalNumber) {
    if (signalNumber == SIGINT && firmwareInterrupts == 0) {
        firmwareInterrupts = 1;
        SayFromHandler(
            "\nkestcfg: the firmware update cannot be cancelled; it goes on in the update tool "
            "(interrupt again to stop following it)\n");
        return;
    }
    _exit(ExitCodeAfterSignal(signalNumber));
}

void Install(void (*handler)(int), bool everySignal) {
    struct sigaction action {};
    action.sa_handler = handler;
    sigemptyset(&action.sa_mask);
    action.sa_flags = SA_RESTART;
    for (const int signalNumber : kHandledSignals) {
        if (everySignal || signalNumber == SIGINT || signalNumber == SIGTERM ||
            signalNumber == SIGHUP) {
            sigaction(signalNumber, &action, nullptr);
        }
    }
}

}  // namespace

void DeferInterruptions() {
    Install(&RecordInterruption, true);
}

void GuardFirmwareUpdate() {
    Install(&InterruptFirmwareFollowing, false);
}

void EndInterruptionHandling() {
    Install(SIG_DFL, true);
}

int RecordedInterruption() {
    return recordedSignal;
}

}  // namespace kest::cfg
