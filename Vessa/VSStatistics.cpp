#include "Vessa/VSStatistics.h"

#include <algorithm>

std::optional<VSQuantity> VSStatistics::quantity(const std::optional<double>& value) const {
    if (!value || !type) return std::nullopt;
    return VSQuantity(type->canonicalUnit(), *value);
}

VSStatisticsCollection::VSStatisticsCollection(const VSObjectType* type, VSDate anchor,
                                               VSDateComponents interval, VSCalendar calendar,
                                               std::vector<VSStatistics> statistics)
    : type_(type),
      anchor_(anchor),
      interval_(interval),
      calendar_(std::move(calendar)),
      statistics_(std::move(statistics)) {}

void VSStatisticsCollection::enumerateStatistics(
    VSDate from, VSDate to, const std::function<void(const VSStatistics&)>& block) const {
    if (!(from < to)) return;
    const auto boundaries = calendar_.bucketBoundaries(anchor_, interval_, from, to);
    auto next = std::lower_bound(statistics_.begin(), statistics_.end(), boundaries.front(),
                                 [](const VSStatistics& s, VSDate date) { return s.startDate < date; });
    for (size_t i = 0; i + 1 < boundaries.size(); ++i) {
        if (next != statistics_.end() && next->startDate == boundaries[i]) {
            block(*next++);
            continue;
        }
        VSStatistics empty;
        empty.type = type_;
        empty.startDate = boundaries[i];
        empty.endDate = boundaries[i + 1];
        block(empty);
    }
}
