#include "VessaUI/VSUnitPreferences.h"

#include "VessaUI/VSDataUnitGroupCatalogue.h"
#include "VessaUI/VSRegion.h"

const VSUnitChoice* VSUnitChoiceForUnit(const VSDataUnit* dataUnit, const VSUnit& unit) {
    for (const VSUnitChoice& choice : dataUnit->row().units)
        if (VSUnit::fromString(choice.unit) == unit) return &choice;
    return nullptr;
}

VSUnit VSRegionalUnit(const VSDataUnit* dataUnit, const std::string& locale) {
    const auto& choices = dataUnit->row().units;
    for (const VSUnitChoice& choice : choices)
        if (VSRegionHasUnitCustom(locale, choice.defaultWhere)) return VSUnit::fromString(choice.unit);
    return VSUnit::fromString(choices.front().unit);
}

VSUnit VSPreferredUnit(const VSDataUnit* dataUnit, const VSValue::Dictionary& chosen,
                       const std::string& locale) {
    const auto entry = chosen.find(dataUnit->dataType()->identifier());
    const std::string* text = entry == chosen.end() ? nullptr : entry->second.string();
    if (text) {
        const VSResult<VSUnit> unit = VSUnit::parse(*text);
        if (unit && VSUnitChoiceForUnit(dataUnit, *unit)) return *unit;
    }
    return VSRegionalUnit(dataUnit, locale);
}

std::map<const VSObjectType*, VSUnit> VSPreferredUnits(const VSValue::Dictionary& chosen,
                                                       const std::string& locale) {
    std::map<const VSObjectType*, VSUnit> units;
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        const auto* group =
            type->isQuantityType() ? VSDataUnitGroupController::shared().dataUnitGroupForType(type) : nullptr;
        if (group && !group->anyDataUnit()->row().units.empty())
            units.emplace(type, VSPreferredUnit(group->anyDataUnit(), chosen, locale));
    }
    return units;
}
