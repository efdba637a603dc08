#pragma once

#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <vector>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/VSPredicate.h"

/// What to compute, a bit set.
enum VSStatisticsOptions : int {
    VSStatisticsOptionNone = 0,
    VSStatisticsOptionSeparateBySource = 1,
    VSStatisticsOptionDiscreteAverage = 2,
    VSStatisticsOptionDiscreteMin = 4,
    VSStatisticsOptionDiscreteMax = 8,
    VSStatisticsOptionCumulativeSum = 16,
};

/// Average, minimum and maximum are over the samples that start in the range; the sum takes of each span the
/// part that lies in the range, in proportion to time, and counts no moment of a cumulative type from two
/// sources (the earlier in the order of sources counts). Empty input gives none, never 0.
struct VSStatistics {
    const VSObjectType* type = nullptr;
    VSDate startDate, endDate;
    int64_t count = 0;                                     // samples that start in the range
    std::optional<double> sum, average, minimum, maximum;  // in the type's canonical unit
    struct OfSource {
        int64_t count = 0;
        std::optional<double> sum, average, minimum, maximum;
    };
    std::map<VSSource, OfSource> bySource;  // filled when asked for

    std::optional<VSQuantity> sumQuantity() const { return quantity(sum); }
    std::optional<VSQuantity> averageQuantity() const { return quantity(average); }
    std::optional<VSQuantity> minimumQuantity() const { return quantity(minimum); }
    std::optional<VSQuantity> maximumQuantity() const { return quantity(maximum); }
    /// Whether any of the values asked for is there.
    bool hasData() const { return sum || average || minimum || maximum; }

 private:
    std::optional<VSQuantity> quantity(const std::optional<double>& value) const;
};

/// The buckets of a statistics-collection query. Immutable, shared; any thread.
class VSStatisticsCollection {
 public:
    /// `statistics` ascending, only buckets with data.
    VSStatisticsCollection(const VSObjectType* type, VSDate anchor, VSDateComponents interval,
                           VSCalendar calendar, std::vector<VSStatistics> statistics);
    /// Only the buckets that hold data, ascending.
    const std::vector<VSStatistics>& statistics() const { return statistics_; }
    /// Every bucket that meets [from, to), empty ones included, ascending.
    void enumerateStatistics(VSDate from, VSDate to,
                             const std::function<void(const VSStatistics&)>& block) const;

 private:
    const VSObjectType* type_;
    VSDate anchor_;
    VSDateComponents interval_;
    VSCalendar calendar_;
    std::vector<VSStatistics> statistics_;
};
