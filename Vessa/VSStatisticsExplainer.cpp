#include "Vessa/VSStatisticsExplainer.h"

#include <algorithm>
#include <set>
#include <tuple>

#include "Vessa/VSExactSum.h"

VSStatisticsExplainer::VSStatisticsExplainer(VSStoreReader& reader, const VSObjectType* type,
                                             const VSPredicate& predicate)
    : reader_(reader),
      type_(type),
      predicate_(predicate),
      from_(predicate.startDate ? predicate.startDate->microseconds() : INT64_MIN),
      to_(predicate.endDate ? predicate.endDate->microseconds() : INT64_MAX) {}

std::vector<VSStatisticsExplanation::Contribution> VSStatisticsExplainer::contributions() {
    readSamples();
    if (type_->isCumulative()) findOwners();
    std::vector<VSStatisticsExplanation::Contribution> result(rows_.size());
    for (size_t index = 0; index < rows_.size(); ++index) {
        result[index].sample = samples_[index];
        result[index].startsInRange = rows_[index].start >= from_ && rows_[index].start < to_;
        if (type_->isQuantityType()) explain(index, result[index]);
    }
    return result;
}

void VSStatisticsExplainer::readSamples() {
    reader_.scan(type_, predicate_, true, [&](const VSSampleRow& row) {
        rows_.push_back(row);
        return true;
    });
    std::sort(rows_.begin(), rows_.end(), [](const VSSampleRow& a, const VSSampleRow& b) {
        return std::tie(a.start, a.id) < std::tie(b.start, b.id);
    });
    std::map<int64_t, size_t> ranks;
    for (int64_t source : reader_.orderedSources(type_)) ranks.emplace(source, ranks.size());
    for (const VSSampleRow& row : rows_) {
        const auto rank = ranks.find(reader_.provenances().sourceOfProvenance(row.provenance));
        if (rank == ranks.end())
            throw VSDatabaseFailure({VSErrorCode::Corrupt, "the store lacks a summary of a source"});
        spans_.push_back({row.start, row.duration, row.value, rank->second});
        samples_.push_back(reader_.object(type_, row));
    }
}

/// One pass over the borders of the spans, with those that cover the moment ordered by their claim to it.
void VSStatisticsExplainer::findOwners() {
    struct Border {
        int64_t moment;
        bool begins;
        size_t index;
    };
    std::vector<Border> borders;
    for (size_t index = 0; index < spans_.size(); ++index) {
        if (spans_[index].duration == 0) continue;
        borders.push_back({spans_[index].start, true, index});
        borders.push_back({spans_[index].end(), false, index});
    }
    std::sort(borders.begin(), borders.end(),
              [](const Border& a, const Border& b) { return a.moment < b.moment; });
    std::set<std::pair<size_t, size_t>> claims;  // rank and index, which is the order of start and number
    for (size_t place = 0; place < borders.size();) {
        const int64_t moment = borders[place].moment;
        for (; place < borders.size() && borders[place].moment == moment; ++place) {
            const std::pair claim{spans_[borders[place].index].rank, borders[place].index};
            if (borders[place].begins)
                claims.insert(claim);
            else
                claims.erase(claim);
        }
        const auto owner = claims.empty() ? std::nullopt : std::optional(claims.begin()->second);
        if (stretches_.empty() || stretches_.back().owner != owner) stretches_.push_back({moment, owner});
    }
}

void VSStatisticsExplainer::explain(size_t index, VSStatisticsExplanation::Contribution& contribution) const {
    const VSRankedSpan& span = spans_[index];
    const bool isMoment = span.duration == 0;
    const int64_t from = std::max(span.start, from_), to = isMoment ? span.start : std::min(span.end(), to_);
    const auto share = [&](int64_t a, int64_t b) {
        return VSShareOfSpan(span.value, span.duration, a - span.start, b - span.start);
    };
    const VSExactSum inRange = share(from, to);
    VSExactSum counted = inRange;
    for (auto stretch = stretchAt(from); stretch != stretches_.end(); ++stretch) {
        if (isMoment ? stretch->from > from : stretch->from >= to) break;
        if (!isTakenFrom(*stretch, index)) continue;
        const auto next = std::next(stretch);
        const int64_t a = std::max(stretch->from, from);
        const int64_t b = next == stretches_.end() ? to : std::min(next->from, to);
        const VSExactSum amount = share(a, b);
        counted -= amount;
        contribution.taken.push_back({samples_[*stretch->owner], VSDate::fromMicroseconds(a),
                                      VSDate::fromMicroseconds(b), amount.value()});
    }
    contribution.inRange = inRange.value();
    contribution.counted = counted.value();
}

/// The stretch that the moment lies in, or the first one.
std::vector<VSStatisticsExplainer::Stretch>::const_iterator VSStatisticsExplainer::stretchAt(
    int64_t moment) const {
    const auto next =
        std::upper_bound(stretches_.begin(), stretches_.end(), moment,
                         [](int64_t value, const Stretch& stretch) { return value < stretch.from; });
    return next == stretches_.begin() ? next : std::prev(next);
}

bool VSStatisticsExplainer::isTakenFrom(const Stretch& stretch, size_t index) const {
    return stretch.owner && spans_[*stretch.owner].rank < spans_[index].rank;
}
