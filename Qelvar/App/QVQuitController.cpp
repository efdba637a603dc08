#include "Qelvar/App/QVQuitController.h"

#include <algorithm>

#include "Platform/Localization.h"

using platform::localized;

QVQuitController::QVQuitController(std::vector<QVTransferController*> works) : works_(std::move(works)) {
    for (QVTransferController* work : works_) {
        connect(work, &QVTransferController::changed, this, [this] {
            if (asks_ && !anythingRuns()) setAsks(false);  // there is nothing to give up any more
        });
    }
}

bool QVQuitController::anythingRuns() const {
    return std::any_of(works_.begin(), works_.end(), [](const auto* work) { return work->isWorking(); });
}

bool QVQuitController::mayQuit() {
    if (givenUp_ || !anythingRuns()) return true;
    setAsks(true);
    return false;
}

void QVQuitController::setAsks(bool asks) {
    if (asks_ == asks) return;
    asks_ = asks;
    emit changed();
    emit buttonsChanged();
}

QString QVQuitController::title() const {
    return localized("QUIT_TITLE");
}

QString QVQuitController::message() const {
    QStringList titles;
    for (const QVTransferController* work : works_)
        if (work->isWorking()) titles << work->title();
    return localized("QUIT_MESSAGE", {titles.join(QStringLiteral(", "))});
}

QStringList QVQuitController::buttonTitles() const {
    if (!asks_) return {};
    return {localized("QUIT_GO_ON"), localized("QUIT_GIVE_UP")};
}

void QVQuitController::pressButton(int index) {
    if (!asks_) return;
    givenUp_ = index == 1;
    setAsks(false);
    if (givenUp_) emit quitRequested();
}
