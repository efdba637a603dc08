#include "Program/QVInterruption.h"

#include <signal.h>

namespace {

std::atomic<bool> interrupted = false;
std::atomic<int> interruptingSignal = 0;
static_assert(std::atomic<bool>::is_always_lock_free && std::atomic<int>::is_always_lock_free);

}  // namespace

void QVCatchInterruptions(QVSecondInterruption second) {
    struct sigaction action {};
    action.sa_handler = [](int signal) {
        int none = 0;
        interruptingSignal.compare_exchange_strong(none, signal);
        interrupted = true;
    };
    const bool isIgnored = second == QVSecondInterruption::IsIgnored;
    action.sa_flags = isIgnored ? SA_RESTART : static_cast<int>(SA_RESETHAND);
    sigaction(SIGINT, &action, nullptr);
    sigaction(SIGTERM, &action, nullptr);
    if (isIgnored) sigaction(SIGHUP, &action, nullptr);
}

const std::atomic<bool>& QVInterrupted() {
    return interrupted;
}

int QVInterruptedExitStatus() {
    return 128 + interruptingSignal;
}
