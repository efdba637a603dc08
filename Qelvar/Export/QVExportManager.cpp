#include "Qelvar/Export/QVExportManager.h"

#include <sys/stat.h>

#include <algorithm>
#include <array>

#include "Qelvar/Export/QVExportArchive.h"
#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/Base/VSLog.h"

namespace {

constexpr int kLastCode = 98;
constexpr std::array kNeverExported{6, 11, 59, 67, 68, 69, 74, 75, 76, 77, 82, 84, 85, 86, 93, 94, 98};
constexpr size_t kPageSize = 512;
constexpr std::ptrdiff_t kPagesWaiting = 4;
/// How much of the time the writing takes; the packing takes the rest.
constexpr double kWritingShare = 0.6;

VSError cancelled() {
    return {VSErrorCode::Cancelled, "the export was cancelled; nothing of it is kept"};
}

}  // namespace

double QVExportProgress::fraction() const {
    const auto share = [](auto done, auto total) {
        return total > 0 ? std::min(1.0, static_cast<double>(done) / static_cast<double>(total)) : 0.0;
    };
    if (bytesTotal > 0) return kWritingShare + (1 - kWritingShare) * share(bytesPacked, bytesTotal);
    return kWritingShare * share(records, recordsTotal);
}

QVExportManager::QVExportManager(QVExportSetting setting)
    : setting_(std::move(setting)), paths_(setting_.documentsPath, setting_.names) {
    queue_.start(1, nullptr);
}

QVExportManager::~QVExportManager() {
    cancelCurrentExport();
    if (worker_.joinable()) worker_.join();
    queue_.finish();
}

void QVExportManager::createExportFile(Completion completion) {
    if (exportInProgress_.exchange(true)) return;
    if (worker_.joinable()) worker_.join();
    units_ = setting_.preferredUnits ? setting_.preferredUnits() : QVExportUnits();
    worker_ = std::thread([this, completion = std::move(completion)] { run(completion); });
}

void QVExportManager::cancelCurrentExport() {
    std::lock_guard lock(
        mutex_);  // under which an export ends, so that this one is not mistaken for the next
    if (!exportInProgress_) return;
    if (!error_) error_ = cancelled();
    exportFailed_ = true;
}

void QVExportManager::cleanupExportFiles() {
    std::lock_guard lock(mutex_);
    files_.reset();
}

QVExportProgress QVExportManager::progress() const {
    return {type_, records_, recordsTotal_, bytesPacked_, bytesTotal_};
}

std::vector<std::pair<std::string, int64_t>> QVExportManager::exportedCounts() const {
    std::map<int, std::pair<std::string, int64_t>> byCode;
    for (const auto& [type, extent] : extents_)
        byCode[VSTypeCodeValue(type->code())] = {std::string(type->name()), extent.count};
    std::vector<std::pair<std::string, int64_t>> counts;
    counts.reserve(byCode.size());
    for (auto& [code, count] : byCode) counts.push_back(std::move(count));
    return counts;
}

void QVExportManager::fail(VSError error) {
    std::lock_guard lock(mutex_);
    if (!error_) error_ = std::move(error);
    exportFailed_ = true;
}

// --- The pass -------------------------------------------------------------------------------------------

void QVExportManager::run(const Completion& completion) {
    const auto result = exportAll();
    snapshot_.reset();
    writer_.reset();
    writerCDA_.reset();
    if (!result) cleanupExportFiles();
    completion(result);
    // After all that was queued, so that no writing of this export is left when the next one begins.
    queue_.enqueue([this] {
        std::lock_guard lock(mutex_);
        error_.reset();
        exportFailed_ = false;
        exportInProgress_ = false;
    });
}

VSResult<std::filesystem::path> QVExportManager::exportAll() {
    type_ = nullptr;
    records_ = recordsTotal_ = 0;
    bytesPacked_ = bytesTotal_ = 0;
    if (VSStatus status = createFiles(); !status) return status.error();
    if (VSStatus status = takeSnapshot(); !status) return status.error();
    sem_ = std::make_unique<std::counting_semaphore<>>(0);
    pages_ = std::make_unique<std::counting_semaphore<>>(kPagesWaiting);
    openDocuments();
    auto relations = snapshot_->relations();
    if (!relations) return relations.error();
    writer_->setRelations(std::move(*relations));
    writePerson();
    writeAllTypes();
    completeAndCloseStreamingXML();
    if (!exportFailed_) {
        if (VSStatus status = archiveExportDirectory(); !status) fail(status.error());
    }
    std::lock_guard lock(mutex_);
    if (exportFailed_) return *error_;
    return paths_.archivePath;
}

VSStatus QVExportManager::createFiles() {
    cleanupExportFiles();
    auto files = QVExportFiles::create(paths_, setting_.folder);
    if (!files) {
        if (files.error().isHeldByOthers) return files.error();
        VSLog(VSLogLevel::Error,
              "File(s) not created: " + paths_.filePath.string() + "; " + paths_.CDAFilePath.string());
        VSLog(VSLogLevel::Error, files.error().message);
        return VSError{files.error().code, "Export file(s) could not be created."};
    }
    std::lock_guard lock(mutex_);
    files_.emplace(std::move(*files));
    return {};
}

VSStatus QVExportManager::takeSnapshot() {
    auto snapshot = VSStoreSnapshot::take(*setting_.healthStore);
    if (!snapshot) return snapshot.error();
    snapshot_ = std::move(*snapshot);
    auto extents = snapshot_->extents();
    if (!extents) return extents.error();
    extents_ = std::move(*extents);
    int64_t total = 0;
    for (const auto& [type, extent] : extents_) total += extent.count;
    recordsTotal_ = total;
    return {};
}

void QVExportManager::openDocuments() {
    const auto environment = VSEnvironment::current();
    const int offset = VSCalendar::current().secondsFromGMT(environment->now());
    writer_ = std::make_unique<QVRecordsDocument>(files_->recordsDocument(), offset, units_);
    // Without what the person prefers beside the locale, such as a clock of 24 hours.
    const std::string locale = environment->localeIdentifier();
    writer_->open(locale.substr(0, locale.find('@')));
    writerCDA_ = std::make_unique<QVClinicalDocument>(files_->clinicalDocument(), offset);
    writerCDA_->open();
}

template <typename T>
T QVExportManager::readPerson(VSResult<T> result, const char* what) {
    if (result) return *result;
    VSLog(VSLogLevel::Error, std::string("Error getting ") + what + ": " + result.error().message);
    return {};
}

void QVExportManager::writePerson() {
    const VSDate now = VSEnvironment::current()->now();
    const auto birthDate = readPerson(snapshot_->dateOfBirth(), "birth date");
    const int sex = readPerson(snapshot_->characteristic(VSCode::BiologicalSex), "biological sex");
    const int bloodType = readPerson(snapshot_->characteristic(VSCode::BloodType), "blood type");
    const int skinType =
        readPerson(snapshot_->characteristic(VSCode::FitzpatrickSkinType), "fitzpatrick skin type");
    const auto medicalID = readPerson(snapshot_->medicalID(), "medical ID");
    writer_->writeXMLPersonWithDateOfBirth(now, birthDate, sex, bloodType, skinType, medicalID);
    // Here, before the first type: the header stands before the first section.
    const std::string name = medicalID ? medicalID->name.value_or("") : "";
    writerCDA_->writeCDAHeaderWithName(now, name, birthDate, sex);
}

void QVExportManager::getAllDataTypesOfClass(VSTypeKind kind, Types& types) {
    for (int code = 0; code <= kLastCode; ++code) {
        const VSObjectType* type = VSObjectType::dataTypeWithCode(code);
        const bool isLeftOut =
            std::find(kNeverExported.begin(), kNeverExported.end(), code) != kNeverExported.end();
        if (type && type->kind() == kind && !isLeftOut) types.push_back(type);
    }
}

void QVExportManager::getAllDataTypesOfCategory(QVClinicalSection category, Types& types) {
    Types all;
    getAllDataTypesOfClass(VSTypeKind::Quantity, all);
    std::copy_if(all.begin(), all.end(), std::back_inserter(types),
                 [category](const VSObjectType* type) { return QVClinicalSectionForType(type) == category; });
}

void QVExportManager::writeAllTypes() {
    resultsTypes_.clear();
    vitalsTypes_.clear();
    getAllDataTypesOfCategory(QVClinicalSection::Results, resultsTypes_);
    getAllDataTypesOfCategory(QVClinicalSection::Vitals, vitalsTypes_);
    Types quantityTypes = resultsTypes_;
    quantityTypes.insert(quantityTypes.end(), vitalsTypes_.begin(), vitalsTypes_.end());
    getAllDataTypesOfCategory(QVClinicalSection::None, quantityTypes);
    Types categoryTypes, correlationTypes;
    getAllDataTypesOfClass(VSTypeKind::Category, categoryTypes);
    getAllDataTypesOfClass(VSTypeKind::Correlation, correlationTypes);

    for (const VSObjectType* type : quantityTypes) {
        if (!exportFailed_) writeQuantityType(type);
    }
    for (const VSObjectType* type : categoryTypes) {
        if (!exportFailed_) writeCategoryType(type);
    }
    for (const VSObjectType* type : correlationTypes) {
        if (!exportFailed_) writeCorrelationType(type);
    }
    if (!exportFailed_) writeWorkoutType();
    type_ = nullptr;
}

void QVExportManager::completeAndCloseStreamingXML() {
    for (const VSStatus& status : {writer_->close(), writerCDA_->close()}) {
        if (!status) fail(status.error());
    }
}

VSStatus QVExportManager::archiveExportDirectory() {
    uint64_t total = 0;
    struct stat status {};
    for (const QVExportFile& file : {files_->recordsDocument(), files_->clinicalDocument()})
        if (fstat(file.descriptor, &status) == 0) total += static_cast<uint64_t>(status.st_size);
    bytesTotal_ = total;
    return QVArchiveExportDirectory(files_->exportFolder(), files_->archive(), [this](uint64_t bytes) {
        bytesPacked_ = bytes;
        return !exportFailed_;
    });
}

// --- Types ----------------------------------------------------------------------------------------------

void QVExportManager::writeType(const VSObjectType* type, VSStoreSnapshot::Order order,
                                const WritePage& writePage, const std::function<void()>& atEnd) {
    type_ = type;
    const VSStatus status =
        snapshot_->readSamples(type, order, kPageSize, [&](std::vector<VSSamplePtr> page) {
            if (exportFailed_) return false;
            pages_->acquire();
            queue_.enqueue([this, &writePage, page = std::move(page)] {
                if (!exportFailed_) writePage(page);
                records_ += static_cast<int64_t>(page.size());
                for (const VSStatus& written : {writer_->status(), writerCDA_->status()}) {
                    if (!written) fail(written.error());
                }
                pages_->release();
            });
            return true;
        });
    if (!status) fail(status.error());
    queue_.enqueue([this, &atEnd] {
        if (atEnd && !exportFailed_) atEnd();
        sem_->release();
    });
    sem_->acquire();
}

void QVExportManager::writeQuantityType(const VSObjectType* type) {
    bool hasBegun = false;
    writeType(
        type, VSStoreSnapshot::Order::EndDate,
        [&](const std::vector<VSSamplePtr>& samples) {
            if (!std::exchange(hasBegun, true)) beginQuantityType(type, samples.front().get());
            writeDataForQuantityType(type, samples);
        },
        [&] {
            if (!hasBegun) beginQuantityType(type, nullptr);
            endQuantityType(type, hasBegun);
        });
}

/// `first`: the sample that ends first; null: there are none.
void QVExportManager::beginQuantityType(const VSObjectType* type, const VSSample* first) {
    if (type == resultsTypes_.front()) writerCDA_->writeCDAResultsHeader();
    if (type == vitalsTypes_.front()) writerCDA_->writeCDAVitalHeader();
    if (!first) return;
    switch (QVClinicalSectionForType(type)) {
        case QVClinicalSection::Vitals:
            return writerCDA_->writeCDAVitalsOrganizerStartWithStartDate(first->startDate(),
                                                                         extents_.at(type).lastEnd);
        case QVClinicalSection::Results:
            return writerCDA_->writeCDAResultsOrganizerStart();
        case QVClinicalSection::None:
            return;
    }
}

void QVExportManager::writeDataForQuantityType(const VSObjectType* type,
                                               const std::vector<VSSamplePtr>& samples) {
    const bool isClinical = QVClinicalSectionForType(type) != QVClinicalSection::None;
    const VSUnit& unit = units_.preferredUnitForObjectType(type);
    for (const VSSamplePtr& sample : samples) {
        writer_->writeRecord(*sample);
        if (isClinical)
            writerCDA_->writeCDAEntryWithValue(static_cast<const VSQuantitySample&>(*sample), unit);
    }
}

void QVExportManager::endQuantityType(const VSObjectType* type, bool hasSamples) {
    if (hasSamples && QVClinicalSectionForType(type) != QVClinicalSection::None)
        writerCDA_->writeCDAOrganizerEnd();
    if (type == resultsTypes_.back() || type == vitalsTypes_.back()) writerCDA_->writeCDASectionFooter();
}

void QVExportManager::writeCategoryType(const VSObjectType* type) {
    writeType(type, VSStoreSnapshot::Order::EndDate, [this](const std::vector<VSSamplePtr>& samples) {
        for (const VSSamplePtr& sample : samples) writer_->writeRecord(*sample);
    });
}

void QVExportManager::writeCorrelationType(const VSObjectType* type) {
    writeType(type, VSStoreSnapshot::Order::Insertion, [this](const std::vector<VSSamplePtr>& samples) {
        for (const VSSamplePtr& sample : samples)
            writer_->writeCorrelation(static_cast<const VSCorrelation&>(*sample));
    });
}

void QVExportManager::writeWorkoutType() {
    writeType(VSObjectType::workoutType(), VSStoreSnapshot::Order::EndDate,
              [this](const std::vector<VSSamplePtr>& samples) {
                  for (const VSSamplePtr& sample : samples)
                      writer_->writeWorkout(static_cast<const VSWorkout&>(*sample));
              });
}
