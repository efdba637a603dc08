#include "VessaUI/VSUnitChoices.h"

// Display types of the category of results. IDs are kept on disk and never reused.

namespace {
using namespace VSUnitChoices;
constexpr double open = VSRowRange::open;
}  // namespace

std::span<const VSDataUnitGroupRow> VSResultsDisplayTypes() {
    static const VSDataUnitGroupRow rows[] = {
        // 2,656 mg/dL (147.6 mmol/L) was survived (M. P. Buonocore, 2008). Meters at home read 20 to 600;
        // below 40 and above 500 a person is as a rule too ill to type.
        {.id = 14,
         .category = VSCategoryID::Results,
         .nameKey = "DISPLAY_TYPE_BLOOD_GLUCOSE",
         .units = {{.type = "BloodGlucose",
                    .units = Glucose,
                    .displayRange = {0, 3000},
                    .absoluteRange = {2, 2700},
                    .confirmRange = {40, 500}}},
         .charting = &VSChartingProfiles::MinMax,
         .confirmUnitChange = true},

        // In per cent, grams in a decilitre. 0.4 kills half of those who reach it; 1.48 was measured in a
        // driver (Poland, 1995), who died of injuries.
        {.id = 15,
         .category = VSCategoryID::Results,
         .nameKey = "DISPLAY_TYPE_BLOOD_ALCOHOL_CONTENT",
         .units = {{.type = "BloodAlcoholContent",
                    .units = FinePercent,
                    .factor = 100,
                    .displayRange = {0, 100},
                    .absoluteRange = {0, 1.5},
                    .confirmRange = {0, 0.4}}},
         .charting = &VSChartingProfiles::Line},

        // Pulsing over still light at the finger: oximeters give 0.02 to 20 per cent.
        {.id = 16,
         .category = VSCategoryID::Results,
         .nameKey = "DISPLAY_TYPE_PERIPHERAL_PERFUSION_INDEX",
         .units = {{.type = "PeripheralPerfusionIndex",
                    .units = Percent,
                    .factor = 100,
                    .displayRange = {0, 100},
                    .absoluteRange = {0, 40},
                    .confirmRange = {0, 20}}},
         .charting = &VSChartingProfiles::Line},

        // The largest lungs measured held 11.7 litres (P. Reed, rower); a tall man of 20 is expected to
        // blow about 6.5 (Global Lung Function Initiative 2012), a child of five about 1.
        {.id = 62,
         .category = VSCategoryID::Results,
         .nameKey = "DISPLAY_TYPE_FORCED_VITAL_CAPACITY",
         .units = {{.type = "ForcedVitalCapacity",
                    .units = LungVolume,
                    .displayRange = {0, 20},
                    .absoluteRange = {0.1, 13},
                    .confirmRange = {0.8, 8}}},
         .charting = &VSChartingProfiles::Line},

        // Of that, 70 to 85 per cent come in the first second; in the most severe obstruction below half a
        // litre.
        {.id = 63,
         .category = VSCategoryID::Results,
         .nameKey = "DISPLAY_TYPE_FORCED_EXPIRATORY_VOLUME",
         .units = {{.type = "ForcedExpiratoryVolume1",
                    .units = LungVolume,
                    .displayRange = {0, 20},
                    .absoluteRange = {0.1, 12},
                    .confirmRange = {0.4, 7}}},
         .charting = &VSChartingProfiles::Line},

        // The scale of peak-flow meters runs from 60 to 880 litres a minute (EN ISO 23747); laboratories
        // have seen a little over 1,000.
        {.id = 64,
         .category = VSCategoryID::Results,
         .nameKey = "DISPLAY_TYPE_PEAK_EXPIRATORY_FLOW_RATE",
         .units = {{.type = "PeakExpiratoryFlowRate",
                    .units = AirFlow,
                    .displayRange = {0, 1500},
                    .absoluteRange = {10, 1200},
                    .confirmRange = {60, 880}}},
         .charting = &VSChartingProfiles::Line},

        // A canister holds 200 puffs; an attack is treated with ten at a time (Global Initiative for
        // Asthma).
        {.id = 61,
         .category = VSCategoryID::Results,
         .nameKey = "DISPLAY_TYPE_INHALER_USAGE",
         .units = {{.type = "InhalerUsage",
                    .units = Puffs,
                    .displayRange = {0, open},
                    .absoluteRange = {0, 200},
                    .confirmRange = {1, 20}}},
         .charting = &VSChartingProfiles::Bars},

        // People with drop attacks may fall some dozens of times a day.
        {.id = 60,
         .category = VSCategoryID::Results,
         .nameKey = "DISPLAY_TYPE_NUMBER_OF_TIMES_FALLEN",
         .units = {{.type = "NumberOfTimesFallen",
                    .units = Falls,
                    .displayRange = {0, open},
                    .absoluteRange = {0, 500},
                    .confirmRange = {0, 20}}},
         .charting = &VSChartingProfiles::Bars},

        // 43.3 was measured once, on Licancabur (Cabrol et al. 2014); inhabited highlands see 20 and more,
        // the rest of the world up to 16.
        {.id = VSGroupID::UVExposure,
         .category = VSCategoryID::Results,
         .nameKey = "DISPLAY_TYPE_UV_EXPOSURE",
         .units = {{.type = "UVExposure",
                    .units = BareNumber,
                    .displayRange = {0, 50},
                    .absoluteRange = {0, 45},
                    .confirmRange = {0, 16}}},
         .charting = &VSChartingProfiles::MinMax},
    };
    return rows;
}
