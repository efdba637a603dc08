#pragma once

#include "VessaUI/VSDataUnitGroupCatalogue.h"

// The lists of units that display types share. The number beside a unit is the fraction digits that its
// scales, meters and labels show.
namespace VSUnitChoices {

inline constexpr VSUnitChoice BodyMass[] = {
    {.unit = "kg", .precision = 1, .nameKey = "UNIT_NAME_KG"},
    {.unit = "lb", .precision = 1, .nameKey = "UNIT_NAME_LB", .defaultWhere = VSUnitCustom::Pounds},
    {.unit = "st", .precision = 2, .nameKey = "UNIT_NAME_ST"},
};
inline constexpr VSUnitChoice Height[] = {
    {.unit = "cm", .precision = 1, .nameKey = "UNIT_NAME_CM"},
    {.unit = "ft", .precision = 2, .nameKey = "UNIT_NAME_FT", .defaultWhere = VSUnitCustom::FeetAndInches},
    {.unit = "m", .precision = 2, .nameKey = "UNIT_NAME_M"},
};
inline constexpr VSUnitChoice Girth[] = {
    {.unit = "cm", .precision = 1, .nameKey = "UNIT_NAME_CM"},
    {.unit = "in", .precision = 1, .nameKey = "UNIT_NAME_IN", .defaultWhere = VSUnitCustom::FeetAndInches},
};
inline constexpr VSUnitChoice Distance[] = {
    {.unit = "km", .precision = 2, .nameKey = "UNIT_NAME_KM"},
    {.unit = "mi", .precision = 2, .nameKey = "UNIT_NAME_MI", .defaultWhere = VSUnitCustom::Miles},
    {.unit = "m", .precision = 0, .nameKey = "UNIT_NAME_M"},
};
inline constexpr VSUnitChoice Energy[] = {
    {.unit = "kcal", .precision = 0, .nameKey = "UNIT_NAME_KCAL"},
    {.unit = "kJ", .precision = 0, .nameKey = "UNIT_NAME_KJ", .defaultWhere = VSUnitCustom::Kilojoules},
};
inline constexpr VSUnitChoice Temperature[] = {
    {.unit = "degC", .precision = 1, .nameKey = "UNIT_NAME_DEGC"},
    {.unit = "degF", .precision = 1, .nameKey = "UNIT_NAME_DEGF", .defaultWhere = VSUnitCustom::Fahrenheit},
};
/// Ovulation moves the basal temperature by 0.2 to 0.5 degrees Celsius; its thermometers show hundredths.
inline constexpr VSUnitChoice BasalTemperature[] = {
    {.unit = "degC", .precision = 2, .nameKey = "UNIT_NAME_DEGC"},
    {.unit = "degF", .precision = 2, .nameKey = "UNIT_NAME_DEGF", .defaultWhere = VSUnitCustom::Fahrenheit},
};
inline constexpr VSUnitChoice Glucose[] = {
    {.unit = "mg/dL", .precision = 0, .nameKey = "UNIT_NAME_MG_PER_DL"},
    {.unit = "mmol<180.1558>/L",
     .precision = 1,
     .nameKey = "UNIT_NAME_MMOL_PER_L",
     .defaultWhere = VSUnitCustom::MillimolarGlucose},
};
inline constexpr VSUnitChoice Drink[] = {
    {.unit = "mL", .precision = 0, .nameKey = "UNIT_NAME_ML"},
    {.unit = "L", .precision = 2, .nameKey = "UNIT_NAME_L"},
    {.unit = "fl_oz_us",
     .precision = 1,
     .nameKey = "UNIT_NAME_FL_OZ_US",
     .defaultWhere = VSUnitCustom::USFluidOunces},
    {.unit = "cup_us", .precision = 2, .nameKey = "UNIT_NAME_CUP_US", .nameHasPlural = true},
    {.unit = "fl_oz_imp", .precision = 1, .nameKey = "UNIT_NAME_FL_OZ_IMP"},
};
inline constexpr VSUnitChoice LungVolume[] = {{.unit = "L", .precision = 2, .nameKey = "UNIT_NAME_L"}};
inline constexpr VSUnitChoice AirFlow[] = {
    {.unit = "L/min", .precision = 0, .nameKey = "UNIT_NAME_L_PER_MIN"}};
inline constexpr VSUnitChoice Pressure[] = {{.unit = "mmHg", .precision = 0, .nameKey = "UNIT_NAME_MMHG"}};
inline constexpr VSUnitChoice HeartRate[] = {
    {.unit = "count/min", .precision = 0, .nameKey = "UNIT_NAME_BPM"}};
inline constexpr VSUnitChoice Breaths[] = {
    {.unit = "count/min", .precision = 0, .nameKey = "UNIT_NAME_BREATHS_PER_MIN"}};
inline constexpr VSUnitChoice WholePercent[] = {
    {.unit = "%", .precision = 0, .nameKey = "UNIT_NAME_PERCENT"}};
inline constexpr VSUnitChoice Percent[] = {{.unit = "%", .precision = 1, .nameKey = "UNIT_NAME_PERCENT"}};
inline constexpr VSUnitChoice FinePercent[] = {{.unit = "%", .precision = 3, .nameKey = "UNIT_NAME_PERCENT"}};

inline constexpr VSUnitChoice Steps[] = {
    {.unit = "count", .precision = 0, .nameKey = "UNIT_NAME_STEPS", .nameHasPlural = true}};
inline constexpr VSUnitChoice Floors[] = {
    {.unit = "count", .precision = 0, .nameKey = "UNIT_NAME_FLOORS", .nameHasPlural = true}};
inline constexpr VSUnitChoice Falls[] = {
    {.unit = "count", .precision = 0, .nameKey = "UNIT_NAME_FALLS", .nameHasPlural = true}};
inline constexpr VSUnitChoice Puffs[] = {
    {.unit = "count", .precision = 0, .nameKey = "UNIT_NAME_PUFFS", .nameHasPlural = true}};
inline constexpr VSUnitChoice BodyMassIndex[] = {
    {.unit = "count", .precision = 1, .nameKey = "UNIT_NAME_BMI"}};
inline constexpr VSUnitChoice BareNumber[] = {{.unit = "count", .precision = 0}};

inline constexpr VSUnitChoice Grams[] = {{.unit = "g", .precision = 1, .nameKey = "UNIT_NAME_G"}};
inline constexpr VSUnitChoice Milligrams[] = {{.unit = "mg", .precision = 0, .nameKey = "UNIT_NAME_MG"}};
/// For nutrients of which a day needs a few milligrams.
inline constexpr VSUnitChoice FineMilligrams[] = {{.unit = "mg", .precision = 2, .nameKey = "UNIT_NAME_MG"}};
inline constexpr VSUnitChoice Micrograms[] = {{.unit = "mcg", .precision = 1, .nameKey = "UNIT_NAME_MCG"}};

}  // namespace VSUnitChoices
