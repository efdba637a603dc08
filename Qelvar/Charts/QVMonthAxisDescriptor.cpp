#include "Qelvar/Charts/QVMonthAxisDescriptor.h"

#include <algorithm>
#include <climits>

#include "Qelvar/Formatters/QVDateFormatters.h"

std::optional<std::vector<QVAxisLabel>> QVMonthAxisDescriptor::generateAxisLabels() const {
    const VSCalendar calendar = VSCalendar::current();
    std::vector<VSDate> dates;
    for (VSDate date = calendar.yesterdayAtNoon(*maxValue()); date > *minValue();
         date = calendar.addDays(date, -dayOffset_))
        dates.push_back(date);
    std::reverse(dates.begin(), dates.end());

    const QVDateFormatter dayFormatter = QVDateFormatter::withPattern("d");
    const QVDateFormatter monthFormatter = QVDateFormatter::withTemplate("MMMd");
    std::vector<QVAxisLabel> labels;
    int marker = INT_MIN;
    for (const VSDate date : dates) {
        const int component = calendar.component(monthMarkerUnit_, date);
        const QVDateFormatter& formatter = component == marker ? dayFormatter : monthFormatter;
        marker = component;
        labels.push_back(label(formatter.stringFromDate(date), date, false));
    }
    if (!labels.empty()) restyle(labels.back(), highlightedStyle());
    return labels;
}
