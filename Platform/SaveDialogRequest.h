#pragma once

#include <QObject>
#include <QVariantMap>

#include "Platform/ShareServices.h"

namespace platform {

/// One dialog that the desktop shows for us: waits for its answer, hands it on and ends itself. Main thread
/// only.
class SaveDialogRequest : public QObject {
    Q_OBJECT
 public:
    explicit SaveDialogRequest(ShareServices::SaveHandler handler) : handler_(std::move(handler)) {}
    /// Before the dialog is asked for, so that no answer is missed.
    void listen(QDBusConnection& bus, const QString& token);
    /// Once; a second answer says nothing.
    void finish(ShareServices::Choice choice, const std::filesystem::path& file);

 private slots:
    void responded(uint response, const QVariantMap& results);

 private:
    ShareServices::SaveHandler handler_;  // empty: it was called
};

}  // namespace platform
