#pragma once

#include <atomic>

// Ctrl+C and its like ask a command to end cleanly.

/// What the second signal of the kind does.
enum class QVSecondInterruption { EndsProcess, IsIgnored };

/// From now on SIGINT and SIGTERM (and SIGHUP, where the second one is ignored) only set the flag below.
void QVCatchInterruptions(QVSecondInterruption second);
/// Set by the first signal, for all the life of the process.
const std::atomic<bool>& QVInterrupted();
/// The exit status of a command that a signal ended: 128 and the signal's number. REQUIRES: QVInterrupted().
int QVInterruptedExitStatus();
