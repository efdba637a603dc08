#pragma once

#include <QObject>
#include <QString>
#include <QStringList>
#include <QTimer>
#include <QUrl>
#include <atomic>
#include <filesystem>
#include <functional>
#include <memory>
#include <vector>

#include "Platform/Queue.h"
#include "Platform/ShareServices.h"
#include "Qelvar/App/QVExportSource.h"
#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Export/QVExportManager.h"

/// The export while the window is open: asks whether to, tells how far it is, lets the user cancel it, offers
/// what can be done with the archive, and removes it afterwards. The sheet QVExportSheet.qml shows it: a
/// title, a message, progress and buttons. Main thread only.
class QVExportController : public QObject {
    Q_OBJECT
    Q_PROPERTY(State state READ state NOTIFY changed)
    Q_PROPERTY(QString title READ title NOTIFY changed)
    Q_PROPERTY(QString message READ message NOTIFY changed)
    Q_PROPERTY(double fraction READ fraction NOTIFY changed)
    Q_PROPERTY(QStringList buttonTitles READ buttonTitles NOTIFY buttonsChanged)
    Q_PROPERTY(QString saveTitle READ saveTitle NOTIFY changed)
    Q_PROPERTY(QString suggestedName READ suggestedName NOTIFY changed)
 public:
    enum class State { Idle, Verifying, Preparing, Canceling, Sharing, Saving, Failed };
    Q_ENUM(State)

    explicit QVExportController(std::shared_ptr<QVControllerManager> controllerManager,
                                platform::ShareServices& shareServices = platform::ShareServices::shared());
    /// Cancels what is under way, waits for its end and removes the files.
    ~QVExportController() override;

    State state() const { return state_; }
    QString title() const;
    QString message() const;
    /// How far the work is, 0 to 1; -1: there is none.
    double fraction() const;
    QStringList buttonTitles() const;
    /// Those of the application's own dialog for saving.
    QString saveTitle() const;
    QString suggestedName() const;
    const QVExportManager& exportManager() const { return *manager_; }

    /// Asks whether to export; nothing while an export is shown already.
    Q_INVOKABLE void verifyExport();
    Q_INVOKABLE void pressButton(int index);
    /// The user leaves without a choice (Escape, Back): cancels what runs, closes what is done.
    Q_INVOKABLE void leave();
    /// What the application's own dialog for saving asks and answers.
    Q_INVOKABLE static bool fileExists(const QUrl& folder, const QString& name);
    Q_INVOKABLE void saveIn(const QUrl& folder, const QString& name);

 signals:
    void changed();
    void buttonsChanged();
    /// The desktop has no dialog for saving: the application shows its own.
    void saveDialogRequested();

 private:
    struct Button {
        const char* titleKey;
        std::function<void()> press;
    };
    std::vector<Button> buttons();
    QVExportUnits preferredUnits() const;
    void setState(State state);
    void startExport();
    void cancelExport();
    void ended(const VSResult<std::filesystem::path>& archive);
    void chooseSaveFile();
    void save(const std::filesystem::path& target);
    void saved(const std::filesystem::path& target, const VSStatus& status);
    void cleanUpExport();
    QString progressText() const;
    QString sharingText() const;
    /// The block, on the main queue, if this is still there.
    void onMain(std::function<void()> block) const;

    const std::shared_ptr<QVControllerManager> controllerManager_;
    platform::ShareServices& shareServices_;
    State state_ = State::Idle;
    bool userCancelled_ = false;
    std::optional<QVExportSource> source_;            // while an archive is shared
    std::optional<std::filesystem::path> savedFile_;  // where it was saved last
    std::optional<VSError> error_;                    // of the export, or of the last saving
    std::unique_ptr<platform::BackgroundTask> backgroundTask_;
    QTimer progressTimer_;
    std::shared_ptr<std::atomic<bool>> cancelSaving_;
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
    std::unique_ptr<QVExportManager> manager_;
    std::shared_ptr<platform::Queue> worker_;  // saves
};
