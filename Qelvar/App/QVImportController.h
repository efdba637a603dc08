#pragma once

#include <QUrl>
#include <atomic>
#include <filesystem>
#include <memory>
#include <vector>

#include "Platform/Queue.h"
#include "Qelvar/App/QVTransferController.h"
#include "Qelvar/Import/QVFileKind.h"
#include "Qelvar/Import/QVRecordsImporter.h"

/// The import of documents while the window is open: looks at the files, reads those that may hold records on
/// a worker thread, tells how far it is or for whom it waits, lets the user cancel it, and says in words what
/// became of each file. The sheet QVImportSheet.qml shows it. Main thread only.
class QVImportController : public QVTransferController {
    Q_OBJECT
    Q_PROPERTY(State state READ state NOTIFY changed)
    Q_PROPERTY(QStringList rowTitles READ rowTitles NOTIFY changed)
    Q_PROPERTY(QStringList rowValues READ rowValues NOTIFY changed)
    Q_PROPERTY(QStringList details READ details NOTIFY detailsChanged)
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
    bool isWorking() const override { return state_ == State::Running; }
    QString title() const override;
    QString message() const override;
    /// How much of the files has been read.
    double fraction() const override;
    /// The result: what was counted and the numbers.
    QStringList rowTitles() const;
    QStringList rowValues() const;
    /// What became of each file, where there were several or one could not be taken.
    QStringList fileLines() const;
    /// Why records were refused: the first ones with document and line, then how many are not listed.
    QStringList refusals() const;
    QStringList details() const { return fileLines() + refusals(); }
    QStringList buttonTitles() const override;
    /// The title of the dialog in which files are chosen, and the name of the files it offers.
    QString chooseTitle() const;
    QString filterName() const;
    /// None unless it finished well.
    const std::optional<QVImportReport>& report() const { return report_; }

    /// Starts with those of the files that may hold records, and says of the others what they are. While an
    /// import runs it shows that one, and says that these were not taken.
    Q_INVOKABLE void importUrls(const QList<QUrl>& urls);
    void importFiles(std::vector<std::filesystem::path> files);
    Q_INVOKABLE void cancel() override;
    /// Closes the result; nothing while an import runs.
    Q_INVOKABLE void dismiss();
    Q_INVOKABLE void pressButton(int index) override;
    Q_INVOKABLE void leave() override;

 signals:
    void detailsChanged();
    void finished();

 private:
    struct UnfitFile {
        QString name;
        QVRecognisedFile file;
    };
    struct Recognised {
        std::vector<std::filesystem::path> fit;
        std::vector<UnfitFile> unfit;
    };
    static Recognised recognise(const std::vector<std::filesystem::path>& files,
                                const std::atomic<bool>& cancel);

    bool isThere() const override { return state_ != State::Idle; }
    void setState(State state);
    void start(std::vector<std::filesystem::path> files);
    QString failureText() const;
    QString waitingText() const;
    void recognised(Recognised files);
    void progressed(const QVImportProgress& progress);
    void ended(VSResult<QVImportReport> result);

    const std::shared_ptr<VSHealthStore> healthStore_;
    State state_ = State::Idle;
    QVImportProgress progress_;
    std::optional<QVImportReport> report_;
    std::optional<VSError> error_;
    QStringList fitNames_;          // of the files that the import reads
    std::vector<UnfitFile> unfit_;  // those that it does not
    QStringList remoteNames_;       // what is on no disk of this machine
    QStringList lateNames_;         // what was dropped while it ran
    std::shared_ptr<std::atomic<bool>> cancel_;
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
    std::shared_ptr<platform::Queue> worker_;
};
