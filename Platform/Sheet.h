#pragma once

#include <memory>

#include "Platform/NavigationStack.h"

namespace platform {

/// A screen that is shown as a sheet, above the window's other screens, until it is closed. Main thread only.
class SheetScreen : public Screen {
    Q_OBJECT
 public:
    /// The user leaves without a choice (Escape, Back).
    Q_INVOKABLE virtual void cancel() { close(); }

 signals:
    void closeRequested(bool animated);

 protected:
    SheetScreen() = default;
    void close(bool animated = true) { emit closeRequested(animated); }
};

/// Shows one sheet at a time. Belongs to the screen that opens sheets, whose layout has a SheetView with this
/// as its `presentation`. Main thread only.
class SheetPresentation : public QObject {
    Q_OBJECT
    Q_PROPERTY(platform::Screen* screen READ screen NOTIFY changed)
    Q_PROPERTY(bool animated READ isAnimated NOTIFY changed)
 public:
    SheetPresentation();
    ~SheetPresentation() override;

    /// What is shown; null: nothing.
    SheetScreen* screen() const { return screen_; }
    /// Whether the last change slides.
    bool isAnimated() const { return animated_; }
    /// Shows the screen; one that is shown already goes at once.
    void present(std::unique_ptr<SheetScreen> screen, bool animated = true);
    /// Takes the sheet away, if there is one. Its screen lives until the sheet has left the display, or at
    /// least until control returns to the event loop.
    void dismiss(bool animated = true);
    /// The sheet has left the display. Called by who lays it out.
    Q_INVOKABLE void transitionFinished();

 signals:
    void changed();

 private:
    std::unique_ptr<NavigationStack> stack_, leaving_;  // each with one screen, which it tells of its coming
    SheetScreen* screen_ = nullptr;
    bool animated_ = false;
};

}  // namespace platform
