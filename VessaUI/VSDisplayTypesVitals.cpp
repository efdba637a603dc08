#include "VessaUI/VSUnitChoices.h"

// Display types of the category of vitals. IDs are kept on disk and never reused.

namespace {
using namespace VSUnitChoices;
}  // namespace

std::span<const VSDataUnitGroupRow> VSVitalsDisplayTypes() {
    static const VSDataUnitGroupRow rows[] = {
        // The fastest pulse measured was 480 (Chhabra et al. 2012), the slowest at rest 26 to 28 in
        // endurance athletes; people cooled to 14 degrees had a few. The oldest rule of thumb for the
        // greatest effort is 220 less age.
        {.id = VSGroupID::HeartRate,
         .category = VSCategoryID::Vitals,
         .nameKey = "DISPLAY_TYPE_HEART_RATE",
         .units = {{.type = "HeartRate",
                    .units = HeartRate,
                    .displayRange = {0, 500},
                    .absoluteRange = {5, 490},
                    .confirmRange = {30, 220}}},
         .charting = &VSChartingProfiles::MinMax},

        // 480/350 was measured inside an artery under the heaviest lift (MacDougall et al. 1985). A crisis
        // begins at 180/120 (ACC/AHA 2017), shock below about 90 systolic; a cuff cannot read below 40.
        {.id = VSGroupID::BloodPressure,
         .category = VSCategoryID::Vitals,
         .nameKey = "DISPLAY_TYPE_BLOOD_PRESSURE",
         .units = {{.type = "BloodPressureSystolic",
                    .labelKey = "DISPLAY_TYPE_BLOOD_PRESSURE_SYSTOLIC",
                    .units = Pressure,
                    .displayRange = {0, 500},
                    .absoluteRange = {20, 490},
                    .confirmRange = {70, 220}},
                   {.type = "BloodPressureDiastolic",
                    .labelKey = "DISPLAY_TYPE_BLOOD_PRESSURE_DIASTOLIC",
                    .units = Pressure,
                    .displayRange = {0, 400},
                    .absoluteRange = {10, 360},
                    .confirmRange = {40, 130}}},
         .charting = &VSChartingProfiles::MinMax,
         .joinKey = "DISPLAY_TYPE_BLOOD_PRESSURE_JOIN"},

        // 12 to 20 at rest in adults and 30 to 60 in the newborn; above 100 only in very ill infants.
        {.id = 56,
         .category = VSCategoryID::Vitals,
         .nameKey = "DISPLAY_TYPE_RESPIRATORY_RATE",
         .units = {{.type = "RespiratoryRate",
                    .units = Breaths,
                    .displayRange = {0, 200},
                    .absoluteRange = {1, 150},
                    .confirmRange = {6, 60}}},
         .charting = &VSChartingProfiles::MinMax},

        // A child lived through 11.8 degrees (Poland, 2014) and a man through 46.5 (W. Jones, Atlanta,
        // 1980). Below 34 is moderate cold injury, above 42 proteins break.
        {.id = 57,
         .category = VSCategoryID::Vitals,
         .nameKey = "DISPLAY_TYPE_BODY_TEMPERATURE",
         .units = {{.type = "BodyTemperature",
                    .units = Temperature,
                    .displayRange = {0, 60},
                    .absoluteRange = {10, 47},
                    .confirmRange = {34, 42}}},
         .charting = &VSChartingProfiles::Line},

        // A share, so 0 to 100. Pulse oximeters are calibrated down to 70.
        {.id = 12,
         .category = VSCategoryID::Vitals,
         .nameKey = "DISPLAY_TYPE_OXYGEN_SATURATION",
         .units = {{.type = "OxygenSaturation",
                    .units = WholePercent,
                    .factor = 100,
                    .displayRange = {0, 100},
                    .absoluteRange = {1, 100},
                    .confirmRange = {70, 100}}},
         .charting = &VSChartingProfiles::MinMax},
    };
    return rows;
}
