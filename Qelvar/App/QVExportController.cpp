#include "Qelvar/App/QVExportController.h"

#include <QFile>
#include <QFileInfo>

#include "Platform/Announcement.h"
#include "Platform/Localization.h"
#include "Qelvar/Export/QVExportTarget.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

using platform::localized;

namespace {

namespace fs = std::filesystem;
constexpr int kProgressInterval = 100;  // milliseconds
constexpr double kMegabyte = 1e6;

std::string fileName(const char* key) {
    return QFile::encodeName(localized(key)).toStdString();
}

/// The archive is private: it is made in the store's own folder, not among the person's documents.
QVExportSetting settingOf(const QVControllerManager& manager, std::function<QVExportUnits()> units) {
    return {manager.healthStore(),
            manager.healthStore()->folder() / "documents",
            {fileName("EXPORT_DATA_FILE_XML"), fileName("EXPORT_DATA_FILE_CDA"),
             fileName("EXPORT_DATE_FILE_ZIP")},
            std::move(units)};
}

QString countText(int64_t count) {
    return QVNumberFormatterWithFractionDigits(0)->stringFromNumber(static_cast<double>(count));
}

QString megabytes(uint64_t bytes) {
    return QVNumberFormatterWithFractionDigits(0)->stringFromNumber(static_cast<double>(bytes) / kMegabyte);
}

/// What a person can do something about; empty: nothing.
QString reasonText(const VSError& error) {
    if (error.code == VSErrorCode::DiskFull) return localized("EXPORT_DISK_FULL");
    if (error.isHeldByOthers) return localized("EXPORT_BUSY");
    return {};
}

/// Why the archive could not be saved, with what to do about it; null: the error itself says it. It waits.
const char* saveFailureKey(const VSError& error, const fs::path& target, const fs::path& store) {
    switch (error.code) {
        case VSErrorCode::NotFound:
            return "EXPORT_NO_FOLDER";
        case VSErrorCode::Invalid:
            return "EXPORT_BAD_NAME";
        case VSErrorCode::Failed:
            return "EXPORT_NOT_WRITABLE";
        case VSErrorCode::Refused:
            return QVExportTarget::isInStore(target, store) ? "EXPORT_IN_STORE" : "EXPORT_NOT_PERMITTED";
        default:
            return nullptr;
    }
}

/// Whether the name says that the file is a zip archive.
bool isNamedAsArchive(const fs::path& file) {
    return QFile::decodeName(file.extension().c_str()).compare(QLatin1String(".zip"), Qt::CaseInsensitive) ==
           0;
}

QString fileNameText(const fs::path& file) {
    return QFile::decodeName(file.filename().c_str());
}

fs::path fileIn(const QUrl& folder, const QString& name) {
    return fs::path(QFile::encodeName(folder.toLocalFile()).toStdString()) /
           QFile::encodeName(name).toStdString();
}

}  // namespace

QVExportController::QVExportController(std::shared_ptr<QVControllerManager> controllerManager,
                                       platform::ShareServices& shareServices)
    : controllerManager_(std::move(controllerManager)),
      shareServices_(shareServices),
      manager_(std::make_unique<QVExportManager>(
          settingOf(*controllerManager_, [this] { return preferredUnits(); }))),
      worker_(platform::makeSerialQueue("export")) {
    progressTimer_.setInterval(kProgressInterval);
    connect(&progressTimer_, &QTimer::timeout, this, &QVExportController::changed);
    worker_->async([paths = manager_->paths()] { QVExportFiles::removeLeftovers(paths); });
}

QVExportController::~QVExportController() {
    if (cancelSaving_) *cancelSaving_ = true;
    worker_.reset();
    manager_.reset();
}

QVExportUnits QVExportController::preferredUnits() const {
    std::map<const VSObjectType*, VSUnit> units;
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        if (!type->isQuantityType()) continue;
        if (const auto* group = controllerManager_->dataUnitGroupController().dataUnitGroupForType(type))
            units.emplace(type, controllerManager_->unitController()->unitForDataUnit(group->anyDataUnit()));
    }
    return QVExportUnits(std::move(units));
}

void QVExportController::onMain(std::function<void()> block) const {
    platform::mainQueue().async([alive = std::weak_ptr<bool>(alive_), block = std::move(block)] {
        if (!alive.expired()) block();
    });
}

void QVExportController::setState(State state) {
    state_ = state;
    if (state == State::Preparing)
        progressTimer_.start();
    else
        progressTimer_.stop();
    emit changed();
    emit buttonsChanged();
}

// --- Texts ----------------------------------------------------------------------------------------------

QString QVExportController::title() const {
    switch (state_) {
        case State::Preparing:
            return localized("EXPORT_PREPARING_TITLE");
        case State::Canceling:
            return localized("EXPORT_CANCELING_TITLE");
        case State::Sharing:
        case State::Saving:
            return localized("EXPORT_SHARE_TITLE");
        case State::Asking:
            return localized("EXPORT_SAVE_TITLE");
        default:
            return localized("EXPORT_TITLE");
    }
}

QString QVExportController::message() const {
    switch (state_) {
        case State::Verifying:
            return localized("EXPORT_PROMPT");
        case State::Preparing:
            return localized("EXPORT_PREPARING_MESSAGE") + QLatin1Char('\n') + stepText();
        case State::Sharing:
            return sharingText();
        case State::Saving:
            return localized("EXPORT_SAVING");
        case State::Asking:
            return localized(question_ == Consent::Replacing ? "EXPORT_ASK_REPLACE" : "EXPORT_ASK_NAME",
                             {fileNameText(chosenFile_)});
        case State::Failed: {
            const QString reason = error_ ? reasonText(*error_) : QString();
            return localized("EXPORT_NO_DATA") + (reason.isEmpty() ? QString() : QLatin1Char('\n') + reason);
        }
        default:
            return {};
    }
}

QString QVExportController::stepText() const {
    const QVExportProgress progress = manager_->progress();
    if (progress.bytesTotal > 0)
        return localized("EXPORT_PROGRESS_PACKING",
                         {megabytes(progress.bytesPacked), megabytes(progress.bytesTotal)});
    const QString counts =
        localized("EXPORT_PROGRESS_RECORDS", {countText(progress.records), countText(progress.recordsTotal)});
    const auto* group =
        progress.type ? controllerManager_->dataUnitGroupController().dataUnitGroupForType(progress.type)
                      : nullptr;
    return group ? group->displayName() + QLatin1Char('\n') + counts : counts;
}

QString QVExportController::sharingText() const {
    if (error_) return localized("EXPORT_SAVE_FAILED", {saveFailure_});
    if (savedFile_) return localized("EXPORT_SAVED", {QFile::decodeName(savedFile_->c_str())});
    return localized("EXPORT_SHARE_MESSAGE");
}

double QVExportController::fraction() const {
    return state_ == State::Preparing ? manager_->progress().fraction() : -1;
}

QString QVExportController::saveTitle() const {
    return localized("EXPORT_SAVE_TITLE");
}

QString QVExportController::suggestedName() const {
    return QFile::decodeName(manager_->paths().archivePath.filename().c_str());
}

std::vector<QVExportController::Button> QVExportController::buttons() {
    switch (state_) {
        case State::Verifying:
            return {{"EXPORT_YES", [this] { startExport(); }}, {"CANCEL", [this] { close(); }}};
        case State::Preparing:
        case State::Saving:
            return {{"TRANSFER_PUT_ASIDE", [this] { putAside(); }}, {"CANCEL", [this] { cancel(); }}};
        case State::Failed:
            return {{"OK", [this] { close(); }}};
        case State::Asking:
            return questionButtons();
        case State::Sharing:
            break;
        default:
            return {};
    }
    std::vector<Button> buttons{{"EXPORT_SAVE_AS", [this] { chooseSaveFile(); }}};
    if (shareServices_.canSendMail()) {
        buttons.push_back({"EXPORT_MAIL", [this] {
                               const auto mail = QVExportSource::Activity::Mail;
                               shareServices_.sendMail(source_->subjectForActivityType(mail),
                                                       source_->itemForActivityType(mail));
                           }});
    }
    if (shareServices_.canShowInFolder()) {
        buttons.push_back({"EXPORT_SHOW_IN_FOLDER", [this] {
                               shareServices_.showInFolder(savedFile_.value_or(
                                   source_->itemForActivityType(QVExportSource::Activity::ShowInFolder)));
                           }});
    }
    buttons.push_back({"DONE", [this] { close(); }});
    return buttons;
}

std::vector<QVExportController::Button> QVExportController::questionButtons() {
    const Button cancel{"CANCEL", [this] { leave(); }};
    const auto file = chosenFile_;
    if (question_ == Consent::Replacing)
        return {cancel, {"EXPORT_REPLACE", [this, file] { save(file, true); }}};
    return {{"EXPORT_ADD_ZIP", [this, file] { save(fs::path(file).concat(".zip"), false); }},
            {"EXPORT_KEEP_NAME", [this, file] { save(file, false); }},
            cancel};
}

QStringList QVExportController::buttonTitles() const {
    QStringList titles;
    for (const Button& button : const_cast<QVExportController*>(this)->buttons())
        titles.append(localized(button.titleKey));
    return titles;
}

// --- What happens ---------------------------------------------------------------------------------------

void QVExportController::verifyExport() {
    if (state_ != State::Idle) return show();
    forgetAside();
    setState(State::Verifying);
}

void QVExportController::pressButton(int index) {
    const auto shown = buttons();
    if (index >= 0 && index < static_cast<int>(shown.size())) shown[static_cast<size_t>(index)].press();
}

void QVExportController::leave() {
    if (state_ == State::Asking) return setState(State::Sharing);
    const bool wouldBeLost = state_ == State::Sharing && !savedFile_;
    if (isWorking() || state_ == State::Canceling || wouldBeLost)
        putAside();
    else
        close();
}

void QVExportController::cancel() {
    if (state_ == State::Preparing) cancelExport();
    if (state_ == State::Saving) *cancelSaving_ = true;
}

void QVExportController::close() {
    if (state_ != State::Idle) cleanUpExport();
}

void QVExportController::startExport() {
    userCancelled_ = false;
    error_.reset();
    backgroundTask_ = std::make_unique<platform::BackgroundTask>(QStringLiteral("Export"));
    manager_->createExportFile(
        [this](const VSResult<fs::path>& archive) { onMain([this, archive] { ended(archive); }); });
    setState(State::Preparing);
}

void QVExportController::cancelExport() {
    userCancelled_ = true;
    manager_->cancelCurrentExport();
    setState(State::Canceling);
}

void QVExportController::ended(const VSResult<fs::path>& archive) {
    if (userCancelled_) return cleanUpExport();
    if (archive) {
        source_.emplace(*archive, localized("EXPORT_SUBJECT"));
        setState(State::Sharing);
    } else {
        error_ = archive.error();
        setState(State::Failed);
    }
    platform::announce(title());
}

void QVExportController::chooseSaveFile() {
    const auto answered = [this, alive = std::weak_ptr<bool>(alive_)](platform::ShareServices::Choice choice,
                                                                      const fs::path& file) {
        if (alive.expired() || state_ != State::Sharing) return;
        if (choice == platform::ShareServices::Choice::Chosen) choose(file);
        if (choice == platform::ShareServices::Choice::Unavailable) emit saveDialogRequested();
    };
    shareServices_.chooseSaveFile(saveTitle(), suggestedName(), answered);
}

bool QVExportController::fileExists(const QUrl& folder, const QString& name) {
    std::error_code error;
    return !name.isEmpty() && fs::exists(fileIn(folder, name), error);
}

void QVExportController::saveIn(const QUrl& folder, const QString& name) {
    if (state_ == State::Sharing && !name.isEmpty()) choose(fileIn(folder, name));
}

void QVExportController::choose(const fs::path& target) {
    error_.reset();
    savedFile_.reset();
    if (isNamedAsArchive(target))
        save(target, false);
    else
        ask(Consent::OtherName, target);
}

void QVExportController::ask(Consent question, const fs::path& target) {
    question_ = question;
    chosenFile_ = target;
    setState(State::Asking);
    platform::announce(message());
}

void QVExportController::save(const fs::path& target, bool mayReplace) {
    chosenFile_ = target;
    cancelSaving_ = std::make_shared<std::atomic<bool>>(false);
    setState(State::Saving);
    worker_->async([this, target, mayReplace, cancel = cancelSaving_,
                    store = controllerManager_->healthStore()->folder(),
                    archive = source_->itemForActivityType(QVExportSource::Activity::Save)] {
        auto file = QVExportTarget::open(target, store);
        if (file && file->holdsSomethingElse() && !mayReplace && !*cancel)
            return onMain([this, target] { ask(Consent::Replacing, target); });
        if (file && mayReplace) file->allowReplacing();
        const VSStatus status = file ? file->takeCopy(archive, *cancel) : VSStatus(file.error());
        const char* const key = status ? nullptr : saveFailureKey(status.error(), target, store);
        onMain([this, target, status, key] { saved(target, status, key); });
    });
}

void QVExportController::saved(const fs::path& target, const VSStatus& status, const char* failureKey) {
    if (status) {
        savedFile_ = target;
    } else if (status.error().code != VSErrorCode::Cancelled) {
        error_ = status.error();
        const QString reason = reasonText(*error_);
        saveFailure_ = !reason.isEmpty() ? reason
                       : failureKey      ? localized(failureKey)
                                         : QString::fromStdString(error_->message);
    }
    setState(State::Sharing);
    platform::announce(isAside() ? title() + QLatin1Char('\n') + message() : message());
}

void QVExportController::cleanUpExport() {
    source_.reset();
    savedFile_.reset();
    error_.reset();
    userCancelled_ = false;
    manager_->cleanupExportFiles();
    backgroundTask_.reset();
    setState(State::Idle);
}
