#pragma once

#include <signal.h>

#include <QSocketNotifier>
#include <array>
#include <memory>

/// While it lives, SIGTERM (the session ends), SIGINT and SIGHUP (the terminal goes) end the event loop with
/// the exit status 128 + signal, so that the application can save what the user is at. One at a time, on the
/// main thread.
class QVTerminationSignals {
 public:
    QVTerminationSignals();
    ~QVTerminationSignals();
    QVTerminationSignals(const QVTerminationSignals&) = delete;
    QVTerminationSignals& operator=(const QVTerminationSignals&) = delete;

 private:
    static constexpr std::array signals_{SIGTERM, SIGINT, SIGHUP};

    int readEnd_ = -1;
    std::array<struct sigaction, signals_.size()> before_{};  // what each did until then
    std::unique_ptr<QSocketNotifier> notifier_;
};
