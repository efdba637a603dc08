#include "Platform/ShareServices.h"

#include <QDBusConnection>
#include <QDBusMessage>
#include <QDBusPendingCallWatcher>
#include <QDBusPendingReply>
#include <QDBusUnixFileDescriptor>
#include <QDesktopServices>
#include <QFile>
#include <QPointer>
#include <QProcess>
#include <QRandomGenerator>
#include <QStandardPaths>
#include <QUrl>
#include <QVariantMap>

#include "Platform/SaveDialogRequest.h"

namespace platform {

namespace {

QString textOf(const std::filesystem::path& file) {
    return QFile::decodeName(file.c_str());
}

/// Calls block(whether it went well) when the answer to the call is there.
template <typename Block>
void callLater(const QDBusConnection& bus, const QDBusMessage& message, Block block) {
    auto* watcher = new QDBusPendingCallWatcher(bus.asyncCall(message));
    QObject::connect(watcher, &QDBusPendingCallWatcher::finished, watcher, [watcher, block] {
        block(!watcher->isError());
        watcher->deleteLater();
    });
}

}  // namespace

ShareServices& ShareServices::shared() {
    static ShareServices services;
    return services;
}

// The dialog of the desktop is asked for through its portal: it is the one that the person knows, whatever
// the desktop is.
void ShareServices::chooseSaveFile(const QString& title, const QString& suggestedName, SaveHandler handler) {
    if (!session_.isConnected()) return handler(Choice::Unavailable, {});
    const QString token = QStringLiteral("qelvar%1").arg(QRandomGenerator::global()->generate());
    auto* request = new SaveDialogRequest(std::move(handler));
    request->listen(session_, token);
    QDBusMessage call = QDBusMessage::createMethodCall(
        QStringLiteral("org.freedesktop.portal.Desktop"), QStringLiteral("/org/freedesktop/portal/desktop"),
        QStringLiteral("org.freedesktop.portal.FileChooser"), QStringLiteral("SaveFile"));
    call << QString() << title
         << QVariantMap{{QStringLiteral("handle_token"), token},
                        {QStringLiteral("current_name"), suggestedName}};
    callLater(session_, call, [request = QPointer(request)](bool isShown) {
        if (!isShown && request) request->finish(Choice::Unavailable, {});
    });
}

bool ShareServices::canShowInFolder() const {
    return session_.isConnected() || !QStandardPaths::findExecutable(QStringLiteral("xdg-open")).isEmpty();
}

void ShareServices::showInFolder(const std::filesystem::path& file) {
    const auto openFolder = [folder = file.parent_path()] {
        QDesktopServices::openUrl(QUrl::fromLocalFile(textOf(folder)));
    };
    if (!session_.isConnected()) return openFolder();
    QDBusMessage call = QDBusMessage::createMethodCall(
        QStringLiteral("org.freedesktop.FileManager1"), QStringLiteral("/org/freedesktop/FileManager1"),
        QStringLiteral("org.freedesktop.FileManager1"), QStringLiteral("ShowItems"));
    call << QStringList{QUrl::fromLocalFile(textOf(file)).toString(QUrl::FullyEncoded)} << QString();
    callLater(session_, call, [openFolder](bool isShown) {
        if (!isShown) openFolder();
    });
}

bool ShareServices::canSendMail() const {
    return !QStandardPaths::findExecutable(QStringLiteral("xdg-email")).isEmpty();
}

void ShareServices::sendMail(const QString& subject, const std::filesystem::path& file) {
    QProcess::startDetached(QStringLiteral("xdg-email"),
                            {QStringLiteral("--utf8"), QStringLiteral("--subject"), subject,
                             QStringLiteral("--attach"), textOf(file)});
}

struct BackgroundTask::State {
    QDBusUnixFileDescriptor lock;  // the machine may sleep when it is closed
};

BackgroundTask::BackgroundTask(const QString& name) : state_(std::make_shared<State>()) {
    const auto bus = QDBusConnection::systemBus();
    if (!bus.isConnected()) return;
    QDBusMessage call = QDBusMessage::createMethodCall(
        QStringLiteral("org.freedesktop.login1"), QStringLiteral("/org/freedesktop/login1"),
        QStringLiteral("org.freedesktop.login1.Manager"), QStringLiteral("Inhibit"));
    call << QStringLiteral("sleep:idle") << QStringLiteral("Qelvar") << name << QStringLiteral("block");
    auto* watcher = new QDBusPendingCallWatcher(bus.asyncCall(call));
    QObject::connect(watcher, &QDBusPendingCallWatcher::finished, watcher,
                     [watcher, state = std::weak_ptr(state_)] {
                         const QDBusPendingReply<QDBusUnixFileDescriptor> reply = *watcher;
                         if (const auto held = state.lock(); held && reply.isValid())
                             held->lock = reply.value();
                         watcher->deleteLater();
                     });
}

BackgroundTask::~BackgroundTask() = default;

}  // namespace platform
