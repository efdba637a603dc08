#include "Qelvar/Export/QVRecordsDocument.h"

#include <bit>
#include <cstdint>
#include <cstdio>

#include "Qelvar/Export/QVRecordsDeclaration.h"
#include "Qelvar/Import/QVImportText.h"
#include "Qelvar/Import/QVXMLText.h"

namespace {

std::string birthDateText(const std::optional<VSBirthDate>& date) {
    if (!date) return {};
    char text[40];
    std::snprintf(text, sizeof text, "%04d-%02d-%02d", date->year, date->month, date->day);
    return text;
}

/// The identifier of a characteristic's value; of one that there is not, that of "not set".
const std::string& characteristicText(VSTypeCode code, int value) {
    const VSObjectType* type = VSObjectType::dataTypeWithCode(code);
    const std::string* identifier = type->identifierForValue(value);
    return identifier ? *identifier : *type->identifierForValue(0);
}

double minutes(VSDuration duration) {
    return VSSecondsFromDuration(duration) / 60;
}

/// Whether an import makes the very number of the text, which is in `unit`.
bool isReadAs(const std::string& text, const VSUnit& unit, double exact, const VSUnit& canonical) {
    const auto read = QVImportNumberFromText(text);
    if (!read) return false;
    const auto converted = unit.convert(*read, canonical);
    return converted && std::bit_cast<int64_t>(*converted) == std::bit_cast<int64_t>(exact);
}

}  // namespace

const std::string& QVDeviceTexts::textOf(const VSSample& sample) {
    const auto& device = sample.provenance().device;
    if (device != device_) {
        device_ = device;
        text_ = device ? device->description() : std::string();
    }
    return text_;
}

QVRecordsDocument::QVRecordsDocument(const QVExportFile& file, int secondsFromGMT, const QVExportUnits& units)
    : writer_(file), exact_(writer_, secondsFromGMT), dates_(secondsFromGMT), units_(units) {}

void QVRecordsDocument::open(const std::string& locale) {
    writer_.startDocument("1.0", "UTF-8");
    writer_.documentType("HealthData", kQVRecordsDeclaration);
    writer_.startElement("HealthData");
    writer_.attribute("locale", locale);
    exact_.writeVersion();
}

void QVRecordsDocument::writeXMLPersonWithDateOfBirth(VSDate now,
                                                      const std::optional<VSBirthDate>& dateOfBirth,
                                                      int biologicalSex, int bloodType, int skinType,
                                                      const std::optional<VSMedicalIDData>& medicalID) {
    writer_.startElement("ExportDate");
    writer_.attribute("value", dates_.recordsString(now));
    writer_.endElement();

    if (medicalID) exact_.writeMedicalID(*medicalID);
    writer_.startElement("Me");
    writer_.attribute("VSCharacteristicTypeIdentifierDateOfBirth", birthDateText(dateOfBirth));
    writer_.attribute("VSCharacteristicTypeIdentifierBiologicalSex",
                      characteristicText(VSCode::BiologicalSex, biologicalSex));
    writer_.attribute("VSCharacteristicTypeIdentifierBloodType",
                      characteristicText(VSCode::BloodType, bloodType));
    writer_.attribute("VSCharacteristicTypeIdentifierFitzpatrickSkinType",
                      characteristicText(VSCode::FitzpatrickSkinType, skinType));
    writer_.endElement();
}

QVRecordsDocument::Value QVRecordsDocument::valueOf(const VSSample& sample) const {
    if (const auto* quantity = dynamic_cast<const VSQuantitySample*>(&sample)) {
        const VSUnit& unit = units_.preferredUnitForObjectType(sample.sampleType());
        const VSUnit& canonical = sample.sampleType()->canonicalUnit();
        const double exact = quantity->quantity().value();
        Value value{unit.description(), QVExportNumberText(quantity->quantity().doubleValueForUnit(unit)),
                    true, std::nullopt};
        if (!isReadAs(value.text, unit, exact, canonical)) value.exact = exact;
        return value;
    }
    if (const auto* category = dynamic_cast<const VSCategorySample*>(&sample)) {
        if (const std::string* identifier = sample.sampleType()->identifierForValue(category->value()))
            return {{}, *identifier, true, std::nullopt};
    }
    return {};
}

void QVRecordsDocument::writeRecord(const VSSample& sample) {
    exact_.writeRelations(sample);
    writeXMLRecordWithType(sample, valueOf(sample));
}

void QVRecordsDocument::writeXMLRecordWithType(const VSSample& sample, const Value& value) {
    if (value.exact) exact_.writeValue("value", VSValue(*value.exact));
    startElement("Record", sample);
    writer_.attribute("type", sample.sampleType()->identifier());
    writeOrigin(sample);
    if (!value.unit.empty()) writer_.attribute("unit", value.unit);
    writeDates(sample);
    if (value.present) writer_.attribute("value", value.text);
    writeMetadata(sample.metadata());
    writer_.endElement();
}

void QVRecordsDocument::writeCorrelation(const VSCorrelation& correlation) {
    exact_.writeRelations(correlation);
    writeXMLCorrelationStartWithType(correlation);
    for (const VSSamplePtr& member : correlation.objects()) {
        exact_.writeMember(*member);
        writeXMLRecordWithType(*member, valueOf(*member));
    }
    writeXMLCorrelationEnd();
}

void QVRecordsDocument::writeXMLCorrelationStartWithType(const VSCorrelation& correlation) {
    startElement("Correlation", correlation);
    writer_.attribute("type", correlation.sampleType()->identifier());
    writeOrigin(correlation);
    writeDates(correlation);
    writeMetadata(correlation.metadata());
}

void QVRecordsDocument::writeWorkout(const VSWorkout& workout) {
    exact_.writeRelations(workout);
    writeXMLWorkoutStartWithActivityType(workout);
    for (const VSWorkoutEvent& event : workout.workoutEvents()) writeXMLWorkoutEventWithEventType(event);
    writeXMLWorkoutEnd();
}

void QVRecordsDocument::writeXMLWorkoutStartWithActivityType(const VSWorkout& workout) {
    const auto amount = [](const std::optional<VSQuantity>& total, const VSUnit& unit) {
        return total ? total->doubleValueForUnit(unit) : 0;
    };
    const std::string* activity = VSWorkoutActivityTypeIdentifier(workout.workoutActivityType());
    const VSUnit& distanceUnit =
        units_.preferredUnitForObjectType(VSObjectType::dataTypeWithCode(VSCode::DistanceWalkingRunning));
    const VSUnit& energyUnit =
        units_.preferredUnitForObjectType(VSObjectType::dataTypeWithCode(VSCode::ActiveEnergyBurned));

    if (!activity) exact_.writeValue("workoutActivityType", VSValue(workout.workoutActivityType()));
    writeExactDuration(workout.duration());
    writeExactTotal("totalDistance", workout.totalDistance(), distanceUnit, VSCode::DistanceWalkingRunning);
    writeExactTotal("totalEnergyBurned", workout.totalEnergyBurned(), energyUnit, VSCode::ActiveEnergyBurned);
    startElement("Workout", workout);
    if (activity) writer_.attribute("workoutActivityType", *activity);
    writeAmount("duration", "durationUnit", minutes(workout.duration()), VSUnit::minuteUnit().description());
    writeAmount("totalDistance", "totalDistanceUnit", amount(workout.totalDistance(), distanceUnit),
                distanceUnit.description());
    writeAmount("totalEnergyBurned", "totalEnergyBurnedUnit", amount(workout.totalEnergyBurned(), energyUnit),
                energyUnit.description());
    writeOrigin(workout);
    writeDates(workout);
    writeMetadata(workout.metadata());
}

void QVRecordsDocument::writeXMLWorkoutEventWithEventType(const VSWorkoutEvent& event) {
    if (event.type != 1 && event.type != 2) exact_.writeValue("type", VSValue(event.type));
    if (event.date) exact_.writeEventDate(*event.date);
    writer_.startElement("WorkoutEvent");
    if (event.type == 1) writer_.attribute("type", "VSWorkoutEventTypePause");
    if (event.type == 2) writer_.attribute("type", "VSWorkoutEventTypeResume");
    if (event.date) writer_.attribute("date", dates_.recordsString(*event.date));
    writer_.endElement();
}

// --- What the elements share ----------------------------------------------------------------------------

void QVRecordsDocument::startElement(const char* name, const VSSample& sample) {
    exact_.writeProvenance(sample, devices_.textOf(sample));
    writer_.startElement(name);
}

void QVRecordsDocument::writeOrigin(const VSSample& sample) {
    const VSSourceRevision& revision = sample.sourceRevision();
    writer_.attribute("sourceName", revision.source.name);
    if (!revision.version.empty()) writer_.attribute("sourceVersion", revision.version);
    const std::string& device = devices_.textOf(sample);
    if (!device.empty()) writer_.attribute("device", device);
}

void QVRecordsDocument::writeDates(const VSSample& sample) {
    if (sample.creationDate())
        writer_.attribute("creationDate", dates_.recordsString(*sample.creationDate()));
    writer_.attribute("startDate", dates_.recordsString(sample.startDate()));
    writer_.attribute("endDate", dates_.recordsString(sample.endDate()));
}

void QVRecordsDocument::writeAmount(const char* name, const char* unitName, double amount,
                                    const std::string& unit) {
    if (unit.empty()) return;
    writer_.attribute(name, QVExportDefaultNumberText(amount));
    writer_.attribute(unitName, unit);
}

void QVRecordsDocument::writeMetadata(const VSMetadata& metadata) {
    for (const auto& [key, value] : metadata) {
        const std::string text = value.description();
        exact_.writeText("key", key);
        if (!QVIsXMLText(text) || QVMetadataValueFromText(key, text) != value)
            exact_.writeValue("value", value);
        writer_.startElement("MetadataEntry");
        writer_.attribute("key", key);
        writer_.attribute("value", text);
        writer_.endElement();
    }
}

/// 0 is also what a workout without that total says.
void QVRecordsDocument::writeExactTotal(const char* name, const std::optional<VSQuantity>& total,
                                        const VSUnit& unit, VSTypeCode type) {
    if (!total) return;
    const VSUnit& canonical = VSObjectType::dataTypeWithCode(type)->canonicalUnit();
    const double exact = total->doubleValueForUnit(canonical);
    const std::string text = QVExportDefaultNumberText(total->doubleValueForUnit(unit));
    if (exact == 0 || !isReadAs(text, unit, exact, canonical)) exact_.writeValue(name, VSValue(exact));
}

void QVRecordsDocument::writeExactDuration(VSDuration duration) {
    const auto seconds = VSUnit::minuteUnit().convert(minutes(duration), VSUnit::secondUnit());
    if (VSDurationFromSeconds(*seconds) != duration)
        exact_.writeValue("duration", VSValue(int64_t{duration.count()}));
}
