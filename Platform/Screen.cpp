#include "Platform/Screen.h"

#include "Platform/UserActivity.h"

#include <QQmlEngine>

namespace platform {

// A screen belongs to its stack; the script engine must not collect one that it has seen.
Screen::Screen() {
    QQmlEngine::setObjectOwnership(this, QQmlEngine::CppOwnership);
}

void Screen::setTitle(const QString& title) {
    if (title_ == title) return;
    title_ = title;
    emit titleChanged();
}

void Screen::setUserActivity(std::shared_ptr<const UserActivity> activity) {
    userActivity_ = std::move(activity);
    if (visible_ && userActivity_) UserActivity::makeCurrent(userActivity_);
}

void Screen::restoreUserActivityState(const UserActivity&) {}
void Screen::encodeRestorableState(RestorableState&) const {}
void Screen::decodeRestorableState(const RestorableState&) {}

void Screen::setVisible(bool visible) {
    if (visible_ == visible) return;
    if (!visible) {
        willDisappear();
        visible_ = false;
        return;
    }
    willAppear();
    visible_ = true;
    didAppear();
    if (userActivity_) UserActivity::makeCurrent(userActivity_);
}

}  // namespace platform
