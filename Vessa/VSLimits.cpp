#include "Vessa/VSLimits.h"

#include <unicode/utf8.h>

#include <chrono>
#include <cmath>

#include "Vessa/VSMedicalID.h"
#include "Vessa/VSObject.h"

namespace {

using Objection = std::optional<VSError>;

VSError invalid(const std::string& why) {
    return VSError{VSErrorCode::Invalid, why};
}

bool isUTF8(std::string_view text) {
    const auto length = static_cast<int32_t>(text.size());
    for (int32_t i = 0; i < length;) {
        UChar32 c = 0;
        U8_NEXT(text.data(), i, length, c);
        if (c < 0) return false;
    }
    return true;
}

Objection objectionToText(std::string_view text, const char* what) {
    if (text.size() > VSLimits::longestText)
        return invalid(std::string(what) + " is longer than 64 KiB (" + std::to_string(text.size()) +
                       " bytes)");
    if (!isUTF8(text)) return invalid(std::string(what) + " is no UTF-8 text");
    return std::nullopt;
}

bool isSound(const VSValue& value, int depth) {
    if (depth > VSLimits::deepestMetadata) return false;
    if (const auto* text = value.string()) return isUTF8(*text);
    if (const auto* array = value.array()) {
        for (const VSValue& element : *array) {
            if (!isSound(element, depth + 1)) return false;
        }
    }
    if (const auto* dictionary = value.dictionary()) {
        for (const auto& [key, element] : *dictionary) {
            if (!isUTF8(key) || !isSound(element, depth + 1)) return false;
        }
    }
    return true;
}

Objection objectionToDictionary(const VSValue::Dictionary& dictionary, const char* what) {
    for (const auto& [key, value] : dictionary) {
        if (!isUTF8(key) || !isSound(value, 1))
            return invalid(std::string(what) + " hold a text that is not UTF-8 or values nested more than " +
                           std::to_string(VSLimits::deepestMetadata) + " deep");
    }
    if (const size_t size = VSValue(dictionary).serialized().size(); size > VSLimits::longestMetadata)
        return invalid(std::string(what) + " are longer than 1 MiB (" + std::to_string(size) + " bytes)");
    return std::nullopt;
}

Objection objectionToRevision(const VSSourceRevision& revision) {
    for (const auto& [text, what] : {std::pair(&revision.source.name, "the source's name"),
                                     std::pair(&revision.source.bundleIdentifier, "the source's identifier"),
                                     std::pair(&revision.version, "the source's version")}) {
        if (auto objection = objectionToText(*text, what)) return objection;
    }
    return std::nullopt;
}

Objection objectionToDevice(const VSDevice& device) {
    for (const auto* field :
         {&device.name, &device.manufacturer, &device.model, &device.hardwareVersion, &device.firmwareVersion,
          &device.softwareVersion, &device.localIdentifier, &device.udiDeviceIdentifier}) {
        if (!*field) continue;
        if (auto objection = objectionToText(**field, "a field of the device")) return objection;
    }
    return std::nullopt;
}

/// Objects share their provenances, so each part is looked at once. The parts are held so that an address
/// cannot come to mean something else.
Objection objectionToProvenance(const VSProvenance& provenance) {
    struct Sound {
        std::shared_ptr<const VSSourceRevision> revision;
        std::shared_ptr<const VSDevice> device;
        std::shared_ptr<const VSMetadata> metadata;
    };
    thread_local Sound sound;
    const auto check = [](const auto& part, auto& known, const auto& objectionTo) -> Objection {
        if (!part || part == known) return std::nullopt;
        if (auto objection = objectionTo(*part)) return objection;
        known = part;
        return std::nullopt;
    };
    if (auto objection = check(provenance.sourceRevision, sound.revision, objectionToRevision))
        return objection;
    if (auto objection = check(provenance.device, sound.device, objectionToDevice)) return objection;
    return check(provenance.metadata, sound.metadata,
                 [](const VSMetadata& metadata) { return objectionToDictionary(metadata, "its metadata"); });
}

Objection objectionToTotal(const std::optional<VSQuantity>& total, const VSUnit& unit, const char* what) {
    if (!total) return std::nullopt;
    const bool fits = total->isCompatibleWith(unit) &&
                      std::fabs(total->doubleValueForUnit(unit)) < VSLimits::absurdValue;  // not of a NaN
    return fits ? std::nullopt : Objection(invalid(what));
}

Objection objectionToWorkout(const VSWorkout& workout) {
    static const VSUnit metre = VSUnit::fromString("m");
    if (auto objection = objectionToTotal(workout.totalEnergyBurned(), VSUnit::kilocalorieUnit(),
                                          "a workout's energy is no amount of energy"))
        return objection;
    if (auto objection =
            objectionToTotal(workout.totalDistance(), metre, "a workout's distance is no length"))
        return objection;
    if (workout.duration() < VSDuration(0)) return invalid("a workout's duration is negative");
    if (workout.duration() > VSLimits::latestDate - VSLimits::earliestDate)
        return invalid("a workout's duration is longer than 9999 years");
    for (const VSWorkoutEvent& event : workout.workoutEvents()) {
        if (event.date && !VSLimits::isDate(*event.date))
            return invalid("an event of a workout lies outside of the years 1 to 9999");
    }
    return std::nullopt;
}

Objection objectionToQuantity(const VSSample& sample) {
    const VSUnit& canonical = sample.sampleType()->canonicalUnit();
    const auto* object = dynamic_cast<const VSQuantitySample*>(&sample);
    if (!object) return invalid("needs a quantity sample");
    const VSUnit& unit = object->quantity().unit();
    if (!unit.isCompatibleWith(canonical))
        return invalid("the unit " + unit.unitString() + " does not convert to " + canonical.unitString());
    const double value =
        unit == canonical ? object->quantity().value() : object->quantity().doubleValueForUnit(canonical);
    if (!std::isfinite(value)) return invalid("the value is not a finite number");
    if (std::fabs(value) >= VSLimits::absurdValue) return invalid("the value is absurdly large");
    return std::nullopt;
}

/// What the values and the kind of object say against it.
Objection objectionToContent(const VSSample& sample) {
    const VSObjectType& type = *sample.sampleType();
    if (type.isQuantityType()) return objectionToQuantity(sample);
    if (type.isCategoryType()) {
        const auto* object = dynamic_cast<const VSCategorySample*>(&sample);
        if (!object) return invalid("needs a category sample");
        if (!type.enumeratedValues().empty() && !type.identifierForValue(object->value()))
            return invalid("has no value " + std::to_string(object->value()));
        return std::nullopt;
    }
    if (type.kind() == VSTypeKind::Workout) {
        const auto* object = dynamic_cast<const VSWorkout*>(&sample);
        return object ? objectionToWorkout(*object) : invalid("needs a workout");
    }
    const auto* object = dynamic_cast<const VSCorrelation*>(&sample);
    if (!object) return invalid("needs a correlation");
    if (object->objects().empty()) return invalid("has no members");
    for (const VSSamplePtr& member : object->objects()) {
        if (!member->sampleType()->isQuantityType() && !member->sampleType()->isCategoryType())
            return invalid("a member is neither a quantity nor a category sample");
        if (auto objection = VSObjectionToSample(*member)) return objection;
    }
    return std::nullopt;
}

Objection objectionToTimes(const VSSample& sample) {
    if (sample.startDate() > sample.endDate()) return invalid("ends before it starts");
    if (!VSLimits::isDate(sample.startDate()) || !VSLimits::isDate(sample.endDate()))
        return invalid("lies outside of the years 1 to 9999");
    if (sample.creationDate() && !VSLimits::isDate(*sample.creationDate()))
        return invalid("its creation date lies outside of the years 1 to 9999");
    if (std::abs(int64_t{sample.timeZoneOffset().value_or(0)}) > VSLimits::greatestTimeZoneOffset)
        return invalid("its time-zone offset is greater than 18 hours");
    return std::nullopt;
}

}  // namespace

std::optional<VSError> VSObjectionToSample(const VSSample& sample) {
    const VSObjectType* type = sample.sampleType();
    if (!type || !type->isSampleType()) return invalid("an object has no type of which samples are kept");
    Objection objection = objectionToTimes(sample);
    if (!objection) objection = objectionToProvenance(sample.provenance());
    if (!objection) objection = objectionToContent(sample);
    if (objection) objection->message = type->identifier() + ": " + objection->message;
    return objection;
}

std::optional<VSError> VSObjectionToBirthDate(const VSBirthDate& date) {
    const bool fits = date.year >= 1 && date.year <= 9999 && date.month >= 1 && date.day >= 1;
    const std::chrono::year_month_day day{std::chrono::year(date.year),
                                          std::chrono::month(static_cast<unsigned>(date.month)),
                                          std::chrono::day(static_cast<unsigned>(date.day))};
    return fits && day.ok() ? std::nullopt : Objection(invalid("the birth date is no day"));
}

std::optional<VSError> VSObjectionToMedicalID(const VSMedicalIDData& data) {
    if (data.birthdate) {
        if (auto objection = VSObjectionToBirthDate(*data.birthdate)) return objection;
    }
    if (data.pictureData && data.pictureData->size() > VSLimits::largestPicture)
        return invalid("the picture of the Medical ID is larger than 16 MiB");
    return objectionToDictionary(VSMedicalIDContent(data), "the fields of the Medical ID");
}
