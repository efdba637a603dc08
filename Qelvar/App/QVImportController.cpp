#include "Qelvar/App/QVImportController.h"

#include <QFile>
#include <QFileInfo>
#include <QLocale>
#include <algorithm>

#include "Platform/Localization.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

using platform::localized;

namespace {

constexpr double kMegabyte = 1e6;

QString countString(int64_t count) {
    return QVNumberFormatterWithFractionDigits(0)->stringFromNumber(static_cast<double>(count));
}

QString megabytes(uint64_t bytes) {
    return QVNumberFormatterWithFractionDigits(1)->stringFromNumber(static_cast<double>(bytes) / kMegabyte);
}

const char* messageKey(const VSError& error) {
    switch (error.code) {
        case VSErrorCode::Cancelled:
            return "IMPORT_CANCELLED";
        case VSErrorCode::DiskFull:
            return "IMPORT_DISK_FULL";
        case VSErrorCode::NotAccessible:
            return "IMPORT_NOT_ACCESSIBLE";
        default:
            return "IMPORT_FAILED_MESSAGE";
    }
}

}  // namespace

QVImportController::QVImportController(std::shared_ptr<VSHealthStore> healthStore)
    : healthStore_(std::move(healthStore)), worker_(platform::makeSerialQueue("import")) {}

QVImportController::~QVImportController() {
    if (cancel_) *cancel_ = true;
    worker_.reset();
}

QString QVImportController::title() const {
    switch (state_) {
        case State::Running:
            return localized("IMPORT_RUNNING_TITLE");
        case State::Cancelling:
            return localized("IMPORT_CANCELING_TITLE");
        case State::Finished:
            break;
        case State::Idle:
            return {};
    }
    if (report_)
        return localized(report_->total.added > 0 ? "IMPORT_DONE_TITLE" : "IMPORT_NOTHING_NEW_TITLE");
    if (error_ && error_->code == VSErrorCode::Cancelled) return localized("IMPORT_CANCELLED_TITLE");
    return localized("IMPORT_FAILED_TITLE");
}

QString QVImportController::message() const {
    if (isRunning()) {
        const QString records = localized("IMPORT_PROGRESS_RECORDS", {countString(progress_.records)});
        if (progress_.bytesTotal == 0) return records;
        return localized("IMPORT_PROGRESS_BYTES",
                         {megabytes(progress_.bytesDone), megabytes(progress_.bytesTotal)}) +
               QLatin1Char('\n') + records;
    }
    if (nothingAccepted_) return localized("IMPORT_NO_RECORDS_FILE");
    if (error_) return localized(messageKey(*error_), {QString::fromStdString(error_->message)});
    if (!report_) return {};
    QStringList documents;
    for (const std::string& document : report_->documents) documents.append(QString::fromStdString(document));
    return documents.join(QLatin1Char('\n'));
}

double QVImportController::fraction() const {
    if (progress_.bytesTotal == 0) return -1;
    return std::min(1.0,
                    static_cast<double>(progress_.bytesDone) / static_cast<double>(progress_.bytesTotal));
}

QStringList QVImportController::rowTitles() const {
    if (!report_) return {};
    return {localized("IMPORT_READ"), localized("IMPORT_ADDED"), localized("IMPORT_ALREADY_HAD"),
            localized("IMPORT_REFUSED")};
}

QStringList QVImportController::rowValues() const {
    if (!report_) return {};
    const QVImportCount& total = report_->total;
    return {countString(total.read), countString(total.added), countString(total.alreadyHad),
            countString(total.refused)};
}

QStringList QVImportController::refusals() const {
    QStringList lines;
    if (!report_) return lines;
    for (const QVImportRefusal& refusal : report_->refusals)
        lines.append(QString::fromStdString(refusal.description()));
    if (const int64_t more = report_->refusalsNotListed(); more > 0)
        lines.append(localized("IMPORT_MORE_REFUSALS", {countString(more)}));
    return lines;
}

QString QVImportController::buttonTitle() const {
    return localized(isRunning() ? "CANCEL" : "DONE");
}

QString QVImportController::chooseTitle() const {
    return localized("IMPORT_CHOOSE_TITLE");
}

QString QVImportController::filterName() const {
    return localized("IMPORT_FILTER");
}

bool QVImportController::acceptsUrl(const QUrl& url) {
    const QString suffix = QFileInfo(url.toLocalFile()).suffix().toLower();
    return url.isLocalFile() && (suffix == QLatin1String("xml") || suffix == QLatin1String("zip"));
}

void QVImportController::importUrls(const QList<QUrl>& urls) {
    if (isRunning()) return;
    std::vector<std::filesystem::path> files;
    for (const QUrl& url : urls)
        if (acceptsUrl(url)) files.emplace_back(QFile::encodeName(url.toLocalFile()).toStdString());
    if (!files.empty()) return importFiles(std::move(files));
    dismiss();
    nothingAccepted_ = true;
    state_ = State::Finished;
    emit changed();
    emit finished();
}

void QVImportController::importFiles(std::vector<std::filesystem::path> files) {
    if (isRunning()) return;
    dismiss();
    state_ = State::Running;
    progress_ = {};
    cancel_ = std::make_shared<std::atomic<bool>>(false);
    const std::weak_ptr<bool> alive = alive_;
    const auto onMain = [alive](std::function<void()> block) {
        platform::mainQueue().async([alive, block = std::move(block)] {
            if (!alive.expired()) block();
        });
    };
    emit changed();
    worker_->async([this, onMain, store = healthStore_, cancel = cancel_, files = std::move(files)] {
        QVImportOptions options;
        options.cancel = cancel.get();
        options.progress = [this, onMain](const QVImportProgress& progress) {
            onMain([this, progress] { progressed(progress); });
        };
        auto result = QVRecordsImporter(store).importFiles(files, options);
        onMain([this, result = std::move(result)] { ended(result); });
    });
}

void QVImportController::progressed(const QVImportProgress& progress) {
    if (!isRunning()) return;
    progress_ = progress;
    emit changed();
}

void QVImportController::ended(VSResult<QVImportReport> result) {
    if (result)
        report_ = std::move(*result);
    else
        error_ = result.error();
    state_ = State::Finished;
    emit changed();
    emit finished();
}

void QVImportController::cancel() {
    if (state_ != State::Running) return;
    *cancel_ = true;
    state_ = State::Cancelling;
    emit changed();
}

void QVImportController::dismiss() {
    if (isRunning() || state_ == State::Idle) return;
    state_ = State::Idle;
    report_.reset();
    error_.reset();
    nothingAccepted_ = false;
    emit changed();
}

void QVImportController::pressButton() {
    if (isRunning())
        cancel();
    else
        dismiss();
}
