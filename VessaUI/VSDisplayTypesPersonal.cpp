#include "VessaUI/VSUnitChoices.h"

// Display types of sleep, of reproductive health and of the person. IDs are kept on disk and never reused.

namespace {
using namespace VSUnitChoices;
constexpr double open = VSRowRange::open;

constexpr int asleep = 1;  // of the values of sleep analysis
}  // namespace

std::span<const VSDataUnitGroupRow> VSSleepDisplayTypes() {
    static const VSDataUnitGroupRow rows[] = {
        // Time in bed is recorded too; what is drawn and counted is time asleep.
        {.id = VSGroupID::SleepAnalysis,
         .category = VSCategoryID::Sleep,
         .nameKey = "DISPLAY_TYPE_SLEEP_ANALYSIS",
         .units = {{.type = "SleepAnalysis",
                    .displayRange = {0, open},
                    .chartedValue = {asleep, asleep, asleep, asleep, asleep}}},
         .charting = &VSChartingProfiles::NoonPeriods},
    };
    return rows;
}

std::span<const VSDataUnitGroupRow> VSReproductiveHealthDisplayTypes() {
    static const VSDataUnitGroupRow rows[] = {
        // The limits of body temperature; at rest after sleep a healthy one lies between 35.5 and 37.5.
        {.id = VSGroupID::BasalBodyTemperature,
         .category = VSCategoryID::ReproductiveHealth,
         .nameKey = "DISPLAY_TYPE_BASAL_BODY_TEMPERATURE",
         .units = {{.type = "BasalBodyTemperature",
                    .units = BasalTemperature,
                    .displayRange = {0, 60},
                    .absoluteRange = {10, 47},
                    .confirmRange = {35, 39}}},
         .charting = &VSChartingProfiles::BasalTemperature},
        {.id = VSGroupID::CervicalMucusQuality,
         .category = VSCategoryID::ReproductiveHealth,
         .nameKey = "DISPLAY_TYPE_CERVICAL_MUCUS_QUALITY",
         .units = {{.type = "CervicalMucusQuality"}},
         .charting = &VSChartingProfiles::Presence},
        {.id = VSGroupID::MenstrualFlow,
         .category = VSCategoryID::ReproductiveHealth,
         .nameKey = "DISPLAY_TYPE_MENSTRUAL_FLOW",
         .units = {{.type = "MenstrualFlow"}},
         .charting = &VSChartingProfiles::Presence},
        {.id = VSGroupID::OvulationTestResult,
         .category = VSCategoryID::ReproductiveHealth,
         .nameKey = "DISPLAY_TYPE_OVULATION_TEST_RESULT",
         .units = {{.type = "OvulationTestResult"}},
         .charting = &VSChartingProfiles::Presence},
        {.id = VSGroupID::SexualActivity,
         .category = VSCategoryID::ReproductiveHealth,
         .nameKey = "DISPLAY_TYPE_SEXUAL_ACTIVITY",
         .units = {{.type = "SexualActivity"}},
         .charting = &VSChartingProfiles::Counts},
        {.id = VSGroupID::Spotting,
         .category = VSCategoryID::ReproductiveHealth,
         .nameKey = "DISPLAY_TYPE_SPOTTING",
         .units = {{.type = "IntermenstrualBleeding"}},
         .charting = &VSChartingProfiles::Presence},
    };
    return rows;
}

std::span<const VSDataUnitGroupRow> VSMeDisplayTypes() {
    // Set on the page of the person, never as data points.
    static const VSDataUnitGroupRow rows[] = {
        {.id = 66,
         .category = VSCategoryID::Me,
         .nameKey = "DISPLAY_TYPE_DATE_OF_BIRTH",
         .units = {{.type = "DateOfBirth"}},
         .charting = &VSChartingProfiles::NotCharted,
         .manualEntry = false},
        {.id = 67,
         .category = VSCategoryID::Me,
         .nameKey = "DISPLAY_TYPE_BIOLOGICAL_SEX",
         .units = {{.type = "BiologicalSex"}},
         .charting = &VSChartingProfiles::NotCharted,
         .manualEntry = false},
        {.id = 68,
         .category = VSCategoryID::Me,
         .nameKey = "DISPLAY_TYPE_BLOOD_TYPE",
         .units = {{.type = "BloodType"}},
         .charting = &VSChartingProfiles::NotCharted,
         .manualEntry = false},
        {.id = 69,
         .category = VSCategoryID::Me,
         .nameKey = "DISPLAY_TYPE_SKIN_TYPE",
         .units = {{.type = "FitzpatrickSkinType"}},
         .charting = &VSChartingProfiles::NotCharted,
         .manualEntry = false},
    };
    return rows;
}
