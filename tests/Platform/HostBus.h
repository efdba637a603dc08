#pragma once

#include <QDBusConnection>
#include <QProcess>
#include <QString>
#include <QVariantMap>
#include <memory>

namespace test {

/// A message bus of the test program's own, which it takes for the system's and the session's, and on it
/// somebody who speaks for the host: the services for date, locale and sleep, and the desktop's settings.
class HostBus {
 public:
    /// Starts with the first call; before anything in the process has looked for a bus.
    static HostBus& shared();

    void timeDateChanged(const QVariantMap& changed);
    void localeChanged(const QStringList& locale);
    void prepareForSleep(bool goingToSleep);
    /// Tells it, and answers with it from now on.
    void setClockFormat(const QString& format);
    /// Returns when the process has got all that was said before.
    bool flush();

 private:
    class Portal;
    HostBus();
    void say(const QString& path, const QString& interface, const QString& signal,
             const QVariantList& arguments);
    void sayPropertiesChanged(const QString& path, const QString& interface, const QVariantMap& changed);

    QProcess daemon_;
    std::unique_ptr<QDBusConnection> host_;
    std::unique_ptr<Portal> portal_;
};

}  // namespace test
