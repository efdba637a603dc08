#include "VessaUI/VSUnitChoices.h"

// Display types of the category of body measurements. IDs are kept on disk and never reused.

namespace {
using namespace VSUnitChoices;
}  // namespace

std::span<const VSDataUnitGroupRow> VSBodyMeasurementDisplayTypes() {
    static const VSDataUnitGroupRow rows[] = {
        // The heaviest person measured stood at 186; adult men who starved died at about 13, women at 11
        // (C. J. K. Henry, "Body mass index and the limits of human survival", 1990).
        {.id = 1,
         .category = VSCategoryID::BodyMeasurements,
         .nameKey = "DISPLAY_TYPE_BODY_MASS_INDEX",
         .units = {{.type = "BodyMassIndex",
                    .units = BodyMassIndex,
                    .displayRange = {0, 300},
                    .absoluteRange = {4, 250},
                    .confirmRange = {11, 60}}},
         .charting = &VSChartingProfiles::Line},

        // Essential fat is about 3 % in men and 12 % in women; above 60 % is seen in the rarest obesity
        // only (American Council on Exercise, body composition table).
        {.id = 2,
         .category = VSCategoryID::BodyMeasurements,
         .nameKey = "DISPLAY_TYPE_BODY_FAT_PERCENTAGE",
         .units = {{.type = "BodyFatPercentage",
                    .units = Percent,
                    .factor = 100,
                    .displayRange = {0, 100},
                    .absoluteRange = {1, 95},
                    .confirmRange = {3, 60}}},
         .charting = &VSChartingProfiles::Line},

        // Robert Wadlow stood 272 cm tall and Chandra Dangi 54.6 cm; the smallest babies that lived
        // measured some 25 cm, the usual ones 45 to 55 cm.
        {.id = VSGroupID::Height,
         .category = VSCategoryID::BodyMeasurements,
         .nameKey = "DISPLAY_TYPE_HEIGHT",
         .units = {{.type = "Height",
                    .units = Height,
                    .displayRange = {0, 300},
                    .absoluteRange = {20, 290},
                    .confirmRange = {45, 230}}},
         .charting = &VSChartingProfiles::Line},

        // Jon Brower Minnoch weighed about 635 kg; a girl born with 212 g lived (Singapore, 2020).
        // Confirmed is what only infants and a few hundred adults weigh.
        {.id = 4,
         .category = VSCategoryID::BodyMeasurements,
         .nameKey = "DISPLAY_TYPE_BODY_MASS",
         .units = {{.type = "BodyMass",
                    .units = BodyMass,
                    .displayRange = {0, 1000},
                    .absoluteRange = {0.2, 700},
                    .confirmRange = {10, 300}}},
         .charting = &VSChartingProfiles::Line},

        // Weight without fat: 121 kg was the most among sumo wrestlers (Kondo et al., "Upper limit of
        // fat-free mass in humans", 1994); the very heaviest people carry more.
        {.id = 5,
         .category = VSCategoryID::BodyMeasurements,
         .nameKey = "DISPLAY_TYPE_LEAN_BODY_MASS",
         .units = {{.type = "LeanBodyMass",
                    .units = BodyMass,
                    .displayRange = {0, 1000},
                    .absoluteRange = {0.2, 400},
                    .confirmRange = {8, 150}}},
         .charting = &VSChartingProfiles::Line},

        // Walter Hudson measured 302 cm. Beyond 102 cm in men and 88 cm in women the risk of disease is
        // high (WHO 2008); a child of one year has about 45 cm.
        {.id = 65,
         .category = VSCategoryID::BodyMeasurements,
         .nameKey = "DISPLAY_TYPE_WAIST_CIRCUMFERENCE",
         .units = {{.type = "WaistCircumference",
                    .units = Girth,
                    .displayRange = {0, 400},
                    .absoluteRange = {15, 320},
                    .confirmRange = {40, 180}}},
         .charting = &VSChartingProfiles::Line},
    };
    return rows;
}
