#include "Vessa/VSPredicate.h"

#include <algorithm>

namespace {

/// What no sample meets: for two conditions that contradict each other. It is a range like others, start
/// before end, so that nobody who reckons with it needs to know.
void matchNothing(VSPredicate& predicate) {
    predicate.startDate = VSDate::distantFuture() - VSDuration(1);
    predicate.endDate = VSDate::distantFuture();
}

/// Says the same without options.
void foldOptions(VSPredicate& predicate) {
    if (predicate.startDate && (predicate.dateOptions & VSQueryOptionStrictStartDate))
        predicate.startsFrom =
            std::max(predicate.startsFrom.value_or(*predicate.startDate), *predicate.startDate);
    if (predicate.endDate && (predicate.dateOptions & VSQueryOptionStrictEndDate))
        predicate.endsBy = std::min(predicate.endsBy.value_or(*predicate.endDate), *predicate.endDate);
    predicate.dateOptions = VSQueryOptionNone;
}

void joinLater(std::optional<VSDate>& a, const std::optional<VSDate>& b) {
    if (b) a = std::max(a.value_or(*b), *b);
}
void joinEarlier(std::optional<VSDate>& a, const std::optional<VSDate>& b) {
    if (b) a = std::min(a.value_or(*b), *b);
}

void joinDates(VSPredicate& a, VSPredicate b) {
    const bool hasRange = a.startDate || a.endDate, otherHasRange = b.startDate || b.endDate;
    if (!hasRange) {
        a.dateOptions = otherHasRange ? b.dateOptions : VSQueryOptionNone;
    } else if (otherHasRange && a.dateOptions != b.dateOptions) {
        foldOptions(a);
        foldOptions(b);
    }
    joinLater(a.startDate, b.startDate);
    joinEarlier(a.endDate, b.endDate);
    joinEarlier(a.startsBefore, b.startsBefore);
    joinLater(a.startsFrom, b.startsFrom);
    joinEarlier(a.endsBy, b.endsBy);
}

/// Whether both want the same of what a sample has one of; afterwards `a` wants it too.
template <typename T>
bool joinSingle(std::optional<T>& a, const std::optional<T>& b) {
    if (a && b) return *a == *b;
    if (b) a = b;
    return true;
}

bool joinSources(std::vector<VSSource>& a, const std::vector<VSSource>& b) {
    if (a.empty()) {
        a = b;
        return true;
    }
    if (b.empty()) return true;
    std::erase_if(a,
                  [&b](const VSSource& source) { return std::find(b.begin(), b.end(), source) == b.end(); });
    return !a.empty();
}

bool matchesDates(const VSPredicate& predicate, VSDate start, VSDate end) {
    if (predicate.startsBefore && start >= *predicate.startsBefore) return false;
    if (predicate.startsFrom && start < *predicate.startsFrom) return false;
    if (predicate.endsBy && end > *predicate.endsBy) return false;
    if (predicate.endDate && start >= *predicate.endDate) return false;
    if (predicate.startDate && end <= *predicate.startDate &&
        !(start == end && start == *predicate.startDate))
        return false;
    if ((predicate.dateOptions & VSQueryOptionStrictStartDate) && predicate.startDate &&
        start < *predicate.startDate)
        return false;
    return !((predicate.dateOptions & VSQueryOptionStrictEndDate) && predicate.endDate &&
             end > *predicate.endDate);
}

bool matchesMetadata(const VSPredicate& predicate, const VSMetadata& metadata) {
    return std::all_of(predicate.metadata.begin(), predicate.metadata.end(),
                       [&](const auto& wanted) {
                           const auto entry = metadata.find(wanted.first);
                           return entry != metadata.end() && entry->second == wanted.second;
                       }) &&
           std::all_of(predicate.metadataKeys.begin(), predicate.metadataKeys.end(),
                       [&](const std::string& key) { return metadata.contains(key); });
}

}  // namespace

VSPredicate VSPredicate::samplesWithStartDate(std::optional<VSDate> start, std::optional<VSDate> end,
                                              int options) {
    VSPredicate predicate;
    predicate.startDate = start;
    predicate.endDate = end;
    predicate.dateOptions = options;
    return predicate;
}

VSPredicate VSPredicate::samplesStartingBefore(VSDate date) {
    VSPredicate predicate;
    predicate.startsBefore = date;
    return predicate;
}

VSPredicate VSPredicate::withMetadata(std::string key, VSValue value) {
    VSPredicate predicate;
    predicate.metadata.emplace_back(std::move(key), std::move(value));
    return predicate;
}

VSPredicate VSPredicate::withCategoryValue(int value) {
    VSPredicate predicate;
    predicate.categoryValue = value;
    return predicate;
}

bool VSPredicate::isDateRangeOnly() const {
    return dateOptions == VSQueryOptionNone && !startsBefore && !startsFrom && !endsBy && sources.empty() &&
           !device && metadata.empty() && metadataKeys.empty() && !categoryValue && !noCorrelation;
}

bool VSPredicate::matches(const VSSample& sample) const {
    if (!matchesDates(*this, sample.startDate(), sample.endDate())) return false;
    if (!sources.empty() &&
        std::find(sources.begin(), sources.end(), sample.sourceRevision().source) == sources.end())
        return false;
    if (device && (!sample.device() || *sample.device() != *device)) return false;
    if (categoryValue) {
        const auto* category = dynamic_cast<const VSCategorySample*>(&sample);
        if (!category || category->value() != *categoryValue) return false;
    }
    return matchesMetadata(*this, sample.metadata());
}

VSPredicate operator&(VSPredicate a, const VSPredicate& b) {
    joinDates(a, b);
    a.metadata.insert(a.metadata.end(), b.metadata.begin(), b.metadata.end());
    a.metadataKeys.insert(a.metadataKeys.end(), b.metadataKeys.begin(), b.metadataKeys.end());
    a.noCorrelation = a.noCorrelation || b.noCorrelation;
    const bool sameSources = joinSources(a.sources, b.sources);
    const bool sameDevice = joinSingle(a.device, b.device);
    const bool sameValue = joinSingle(a.categoryValue, b.categoryValue);
    if (!sameSources || !sameDevice || !sameValue) matchNothing(a);
    return a;
}
