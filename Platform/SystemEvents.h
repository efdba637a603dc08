#pragma once

#include <QDBusVariant>
#include <QObject>
#include <QStringList>
#include <QVariantMap>
#include <filesystem>
#include <memory>

namespace platform {

/// Events of the host: a new day, a change of clock or zone, a change of locale. A locale or a zone that the
/// process was given of its own (LANG, TZ) stays. Main thread only; one object for the process, made at
/// start-up.
class SystemEvents : public QObject {
    Q_OBJECT
 public:
    static SystemEvents& shared();
    /// Starts listening: a timer to the next midnight of the user's zone, the kernel's notice of a set clock
    /// (timerfd), the zone file (localtime) and the locale files (locale.conf, default/locale) in `etc`, the
    /// system's services for date and locale, the desktop's setting of the clock, the system's resume.
    void start(const std::filesystem::path& etc = "/etc");
    /// Tells the observers as if it had happened.
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
    void busLocaleChanged(const QString& interface, const QVariantMap& changed,
                          const QStringList& invalidated);
    // What the session's bus tells of the desktop's settings.
    void busSettingChanged(const QString& group, const QString& key, const QDBusVariant& value);

 private:
    SystemEvents();
    ~SystemEvents() override;
    struct Private;
    std::unique_ptr<Private> private_;
};

}  // namespace platform
