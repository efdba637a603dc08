#include "Qelvar/Charts/QVHourAxisDescriptor.h"

#include "Qelvar/Formatters/QVDateFormatters.h"
#include "Vessa/Base/VSCalendar.h"

std::optional<std::vector<QVAxisLabel>> QVHourAxisDescriptor::generateAxisLabels() const {
    VSDate middle = VSMidDate(*minValue(), *maxValue());
    // A day that ends a moment before midnight, or that lost an hour, has its middle before noon, and a night
    // of 23 hours before midnight: name noon and midnight all the same.
    if (VSCalendar::current().component(VSCalendarUnit::Hour, middle) % 12 == 11)
        middle = middle + std::chrono::hours(1);

    const QVDateFormatter formatter = QVHourOfDayFormatter();
    std::vector<QVAxisLabel> labels;
    for (const VSDate date : {*minValue(), middle, *maxValue()})
        labels.push_back(label(formatter.stringFromDate(date), date, alwaysHighlight()));
    return labels;
}
