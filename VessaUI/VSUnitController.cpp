#include "VessaUI/VSUnitController.h"

#include <algorithm>
#include <cmath>

#include "Platform/Localization.h"
#include "Platform/Queue.h"
#include "Platform/SystemEvents.h"
#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/Base/VSLog.h"
#include "VessaUI/VSDataUnitGroupCatalogue.h"
#include "VessaUI/VSUnitPreferences.h"

namespace {

/// The number whose plural form stands for "any other number": what a fraction and a bare name get.
constexpr int manyOfThem = 100;

/// The unit of the numbers of a type that is not a quantity.
VSUnit unitOfOtherKinds(const VSObjectType* type) {
    const bool lastsSomeTime = type == VSObjectType::workoutType() || type->code() == VSCode::SleepAnalysis ||
                               type->code() == VSCode::ZentroStandHour;
    return lastsSomeTime ? VSUnit::hourUnit() : VSUnit::countUnit();
}

double roundedToDigits(double value, int digits) {
    const double scale = std::pow(10.0, digits);
    return std::round(value * scale) / scale;
}

template <typename Function>
void forEachQuantityUnit(Function&& function) {
    for (const VSDataUnitGroup* group : VSDataUnitGroupController::shared().allDataUnitGroups())
        for (const VSDataUnit* unit : group->dataUnits())
            if (!unit->row().units.empty()) function(unit);
}

}  // namespace

VSUnitController::VSUnitController(std::shared_ptr<VSHealthStore> healthStore)
    : healthStore_(std::move(healthStore)) {
    connect(&platform::SystemEvents::shared(), &platform::SystemEvents::localeDidChange, this,
            &VSUnitController::localeDidChange);
    forEachQuantityUnit([this](const VSDataUnit* unit) {
        defaultsTold_.insert_or_assign(unit->dataType(), unitForDataUnit(unit));
    });
    observation_ =
        healthStore_->observeDefaultValues([this, alive = std::weak_ptr(alive_)](const std::string& key) {
            if (key != VSPreferredUnitsKey) return;
            platform::mainQueue().async([this, alive] {
                if (!alive.expired()) load();
            });
        });
    load();
}

// ---- The store ----

void VSUnitController::load() {
    healthStore_->getDefaultValue(VSPreferredUnitsKey, [this, alive = std::weak_ptr(alive_)](
                                                           const VSResult<std::optional<VSValue>>& result) {
        platform::mainQueue().async([this, alive, result] {
            if (!alive.expired()) wasRead(result, "reading");
        });
    });
}

void VSUnitController::wasRead(const VSResult<std::optional<VSValue>>& result, const char* what) {
    if (!result) {
        VSLog(VSLogLevel::Error,
              std::string("VSUnitController: Error ") + what + " preferred units: " + result.error().message);
        return;
    }
    const VSValue::Dictionary* dictionary = *result ? (*result)->dictionary() : nullptr;
    if (dictionary) adopt(*dictionary);
}

void VSUnitController::adopt(const VSValue::Dictionary& stored) {
    QSet<const VSObjectType*> changed;
    forEachQuantityUnit([&](const VSDataUnit* unit) {
        // What was chosen here and is not stored yet stands.
        if (unsaved_.contains(unit->dataType()->identifier())) return;
        const auto entry = stored.find(unit->dataType()->identifier());
        const std::string* text = entry == stored.end() ? nullptr : entry->second.string();
        if (!text) return;
        const VSResult<VSUnit> parsed = VSUnit::parse(*text);
        // An unknown unit is left alone in the store: another version may understand it.
        if (!parsed || !VSUnitChoiceForUnit(unit, parsed.value())) return;
        if (unitForDataUnit(unit) != parsed.value()) changed.insert(unit->dataType());
        preferred_.insert_or_assign(unit->dataType(), parsed.value());
    });
    if (!changed.isEmpty()) emit unitPreferencesDidChange(changed);
}

/// The dictionary holds the choices of all types, also those of other windows: only what was chosen here is
/// changed in it.
void VSUnitController::save() {
    healthStore_->updateDefaultValue(
        VSPreferredUnitsKey,
        [choices = unsaved_](const std::optional<VSValue>& current) {
            const VSValue::Dictionary* known = current ? current->dictionary() : nullptr;
            VSValue::Dictionary units = known ? *known : VSValue::Dictionary{};
            for (const auto& [identifier, unit] : choices) units.insert_or_assign(identifier, unit);
            return VSValue(std::move(units));
        },
        [this, choices = unsaved_,
         alive = std::weak_ptr(alive_)](const VSResult<std::optional<VSValue>>& result) {
            platform::mainQueue().async([this, alive, choices, result] {
                if (alive.expired()) return;
                if (result)
                    std::erase_if(unsaved_, [&](const auto& entry) {
                        const auto saved = choices.find(entry.first);
                        return saved != choices.end() && saved->second == entry.second;
                    });
                wasRead(result, "saving");
            });
        });
}

// ---- Units ----

VSUnit VSUnitController::unitForDataUnit(const VSDataUnit* dataUnit) const {
    if (dataUnit->row().units.empty()) return unitOfOtherKinds(dataUnit->dataType());
    const auto chosen = preferred_.find(dataUnit->dataType());
    if (chosen != preferred_.end()) return chosen->second;
    return VSRegionalUnit(dataUnit, VSEnvironment::current()->localeIdentifier());
}

std::vector<VSUnit> VSUnitController::availableUnits(const VSDataUnitGroup* group) const {
    std::vector<VSUnit> units;
    for (const VSUnitChoice& choice : group->anyDataUnit()->row().units)
        units.push_back(VSUnit::fromString(choice.unit));
    return units;
}

void VSUnitController::updatePreferredUnit(const VSUnit& unit, const VSDataUnit* dataUnit) {
    if (!VSUnitChoiceForUnit(dataUnit, unit)) {
        VSLog(VSLogLevel::Error, "VSUnitController: " + unit.unitString() + " is not a unit of " +
                                     dataUnit->dataType()->identifier());
        return;
    }
    const bool changes = unitForDataUnit(dataUnit) != unit;
    preferred_.insert_or_assign(dataUnit->dataType(), unit);
    unsaved_.insert_or_assign(dataUnit->dataType()->identifier(), VSValue(unit.unitString()));
    save();
    if (changes) emit unitPreferencesDidChange({dataUnit->dataType()});
}

void VSUnitController::localeDidChange() {
    const std::string locale = VSEnvironment::current()->localeIdentifier();
    QSet<const VSObjectType*> changed;
    forEachQuantityUnit([&](const VSDataUnit* unit) {
        const VSUnit regional = VSRegionalUnit(unit, locale);
        VSUnit& told = defaultsTold_.at(unit->dataType());
        if (told != regional && !preferred_.contains(unit->dataType())) changed.insert(unit->dataType());
        told = regional;
    });
    if (!changed.isEmpty()) emit unitPreferencesDidChange(changed);
}

// ---- Names ----

QString VSUnitController::nameOfUnit(const VSDataUnit* dataUnit, const VSUnit& unit,
                                     std::optional<double> value) const {
    if (dataUnit->row().units.empty()) return {};
    const VSUnitChoice* choice = VSUnitChoiceForUnit(dataUnit, unit);
    if (!choice) return QString::fromStdString(unit.unitString());
    if (!*choice->nameKey) return {};
    if (!choice->nameHasPlural) return platform::localized(choice->nameKey);
    if (!value) return platform::localizedPlural(choice->nameKey, manyOfThem);
    // The form of the number as it is written: 0.996 steps read "1 step".
    double shown = roundedToDigits(*value, choice->precision);
    // Less than a floor is written "<1 floor".
    if (shown == 0 && *value > 0) shown = std::pow(10, -choice->precision);
    const bool whole = shown == std::floor(shown) && std::abs(shown) < 1e9;
    return platform::localizedPlural(choice->nameKey, whole ? static_cast<int>(shown) : manyOfThem);
}

QString VSUnitController::displayNameForDataUnit(const VSDataUnit* dataUnit) const {
    return nameOfUnit(dataUnit, unitForDataUnit(dataUnit), std::nullopt);
}

QString VSUnitController::displayNameForDataUnit(const VSDataUnit* dataUnit, double value) const {
    return nameOfUnit(dataUnit, unitForDataUnit(dataUnit), value);
}

QString VSUnitController::displayNameForDataUnit(const VSDataUnit* dataUnit, const VSUnit& unit) const {
    return nameOfUnit(dataUnit, unit, std::nullopt);
}

QString VSUnitController::displayNameForDataUnitGroup(const VSDataUnitGroup* group) const {
    return displayNameForDataUnit(group->anyDataUnit());
}

// ---- Ranges ----

std::optional<VSValueRange> VSUnitController::rangeInPreferredUnit(const VSDataUnit* dataUnit,
                                                                   const VSValueRange& range) const {
    const VSDataUnitRow& row = dataUnit->row();
    if (row.units.empty()) return range;
    const VSUnit from = VSUnit::fromString(row.units.front().unit);
    const VSUnit to = unitForDataUnit(dataUnit);
    if (from == to) return range;
    // A bound is a number that people read: it has the digits of its unit.
    const int precision = dataUnit->dataUnitGroup()->chartingRules().allowedDecimalPrecisionForUnit(to);
    const auto converted = [&](const std::optional<double>& bound) -> std::optional<double> {
        if (!bound) return std::nullopt;
        const std::optional<double> value = from.convert(*bound, to);
        return value ? std::optional(roundedToDigits(*value, precision)) : std::nullopt;
    };
    return VSValueRange{converted(range.minimum), converted(range.maximum)};
}

std::optional<VSValueRange> VSUnitController::displayRangeForDataUnit(const VSDataUnit* dataUnit) const {
    const auto range = dataUnit->row().displayRange.range();
    return range ? rangeInPreferredUnit(dataUnit, *range) : std::nullopt;
}

std::optional<VSValueRange> VSUnitController::manualEntryAbsoluteRangeForDataUnit(
    const VSDataUnit* dataUnit) const {
    const auto range = dataUnit->row().absoluteRange.range();
    return range ? rangeInPreferredUnit(dataUnit, *range) : std::nullopt;
}

std::optional<VSValueRange> VSUnitController::manualEntryConfirmRangeForDataUnit(
    const VSDataUnit* dataUnit) const {
    const auto range = dataUnit->row().confirmRange.range();
    return range ? rangeInPreferredUnit(dataUnit, *range) : std::nullopt;
}
