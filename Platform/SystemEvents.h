#pragma once

#include <QObject>
#include <QStringList>
#include <QVariantMap>
#include <memory>

namespace platform {

/// Events of the host: a new day, a change of clock or zone, a change of locale. Main thread only; one object
/// for the process, made at start-up.
class SystemEvents : public QObject {
    Q_OBJECT
 public:
    static SystemEvents& shared();
    /// Starts listening: a timer to the next midnight of the user's zone, the kernel's notice of a set clock
    /// (timerfd), the zone file (/etc/localtime) and the system's time-date service, the system's resume.
    void start();
    /// Tells the observers as if it had happened (menu, tests).
    void postSignificantTimeChange();
    void postLocaleChange();

 signals:
    /// A new day began, or the time zone or the clock changed.
    void significantTimeChange();
    /// The user's locale changed; translations have been loaded anew.
    void localeDidChange();

 private slots:
    // What the system bus tells.
    void busTimeDateChanged(const QString& interface, const QVariantMap& changed,
                            const QStringList& invalidated);
    void busPrepareForSleep(bool goingToSleep);

 private:
    SystemEvents();
    ~SystemEvents() override;
    struct Private;
    std::unique_ptr<Private> private_;
};

}  // namespace platform
