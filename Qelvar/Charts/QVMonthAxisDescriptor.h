#pragma once

#include "Qelvar/Charts/QVCachedAxisDescriptor.h"
#include "Vessa/Base/VSCalendar.h"

/// The days of a week or a month: noon of every `dayOffset`-th day, counted backwards from the last day of
/// the range. The first label and the first one in each new month name the month; the last is highlighted.
class QVMonthAxisDescriptor : public QVCachedAxisDescriptor {
 public:
    int dayOffset() const { return dayOffset_; }
    /// REQUIRES: dayOffset > 0.
    void setDayOffset(int dayOffset) { dayOffset_ = dayOffset; }
    /// The calendar unit at whose change the month is named again.
    VSCalendarUnit monthMarkerUnit() const { return monthMarkerUnit_; }
    void setMonthMarkerUnit(VSCalendarUnit unit) { monthMarkerUnit_ = unit; }

 protected:
    std::optional<std::vector<QVAxisLabel>> generateAxisLabels() const override;

 private:
    int dayOffset_ = 1;
    VSCalendarUnit monthMarkerUnit_ = VSCalendarUnit::Month;
};
