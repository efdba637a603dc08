#include "Qelvar/Charts/QVMonthAxisDescriptor.h"

#include <algorithm>
#include <climits>

#include "Qelvar/Formatters/QVDateFormatters.h"

std::optional<std::vector<QVAxisLabel>> QVMonthAxisDescriptor::generateAxisLabels() const {
    const VSCalendar calendar = VSCalendar::current();
    std::vector<VSDate> dates;
    const VSDate last = calendar.yesterdayAtNoon(*maxValue()), lastDay = calendar.startOfDay(last);
    VSDate noon = last;
    for (int days = dayOffset_; noon > *minValue(); days += dayOffset_) {
        // A day that the zone left out is the one after it.
        if (dates.empty() || noon < dates.back()) dates.push_back(noon);
        noon = calendar.noonOfDay(calendar.addDays(lastDay, -days));
    }
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
