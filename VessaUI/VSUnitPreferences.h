#pragma once

#include <map>
#include <string>

#include "Vessa/Base/VSValue.h"
#include "VessaUI/VSDataUnitGroup.h"

struct VSUnitChoice;

// Which unit a person sees values in. Pure functions; any thread.

/// The key of the default value that holds what a person chose: a dictionary from type identifier to unit
/// string.
inline constexpr const char* VSPreferredUnitsKey = "VSPreferredUnits";

/// Null: the unit is none of those to choose from.
const VSUnitChoice* VSUnitChoiceForUnit(const VSDataUnit* dataUnit, const VSUnit& unit);
/// What is customary in a locale's region. REQUIRES: a data unit of a quantity.
VSUnit VSRegionalUnit(const VSDataUnit* dataUnit, const std::string& locale);
/// The chosen unit, else the regional one. REQUIRES: a data unit of a quantity.
VSUnit VSPreferredUnit(const VSDataUnit* dataUnit, const VSValue::Dictionary& chosen,
                       const std::string& locale);
/// The unit in which each quantity type is shown: that of its display type.
std::map<const VSObjectType*, VSUnit> VSPreferredUnits(const VSValue::Dictionary& chosen,
                                                       const std::string& locale);
