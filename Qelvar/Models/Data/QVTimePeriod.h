#pragma once

#include <functional>
#include <string>

#include "Vessa/Base/VSDate.h"

class VSSample;

/// A span between two dates. Plain value.
class QVTimePeriod {
 public:
    QVTimePeriod(VSDate startDate, VSDate endDate) : startDate_(startDate), endDate_(endDate) {}
    /// From the sample's start to its end.
    explicit QVTimePeriod(const VSSample& sample);

    VSDate startDate() const { return startDate_; }
    VSDate endDate() const { return endDate_; }
    void setStartDate(VSDate date) { startDate_ = date; }
    void setEndDate(VSDate date) { endDate_ = date; }

    /// For logs.
    std::string description() const;
    friend bool operator==(const QVTimePeriod&, const QVTimePeriod&) = default;

 private:
    VSDate startDate_, endDate_;
};

template <>
struct std::hash<QVTimePeriod> {
    size_t operator()(const QVTimePeriod& period) const noexcept {
        return std::hash<VSDate>()(period.startDate()) ^ std::hash<VSDate>()(period.endDate());
    }
};
