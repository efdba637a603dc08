#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <string_view>

#include "Vessa/Base/VSDate.h"
#include "Vessa/Base/VSValue.h"

// The elements and attributes of a records document.

enum class QVElementName : uint8_t {
    HealthData,
    ExportDate,
    Me,
    Record,
    Correlation,
    Workout,
    WorkoutEvent,
    MetadataEntry,
    Unknown
};
inline constexpr std::array<const char*, 8> kQVElementNames{
    "HealthData", "ExportDate", "Me", "Record", "Correlation", "Workout", "WorkoutEvent", "MetadataEntry"};

enum class QVAttributeName : uint8_t {
    Type,
    SourceName,
    SourceVersion,
    Device,
    Unit,
    CreationDate,
    StartDate,
    EndDate,
    Value,
    Key,
    Date,
    WorkoutActivityType,
    Duration,
    DurationUnit,
    TotalDistance,
    TotalDistanceUnit,
    TotalEnergyBurned,
    TotalEnergyBurnedUnit,
    DateOfBirth,
    BiologicalSex,
    BloodType,
    FitzpatrickSkinType,
    Unknown
};
inline constexpr size_t kQVAttributeCount = static_cast<size_t>(QVAttributeName::Unknown);
inline constexpr std::array<const char*, kQVAttributeCount> kQVAttributeNames{
    "type",
    "sourceName",
    "sourceVersion",
    "device",
    "unit",
    "creationDate",
    "startDate",
    "endDate",
    "value",
    "key",
    "date",
    "workoutActivityType",
    "duration",
    "durationUnit",
    "totalDistance",
    "totalDistanceUnit",
    "totalEnergyBurned",
    "totalEnergyBurnedUnit",
    "VSCharacteristicTypeIdentifierDateOfBirth",
    "VSCharacteristicTypeIdentifierBiologicalSex",
    "VSCharacteristicTypeIdentifierBloodType",
    "VSCharacteristicTypeIdentifierFitzpatrickSkinType"};

struct QVExactFacts;

/// The start tag of an element. The texts are valid only while it is being handled.
struct QVElement {
    QVElementName name = QVElementName::Unknown;
    std::string_view givenName;  // as the document writes it
    int64_t line = 0;
    uint32_t present = 0;  // a bit for each attribute that is there
    std::array<std::string_view, kQVAttributeCount> values;
    const QVExactFacts* exact = nullptr;  // what instructions say of it; null: nothing

    bool has(QVAttributeName attribute) const { return present >> static_cast<unsigned>(attribute) & 1U; }
    /// Empty when it is not there.
    std::string_view operator[](QVAttributeName attribute) const {
        return has(attribute) ? values[static_cast<size_t>(attribute)] : std::string_view();
    }
    /// What an instruction says of the attribute; null: nothing.
    const VSValue* exactValue(QVAttributeName attribute) const;
    /// The microseconds beyond the second that the date says.
    VSDuration microsecondsOf(size_t date) const;
    /// The beginning of the element, for a message.
    std::string excerpt() const;
};
