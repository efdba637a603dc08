#pragma once

#include <compare>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Vessa/Base/VSDate.h"
#include "Vessa/Base/VSValue.h"
#include "Vessa/VSObjectType.h"
#include "Vessa/VSQuantity.h"
#include "Vessa/VSSource.h"

/// The place of an object in the store's one ever-growing order of insertions; 0 for one not yet saved.
/// Kept on disk; never reused.
enum class VSObjectID : int64_t {};
constexpr int64_t VSObjectIDValue(VSObjectID id) {
    return static_cast<int64_t>(id);
}

using VSMetadata = VSValue::Dictionary;
inline constexpr const char* VSMetadataKeyWasUserEntered = "VSMetadataKeyWasUserEntered";
inline constexpr const char* VSMetadataKeyMenstrualCycleStart = "VSMetadataKeyMenstrualCycleStart";
inline constexpr const char* VSMetadataKeySexualActivityProtectionUsed =
    "VSMetadataKeySexualActivityProtectionUsed";

class VSSample;
/// Samples are immutable once made and shared.
using VSSamplePtr = std::shared_ptr<const VSSample>;

/// Where an object comes from and what was noted about it. The source and device are shared among objects.
struct VSProvenance {
    std::shared_ptr<const VSSourceRevision> sourceRevision;  // null: this application's own
    std::shared_ptr<const VSDevice> device;                  // null: none
    std::shared_ptr<const VSMetadata> metadata;              // null: none
    std::optional<VSDate> creationDate;                      // none: the store notes the time of the save
    /// The offset from Greenwich that was in force where the sample was recorded, in seconds; none: unknown.
    std::optional<int> timeZoneOffset;
};

/// A record with a type and a span of time: the base of the four kinds. startDate <= endDate.
class VSSample {
 public:
    virtual ~VSSample() = default;
    VSObjectID dataID() const { return id_; }
    const VSObjectType* sampleType() const { return type_; }
    VSDate startDate() const { return start_; }
    VSDate endDate() const { return end_; }
    const VSSourceRevision& sourceRevision() const;
    const VSDevice* device() const { return provenance_.device.get(); }  // null: none
    const VSMetadata& metadata() const;                                  // empty when none
    /// When the store received it; present on every object that a query gave.
    std::optional<VSDate> creationDate() const { return provenance_.creationDate; }
    std::optional<int> timeZoneOffset() const { return provenance_.timeZoneOffset; }
    const VSProvenance& provenance() const { return provenance_; }

 protected:
    VSSample(const VSObjectType* type, VSDate start, VSDate end, VSProvenance provenance, VSObjectID id);

 private:
    const VSObjectType* type_;
    VSDate start_, end_;
    VSProvenance provenance_;
    VSObjectID id_;
};

class VSQuantitySample final : public VSSample {
 public:
    /// REQUIRES: a quantity type with a compatible unit, start <= end, a finite value.
    VSQuantitySample(const VSObjectType* type, VSQuantity quantity, VSDate start, VSDate end,
                     VSProvenance provenance = {}, VSObjectID id = {});
    const VSQuantity& quantity() const { return quantity_; }

 private:
    VSQuantity quantity_;
};

class VSCategorySample final : public VSSample {
 public:
    /// REQUIRES: a category type, start <= end.
    VSCategorySample(const VSObjectType* type, int value, VSDate start, VSDate end,
                     VSProvenance provenance = {}, VSObjectID id = {});
    int value() const { return value_; }

 private:
    int value_;
};

/// Several samples that belong together, such as the two values of a blood pressure reading.
class VSCorrelation final : public VSSample {
 public:
    VSCorrelation(const VSObjectType* type, VSDate start, VSDate end, std::vector<VSSamplePtr> objects,
                  VSProvenance provenance = {}, VSObjectID id = {});
    const std::vector<VSSamplePtr>& objects() const { return objects_; }

 private:
    std::vector<VSSamplePtr> objects_;
};

struct VSWorkoutEvent {
    int type = 0;  // 1 pause, 2 resume; other values are kept
    std::optional<VSDate> date;
    friend bool operator==(const VSWorkoutEvent&, const VSWorkoutEvent&) = default;
};

class VSWorkout final : public VSSample {
 public:
    /// `duration` 0 means: the span less its pauses.
    VSWorkout(int activityType, VSDate start, VSDate end, VSDuration duration,
              std::optional<VSQuantity> totalEnergyBurned, std::optional<VSQuantity> totalDistance,
              std::vector<VSWorkoutEvent> events, VSProvenance provenance = {}, VSObjectID id = {});
    int workoutActivityType() const { return activity_; }
    VSDuration duration() const { return duration_; }
    const std::optional<VSQuantity>& totalEnergyBurned() const { return energy_; }
    const std::optional<VSQuantity>& totalDistance() const { return distance_; }
    const std::vector<VSWorkoutEvent>& workoutEvents() const { return events_; }

 private:
    int activity_;
    VSDuration duration_;
    std::optional<VSQuantity> energy_, distance_;
    std::vector<VSWorkoutEvent> events_;
};

/// What was deleted: all that is left of an object.
struct VSDeletedObject {
    VSObjectID id;
    const VSObjectType* type;
};
