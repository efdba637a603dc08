#include "Vessa/VSTypeTable.h"

#include <array>

namespace {

using enum VSTypeKind;
constexpr auto Sum = VSAggregationStyle::Cumulative;
constexpr auto Average = VSAggregationStyle::DiscreteAverage;

// The codes, names and canonical units are on people's disks: a row never changes, and a code is never given
// to another type. A fraction (unit "%") is kept as 0.23 for 23 percent. Nutrients are kept in grams down to
// the micrograms of vitamins, so that all convert alike.
constexpr std::array kTypes{
    // Body measurements
    VSTypeRow{0, Quantity, "BodyMassIndex", Average, "count"},
    VSTypeRow{1, Quantity, "BodyFatPercentage", Average, "%"},
    VSTypeRow{2, Quantity, "Height", Average, "m"},
    VSTypeRow{3, Quantity, "BodyMass", Average, "kg"},
    VSTypeRow{4, Quantity, "LeanBodyMass", Average, "kg"},
    // Vitals and activity
    VSTypeRow{5, Quantity, "HeartRate", Average, "count/min"},
    VSTypeRow{7, Quantity, "StepCount", Sum, "count"},
    VSTypeRow{8, Quantity, "DistanceWalkingRunning", Sum, "m"},
    VSTypeRow{9, Quantity, "BasalEnergyBurned", Sum, "kcal"},
    VSTypeRow{10, Quantity, "ActiveEnergyBurned", Sum, "kcal"},
    VSTypeRow{12, Quantity, "FlightsClimbed", Sum, "count"},
    VSTypeRow{13, Quantity, "NikeFuel", Sum, "count"},
    VSTypeRow{14, Quantity, "OxygenSaturation", Average, "%"},
    // Results
    VSTypeRow{15, Quantity, "BloodGlucose", Average, "mg/dL"},
    VSTypeRow{16, Quantity, "BloodPressureSystolic", Average, "mmHg"},
    VSTypeRow{17, Quantity, "BloodPressureDiastolic", Average, "mmHg"},
    VSTypeRow{18, Quantity, "BloodAlcoholContent", Average, "%"},
    VSTypeRow{19, Quantity, "PeripheralPerfusionIndex", Average, "%"},
    // Nutrition
    VSTypeRow{20, Quantity, "DietaryFatTotal", Sum, "g"},
    VSTypeRow{21, Quantity, "DietaryFatPolyunsaturated", Sum, "g"},
    VSTypeRow{22, Quantity, "DietaryFatMonounsaturated", Sum, "g"},
    VSTypeRow{23, Quantity, "DietaryFatSaturated", Sum, "g"},
    VSTypeRow{24, Quantity, "DietaryCholesterol", Sum, "g"},
    VSTypeRow{25, Quantity, "DietarySodium", Sum, "g"},
    VSTypeRow{26, Quantity, "DietaryCarbohydrates", Sum, "g"},
    VSTypeRow{27, Quantity, "DietaryFiber", Sum, "g"},
    VSTypeRow{28, Quantity, "DietarySugar", Sum, "g"},
    VSTypeRow{29, Quantity, "DietaryEnergyConsumed", Sum, "kcal"},
    VSTypeRow{30, Quantity, "DietaryProtein", Sum, "g"},
    VSTypeRow{31, Quantity, "DietaryVitaminA", Sum, "g"},
    VSTypeRow{32, Quantity, "DietaryVitaminB6", Sum, "g"},
    VSTypeRow{33, Quantity, "DietaryVitaminB12", Sum, "g"},
    VSTypeRow{34, Quantity, "DietaryVitaminC", Sum, "g"},
    VSTypeRow{35, Quantity, "DietaryVitaminD", Sum, "g"},
    VSTypeRow{36, Quantity, "DietaryVitaminE", Sum, "g"},
    VSTypeRow{37, Quantity, "DietaryVitaminK", Sum, "g"},
    VSTypeRow{38, Quantity, "DietaryCalcium", Sum, "g"},
    VSTypeRow{39, Quantity, "DietaryIron", Sum, "g"},
    VSTypeRow{40, Quantity, "DietaryThiamin", Sum, "g"},
    VSTypeRow{41, Quantity, "DietaryRiboflavin", Sum, "g"},
    VSTypeRow{42, Quantity, "DietaryNiacin", Sum, "g"},
    VSTypeRow{43, Quantity, "DietaryFolate", Sum, "g"},
    VSTypeRow{44, Quantity, "DietaryBiotin", Sum, "g"},
    VSTypeRow{45, Quantity, "DietaryPantothenicAcid", Sum, "g"},
    VSTypeRow{46, Quantity, "DietaryPhosphorus", Sum, "g"},
    VSTypeRow{47, Quantity, "DietaryIodine", Sum, "g"},
    VSTypeRow{48, Quantity, "DietaryMagnesium", Sum, "g"},
    VSTypeRow{49, Quantity, "DietaryZinc", Sum, "g"},
    VSTypeRow{50, Quantity, "DietarySelenium", Sum, "g"},
    VSTypeRow{51, Quantity, "DietaryCopper", Sum, "g"},
    VSTypeRow{52, Quantity, "DietaryManganese", Sum, "g"},
    VSTypeRow{53, Quantity, "DietaryChromium", Sum, "g"},
    VSTypeRow{54, Quantity, "DietaryMolybdenum", Sum, "g"},
    VSTypeRow{55, Quantity, "DietaryChloride", Sum, "g"},
    VSTypeRow{56, Quantity, "DietaryPotassium", Sum, "g"},
    VSTypeRow{57, Quantity, "DietaryCaffeine", Sum, "g"},
    // Results and vitals again
    VSTypeRow{58, Quantity, "NumberOfTimesFallen", Sum, "count"},
    VSTypeRow{60, Quantity, "InhalerUsage", Sum, "count"},
    VSTypeRow{61, Quantity, "RespiratoryRate", Average, "count/min"},
    VSTypeRow{62, Quantity, "BodyTemperature", Average, "degC"},
    VSTypeRow{63, Category, "SleepAnalysis"},
    // About the person
    VSTypeRow{64, Characteristic, "BiologicalSex"},
    VSTypeRow{65, Characteristic, "DateOfBirth"},
    VSTypeRow{66, Characteristic, "BloodType"},
    VSTypeRow{70, Category, "ZentroStandHour"},
    // Lungs
    VSTypeRow{71, Quantity, "ForcedVitalCapacity", Average, "L"},
    VSTypeRow{72, Quantity, "ForcedExpiratoryVolume1", Average, "L"},
    VSTypeRow{73, Quantity, "PeakExpiratoryFlowRate", Average, "L/min"},
    VSTypeRow{78, Quantity, "WaistCircumference", Average, "m"},
    VSTypeRow{79, Workout, "Workout"},
    // Samples that belong together
    VSTypeRow{80, Correlation, "BloodPressure"},
    VSTypeRow{81, Correlation, "Food"},
    VSTypeRow{83, Quantity, "DistanceCycling", Sum, "m"},
    VSTypeRow{87, Quantity, "DietaryWater", Sum, "mL"},
    VSTypeRow{88, Characteristic, "FitzpatrickSkinType"},
    VSTypeRow{89, Quantity, "UVExposure", Average, "count"},
    // Reproductive health
    VSTypeRow{90, Quantity, "BasalBodyTemperature", Average, "degC"},
    VSTypeRow{91, Category, "CervicalMucusQuality"},
    VSTypeRow{92, Category, "OvulationTestResult"},
    VSTypeRow{95, Category, "MenstrualFlow"},
    VSTypeRow{96, Category, "IntermenstrualBleeding"},
    VSTypeRow{97, Category, "SexualActivity"},
};

constexpr std::array kValues{
    VSTypeValueRow{63, 0, "VSCategoryValueSleepAnalysisInBed"},
    VSTypeValueRow{63, 1, "VSCategoryValueSleepAnalysisAsleep"},
    VSTypeValueRow{64, 0, "VSBiologicalSexNotSet"},
    VSTypeValueRow{64, 1, "VSBiologicalSexFemale"},
    VSTypeValueRow{64, 2, "VSBiologicalSexMale"},
    VSTypeValueRow{64, 3, "VSBiologicalSexOther"},
    VSTypeValueRow{66, 0, "VSBloodTypeNotSet"},
    VSTypeValueRow{66, 1, "VSBloodTypeAPositive"},
    VSTypeValueRow{66, 2, "VSBloodTypeANegative"},
    VSTypeValueRow{66, 3, "VSBloodTypeBPositive"},
    VSTypeValueRow{66, 4, "VSBloodTypeBNegative"},
    VSTypeValueRow{66, 5, "VSBloodTypeABPositive"},
    VSTypeValueRow{66, 6, "VSBloodTypeABNegative"},
    VSTypeValueRow{66, 7, "VSBloodTypeOPositive"},
    VSTypeValueRow{66, 8, "VSBloodTypeONegative"},
    VSTypeValueRow{70, 0, "VSCategoryValueZentroStandHourStood"},
    VSTypeValueRow{70, 1, "VSCategoryValueZentroStandHourIdle"},
    VSTypeValueRow{88, 0, "VSFitzpatrickSkinTypeNotSet"},
    VSTypeValueRow{88, 1, "VSFitzpatrickSkinTypeI"},
    VSTypeValueRow{88, 2, "VSFitzpatrickSkinTypeII"},
    VSTypeValueRow{88, 3, "VSFitzpatrickSkinTypeIII"},
    VSTypeValueRow{88, 4, "VSFitzpatrickSkinTypeIV"},
    VSTypeValueRow{88, 5, "VSFitzpatrickSkinTypeV"},
    VSTypeValueRow{88, 6, "VSFitzpatrickSkinTypeVI"},
    VSTypeValueRow{91, 1, "VSCategoryValueCervicalMucusQualityDry"},
    VSTypeValueRow{91, 2, "VSCategoryValueCervicalMucusQualitySticky"},
    VSTypeValueRow{91, 3, "VSCategoryValueCervicalMucusQualityCreamy"},
    VSTypeValueRow{91, 4, "VSCategoryValueCervicalMucusQualityWatery"},
    VSTypeValueRow{91, 5, "VSCategoryValueCervicalMucusQualityEggWhite"},
    VSTypeValueRow{92, 1, "VSCategoryValueOvulationTestResultNegative"},
    VSTypeValueRow{92, 2, "VSCategoryValueOvulationTestResultPositive"},
    VSTypeValueRow{92, 3, "VSCategoryValueOvulationTestResultIndeterminate"},
    VSTypeValueRow{95, 1, "VSCategoryValueMenstrualFlowUnspecified"},
    VSTypeValueRow{95, 2, "VSCategoryValueMenstrualFlowLight"},
    VSTypeValueRow{95, 3, "VSCategoryValueMenstrualFlowMedium"},
    VSTypeValueRow{95, 4, "VSCategoryValueMenstrualFlowHeavy"},
    VSTypeValueRow{96, 0, "VSCategoryValueNotApplicable"},
    VSTypeValueRow{97, 0, "VSCategoryValueNotApplicable"},
};

// The export leaves these codes out, whatever would have them. A record of such a type would be lost when a
// person takes the records to another machine, so that no type may ever be given one.
constexpr std::array kReserved{6, 11, 59, 67, 68, 69, 74, 75, 76, 77, 82, 84, 85, 86, 93, 94, 98};

// The n-th name is of activity n. Kept on disk: the order never changes, new activities stand at the end.
constexpr std::array<std::string_view, 57> kActivities{
    "AmericanFootball",
    "Archery",
    "AustralianFootball",
    "Badminton",
    "Baseball",
    "Basketball",
    "Bowling",
    "Boxing",
    "Climbing",
    "Cricket",
    "CrossTraining",
    "Curling",
    "Cycling",
    "Dance",
    "DanceInspiredTraining",
    "Elliptical",
    "EquestrianSports",
    "Fencing",
    "Fishing",
    "FunctionalStrengthTraining",
    "Golf",
    "Gymnastics",
    "Handball",
    "Hiking",
    "Hockey",
    "Hunting",
    "Lacrosse",
    "MartialArts",
    "MindAndBody",
    "MixedMetabolicCardioTraining",
    "PaddleSports",
    "Play",
    "PreparationAndRecovery",
    "Racquetball",
    "Rowing",
    "Rugby",
    "Running",
    "Sailing",
    "SkatingSports",
    "SnowSports",
    "Soccer",
    "Softball",
    "Squash",
    "StairClimbing",
    "SurfingSports",
    "Swimming",
    "TableTennis",
    "Tennis",
    "TrackAndField",
    "TraditionalStrengthTraining",
    "Volleyball",
    "Walking",
    "WaterFitness",
    "WaterPolo",
    "WaterSports",
    "Wrestling",
    "Yoga",
};

}  // namespace

std::span<const VSTypeRow> VSTypeRows() {
    return kTypes;
}
std::span<const VSTypeValueRow> VSTypeValueRows() {
    return kValues;
}
std::span<const int> VSReservedTypeCodes() {
    return kReserved;
}
std::span<const std::string_view> VSWorkoutActivityNames() {
    return kActivities;
}
