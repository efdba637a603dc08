#pragma once

#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Vessa/VSUnit.h"

/// The integer code of a data type, 0 to 98. Kept on disk; never reused.
enum class VSTypeCode : int {};
constexpr int VSTypeCodeValue(VSTypeCode code) {
    return static_cast<int>(code);
}

/// Codes that the program itself speaks of.
namespace VSCode {
inline constexpr VSTypeCode BodyMassIndex{0}, BodyFatPercentage{1}, Height{2}, BodyMass{3}, HeartRate{5},
    StepCount{7}, DistanceWalkingRunning{8}, BasalEnergyBurned{9}, ActiveEnergyBurned{10}, FlightsClimbed{12},
    NikeFuel{13}, OxygenSaturation{14}, BloodGlucose{15}, BloodPressureSystolic{16},
    BloodPressureDiastolic{17}, DietaryEnergyConsumed{29}, RespiratoryRate{61}, BodyTemperature{62},
    SleepAnalysis{63}, BiologicalSex{64}, DateOfBirth{65}, BloodType{66}, ZentroStandHour{70}, Workout{79},
    BloodPressure{80}, DistanceCycling{83}, DietaryWater{87}, FitzpatrickSkinType{88}, UVExposure{89},
    BasalBodyTemperature{90}, CervicalMucusQuality{91}, OvulationTestResult{92}, MenstrualFlow{95},
    IntermenstrualBleeding{96}, SexualActivity{97};
}  // namespace VSCode

enum class VSTypeKind { Quantity, Category, Correlation, Characteristic, Workout };

/// How values of a quantity type combine; the numbers are the catalogue's.
enum class VSAggregationStyle { Cumulative = 0, DiscreteAverage = 1 };

/// A data type of the service. The instances live in the catalogue until the process ends; types are compared
/// by their address and passed as `const VSObjectType*`, never null unless said. Any thread.
class VSObjectType {
 public:
    VSTypeCode code() const { return code_; }
    /// The kind's prefix and the name in upper camel case: "VSQuantityTypeIdentifierHeartRate".
    const std::string& identifier() const { return identifier_; }
    /// The identifier without the prefix: "HeartRate".
    std::string_view name() const;
    VSTypeKind kind() const { return kind_; }
    bool isQuantityType() const { return kind_ == VSTypeKind::Quantity; }
    bool isCategoryType() const { return kind_ == VSTypeKind::Category; }
    /// Whether samples of it can be saved: all kinds but characteristics.
    bool isSampleType() const { return kind_ != VSTypeKind::Characteristic; }
    /// REQUIRES: isQuantityType().
    VSAggregationStyle aggregationStyle() const { return aggregation_; }
    bool isCumulative() const { return isQuantityType() && aggregation_ == VSAggregationStyle::Cumulative; }
    /// The unit in which the store keeps values. REQUIRES: isQuantityType().
    const VSUnit& canonicalUnit() const { return *canonicalUnit_; }
    /// A unit string as documents give it for this type: "mmol/L" of blood glucose means mmol of glucose.
    /// Invalid when it does not parse or does not convert to the canonical unit. REQUIRES: isQuantityType().
    VSResult<VSUnit> unitFromString(std::string_view text) const;

    /// Values of a category type or enumerated characteristic and their identifiers, ascending; empty for
    /// others.
    std::span<const std::pair<int, std::string>> enumeratedValues() const { return values_; }
    /// The identifier of an enumerated value ("VSCategoryValueSleepAnalysisAsleep"), or null.
    const std::string* identifierForValue(int value) const;
    std::optional<int> valueForIdentifier(std::string_view identifier) const;

    static const VSObjectType* dataTypeWithCode(VSTypeCode code);  // null: no type has this code
    static const VSObjectType* dataTypeWithCode(int code) { return dataTypeWithCode(VSTypeCode{code}); }
    /// By identifier; null when there is none of that kind.
    static const VSObjectType* quantityTypeForIdentifier(std::string_view identifier);
    static const VSObjectType* categoryTypeForIdentifier(std::string_view identifier);
    static const VSObjectType* correlationTypeForIdentifier(std::string_view identifier);
    static const VSObjectType* characteristicTypeForIdentifier(std::string_view identifier);
    static const VSObjectType* workoutType();
    /// Of any kind, by identifier with or without its prefix; null when there is none.
    static const VSObjectType* typeForIdentifier(std::string_view identifier);
    /// All types in ascending order of their codes.
    static std::span<const VSObjectType* const> allTypes();

    VSObjectType(const VSObjectType&) = delete;
    VSObjectType& operator=(const VSObjectType&) = delete;

    struct Catalogue;  // builds the instances

 private:
    VSObjectType() = default;
    VSTypeCode code_{};
    VSTypeKind kind_{};
    VSAggregationStyle aggregation_{};
    std::string identifier_;
    std::optional<VSUnit> canonicalUnit_;
    std::vector<std::pair<int, std::string>> values_;
};

inline constexpr std::string_view VSQuantityTypeIdentifierPrefix = "VSQuantityTypeIdentifier";
inline constexpr std::string_view VSCategoryTypeIdentifierPrefix = "VSCategoryTypeIdentifier";
inline constexpr std::string_view VSCorrelationTypeIdentifierPrefix = "VSCorrelationTypeIdentifier";
inline constexpr std::string_view VSCharacteristicTypeIdentifierPrefix = "VSCharacteristicTypeIdentifier";
inline constexpr std::string_view VSWorkoutTypeIdentifier = "VSWorkoutTypeIdentifier";

/// "VSWorkoutActivityTypeRunning" for 37; null for values other than 1 to 57 and 3000. And back.
const std::string* VSWorkoutActivityTypeIdentifier(int activity);
std::optional<int> VSWorkoutActivityTypeForIdentifier(std::string_view identifier);
