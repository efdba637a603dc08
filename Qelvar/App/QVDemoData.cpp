#include "Qelvar/App/QVDemoData.h"

#include <QBuffer>
#include <QFile>
#include <QImage>
#include <QTimeZone>
#include <algorithm>
#include <cmath>
#include <set>

#include "Platform/PropertyList.h"
#include "Platform/Queue.h"
#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/Base/VSLog.h"

namespace {

constexpr const char* kUseDemoData = "UseDemoData";
constexpr const char* kLastResetDate = "DemoDataKeyLastResetDate";
constexpr const char* kLastResetSex = "DemoDataKeyLastResetSex";
constexpr const char* kFemale = "Female";
constexpr size_t kBatchSize = 10'000;

constexpr double kDefaultWorkoutKilocalories = 250, kDefaultWorkoutMiles = 3;
constexpr int kLargestMenstrualFlow = 4;
constexpr int kMenstrualFlowCycleMark = 1;
constexpr int kProtected = 2, kUnprotected = 3;

/// The types whose demonstration values have a unit of their own.
const std::pair<VSTypeCode, const char*> kFixedUnits[] = {
    {VSCode::StepCount, "count"},
    {VSCode::DietaryEnergyConsumed, "kcal"},
    {VSCode::BloodPressureSystolic, "mmHg"},
    {VSCode::BodyFatPercentage, "%"},
    {VSCode::ActiveEnergyBurned, "kcal"},
    {VSCode::BasalEnergyBurned, "kcal"},
    {VSCode::BodyMass, "lb"},
    {VSCode::BloodPressureDiastolic, "mmHg"},
    {VSCode::BodyMassIndex, "count"},
    {VSCode::HeartRate, "count/min"},
    {VSCode::BasalBodyTemperature, "degC"},
    {VSCode::BodyTemperature, "degC"},
    {VSCode::DietaryWater, "mL"},
    {VSCode::Height, "cm"},
};

std::optional<double> numberEntry(const VSValue& entry, std::string_view key) {
    const VSValue* value = entry[key];
    return value ? value->number() : std::nullopt;
}

std::optional<std::string> stringEntry(const VSValue& entry, std::string_view key) {
    const VSValue* value = entry[key];
    return value && value->string() ? std::optional(*value->string()) : std::nullopt;
}

QByteArray demoDocument() {
    QFile file(QStringLiteral(":/demo/demodata.plist"));
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

/// Goes through the entries in their order and collects the samples.
class SampleBuilder {
 public:
    SampleBuilder(VSDate anchor, const QVDemoUnits& units, size_t batchSize,
                  const std::function<void(std::vector<VSSamplePtr>, bool)>& handler)
        : anchor_(anchor), units_(units), batchSize_(batchSize), handler_(handler) {}

    void add(const VSValue& entry) {
        const std::string* identifier =
            entry["dataTypeIdentifier"] ? entry["dataTypeIdentifier"]->string() : nullptr;
        const auto offset = numberEntry(entry, "dateOffsetInterval");
        if (!identifier || !offset) return;
        start_ = anchor_ + VSDurationFromSeconds(*offset);
        const auto endOffset = numberEntry(entry, "dateOffsetIntervalEnd");
        end_ = endOffset ? anchor_ + VSDurationFromSeconds(*endOffset) : start_;
        if (end_ < start_) return;
        metadata_.reset();
        if (const VSValue* metadata = entry["metadata"]; metadata && metadata->dictionary())
            metadata_ = std::make_shared<const VSMetadata>(*metadata->dictionary());

        if (const auto* quantity = VSObjectType::quantityTypeForIdentifier(*identifier))
            addQuantity(entry, quantity);
        else if (const auto* category = VSObjectType::categoryTypeForIdentifier(*identifier))
            addCategory(entry, category);
        else if (const auto* correlation = VSObjectType::correlationTypeForIdentifier(*identifier))
            addBloodPressure(correlation);
        else if (*identifier == VSWorkoutTypeIdentifier)
            addWorkout(entry);
    }

    void finish() { handler_(std::move(batch_), true); }

 private:
    VSProvenance provenance() const {
        VSProvenance provenance;
        provenance.metadata = metadata_;
        return provenance;
    }

    void addObject(VSSamplePtr object) {
        batch_.push_back(std::move(object));
        if (batch_.size() < batchSize_) return;
        // A reading and its values are saved together: values that wait for their reading stay here.
        const auto waiting =
            std::stable_partition(batch_.begin(), batch_.end(), [&](const VSSamplePtr& sample) {
                return std::find(pendingPressures_.begin(), pendingPressures_.end(), sample) ==
                       pendingPressures_.end();
            });
        std::vector<VSSamplePtr> next(waiting, batch_.end());
        batch_.erase(waiting, batch_.end());
        if (!batch_.empty()) handler_(std::exchange(batch_, {}), false);
        batch_ = std::move(next);
    }

    void addQuantity(const VSValue& entry, const VSObjectType* type) {
        const auto value = numberEntry(entry, "value");
        const auto unit = unitFor(entry, type);
        if (!value || !unit || !std::isfinite(*value)) return;
        auto sample = std::make_shared<const VSQuantitySample>(type, VSQuantity(*unit, *value), start_, end_,
                                                               provenance());
        if (type->code() == VSCode::BloodPressureSystolic || type->code() == VSCode::BloodPressureDiastolic)
            pendingPressures_.push_back(sample);
        addObject(std::move(sample));
    }

    /// An entry may name its unit, so that it does not mean another amount for people with other preferences.
    std::optional<VSUnit> unitFor(const VSValue& entry, const VSObjectType* type) const {
        if (const auto text = stringEntry(entry, "unit")) {
            auto unit = type->unitFromString(*text);
            return unit ? std::optional(*unit) : std::nullopt;
        }
        const auto found = units_.find(type);
        return found == units_.end() ? std::nullopt : std::optional(found->second);
    }

    void addCategory(const VSValue& entry, const VSObjectType* type) {
        const auto number = numberEntry(entry, "value");
        if (!number || std::abs(*number) > 1000) return;
        int value = static_cast<int>(*number);
        if (type->code() == VSCode::SexualActivity) {
            if (value == kProtected || value == kUnprotected)
                addMetadata(VSMetadataKeySexualActivityProtectionUsed, value == kProtected);
            value = 0;
        } else if (type->code() == VSCode::MenstrualFlow) {
            if (value == kMenstrualFlowCycleMark) {
                nextFlowStartsCycle_ = true;
                return;
            }
            value = std::min(value, kLargestMenstrualFlow);
            metadata_ = std::make_shared<const VSMetadata>(
                VSMetadata{{VSMetadataKeyMenstrualCycleStart, std::exchange(nextFlowStartsCycle_, false)}});
        }
        addObject(std::make_shared<const VSCategorySample>(type, value, start_, end_, provenance()));
    }

    void addMetadata(const char* key, bool value) {
        VSMetadata metadata = metadata_ ? *metadata_ : VSMetadata();
        metadata.insert_or_assign(key, value);
        metadata_ = std::make_shared<const VSMetadata>(std::move(metadata));
    }

    /// Holds all pressures since the one before, which were added by themselves as well.
    void addBloodPressure(const VSObjectType* type) {
        if (pendingPressures_.size() < 2) return;
        addObject(std::make_shared<const VSCorrelation>(type, start_, end_,
                                                        std::exchange(pendingPressures_, {}), provenance()));
    }

    void addWorkout(const VSValue& entry) {
        const auto activity = numberEntry(entry, "value");
        if (!activity) return;
        const VSQuantity energy(VSUnit::kilocalorieUnit(),
                                numberEntry(entry, "energyBurned").value_or(kDefaultWorkoutKilocalories));
        const VSQuantity distance(VSUnit::mileUnit(),
                                  numberEntry(entry, "totalDistance").value_or(kDefaultWorkoutMiles));
        addObject(std::make_shared<const VSWorkout>(static_cast<int>(*activity), start_, end_,
                                                    VSDuration::zero(), energy, distance,
                                                    std::vector<VSWorkoutEvent>()));
    }

    const VSDate anchor_;
    const QVDemoUnits& units_;
    const size_t batchSize_;
    const std::function<void(std::vector<VSSamplePtr>, bool)>& handler_;
    std::vector<VSSamplePtr> batch_;
    std::vector<VSSamplePtr> pendingPressures_;
    bool nextFlowStartsCycle_ = true;
    VSDate start_, end_;  // of the entry
    std::shared_ptr<const VSMetadata> metadata_;
};

/// The sample types of every data unit of every display type, and the correlations that hold their samples:
/// left behind, these would be readings without values.
std::vector<const VSObjectType*> allSampleTypes() {
    std::set<const VSObjectType*> types;
    for (const VSObjectType* type : VSObjectType::allTypes())
        if (type->kind() == VSTypeKind::Correlation) types.insert(type);
    for (const VSDataUnitGroup* group : VSDataUnitGroupController::shared().allDataUnitGroups())
        for (const VSDataUnit* unit : group->dataUnits())
            if (unit->sampleType()->isSampleType()) types.insert(unit->sampleType());
    return {types.begin(), types.end()};
}

std::optional<VSBirthDate> birthDate(const VSValue& medicalID) {
    const VSValue* value = medicalID["birthdate"];
    const auto date = value ? value->date() : std::nullopt;
    if (!date) return std::nullopt;
    // The document gives the day as its midnight in Greenwich.
    const VSCalendar greenwich("UTC", "en_US_POSIX");
    return VSBirthDate{greenwich.component(VSCalendarUnit::Year, *date),
                       greenwich.component(VSCalendarUnit::Month, *date),
                       greenwich.component(VSCalendarUnit::Day, *date)};
}

std::optional<VSValue::Data> pictureAsJPEG(const QString& file) {
    const QImage picture(file);
    QByteArray bytes;
    QBuffer buffer(&bytes);
    if (picture.isNull() || !buffer.open(QIODevice::WriteOnly) ||
        !picture.convertToFormat(QImage::Format_RGB32).save(&buffer, "JPEG", 100))
        return std::nullopt;
    return VSValue::Data(bytes.begin(), bytes.end());
}

const VSValue& medicalIDOf(const VSValue::Dictionary& dictionary) {
    static const VSValue kNone;
    const auto found = dictionary.find("medicalID");
    return found == dictionary.end() ? kNone : found->second;
}

}  // namespace

bool QVUsesDemoData() {
    return platform::UserDefaults::standard().boolean(kUseDemoData);
}

VSResult<VSValue::Dictionary> QVDemoDataDictionary() {
    const QByteArray document = demoDocument();
    auto value = platform::readPropertyList({document.constData(), static_cast<size_t>(document.size())});
    if (!value) return value.error();
    if (!value->dictionary()) return VSError{VSErrorCode::Invalid, "demodata.plist holds no dictionary"};
    return *value->dictionary();
}

std::optional<VSValue::Dictionary> QVDemoDataHead() {
    const QByteArray document = demoDocument();
    auto head = platform::readPropertyListBefore({document.constData(), static_cast<size_t>(document.size())},
                                                 "samples");
    if (head) return std::move(*head);
    VSLog(VSLogLevel::Error, "demodata.plist: " + head.error().message);
    return std::nullopt;
}

QVDemoUnits QVMakeDemoUnits(const VSUnitController& unitController) {
    QVDemoUnits units;
    for (const VSDataUnitGroup* group : VSDataUnitGroupController::shared().allDataUnitGroups())
        for (const VSDataUnit* unit : group->dataUnits())
            if (unit->dataType()->isQuantityType())
                units.insert_or_assign(unit->dataType(), unitController.unitForDataUnit(unit));
    for (const auto& [code, unitString] : kFixedUnits)
        units.insert_or_assign(VSObjectType::dataTypeWithCode(code), VSUnit::fromString(unitString));
    return units;
}

void QVBuildDemoSamples(const VSValue::Array& entries, VSDate anchor, const QVDemoUnits& units,
                        size_t batchSize,
                        const std::function<void(std::vector<VSSamplePtr> batch, bool isLast)>& handler) {
    SampleBuilder builder(anchor, units, batchSize, handler);
    for (const VSValue& entry : entries) builder.add(entry);
    builder.finish();
}

QVDemoData::QVDemoData(std::shared_ptr<VSHealthStore> healthStore,
                       std::shared_ptr<VSUnitController> unitController, std::function<void()> didSave)
    : healthStore_(std::move(healthStore)),
      unitController_(std::move(unitController)),
      didSave_(std::move(didSave)) {}

QVDemoData::~QVDemoData() = default;

bool QVDemoData::isDue(const std::string& demoDataSex) const {
    const auto& defaults = platform::UserDefaults::standard();
    const auto date = defaults.value(kLastResetDate);
    const auto sex = defaults.value(kLastResetSex);
    if (!date || !date->date() || !sex || !sex->string() || *sex->string() != demoDataSex) return true;
    return !VSCalendar::current().isToday(*date->date());
}

void QVDemoData::resetDemoData(VSValue::Dictionary dictionary, const std::string& demoDataSex) {
    if (resetting_ || !isDue(demoDataSex)) return;
    resetting_ = true;
    const bool isFemale = demoDataSex == kFemale;
    updateMedicalID(dictionary, isFemale);
    updateCharacteristics(dictionary, isFemale);

    const std::weak_ptr<bool> alive = alive_;
    // Runs a block on the main thread, if this object still lives there.
    const auto onMain = [alive](std::function<void()> block) {
        platform::mainQueue().async([alive, block = std::move(block)] {
            if (!alive.expired()) block();
        });
    };
    auto build = [this, onMain, demoDataSex, store = healthStore_, units = QVMakeDemoUnits(*unitController_),
                  anchor = VSCalendar::current().startOfDay(VSEnvironment::current()->now()),
                  document = std::make_shared<const VSValue::Dictionary>(std::move(dictionary))](
                     const VSStatus& deleted) {
        if (!deleted) {
            VSLog(VSLogLevel::Error,
                  "The demonstration's old records could not be deleted: " + deleted.error().message);
            return onMain([this] { resetting_ = false; });
        }
        const auto samples = document->find("samples");
        const VSValue::Array* entries = samples == document->end() ? nullptr : samples->second.array();
        QVBuildDemoSamples(entries ? *entries : VSValue::Array(), anchor, units, kBatchSize,
                           [&](std::vector<VSSamplePtr> batch, bool isLast) {
                               store->saveObjects(std::move(batch), [this, onMain, isLast,
                                                                     demoDataSex](const VSStatus& saved) {
                                   if (!saved)
                                       VSLog(VSLogLevel::Error,
                                             "A demonstration batch was not saved: " + saved.error().message);
                                   onMain([this, isLast, demoDataSex] {
                                       if (didSave_) didSave_();
                                       if (isLast) finished(demoDataSex);
                                   });
                               });
                           });
    };
    healthStore_->deleteAllSamples(allSampleTypes(), std::nullopt, std::move(build));
}

void QVDemoData::updateMedicalID(const VSValue::Dictionary& dictionary, bool isFemale) {
    const VSValue& medicalID = medicalIDOf(dictionary);
    VSMedicalIDData data;
    data.name = stringEntry(medicalID, "name");
    data.birthdate = birthDate(medicalID);
    data.medicalConditions = stringEntry(medicalID, "medicalConditions");
    data.medicalNotes = stringEntry(medicalID, "medicalNotes");
    data.allergyInfo = stringEntry(medicalID, "allergyInfo");
    data.medicationInfo = stringEntry(medicalID, "medicationInfo");
    data.pictureData = pictureAsJPEG(isFemale ? QStringLiteral(":/demo/demoMedicalIDPictureFemale.png")
                                              : QStringLiteral(":/demo/demoMedicalIDPicture.jpg"));
    healthStore_->updateMedicalIDData(std::move(data), {});
}

void QVDemoData::updateCharacteristics(const VSValue::Dictionary& dictionary, bool isFemale) {
    const auto set = [this](VSTypeCode code, int value) {
        healthStore_->setCharacteristic(VSObjectType::dataTypeWithCode(code), value, {});
    };
    set(VSCode::BiologicalSex, isFemale ? 1 : 2);
    set(VSCode::BloodType, isFemale ? 7 : 1);
    set(VSCode::FitzpatrickSkinType, isFemale ? 4 : 3);
    if (const auto date = birthDate(medicalIDOf(dictionary))) healthStore_->setDateOfBirth(date, {});
}

void QVDemoData::finished(const std::string& demoDataSex) {
    auto& defaults = platform::UserDefaults::standard();
    defaults.setValue(kLastResetDate, VSEnvironment::current()->now());
    defaults.setValue(kLastResetSex, demoDataSex);
    resetting_ = false;
}
