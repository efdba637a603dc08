#include "Platform/SaveDialogRequest.h"

#include <QFile>
#include <QUrl>
#include <utility>

namespace platform {

void SaveDialogRequest::listen(QDBusConnection& bus, const QString& token) {
    // The portal names the request after who asks and the token.
    QString sender = bus.baseService().mid(1);
    sender.replace(QLatin1Char('.'), QLatin1Char('_'));
    bus.connect({}, QStringLiteral("/org/freedesktop/portal/desktop/request/%1/%2").arg(sender, token),
                QStringLiteral("org.freedesktop.portal.Request"), QStringLiteral("Response"), this,
                SLOT(responded(uint, QVariantMap)));
}

void SaveDialogRequest::responded(uint response, const QVariantMap& results) {
    const QStringList uris = results.value(QStringLiteral("uris")).toStringList();
    const QUrl url = uris.isEmpty() ? QUrl() : QUrl(uris.first());
    if (response == 0 && url.isLocalFile())
        finish(ShareServices::Choice::Chosen, QFile::encodeName(url.toLocalFile()).toStdString());
    else
        finish(ShareServices::Choice::Cancelled, {});
}

void SaveDialogRequest::finish(ShareServices::Choice choice, const std::filesystem::path& file) {
    const auto handler = std::exchange(handler_, nullptr);
    if (!handler) return;
    deleteLater();
    handler(choice, file);
}

}  // namespace platform
