#include "Platform/Appearance.h"

#include <gtest/gtest.h>

#include <QDBusMessage>
#include <QDBusVariant>
#include <QDBusVirtualObject>
#include <QProcess>
#include <QStandardPaths>
#include <map>

#include "QtTestSupport.h"

namespace {

const QString kPortal = QStringLiteral("org.freedesktop.portal.Desktop");
const QString kSettings = QStringLiteral("org.freedesktop.portal.Settings");
const QString kPath = QStringLiteral("/org/freedesktop/portal/desktop");

/// The settings of a desktop.
class Desktop : public QDBusVirtualObject {
 public:
    QString introspect(const QString&) const override { return {}; }
    bool handleMessage(const QDBusMessage& call, const QDBusConnection& bus) override {
        const auto found =
            values.find({call.arguments().value(0).toString(), call.arguments().value(1).toString()});
        if (call.member() != QLatin1String("Read") || found == values.end())
            return bus.send(
                call.createErrorReply(QDBusError::InvalidArgs, QStringLiteral("no such setting")));
        // Portals pack the value twice.
        const QDBusVariant once(found->second);
        return bus.send(call.createReply(QVariant::fromValue(QDBusVariant(QVariant::fromValue(once)))));
    }
    std::map<std::pair<QString, QString>, QVariant> values;
};

TEST(Appearance, FollowsWhatTheDesktopSaysWhileRunning) {
    if (QStandardPaths::findExecutable(QStringLiteral("dbus-daemon")).isEmpty())
        GTEST_SKIP() << "there is no dbus-daemon";
    QProcess daemon;
    daemon.start(QStringLiteral("dbus-daemon"), {QStringLiteral("--session"), QStringLiteral("--nofork"),
                                                 QStringLiteral("--print-address=1")});
    ASSERT_TRUE(daemon.waitForReadyRead());
    const QString address = QString::fromUtf8(daemon.readLine()).trimmed();
    auto bus = QDBusConnection::connectToBus(address, QStringLiteral("settings"));
    Desktop desktop;
    ASSERT_TRUE(bus.registerVirtualObject(kPath, &desktop));
    ASSERT_TRUE(bus.registerService(kPortal));
    const QString appearance = QStringLiteral("org.freedesktop.appearance");
    desktop.values[{appearance, QStringLiteral("contrast")}] = 1u;

    auto& wishes = platform::Appearance::shared();
    EXPECT_FALSE(wishes.highContrast() || wishes.reducedMotion());
    wishes.listen(QDBusConnection::connectToBus(address, QStringLiteral("application")));
    ASSERT_TRUE(test::waitUntil([&] { return wishes.highContrast(); })) << "as it is at the start";
    EXPECT_FALSE(wishes.reducedMotion());

    const auto say = [&](const QString& group, const char* key, const QVariant& value) {
        auto changed = QDBusMessage::createSignal(kPath, kSettings, QStringLiteral("SettingChanged"));
        changed << group << QLatin1String(key) << QVariant::fromValue(QDBusVariant(value));
        ASSERT_TRUE(bus.send(changed));
    };
    const auto becomes = [&](bool contrast, bool lessMotion) {
        return test::waitUntil(
            [&] { return wishes.highContrast() == contrast && wishes.reducedMotion() == lessMotion; });
    };
    say(appearance, "reduced-motion", 1u);
    EXPECT_TRUE(becomes(true, true));
    say(appearance, "contrast", 0u);
    EXPECT_TRUE(becomes(false, true));
    say(appearance, "reduced-motion", 0u);
    EXPECT_TRUE(becomes(false, false));
    // A desktop that has only its own settings.
    say(QStringLiteral("org.gnome.desktop.interface"), "enable-animations", false);
    EXPECT_TRUE(becomes(false, true));
    say(QStringLiteral("org.gnome.desktop.a11y.interface"), "high-contrast", true);
    EXPECT_TRUE(becomes(true, true));
    say(QStringLiteral("org.gnome.desktop.a11y.interface"), "high-contrast", false);
    say(QStringLiteral("org.gnome.desktop.interface"), "enable-animations", true);
    EXPECT_TRUE(becomes(false, false));

    for (const char* name : {"settings", "application"})
        QDBusConnection::disconnectFromBus(QLatin1String(name));
    daemon.kill();
    daemon.waitForFinished();
}

}  // namespace
