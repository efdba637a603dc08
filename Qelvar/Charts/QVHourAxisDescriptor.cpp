#include "Qelvar/Charts/QVHourAxisDescriptor.h"

#include "Qelvar/Formatters/QVDateFormatters.h"
#include "Vessa/Base/VSCalendar.h"

std::optional<std::vector<QVAxisLabel>> QVHourAxisDescriptor::generateAxisLabels() const {
    VSDate middle = VSMidDate(*minValue(), *maxValue());
    // A day that ends a moment before midnight, or that lost or got an hour or two, has its middle beside
    // noon, and such a night beside midnight: name noon and midnight all the same.
    const int hour = VSCalendar::current().component(VSCalendarUnit::Hour, middle) % 12;
    if (hour == 11) middle = middle + std::chrono::hours(1);
    if (hour == 1) middle = middle - std::chrono::hours(1);

    const QVDateFormatter formatter = QVHourOfDayFormatter();
    std::vector<QVAxisLabel> labels;
    for (const VSDate date : {*minValue(), middle, *maxValue()})
        labels.push_back(label(formatter.stringFromDate(date), date, alwaysHighlight()));
    return labels;
}
