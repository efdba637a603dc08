#pragma once

#include <QObject>
#include <QString>
#include <memory>
#include <vector>

#include "Platform/Screen.h"

namespace platform {

/// Screens on top of each other: a root that stays, and what was opened from it. Main thread only.
class NavigationStack : public QObject {
    Q_OBJECT
    Q_PROPERTY(platform::Screen* rootScreen READ rootScreen CONSTANT)
    Q_PROPERTY(platform::Screen* topScreen READ topScreen NOTIFY changed)
    Q_PROPERTY(QString backTitle READ backTitle NOTIFY backTitleChanged)
    Q_PROPERTY(bool canGoBack READ canGoBack NOTIFY changed)
 public:
    /// The identifier names the stack in saved states.
    NavigationStack(QString restorationIdentifier, std::unique_ptr<Screen> root);
    ~NavigationStack() override;

    const QString& restorationIdentifier() const { return restorationIdentifier_; }
    Screen* rootScreen() const { return screens_.front().get(); }
    Screen* topScreen() const { return screens_.back().get(); }
    Q_INVOKABLE int count() const { return static_cast<int>(screens_.size()); }
    /// The screens from the root (0) upward.
    Q_INVOKABLE platform::Screen* screenAt(int index) const {
        return screens_.at(static_cast<size_t>(index)).get();
    }
    bool canGoBack() const { return screens_.size() > 1; }
    /// The title of the screen below the top one; empty: none.
    QString backTitle() const;

    void push(std::unique_ptr<Screen> screen, bool animated = true);
    /// Takes the top screen away; nothing at the root.
    Q_INVOKABLE void pop(bool animated = true);
    Q_INVOKABLE void popToRoot(bool animated = true);

    /// The screens that went have left the display. Called by who lays the screens out.
    Q_INVOKABLE void transitionFinished();

    /// Whether the stack is what the user sees: its top screen is told. Called by who holds the stack.
    void setVisible(bool visible);

 signals:
    void changed();
    void backTitleChanged();
    /// What a later session begins with may be another than before: other screens, or another state of one.
    void restorableStateChanged();
    /// Sent after the change; those who lay the screens out follow.
    void pushed(platform::Screen* screen, bool animated);
    /// `count` screens went. They live on until transitionFinished() when animated, else until control
    /// returns to the event loop.
    void popped(int count, bool animated);

 private:
    void adopt(Screen& screen);
    void popTo(size_t count, bool animated);
    QString restorationIdentifier_;
    std::vector<std::unique_ptr<Screen>> screens_;
    std::vector<std::unique_ptr<Screen>> leaving_;
    bool visible_ = false;
};

}  // namespace platform
