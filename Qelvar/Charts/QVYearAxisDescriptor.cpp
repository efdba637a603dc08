#include "Qelvar/Charts/QVYearAxisDescriptor.h"

#include <algorithm>
#include <climits>

#include "Qelvar/Formatters/QVDateFormatters.h"
#include "Vessa/Base/VSCalendar.h"

std::optional<std::vector<QVAxisLabel>> QVYearAxisDescriptor::generateAxisLabels() const {
    const VSCalendar calendar = VSCalendar::current();
    std::vector<VSDate> dates;
    for (VSDate date = calendar.middleOfMonth(*maxValue()); date >= *minValue();
         date = calendar.addMonths(date, -3))
        dates.push_back(date);
    std::reverse(dates.begin(), dates.end());

    const QVDateFormatter monthFormatter = QVDateFormatter::withPattern("MMM");
    const QVDateFormatter yearFormatter = QVDateFormatter::withTemplate("MMMU");
    std::vector<QVAxisLabel> labels;
    int marker = INT_MIN;
    for (const VSDate date : dates) {
        const int year = calendar.component(VSCalendarUnit::Year, date);
        const QVDateFormatter& formatter = year == marker ? monthFormatter : yearFormatter;
        marker = year;
        labels.push_back(label(formatter.stringFromDate(date), date, false));
    }
    if (!labels.empty()) restyle(labels.back(), highlightedStyle());
    return labels;
}
