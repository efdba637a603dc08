#include "Qelvar/App/QVImportController.h"

#include <QFile>
#include <algorithm>

#include "Platform/Announcement.h"
#include "Platform/Localization.h"
#include "Qelvar/Formatters/QVDateFormatters.h"
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

const char* lookKey(QVFileKind kind) {
    using enum QVFileKind;
    switch (kind) {
        case MayHoldRecords:
        case Missing:
            return "FILE_IS_MISSING";
        case NotReadable:
            return "FILE_MAY_NOT_BE_READ";
        case Folder:
            return "FILE_IS_A_FOLDER";
        case Empty:
            return "FILE_IS_EMPTY";
        case PDF:
            return "FILE_LOOKS_LIKE_PDF";
        case Picture:
            return "FILE_LOOKS_LIKE_PICTURE";
        case Media:
            return "FILE_LOOKS_LIKE_MEDIA";
        case Program:
            return "FILE_LOOKS_LIKE_PROGRAM";
        case Script:
            return "FILE_LOOKS_LIKE_SCRIPT";
        case Table:
            return "FILE_LOOKS_LIKE_TABLE";
        case JSON:
            return "FILE_LOOKS_LIKE_JSON";
        case WebPage:
            return "FILE_LOOKS_LIKE_WEB_PAGE";
        case ClinicalDocument:
            return "FILE_LOOKS_LIKE_CLINICAL_DOCUMENT";
        case OtherXML:
            return "FILE_LOOKS_LIKE_OTHER_XML";
        case ArchiveWithoutRecords:
            return "FILE_IS_ARCHIVE_WITHOUT_RECORDS";
        case UnreadableArchive:
            return "FILE_IS_UNREADABLE_ARCHIVE";
        case OfficeDocument:
            return "FILE_LOOKS_LIKE_OFFICE_DOCUMENT";
        case OtherArchive:
            return "FILE_LOOKS_LIKE_OTHER_ARCHIVE";
        case Database:
            return "FILE_LOOKS_LIKE_DATABASE";
        case Activity:
            return "FILE_LOOKS_LIKE_ACTIVITY";
        case Text:
            return "FILE_LOOKS_LIKE_TEXT";
        case Binary:
            break;
    }
    return "FILE_LOOKS_LIKE_BINARY";
}

const char* holderKey(const VSStoreHolder& holder) {
    const bool isWindow = holder.program == VSStoreHolder::Program::Window;
    if (holder.work == VSStoreHolder::Work::Import)
        return isWindow ? "HOLDER_IMPORT_IN_WINDOW" : "HOLDER_IMPORT_IN_TERMINAL";
    if (holder.work == VSStoreHolder::Work::Undo && !isWindow) return "HOLDER_UNDO_IN_TERMINAL";
    return "HOLDER_OTHER";
}

QString lookText(const QString& name, const QVRecognisedFile& file) {
    return localized(lookKey(file.kind), {name, QString::fromStdString(file.detail)});
}

QString fileName(const std::filesystem::path& path) {
    const auto name = path.has_filename() ? path.filename() : path.parent_path().filename();
    return QFile::decodeName(name.c_str());
}

}  // namespace

QVImportController::QVImportController(std::shared_ptr<VSHealthStore> healthStore)
    : healthStore_(std::move(healthStore)), worker_(platform::makeSerialQueue("import")) {}

QVImportController::~QVImportController() {
    if (cancel_) *cancel_ = true;
    worker_.reset();
}

void QVImportController::setState(State state) {
    state_ = state;
    emit changed();
    emit buttonsChanged();
    emit detailsChanged();
}

// --- Texts ----------------------------------------------------------------------------------------------

QString QVImportController::title() const {
    switch (state_) {
        case State::Running:
            return localized(progress_.isWaiting ? "IMPORT_WAITING_TITLE" : "IMPORT_RUNNING_TITLE");
        case State::Cancelling:
            return localized("IMPORT_CANCELING_TITLE");
        case State::Finished:
            break;
        case State::Idle:
            return {};
    }
    if (report_ && !(unfit_.empty() && remoteNames_.isEmpty())) return localized("IMPORT_PARTLY_TITLE");
    if (report_)
        return localized(report_->total.added > 0 ? "IMPORT_DONE_TITLE" : "IMPORT_NOTHING_NEW_TITLE");
    if (error_ && error_->code == VSErrorCode::Cancelled) return localized("IMPORT_CANCELLED_TITLE");
    return localized("IMPORT_FAILED_TITLE");
}

QString QVImportController::waitingText() const {
    const auto& holder = progress_.holder;
    const QString who = holder ? localized(holderKey(*holder), {QString::fromStdString(holder->name),
                                                                QVLastUpdatedString(holder->since),
                                                                QString::number(holder->process)})
                               : localized("HOLDER_UNKNOWN");
    return who + QLatin1Char('\n') + localized("IMPORT_WAITING_MESSAGE");
}

QString QVImportController::message() const {
    QStringList lines;
    if (state_ == State::Running && progress_.isWaiting) {
        lines << waitingText();
    } else if (isRunning()) {
        if (progress_.bytesTotal > 0)
            lines << localized("IMPORT_PROGRESS_BYTES",
                               {megabytes(progress_.bytesDone), megabytes(progress_.bytesTotal)});
        lines << localized("IMPORT_PROGRESS_RECORDS", {countString(progress_.records)});
    } else if (!report_) {
        lines << failureText();
    } else {
        for (const std::string& document : report_->documents) lines << QString::fromStdString(document);
    }
    if (!lateNames_.isEmpty()) lines << localized("IMPORT_BUSY", {lateNames_.join(QStringLiteral(", "))});
    return lines.join(QLatin1Char('\n'));
}

QString QVImportController::failureText() const {
    const QString nothing = localized("IMPORT_CANCELLED");
    if (!error_) return localized("IMPORT_NO_RECORDS_FILE");
    const QString detail = QString::fromStdString(error_->message);
    switch (error_->code) {
        case VSErrorCode::Cancelled:
            return nothing;
        case VSErrorCode::DiskFull:
            return localized("IMPORT_DISK_FULL");
        case VSErrorCode::NotAccessible:
            return localized("IMPORT_NOT_ACCESSIBLE", {detail});
        case VSErrorCode::Invalid:
            return localized("IMPORT_DAMAGED") + QLatin1Char('\n') + detail;
        default:
            return localized("IMPORT_FAILED_MESSAGE", {detail});
    }
}

double QVImportController::fraction() const {
    if (progress_.bytesTotal == 0 || progress_.isWaiting || state_ == State::Idle) return -1;
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

QStringList QVImportController::fileLines() const {
    QStringList lines;
    if (state_ != State::Finished) return lines;
    for (const UnfitFile& one : unfit_) lines << lookText(one.name, one.file);
    for (const QString& name : remoteNames_) lines << localized("FILE_IS_ELSEWHERE", {name});
    const bool mentionsFit = fitNames_.size() > 1 || (!lines.isEmpty() && !fitNames_.isEmpty());
    const char* const key = report_ ? "FILE_WAS_IMPORTED" : "FILE_WAS_NOT_IMPORTED";
    if (mentionsFit)
        for (const QString& name : fitNames_) lines << localized(key, {name});
    return lines;
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

QStringList QVImportController::buttonTitles() const {
    if (state_ == State::Running) return {localized("TRANSFER_PUT_ASIDE"), localized("CANCEL")};
    if (state_ == State::Finished) return {localized("DONE")};
    return {};
}

QString QVImportController::chooseTitle() const {
    return localized("IMPORT_CHOOSE_TITLE");
}

QString QVImportController::filterName() const {
    return localized("IMPORT_FILTER");
}

// --- What happens ---------------------------------------------------------------------------------------

void QVImportController::importUrls(const QList<QUrl>& urls) {
    std::vector<std::filesystem::path> files;
    QStringList remote, names;
    for (const QUrl& url : urls) {
        if (url.isLocalFile())
            files.emplace_back(QFile::encodeName(url.toLocalFile()).toStdString());
        else
            remote << url.toDisplayString();
        names << (url.isLocalFile() ? fileName(files.back()) : url.toDisplayString());
    }
    if (names.isEmpty()) return;
    if (isRunning()) {
        lateNames_ << names;
        show();
        emit changed();
        platform::announce(localized("IMPORT_BUSY", {names.join(QStringLiteral(", "))}));
        return;
    }
    dismiss();
    remoteNames_ = remote;
    start(std::move(files));
}

void QVImportController::importFiles(std::vector<std::filesystem::path> files) {
    if (isRunning()) return;
    dismiss();
    start(std::move(files));
}

QVImportController::Recognised QVImportController::recognise(const std::vector<std::filesystem::path>& files,
                                                             const std::atomic<bool>& cancel) {
    Recognised recognised;
    for (const auto& path : files) {
        if (cancel) break;
        QVRecognisedFile file = QVRecogniseFile(path);
        if (file.mayHoldRecords())
            recognised.fit.push_back(path);
        else
            recognised.unfit.push_back({fileName(path), std::move(file)});
    }
    return recognised;
}

void QVImportController::start(std::vector<std::filesystem::path> files) {
    forgetAside();
    progress_ = {};
    cancel_ = std::make_shared<std::atomic<bool>>(false);
    const std::weak_ptr<bool> alive = alive_;
    const auto onMain = [alive](std::function<void()> block) {
        platform::mainQueue().async([alive, block = std::move(block)] {
            if (!alive.expired()) block();
        });
    };
    setState(State::Running);
    worker_->async([this, onMain, store = healthStore_, cancel = cancel_, files = std::move(files)] {
        QVImportOptions options;
        options.cancel = cancel.get();
        options.progress = [this, onMain](const QVImportProgress& progress) {
            onMain([this, progress] { progressed(progress); });
        };
        const Recognised found = recognise(files, *cancel);
        onMain([this, found] { recognised(found); });
        const VSError none{*cancel ? VSErrorCode::Cancelled : VSErrorCode::NotFound, ""};
        auto result = found.fit.empty() || *cancel ? VSResult<QVImportReport>(none)
                                                   : QVRecordsImporter(store).importFiles(found.fit, options);
        onMain([this, result = std::move(result)] { ended(result); });
    });
}

void QVImportController::recognised(Recognised files) {
    for (const auto& path : files.fit) fitNames_ << fileName(path);
    unfit_ = std::move(files.unfit);
}

void QVImportController::progressed(const QVImportProgress& progress) {
    if (!isRunning()) return;
    const bool waitedBefore = std::exchange(progress_, progress).isWaiting;
    emit changed();
    if (progress.isWaiting && !waitedBefore) platform::announce(title() + QLatin1Char('\n') + waitingText());
}

void QVImportController::ended(VSResult<QVImportReport> result) {
    if (result)
        report_ = std::move(*result);
    else if (!fitNames_.isEmpty() || result.error().code == VSErrorCode::Cancelled)
        error_ = result.error();
    progress_.isWaiting = false;
    setState(State::Finished);
    platform::announce(title());
    emit finished();
}

void QVImportController::cancel() {
    if (state_ != State::Running) return;
    *cancel_ = true;
    setState(State::Cancelling);
}

void QVImportController::dismiss() {
    if (isRunning() || state_ == State::Idle) return;
    report_.reset();
    error_.reset();
    unfit_.clear();
    for (QStringList* names : {&fitNames_, &remoteNames_, &lateNames_}) names->clear();
    setState(State::Idle);
    forgetAside();
}

void QVImportController::pressButton(int index) {
    if (state_ == State::Finished)
        dismiss();
    else if (index == 0)
        putAside();
    else
        cancel();
}

void QVImportController::leave() {
    if (isRunning())
        putAside();
    else
        dismiss();
}
