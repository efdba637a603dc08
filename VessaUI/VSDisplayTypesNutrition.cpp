#include "VessaUI/VSUnitChoices.h"

// Display types of the category of nutrition. IDs are kept on disk and never reused.
//
// The ranges are of one entry. Where the comment names no other source, the daily need (RDA, or AI where
// there is none) and the tolerable upper intake (UL) of adults are those of the Dietary Reference Intakes
// of the US National Academies. An entry is asked about when it is several times a whole day's upper intake
// or more than the strongest single dose in use; it is refused when no body could take it up: then a unit
// was mistaken (milligrams typed for micrograms).

namespace {
using namespace VSUnitChoices;
constexpr double open = VSRowRange::open;

VSDataUnitGroupRow nutrient(int id, const char* nameKey, const char* type,
                            std::span<const VSUnitChoice> units, double confirmMaximum,
                            double absoluteMaximum) {
    return {.id = id,
            .category = VSCategoryID::Nutrition,
            .nameKey = nameKey,
            .units = {{.type = type,
                       .units = units,
                       .displayRange = {0, open},
                       .absoluteRange = {0, absoluteMaximum},
                       .confirmRange = {0, confirmMaximum}}},
            .charting = &VSChartingProfiles::Bars};
}
}  // namespace

std::span<const VSDataUnitGroupRow> VSNutritionDisplayTypes() {
    static const VSDataUnitGroupRow rows[] = {
        // Champion eaters took about 20,000 kcal at a sitting, cyclists in a stage race 9,000 in a day.
        nutrient(27, "DISPLAY_TYPE_DIETARY_ENERGY", "DietaryEnergyConsumed", Energy, 5000, 30000),
        // The energy nutrients: the absolute limit is about 10,000 kcal of that one alone, at 4 or 9 kcal a
        // gram.
        nutrient(24, "DISPLAY_TYPE_CARBOHYDRATES", "DietaryCarbohydrates", Grams, 500, 2500),
        // 25 to 38 g a day are advised; peoples living on wild plants eat 100.
        nutrient(25, "DISPLAY_TYPE_FIBER", "DietaryFiber", Grams, 80, 500),
        nutrient(26, "DISPLAY_TYPE_SUGAR", "DietarySugar", Grams, 300, 2500),
        nutrient(18, "DISPLAY_TYPE_TOTAL_FAT", "DietaryFatTotal", Grams, 250, 1200),
        nutrient(21, "DISPLAY_TYPE_SATURATED_FAT", "DietaryFatSaturated", Grams, 150, 1200),
        nutrient(20, "DISPLAY_TYPE_MONOUNSATURATED_FAT", "DietaryFatMonounsaturated", Grams, 150, 1200),
        nutrient(19, "DISPLAY_TYPE_POLYUNSATURATED_FAT", "DietaryFatPolyunsaturated", Grams, 100, 1200),
        // An egg has 190 mg: ten eggs, and a crate of them.
        nutrient(22, "DISPLAY_TYPE_DIETARY_CHOLESTEROL", "DietaryCholesterol", Milligrams, 2000, 50000),
        // 0.8 g per kilogram a day; a kilogram of meat holds 250 g.
        nutrient(28, "DISPLAY_TYPE_PROTEIN", "DietaryProtein", Grams, 250, 2500),

        // Retinol equivalents. RDA 900, UL 3,000; 100 g of beef liver hold 5,000 to 10,000, the
        // prophylactic dose of the WHO 60,000.
        nutrient(29, "DISPLAY_TYPE_VITAMIN_A", "DietaryVitaminA", Micrograms, 15000, 1000000),
        // RDA 1.2; tablets of 300.
        nutrient(39, "DISPLAY_TYPE_THIAMIN", "DietaryThiamin", FineMilligrams, 500, 10000),
        // RDA 1.3; 400 against migraine.
        nutrient(40, "DISPLAY_TYPE_RIBOFLAVIN", "DietaryRiboflavin", FineMilligrams, 500, 10000),
        // RDA 16, UL 35; up to 3,000 against blood lipids.
        nutrient(41, "DISPLAY_TYPE_NIACIN", "DietaryNiacin", FineMilligrams, 3000, 20000),
        // AI 5; tablets of 500.
        nutrient(44, "DISPLAY_TYPE_PANTOTHENIC_ACID", "DietaryPantothenicAcid", FineMilligrams, 1000, 20000),
        // RDA 1.3, UL 100; injections of 100 to 200.
        nutrient(30, "DISPLAY_TYPE_VITAMIN_B6", "DietaryVitaminB6", FineMilligrams, 200, 10000),
        // AI 30; supplements of 10,000, trials with 300,000.
        nutrient(43, "DISPLAY_TYPE_BIOTIN", "DietaryBiotin", Micrograms, 20000, 500000),
        // RDA 400, UL 1,000; tablets of 5,000.
        nutrient(42, "DISPLAY_TYPE_FOLATE", "DietaryFolate", Micrograms, 5000, 100000),
        // RDA 2.4; tablets and injections of up to 5,000.
        nutrient(31, "DISPLAY_TYPE_VITAMIN_B12", "DietaryVitaminB12", Micrograms, 5000, 100000),
        // RDA 90, UL 2,000; infusions of up to 100 g.
        nutrient(32, "DISPLAY_TYPE_VITAMIN_C", "DietaryVitaminC", Milligrams, 5000, 200000),
        // RDA 15, UL 100 (4,000 IU); the largest dose given at once is 15,000 (600,000 IU).
        nutrient(33, "DISPLAY_TYPE_VITAMIN_D", "DietaryVitaminD", Micrograms, 250, 15000),
        // RDA 15, UL 1,000.
        nutrient(34, "DISPLAY_TYPE_VITAMIN_E", "DietaryVitaminE", FineMilligrams, 1500, 20000),
        // AI 120; 200 g of kale hold 800 to 1,600; 10,000 is a therapeutic dose.
        nutrient(35, "DISPLAY_TYPE_VITAMIN_K", "DietaryVitaminK", Micrograms, 2000, 100000),

        // RDA 1,000, UL 2,500.
        nutrient(36, "DISPLAY_TYPE_CALCIUM", "DietaryCalcium", Milligrams, 3000, 50000),
        // AI 2,300, UL 3,600: the partner of sodium in salt, half as much again.
        nutrient(52, "DISPLAY_TYPE_CHLORIDE", "DietaryChloride", Milligrams, 9000, 150000),
        // AI 35; supplements of 1,000.
        nutrient(50, "DISPLAY_TYPE_CHROMIUM", "DietaryChromium", Micrograms, 2000, 100000),
        // RDA 0.9, UL 10.
        nutrient(48, "DISPLAY_TYPE_COPPER", "DietaryCopper", FineMilligrams, 20, 1000),
        // RDA 150, UL 1,100; seaweed of several thousand; tablets of 100,000 protect the thyroid after a
        // reactor accident (WHO).
        nutrient(46, "DISPLAY_TYPE_IODINE", "DietaryIodine", Micrograms, 3000, 500000),
        // RDA 8 to 18, UL 45; 200 are prescribed, 60 mg per kilogram of body weight kill.
        nutrient(37, "DISPLAY_TYPE_IRON", "DietaryIron", FineMilligrams, 200, 10000),
        // RDA 400; laxatives hold up to 2,000.
        nutrient(38, "DISPLAY_TYPE_MAGNESIUM", "DietaryMagnesium", Milligrams, 2000, 20000),
        // AI 2.3, UL 11.
        nutrient(49, "DISPLAY_TYPE_MANGANESE", "DietaryManganese", FineMilligrams, 30, 1000),
        // RDA 45, UL 2,000.
        nutrient(51, "DISPLAY_TYPE_MOLYBDENUM", "DietaryMolybdenum", Micrograms, 2000, 100000),
        // RDA 700, UL 4,000.
        nutrient(45, "DISPLAY_TYPE_PHOSPHORUS", "DietaryPhosphorus", Milligrams, 4000, 50000),
        // AI 3,400; 18 g and more at once have killed.
        nutrient(53, "DISPLAY_TYPE_POTASSIUM", "DietaryPotassium", Milligrams, 6000, 50000),
        // RDA 55, UL 400; a Brazil nut may hold 90.
        nutrient(54, "DISPLAY_TYPE_SELENIUM", "DietarySelenium", Micrograms, 800, 50000),
        // AI 1,500, risk from 2,300; 6,000 are 15 g of salt, 100,000 a deadly 250 g.
        nutrient(23, "DISPLAY_TYPE_SODIUM", "DietarySodium", Milligrams, 6000, 100000),
        // RDA 11, UL 40.
        nutrient(47, "DISPLAY_TYPE_ZINC", "DietaryZinc", FineMilligrams, 150, 5000),

        // 200 mg at once and 400 a day are held to be safe (EFSA 2015); 10 g kill.
        nutrient(55, "DISPLAY_TYPE_CAFFEINE", "DietaryCaffeine", Milligrams, 600, 10000),
        // A healthy kidney passes 800 to 1,000 mL an hour; more than that kept up for hours thins the
        // blood's salt.
        nutrient(VSGroupID::Water, "DISPLAY_TYPE_WATER", "DietaryWater", Drink, 3000, 20000),
    };
    return rows;
}
