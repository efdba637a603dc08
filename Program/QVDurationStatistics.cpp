#include "Program/QVDurationStatistics.h"

#include <algorithm>

std::string QVValueText(const VSSample& sample) {
    const auto text = [](const std::string* identifier, int number) {
        return identifier ? *identifier : std::to_string(number);
    };
    if (const auto* category = dynamic_cast<const VSCategorySample*>(&sample))
        return text(category->sampleType()->identifierForValue(category->value()), category->value());
    if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample)) {
        const int activity = workout->workoutActivityType();
        return text(VSWorkoutActivityTypeIdentifier(activity), activity);
    }
    return {};
}

size_t QVDurationStatistics::intervalOf(VSDate date) const {
    const auto after = std::upper_bound(boundaries_.begin(), boundaries_.end(), date);
    const auto index = after - boundaries_.begin() - 1;
    return static_cast<size_t>(std::clamp<std::ptrdiff_t>(index, 0, std::ssize(intervals_) - 1));
}

void QVDurationStatistics::add(const VSSample& sample) {
    const double span = VSSecondsFromDuration(sample.endDate() - sample.startDate());
    const auto* workout = dynamic_cast<const VSWorkout*>(&sample);
    const double rate = workout && span > 0 ? VSSecondsFromDuration(workout->duration()) / span : 1;
    const std::string value = byValue_ ? QVValueText(sample) : std::string();
    add(sample, {value, ""}, rate);
    add(sample, {value, sample.sourceRevision().source.name}, rate);
}

void QVDurationStatistics::add(const VSSample& sample, const Key& key, double rate) {
    const VSDate recordStart = sample.startDate();
    if (recordStart >= from_ && recordStart < to_) ++intervals_[intervalOf(recordStart)][key].count;
    if (!byValue_) return;
    const auto [covered, isFirst] = coveredUntil_.try_emplace(key, from_);
    VSDate start = std::max(recordStart, covered->second);
    const VSDate end = std::min(sample.endDate(), to_);
    covered->second = std::max(covered->second, end);
    for (size_t interval = intervalOf(start); start < end; ++interval) {
        const VSDate stop = std::min(end, boundaries_[interval + 1]);
        intervals_[interval][key].seconds += rate * VSSecondsFromDuration(stop - start);
        start = stop;
    }
}
