#include "Qelvar/App/QVTerminationSignals.h"

#include <fcntl.h>
#include <unistd.h>

#include <QCoreApplication>
#include <cerrno>

namespace {

// The handler's end of the pipe; there is one application in the process.
int writeEnd = -1;

// A handler may do next to nothing: it wakes the event loop. A second signal ends the process at once.
void handle(int signal) {
    const int error = errno;
    const auto number = static_cast<unsigned char>(signal);
    if (write(writeEnd, &number, 1) != 1) _exit(128 + signal);
    errno = error;
}

}  // namespace

QVTerminationSignals::QVTerminationSignals() {
    int ends[2];
    if (pipe2(ends, O_CLOEXEC | O_NONBLOCK) != 0) return;  // then they end the process as they always do
    readEnd_ = ends[0];
    writeEnd = ends[1];
    notifier_ = std::make_unique<QSocketNotifier>(readEnd_, QSocketNotifier::Read);
    QObject::connect(notifier_.get(), &QSocketNotifier::activated, notifier_.get(), [this] {
        unsigned char number = 0;
        if (read(readEnd_, &number, 1) == 1) QCoreApplication::exit(128 + number);
    });
    struct sigaction action {};
    action.sa_handler = handle;
    action.sa_flags = static_cast<int>(SA_RESETHAND);
    for (size_t i = 0; i < signals_.size(); ++i) {
        sigaction(signals_[i], nullptr, &before_[i]);
        // What whoever started the program has it ignore stays ignored.
        if (before_[i].sa_handler != SIG_IGN) sigaction(signals_[i], &action, nullptr);
    }
}

QVTerminationSignals::~QVTerminationSignals() {
    if (readEnd_ < 0) return;
    for (size_t i = 0; i < signals_.size(); ++i) sigaction(signals_[i], &before_[i], nullptr);
    notifier_.reset();
    close(readEnd_);
    close(writeEnd);
}
