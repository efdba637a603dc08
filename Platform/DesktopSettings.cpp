#include "Platform/DesktopSettings.h"

#include <QDBusConnection>
#include <QDBusMessage>
#include <QDBusMetaType>
#include <QDBusPendingCallWatcher>
#include <QDBusPendingReply>
#include <QFile>

namespace platform {

namespace {

const QString kService = QStringLiteral("org.freedesktop.portal.Desktop");
const QString kPath = QStringLiteral("/org/freedesktop/portal/desktop");
const QString kInterface = QStringLiteral("org.freedesktop.portal.Settings");

// A session without a bus gets none: the library would start one.
bool hasSessionBus() {
    return qEnvironmentVariableIsSet("DBUS_SESSION_BUS_ADDRESS") ||
           QFile::exists(qEnvironmentVariable("XDG_RUNTIME_DIR") + QStringLiteral("/bus"));
}

}  // namespace

void listenToDesktopSetting(QObject* receiver, const char* slotName, const QString& group,
                            const QString& key) {
    if (!hasSessionBus()) return;
    const auto bus = QDBusConnection::sessionBus();
    if (bus.isConnected()) listenToDesktopSetting(bus, receiver, slotName, group, key);
}

void listenToDesktopSetting(QDBusConnection bus, QObject* receiver, const char* slotName,
                            const QString& group, const QString& key) {
    // A slot with a type that the library does not know yet is refused without a word, and no change is heard
    // of.
    qDBusRegisterMetaType<QDBusVariant>();
    const QByteArray slot = QByteArray("1") + slotName + "(QString,QString,QDBusVariant)";
    bus.connect(kService, kPath, kInterface, QStringLiteral("SettingChanged"), receiver, slot.constData());
    auto read = QDBusMessage::createMethodCall(kService, kPath, kInterface, QStringLiteral("Read"));
    read.setArguments({group, key});
    auto* answer = new QDBusPendingCallWatcher(bus.asyncCall(read), receiver);
    const auto tell = [receiver, name = QByteArray(slotName), group, key](QDBusPendingCallWatcher* finished) {
        finished->deleteLater();
        const QDBusPendingReply<QDBusVariant> reply = *finished;
        if (!reply.isValid()) return;
        QMetaObject::invokeMethod(receiver, name.constData(), Q_ARG(QString, group), Q_ARG(QString, key),
                                  Q_ARG(QDBusVariant, reply.value()));
    };
    QObject::connect(answer, &QDBusPendingCallWatcher::finished, receiver, tell);
}

QVariant unpackedSetting(QVariant value) {
    while (value.metaType() == QMetaType::fromType<QDBusVariant>())
        value = value.value<QDBusVariant>().variant();
    return value;
}

}  // namespace platform
