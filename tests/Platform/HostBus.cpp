#include "HostBus.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/prctl.h>

#include <QDBusMessage>
#include <QDBusPendingCallWatcher>
#include <QDBusVariant>
#include <QDBusVirtualObject>

#include "QtTestSupport.h"

namespace test {

namespace {

const QString kSettings = QStringLiteral("org.freedesktop.portal.Settings");
const QString kSettingsPath = QStringLiteral("/org/freedesktop/portal/desktop");
const QString kGroup = QStringLiteral("org.gnome.desktop.interface");
const QString kClock = QStringLiteral("clock-format");

}  // namespace

/// Answers questions for the desktop's settings.
class HostBus::Portal : public QDBusVirtualObject {
 public:
    QString introspect(const QString&) const override { return {}; }
    bool handleMessage(const QDBusMessage& message, const QDBusConnection& connection) override {
        if (message.interface() != kSettings || message.member() != QLatin1String("Read")) return false;
        if (message.arguments() != QVariantList{kGroup, kClock})
            return connection.send(message.createErrorReply(
                QStringLiteral("org.freedesktop.portal.Error.NotFound"), QStringLiteral("no such setting")));
        const QVariant twice = QVariant::fromValue(QDBusVariant(QVariant::fromValue(QDBusVariant(clock))));
        return connection.send(message.createReply(twice));
    }
    QString clock = QStringLiteral("12h");
};

HostBus& HostBus::shared() {
    static auto* const bus = new HostBus;
    return *bus;
}

HostBus::HostBus() : portal_(std::make_unique<Portal>()) {
    daemon_.setChildProcessModifier([] { prctl(PR_SET_PDEATHSIG, SIGTERM); });  // it ends with us
    daemon_.start(QStringLiteral("dbus-daemon"), {QStringLiteral("--session"), QStringLiteral("--nofork"),
                                                  QStringLiteral("--print-address=1")});
    QByteArray address;
    while (!address.endsWith('\n') && daemon_.waitForReadyRead()) address += daemon_.readAllStandardOutput();
    address = address.trimmed();
    EXPECT_FALSE(address.isEmpty()) << daemon_.errorString().toStdString();
    qputenv("DBUS_SYSTEM_BUS_ADDRESS", address);
    qputenv("DBUS_SESSION_BUS_ADDRESS", address);
    host_ = std::make_unique<QDBusConnection>(
        QDBusConnection::connectToBus(QString::fromUtf8(address), QStringLiteral("host")));
    for (const char* service : {"org.freedesktop.timedate1", "org.freedesktop.login1",
                                "org.freedesktop.locale1", "org.freedesktop.portal.Desktop"})
        EXPECT_TRUE(host_->registerService(QString::fromLatin1(service)));
    EXPECT_TRUE(host_->registerVirtualObject(kSettingsPath, portal_.get()));
}

void HostBus::say(const QString& path, const QString& interface, const QString& signal,
                  const QVariantList& arguments) {
    auto message = QDBusMessage::createSignal(path, interface, signal);
    message.setArguments(arguments);
    EXPECT_TRUE(host_->send(message));
}

void HostBus::sayPropertiesChanged(const QString& path, const QString& interface,
                                   const QVariantMap& changed) {
    say(path, QStringLiteral("org.freedesktop.DBus.Properties"), QStringLiteral("PropertiesChanged"),
        {interface, changed, QStringList()});
}

void HostBus::timeDateChanged(const QVariantMap& changed) {
    sayPropertiesChanged(QStringLiteral("/org/freedesktop/timedate1"),
                         QStringLiteral("org.freedesktop.timedate1"), changed);
}

void HostBus::localeChanged(const QStringList& locale) {
    sayPropertiesChanged(QStringLiteral("/org/freedesktop/locale1"),
                         QStringLiteral("org.freedesktop.locale1"), {{QStringLiteral("Locale"), locale}});
}

void HostBus::prepareForSleep(bool goingToSleep) {
    say(QStringLiteral("/org/freedesktop/login1"), QStringLiteral("org.freedesktop.login1.Manager"),
        QStringLiteral("PrepareForSleep"), {goingToSleep});
}

void HostBus::setClockFormat(const QString& format) {
    portal_->clock = format;
    say(kSettingsPath, kSettings, QStringLiteral("SettingChanged"),
        {kGroup, kClock, QVariant::fromValue(QDBusVariant(format))});
}

bool HostBus::flush() {
    // The answer of who speaks comes behind what was said.
    const auto question = QDBusMessage::createMethodCall(host_->baseService(), kSettingsPath, kSettings,
                                                         QStringLiteral("Read"));
    for (QDBusConnection bus : {QDBusConnection::systemBus(), QDBusConnection::sessionBus()}) {
        QDBusPendingCallWatcher answer(bus.asyncCall(question));
        if (!waitUntil([&] { return answer.isFinished(); })) return false;
    }
    return true;
}

}  // namespace test
