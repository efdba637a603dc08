#include "Platform/ShareServices.h"

#include <gtest/gtest.h>

#include <QDBusArgument>
#include <QDBusConnection>
#include <QDBusMessage>
#include <QDBusObjectPath>
#include <QDBusVirtualObject>
#include <QProcess>
#include <QStandardPaths>
#include <QUrl>

#include "QtTestSupport.h"

namespace {

using Choice = platform::ShareServices::Choice;

/// The desktop's services, on a bus of their own.
class Desktop : public QDBusVirtualObject {
 public:
    QString introspect(const QString&) const override { return {}; }
    bool handleMessage(const QDBusMessage& call, const QDBusConnection& bus) override {
        if (call.member() == QLatin1String("ShowItems")) {
            shown = call.arguments().value(0).toStringList();
            return bus.send(call.createReply());
        }
        const QVariantMap options = qdbus_cast<QVariantMap>(call.arguments().value(2));
        suggested = options.value(QStringLiteral("current_name")).toString();
        QString sender = call.service().mid(1);
        sender.replace(QLatin1Char('.'), QLatin1Char('_'));
        const QString path = QStringLiteral("/org/freedesktop/portal/desktop/request/%1/%2")
                                 .arg(sender, options.value(QStringLiteral("handle_token")).toString());
        bus.send(call.createReply(QVariant::fromValue(QDBusObjectPath(path))));
        QDBusMessage response = QDBusMessage::createTargetedSignal(
            call.service(), path, QStringLiteral("org.freedesktop.portal.Request"),
            QStringLiteral("Response"));
        response << answer << QVariantMap{{QStringLiteral("uris"), uris}};
        return bus.send(response);
    }

    uint answer = 0;
    QStringList uris, shown;
    QString suggested;
};

TEST(ShareServices, AsksTheDesktopAndDoesWithoutIt) {
    if (QStandardPaths::findExecutable(QStringLiteral("dbus-daemon")).isEmpty())
        GTEST_SKIP() << "there is no dbus-daemon";
    QProcess daemon;
    daemon.start(QStringLiteral("dbus-daemon"), {QStringLiteral("--session"), QStringLiteral("--nofork"),
                                                 QStringLiteral("--print-address=1")});
    ASSERT_TRUE(daemon.waitForReadyRead());
    const QString address = QString::fromUtf8(daemon.readLine()).trimmed();
    auto bus = QDBusConnection::connectToBus(address, QStringLiteral("desktop"));
    ASSERT_TRUE(bus.isConnected());
    platform::ShareServices services(QDBusConnection::connectToBus(address, QStringLiteral("application")));
    std::optional<Choice> choice;
    std::filesystem::path chosen;
    const auto ask = [&] {
        choice.reset();
        services.chooseSaveFile(QStringLiteral("Save"), QStringLiteral("export.zip"),
                                [&](Choice made, const std::filesystem::path& file) {
                                    choice = made;
                                    if (made == Choice::Chosen) chosen = file;
                                });
        return test::waitUntil([&] { return choice.has_value(); });
    };
    ASSERT_TRUE(ask());
    EXPECT_EQ(*choice, Choice::Unavailable);

    Desktop desktop;
    ASSERT_TRUE(
        bus.registerVirtualObject(QStringLiteral("/org/freedesktop"), &desktop, QDBusConnection::SubPath));
    ASSERT_TRUE(bus.registerService(QStringLiteral("org.freedesktop.portal.Desktop")));
    ASSERT_TRUE(bus.registerService(QStringLiteral("org.freedesktop.FileManager1")));
    desktop.uris = {QStringLiteral("file:///tmp/s%C3%B8n%20%26%20co.zip")};
    ASSERT_TRUE(ask());
    EXPECT_EQ(*choice, Choice::Chosen);
    EXPECT_EQ(chosen, "/tmp/s\xC3\xB8n & co.zip");
    EXPECT_EQ(desktop.suggested, "export.zip");
    desktop.answer = 1;
    ASSERT_TRUE(ask());
    EXPECT_EQ(*choice, Choice::Cancelled);

    EXPECT_TRUE(services.canShowInFolder());
    services.showInFolder(chosen);
    ASSERT_TRUE(test::waitUntil([&] { return !desktop.shown.isEmpty(); }));
    EXPECT_EQ(QUrl(desktop.shown.first()).toLocalFile(), QUrl(desktop.uris.first()).toLocalFile());
    for (const char* name : {"desktop", "application"})
        QDBusConnection::disconnectFromBus(QLatin1String(name));
    daemon.kill();
    daemon.waitForFinished();
}

}  // namespace
