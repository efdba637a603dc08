#include "Platform/NavigationStack.h"

#include <cassert>
#include <utility>

namespace platform {

NavigationStack::NavigationStack(QString restorationIdentifier, std::unique_ptr<Screen> root)
    : restorationIdentifier_(std::move(restorationIdentifier)) {
    assert(root);
    adopt(*root);
    screens_.push_back(std::move(root));
    connect(this, &NavigationStack::changed, this, &NavigationStack::backTitleChanged);
    connect(this, &NavigationStack::changed, this, &NavigationStack::restorableStateChanged);
}

void NavigationStack::adopt(Screen& screen) {
    screen.navigationStack_ = this;
    connect(&screen, &Screen::titleChanged, this, &NavigationStack::backTitleChanged);
    connect(&screen, &Screen::restorableStateChanged, this, &NavigationStack::restorableStateChanged);
}

NavigationStack::~NavigationStack() {
    // Screens on top may speak of those below: the topmost goes first.
    leaving_.clear();
    while (!screens_.empty()) screens_.pop_back();
}

QString NavigationStack::backTitle() const {
    return canGoBack() ? screens_[screens_.size() - 2]->title() : QString();
}

void NavigationStack::push(std::unique_ptr<Screen> screen, bool animated) {
    assert(screen);
    screens_.back()->setVisible(false);
    adopt(*screen);
    screens_.push_back(std::move(screen));
    screens_.back()->setVisible(visible_);
    emit pushed(topScreen(), animated);
    emit changed();
}

void NavigationStack::pop(bool animated) {
    popTo(screens_.size() - 1, animated);
}

void NavigationStack::popToRoot(bool animated) {
    popTo(1, animated);
}

void NavigationStack::popTo(size_t count, bool animated) {
    if (count < 1 || count >= screens_.size()) return;
    const int gone = static_cast<int>(screens_.size() - count);
    screens_.back()->setVisible(false);
    while (screens_.size() > count) {
        // Its layout may still slide out of view, and the caller may be one of its own actions.
        leaving_.push_back(std::move(screens_.back()));
        leaving_.back()->navigationStack_ = nullptr;
        disconnect(leaving_.back().get(), nullptr, this, nullptr);
        screens_.pop_back();
    }
    screens_.back()->setVisible(visible_);
    emit popped(gone, animated);
    emit changed();
    if (!animated) transitionFinished();
}

void NavigationStack::transitionFinished() {
    for (auto& screen : std::exchange(leaving_, {})) screen.release()->deleteLater();
}

void NavigationStack::setVisible(bool visible) {
    visible_ = visible;
    topScreen()->setVisible(visible);
}

}  // namespace platform
