#include "tools/qmedit/interrupts.h"

#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"

#include <csignal>
#include <string_view>
#include <unistd.h>

namespace interrupts {

namespace {

constexpr int kSignals[] = {SIGINT, SIGTERM, SIGHUP};
constexpr int kSignalBase = 128; ///< what the shell adds to a signal's number

volatile std::sig_atomic_t notedSignal = 0;
volatile std::sig_atomic_t numHolds = 0;
volatile std::sig_atomic_t workIsOver = 0;

void onSignal(int signal) {
    if (numHolds > 0) {
        notedSignal = signal;
        return;
    }
    constexpr std::string_view kUnchanged = "qmedit: interrupted; no edit was changed\n";
    constexpr std::string_view kOver = "qmedit: interrupted; its work on the edits was over\n";
    const std::string_view line = workIsOver != 0 ? kOver : kUnchanged;
    const ssize_t written = ::write(STDERR_FILENO, line.data(), line.size());
    static_cast<void>(written);
    ::_exit(kSignalBase + signal);
}

} // namespace

void install() {
    struct sigaction action {};
    action.sa_handler = onSignal;
    action.sa_flags = SA_RESTART;
    sigemptyset(&action.sa_mask);
    for (const int signal : kSignals) {
        sigaddset(&action.sa_mask, signal);
    }
    for (const int signal : kSignals) {
        struct sigaction before {};
        if (::sigaction(signal, nullptr, &before) == 0 && before.sa_handler != SIG_IGN) {
            ::sigaction(signal, &action, nullptr);
        }
    }
}

Hold::Hold(bool changesEdits) : m_changesEdits(changesEdits) {
    numHolds = numHolds + 1;
}

Hold::~Hold() {
    if (m_changesEdits) {
        workIsOver = 1;
    }
    numHolds = numHolds - 1;
}

bool noted() {
    return notedSignal != 0;
}

bool editsWereChanged() {
    return workIsOver != 0;
}

int exitCode(int code) {
    if (notedSignal == 0) {
        return code;
    }
    reportError(code == kDone ? "interrupted; what had begun was finished" : "interrupted");
    return kSignalBase + notedSignal;
}

} // namespace interrupts
