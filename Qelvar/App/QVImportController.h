#pragma once

#include <QObject>
#include <QString>
#include <QStringList>
#include <QUrl>
#include <atomic>
#include <filesystem>
#include <memory>
#include <vector>

#include "Platform/Queue.h"
#include "Qelvar/Import/QVRecordsImporter.h"

/// The import of documents while the window is open: starts it on a worker thread, tells how far it is, lets
/// the user cancel it, and says in words what became of it. The sheet QVImportSheet.qml shows it. Main thread
/// only.
class QVImportController : public QObject {
    Q_OBJECT
    Q_PROPERTY(State state READ state NOTIFY changed)
    Q_PROPERTY(QString title READ title NOTIFY changed)
    Q_PROPERTY(QString message READ message NOTIFY changed)
    Q_PROPERTY(double fraction READ fraction NOTIFY changed)
    Q_PROPERTY(QStringList rowTitles READ rowTitles NOTIFY changed)
    Q_PROPERTY(QStringList rowValues READ rowValues NOTIFY changed)
    Q_PROPERTY(QStringList refusals READ refusals NOTIFY changed)
    Q_PROPERTY(QString buttonTitle READ buttonTitle NOTIFY changed)
    Q_PROPERTY(QString chooseTitle READ chooseTitle NOTIFY changed)
    Q_PROPERTY(QString filterName READ filterName NOTIFY changed)
 public:
    enum class State { Idle, Running, Cancelling, Finished };
    Q_ENUM(State)

    explicit QVImportController(std::shared_ptr<VSHealthStore> healthStore);
    /// Cancels an import that is under way and waits for its end: it leaves no trace.
    ~QVImportController() override;

    State state() const { return state_; }
    bool isRunning() const { return state_ == State::Running || state_ == State::Cancelling; }
    QString title() const;
    QString message() const;
    /// How much of the files has been read, 0 to 1; -1: not known.
    double fraction() const;
    /// The result: what was counted and the numbers.
    QStringList rowTitles() const;
    QStringList rowValues() const;
    /// Why records were refused: the first ones with document and line, then how many are not listed.
    QStringList refusals() const;
    QString buttonTitle() const;
    /// The title of the dialog in which files are chosen, and the name of the files it offers.
    QString chooseTitle() const;
    QString filterName() const;
    /// None unless it finished well.
    const std::optional<QVImportReport>& report() const { return report_; }

    /// Whether a dropped or chosen file may hold records, by its name.
    Q_INVOKABLE static bool acceptsUrl(const QUrl& url);
    /// Starts with those of the files that are accepted; nothing while an import runs. When none is, says so.
    Q_INVOKABLE void importUrls(const QList<QUrl>& urls);
    void importFiles(std::vector<std::filesystem::path> files);
    Q_INVOKABLE void cancel();
    /// Closes the result; nothing while an import runs.
    Q_INVOKABLE void dismiss();
    /// What the sheet's one button does: cancels what runs, closes what is done.
    Q_INVOKABLE void pressButton();

 signals:
    void changed();
    void finished();

 private:
    void progressed(const QVImportProgress& progress);
    void ended(VSResult<QVImportReport> result);

    const std::shared_ptr<VSHealthStore> healthStore_;
    State state_ = State::Idle;
    QVImportProgress progress_;
    std::optional<QVImportReport> report_;
    std::optional<VSError> error_;
    bool nothingAccepted_ = false;
    std::shared_ptr<std::atomic<bool>> cancel_;
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
    std::shared_ptr<platform::Queue> worker_;
};
