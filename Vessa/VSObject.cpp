#include "Vessa/VSObject.h"

#include <algorithm>
#include <cassert>
#include <cmath>

namespace {

/// The length of the span that lies in none of the pauses.
VSDuration durationWithoutPauses(VSDate start, VSDate end, std::vector<VSWorkoutEvent> events) {
    constexpr int kPause = 1, kResume = 2;
    std::erase_if(events, [](const VSWorkoutEvent& event) { return !event.date; });
    std::stable_sort(events.begin(), events.end(),
                     [](const auto& a, const auto& b) { return *a.date < *b.date; });

    VSDuration active{};
    std::optional<VSDate> runningSince = start;
    for (const VSWorkoutEvent& event : events) {
        const VSDate time = std::clamp(*event.date, start, end);
        if (event.type == kPause && runningSince) {
            active += time - *runningSince;
            runningSince.reset();
        } else if (event.type == kResume && !runningSince) {
            runningSince = time;
        }
    }
    if (runningSince) active += end - *runningSince;
    return active;
}

}  // namespace

VSSample::VSSample(const VSObjectType* type, VSDate start, VSDate end, VSProvenance provenance, VSObjectID id)
    : type_(type), start_(start), end_(end), provenance_(std::move(provenance)), id_(id) {
    assert(type_ && type_->isSampleType());
    assert(start_ <= end_);
}

const VSSourceRevision& VSSample::sourceRevision() const {
    static const VSSourceRevision ours{VSSource::application(), ""};
    return provenance_.sourceRevision ? *provenance_.sourceRevision : ours;
}

const VSMetadata& VSSample::metadata() const {
    static const VSMetadata none;
    return provenance_.metadata ? *provenance_.metadata : none;
}

VSQuantitySample::VSQuantitySample(const VSObjectType* type, VSQuantity quantity, VSDate start, VSDate end,
                                   VSProvenance provenance, VSObjectID id)
    : VSSample(type, start, end, std::move(provenance), id), quantity_(quantity) {
    assert(type->isQuantityType() && quantity_.isCompatibleWith(type->canonicalUnit()));
    assert(std::isfinite(quantity_.value()));
}

VSCategorySample::VSCategorySample(const VSObjectType* type, int value, VSDate start, VSDate end,
                                   VSProvenance provenance, VSObjectID id)
    : VSSample(type, start, end, std::move(provenance), id), value_(value) {
    assert(type->isCategoryType());
}

VSCorrelation::VSCorrelation(const VSObjectType* type, VSDate start, VSDate end,
                             std::vector<VSSamplePtr> objects, VSProvenance provenance, VSObjectID id)
    : VSSample(type, start, end, std::move(provenance), id), objects_(std::move(objects)) {
    assert(type->kind() == VSTypeKind::Correlation);
}

VSWorkout::VSWorkout(int activityType, VSDate start, VSDate end, VSDuration duration,
                     std::optional<VSQuantity> totalEnergyBurned, std::optional<VSQuantity> totalDistance,
                     std::vector<VSWorkoutEvent> events, VSProvenance provenance, VSObjectID id)
    : VSSample(VSObjectType::workoutType(), start, end, std::move(provenance), id),
      activity_(activityType),
      duration_(duration == VSDuration::zero() ? durationWithoutPauses(start, end, events) : duration),
      energy_(totalEnergyBurned),
      distance_(totalDistance),
      events_(std::move(events)) {}
