#include "VessaUI/VSDataUnitGroupCatalogue.h"

const VSDataUnitGroupCatalogue& VSDataUnitGroupCatalogue::shared() {
    // Never destroyed: display types are compared by address until the last thread has ended.
    static const auto* catalogue = new VSDataUnitGroupCatalogue;
    return *catalogue;
}

VSDataUnitGroupCatalogue::VSDataUnitGroupCatalogue() {
    for (const auto& rows : {VSFitnessDisplayTypes(), VSVitalsDisplayTypes(), VSBodyMeasurementDisplayTypes(),
                             VSResultsDisplayTypes(), VSSleepDisplayTypes(), VSNutritionDisplayTypes(),
                             VSReproductiveHealthDisplayTypes(), VSMeDisplayTypes()})
        for (const VSDataUnitGroupRow& row : rows) add(row);
}

VSDataUnitGroupCatalogue::~VSDataUnitGroupCatalogue() = default;

void VSDataUnitGroupCatalogue::add(const VSDataUnitGroupRow& row) {
    std::unique_ptr<VSDataUnitGroup> group(new VSDataUnitGroup);
    group->row_ = &row;
    for (const VSDataUnitRow& unitRow : row.units) {
        auto unit = makeUnit(unitRow, group.get());
        if (!unit) continue;
        byType.emplace(unit->dataType(), group.get());
        group->units_.push_back(unit.get());
        ownedUnits_.push_back(std::move(unit));
    }
    // Without a type of the service there is nothing to show; the tests see to it that this never happens.
    if (group->units_.empty()) return;
    group->rules_ = makeRules(row);
    groups.push_back(group.get());
    byID.emplace(row.id, group.get());
    ownedGroups_.push_back(std::move(group));
    // The readings of a display type with several units are kept in a correlation, which it shows as well.
    if (row.id == VSGroupID::BloodPressure)
        byType.emplace(VSObjectType::dataTypeWithCode(VSCode::BloodPressure), groups.back());
}

std::unique_ptr<VSDataUnit> VSDataUnitGroupCatalogue::makeUnit(const VSDataUnitRow& row,
                                                               const VSDataUnitGroup* group) const {
    const VSObjectType* type = VSObjectType::typeForIdentifier(row.type);
    if (!type) return nullptr;
    std::unique_ptr<VSDataUnit> unit(new VSDataUnit);
    unit->dataType_ = type;
    unit->group_ = group;
    unit->row_ = &row;
    unit->factor_ = row.factor;
    return unit;
}

std::unique_ptr<const VSDataUnitGroupChartingRules> VSDataUnitGroupCatalogue::makeRules(
    const VSDataUnitGroupRow& row) {
    auto rules = std::make_unique<VSDataUnitGroupChartingRules>();
    const VSChartingProfile& profile = *row.charting;
    rules->intervals_ = profile.intervals;
    rules->styles_ = profile.styles;
    rules->defaultStyle_ = profile.style;
    rules->pointRadius_ = profile.pointRadius;
    rules->pointLineWidth_ = profile.pointLineWidth;
    rules->startDayAtNoon_ = profile.startDayAtNoon;
    rules->hideAverageLine_ = profile.hideAverageLine;
    for (const VSDataUnitRow& unitRow : row.units) {
        if (unitRow.factor == 100) rules->ceiling_ = 100;
        for (const VSUnitChoice& choice : unitRow.units)
            rules->precisions_.emplace_back(VSUnit::fromString(choice.unit), choice.precision);
    }
    return rules;
}
