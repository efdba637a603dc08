#pragma once

#include <QSocketNotifier>
#include <memory>

/// While it lives, SIGTERM (the session ends) and SIGINT end the event loop with the exit status 128 +
/// signal, so that the application can save what the user is at. One at a time, on the main thread.
class QVTerminationSignals {
 public:
    QVTerminationSignals();
    ~QVTerminationSignals();
    QVTerminationSignals(const QVTerminationSignals&) = delete;
    QVTerminationSignals& operator=(const QVTerminationSignals&) = delete;

 private:
    int readEnd_ = -1;
    std::unique_ptr<QSocketNotifier> notifier_;
};
