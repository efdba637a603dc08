#pragma once

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
#include "Qelvar/App/QVTransferController.h"
#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Export/QVExportManager.h"

/// The export while the window is open: asks whether to, tells how far it is, lets the user cancel it, offers
/// what can be done with the archive, and removes it afterwards. The sheet QVExportSheet.qml shows it: a
/// title, a message, progress and buttons. Main thread only.
class QVExportController : public QVTransferController {
    Q_OBJECT
    Q_PROPERTY(State state READ state NOTIFY changed)
    Q_PROPERTY(QString saveTitle READ saveTitle NOTIFY changed)
    Q_PROPERTY(QString suggestedName READ suggestedName NOTIFY changed)
 public:
    enum class State { Idle, Verifying, Preparing, Canceling, Sharing, Asking, Saving, Failed };
    Q_ENUM(State)

    explicit QVExportController(std::shared_ptr<QVControllerManager> controllerManager,
                                platform::ShareServices& shareServices = platform::ShareServices::shared());
    /// Cancels what is under way, waits for its end and removes the files.
    ~QVExportController() override;

    State state() const { return state_; }
    bool isWorking() const override { return state_ == State::Preparing || state_ == State::Saving; }
    QString title() const override;
    QString message() const override;
    double fraction() const override;
    QStringList buttonTitles() const override;
    /// Those of the application's own dialog for saving.
    QString saveTitle() const;
    QString suggestedName() const;
    const QVExportManager& exportManager() const { return *manager_; }

    /// Asks whether to export; while there is an export shows that.
    Q_INVOKABLE void verifyExport();
    Q_INVOKABLE void pressButton(int index) override;
    /// An archive that was not saved is put aside too.
    Q_INVOKABLE void leave() override;
    Q_INVOKABLE void cancel() override;
    /// What the application's own dialog for saving asks and answers.
    Q_INVOKABLE static bool fileExists(const QUrl& folder, const QString& name);
    Q_INVOKABLE void saveIn(const QUrl& folder, const QString& name);

 signals:
    /// The desktop has no dialog for saving: the application shows its own.
    void saveDialogRequested();

 private:
    struct Button {
        const char* titleKey;
        std::function<void()> press;
    };
    std::vector<Button> buttons();
    bool isThere() const override { return state_ != State::Idle; }
    QVExportUnits preferredUnits() const;
    void setState(State state);
    void startExport();
    void cancelExport();
    void close();
    void ended(const VSResult<std::filesystem::path>& archive);
    void chooseSaveFile();
    /// What is not to be done unasked when the archive is saved.
    enum class Consent { None, OtherName, Replacing };
    /// Asks where a consent is missing, else saves.
    void choose(const std::filesystem::path& target);
    void ask(Consent question, const std::filesystem::path& target);
    void save(const std::filesystem::path& target, bool mayReplace);
    /// `failureKey`: of the text that says why not; null: the error says it.
    void saved(const std::filesystem::path& target, const VSStatus& status, const char* failureKey);
    std::vector<Button> questionButtons();
    void cleanUpExport();
    QString stepText() const;
    QString sharingText() const;
    /// The block, on the main queue, if this is still there.
    void onMain(std::function<void()> block) const;

    const std::shared_ptr<QVControllerManager> controllerManager_;
    platform::ShareServices& shareServices_;
    State state_ = State::Idle;
    bool userCancelled_ = false;
    std::optional<QVExportSource> source_;            // while an archive is shared
    std::optional<std::filesystem::path> savedFile_;  // where it was saved last
    Consent question_ = Consent::None;                // while something is asked
    std::filesystem::path chosenFile_;                // about which it is asked
    std::optional<VSError> error_;                    // of the export, or of the last saving
    QString saveFailure_;                             // why, when it is of the saving
    std::unique_ptr<platform::BackgroundTask> backgroundTask_;
    QTimer progressTimer_;
    std::shared_ptr<std::atomic<bool>> cancelSaving_;
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
    std::unique_ptr<QVExportManager> manager_;
    std::shared_ptr<platform::Queue> worker_;  // saves
};
