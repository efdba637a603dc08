#pragma once

#include <QDBusConnection>
#include <QString>
#include <filesystem>
#include <functional>
#include <memory>

namespace platform {

/// What the desktop does with a file on behalf of the application. Main thread only; everything returns at
/// once.
class ShareServices {
 public:
    static ShareServices& shared();
    /// By the services of that session of a desktop.
    explicit ShareServices(const QDBusConnection& session = QDBusConnection::sessionBus())
        : session_(session) {}
    virtual ~ShareServices() = default;

    enum class Choice { Chosen, Cancelled, Unavailable };
    using SaveHandler = std::function<void(Choice choice, const std::filesystem::path& file)>;
    /// The desktop's dialog for choosing where to save; it asks before a file is replaced. Unavailable: there
    /// is none, and the application shows its own. The handler may be called long after.
    virtual void chooseSaveFile(const QString& title, const QString& suggestedName, SaveHandler handler);

    virtual bool canShowInFolder() const;
    /// The file in the desktop's file manager.
    virtual void showInFolder(const std::filesystem::path& file);

    virtual bool canSendMail() const;
    /// A new mail with the file, in the person's mail program, which may read the file at any time after.
    virtual void sendMail(const QString& subject, const std::filesystem::path& file);

 private:
    QDBusConnection session_;
};

/// While it lives the machine does not fall asleep by itself, where the system lets us ask for that. Main
/// thread only.
class BackgroundTask {
 public:
    /// The name tells people what keeps their machine awake.
    explicit BackgroundTask(const QString& name);
    ~BackgroundTask();

 private:
    struct State;
    std::shared_ptr<State> state_;
};

}  // namespace platform
