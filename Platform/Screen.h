#pragma once

#include <QObject>
#include <QString>
#include <QUrl>
#include <memory>

namespace platform {

class NavigationStack;
class RestorableState;
struct UserActivity;

/// One screen: what it shows and does, without a window. The QML file that lays it out gets it as its
/// property `screen`. A screen lives in one navigation stack, which tells it when it comes and goes. Main
/// thread only.
class Screen : public QObject {
    Q_OBJECT
    Q_PROPERTY(QString title READ title NOTIFY titleChanged)
    Q_PROPERTY(QUrl view READ view CONSTANT)
 public:
    /// The QML file that lays the screen out.
    virtual QUrl view() const = 0;

    QString title() const { return title_; }
    void setTitle(const QString& title);
    /// The stack that it is in; null: none.
    NavigationStack* navigationStack() const { return navigationStack_; }
    /// Whether it is what the user sees: on top of its stack, in the selected tab.
    bool isVisible() const { return visible_; }

    /// What the user is at while the screen is shown: made current each time it has appeared. Null: nothing.
    std::shared_ptr<const UserActivity> userActivity() const { return userActivity_; }
    /// Set anew (its texts are in another language now) it is current at once while the screen is shown.
    void setUserActivity(std::shared_ptr<const UserActivity> activity);
    /// Brings the screen to where the activity was, after its stack was popped to its root.
    virtual void restoreUserActivityState(const UserActivity& activity);

    /// Its name in saved states; empty: neither the screen nor those on top of it are there in a later
    /// session.
    virtual QString restorationIdentifier() const { return {}; }
    /// What a later session begins with. Decoded before the screen is shown for the first time; values that
    /// mean nothing (any more) are left alone.
    virtual void encodeRestorableState(RestorableState& state) const;
    virtual void decodeRestorableState(const RestorableState& state);

 signals:
    void titleChanged();
    /// What encodeRestorableState() gives may be another than before.
    void restorableStateChanged();

 protected:
    Screen();
    /// Hooks around being shown and hidden; each first one comes before the change on the display.
    virtual void willAppear() {}
    virtual void didAppear() {}
    virtual void willDisappear() {}

 private:
    friend class NavigationStack;
    void setVisible(bool visible);
    QString title_;
    NavigationStack* navigationStack_ = nullptr;
    bool visible_ = false;
    std::shared_ptr<const UserActivity> userActivity_;
};

}  // namespace platform
