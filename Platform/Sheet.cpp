#include "Platform/Sheet.h"

#include <QQmlEngine>
#include <cassert>

namespace platform {

SheetPresentation::SheetPresentation() {
    QQmlEngine::setObjectOwnership(this, QQmlEngine::CppOwnership);
}

SheetPresentation::~SheetPresentation() = default;

void SheetPresentation::present(std::unique_ptr<SheetScreen> screen, bool animated) {
    assert(screen);
    dismiss(false);
    screen_ = screen.get();
    connect(screen_, &SheetScreen::closeRequested, this, &SheetPresentation::dismiss);
    stack_ = std::make_unique<NavigationStack>(QString(), std::move(screen));
    animated_ = animated;
    stack_->setVisible(true);
    emit changed();
}

void SheetPresentation::dismiss(bool animated) {
    if (!screen_) return;
    transitionFinished();
    disconnect(screen_, nullptr, this, nullptr);
    stack_->setVisible(false);
    leaving_ = std::move(stack_);
    screen_ = nullptr;
    animated_ = animated;
    emit changed();
    if (!animated) transitionFinished();
}

void SheetPresentation::transitionFinished() {
    // The caller may be an action of the screen that goes.
    if (leaving_) leaving_.release()->deleteLater();
}

}  // namespace platform
