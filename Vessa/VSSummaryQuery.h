#pragma once

#include <variant>

#include "Vessa/VSQuery.h"

struct VSSampleCount {
    int64_t value = 0;
    friend bool operator==(const VSSampleCount&, const VSSampleCount&) = default;
};
struct VSCategoryValue {
    int value = 0;
    friend bool operator==(const VSCategoryValue&, const VSCategoryValue&) = default;
};

/// What one range of time holds of one type, in the form of its kind:
///
/// - a cumulative quantity: VSQuantity, the sum, no moment counted from two sources;
/// - another quantity: VSQuantity, the average of the samples that start in the range;
/// - sleep analysis: VSDuration, how long asleep, or where nothing says asleep how long in bed. Spans are cut
///   at the range's ends and overlapping ones count once;
/// - workouts: VSDuration, the durations of all; of one that crosses an end of the range the share of its
///   span that lies inside;
/// - stand hours: VSSampleCount, the hours that start in the range and in which the person stood; one that
///   two sources recorded counts once;
/// - sexual activity: VSSampleCount, the samples that start in the range;
/// - intermenstrual bleeding: VSDate, the start of the latest sample;
/// - other categories: VSCategoryValue, that of the latest sample (which ends last, of those the last
///   inserted).
///
/// Correlations have none: their members have. Quantities are in the type's canonical unit.
using VSSummaryValue = std::variant<VSQuantity, VSDuration, VSSampleCount, VSCategoryValue, VSDate>;

/// The values of all types over [start, end), then (with an update handler) after each change those that
/// became others. Types without a value, and those that the application may not read, are left out of the
/// first answer.
class VSSummaryQuery final : public VSQuery {
 public:
    /// In an update, none: the type has no value any more.
    using Values = std::map<const VSObjectType*, std::optional<VSSummaryValue>>;
    using Handler = std::function<void(const VSResult<Values>&)>;
    VSSummaryQuery(VSDate start, VSDate end, Handler handler)
        : VSQuery(nullptr, VSPredicate::samplesWithStartDate(start, end, VSQueryOptionNone)),
          startDate(start),
          endDate(end),
          completionHandler(std::move(handler)) {}
    std::unique_ptr<VSQueryAnswerer> answerer() const override;
    const VSDate startDate, endDate;
    const Handler completionHandler;
    /// Set before execution; empty: the query ends with its first answer. Not called where no value became
    /// another. After a failed update the next one tells all types that changed since the last that did not.
    Handler updateHandler;
};
