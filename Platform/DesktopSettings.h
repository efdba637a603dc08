#pragma once

#include <QDBusConnection>
#include <QObject>
#include <QVariant>

namespace platform {

/// Has the receiver's slot `slotName(QString group, QString key, QDBusVariant value)` called with what the
/// desktop's portal says of a setting: once soon, then with every change of any setting. Where there is no
/// session bus, or nobody answers for the desktop, it is never called. Main thread.
void listenToDesktopSetting(QObject* receiver, const char* slotName, const QString& group,
                            const QString& key);
/// The same on a bus that is there.
void listenToDesktopSetting(QDBusConnection bus, QObject* receiver, const char* slotName,
                            const QString& group, const QString& key);

/// The value itself: portals pack it more than once.
QVariant unpackedSetting(QVariant value);

}  // namespace platform
