#include "Qelvar/Models/Data/QVChartPoint.h"

#include <algorithm>
#include <cmath>
#include <functional>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSValue.h"

namespace {

std::string dateDescription(VSDate date) {
    return VSISO8601FromDate(date, VSCalendar::current());
}

// Equal numbers hash alike: 0.0 and -0.0 too, which std::hash sees to.
size_t hashOfNumber(double number) {
    return std::hash<double>()(number);
}

bool smaller(const QVChartYValues::value_type& a, const QVChartYValues::value_type& b) {
    return a.second < b.second;
}

}  // namespace

std::vector<double> QVChartPointNumeric::allYValues() const {
    if (!yValue_) return {};
    return {*yValue_};
}

QVChartYValue QVChartPointNumeric::yValue() const {
    if (!yValue_) return std::monostate();
    return *yValue_;
}

bool QVChartPointNumeric::isEqual(const QVChartPoint& other) const {
    const auto* numeric = dynamic_cast<const QVChartPointNumeric*>(&other);
    return numeric && xValue() == numeric->xValue() && yValue_ == numeric->yValue_;
}

size_t QVChartPointNumeric::hash() const {
    return std::hash<VSDate>()(xValue()) ^ (yValue_ ? hashOfNumber(*yValue_) : 0);
}

std::string QVChartPointNumeric::description() const {
    return "(" + dateDescription(xValue()) + ", " + (yValue_ ? VSValue(*yValue_).description() : "none") +
           ")";
}

std::optional<double> QVChartPointDictionary::yValueForKey(std::string_view key) const {
    const auto found = yValue_.find(key);
    if (found == yValue_.end()) return std::nullopt;
    return found->second;
}

std::vector<double> QVChartPointDictionary::allYValues() const {
    std::vector<double> values;
    values.reserve(yValue_.size());
    for (const auto& [key, value] : yValue_) values.push_back(value);
    return values;
}

std::optional<double> QVChartPointDictionary::minYValue() const {
    if (yValue_.empty()) return std::nullopt;
    return std::min_element(yValue_.begin(), yValue_.end(), smaller)->second;
}

std::optional<double> QVChartPointDictionary::maxYValue() const {
    if (yValue_.empty()) return std::nullopt;
    return std::max_element(yValue_.begin(), yValue_.end(), smaller)->second;
}

std::optional<double> QVChartPointDictionary::averageYValue() const {
    if (averageStyle_ == AverageStyle::Minimum) return minYValue();
    if (averageStyle_ != AverageStyle::Mean) return maxYValue();
    double sum = 0;
    for (const auto& [key, value] : yValue_) sum += value;
    if (yValue_.empty() || !std::isfinite(sum)) return std::nullopt;
    return sum / static_cast<double>(yValue_.size());
}

bool QVChartPointDictionary::isEqual(const QVChartPoint& other) const {
    const auto* dictionary = dynamic_cast<const QVChartPointDictionary*>(&other);
    return dictionary && xValue() == dictionary->xValue() && yValue_ == dictionary->yValue_ &&
           averageStyle_ == dictionary->averageStyle_;
}

size_t QVChartPointDictionary::hash() const {
    size_t values = yValue_.size();
    for (const auto& [key, value] : yValue_)
        values = values * 31 + (std::hash<std::string>()(key) ^ hashOfNumber(value));
    return std::hash<VSDate>()(xValue()) ^ values ^ static_cast<size_t>(averageStyle_);
}

std::string QVChartPointDictionary::description() const {
    std::string result = "(" + dateDescription(xValue());
    for (const auto& [key, value] : yValue_) result += ", " + key + " " + VSValue(value).description();
    return result + ")";
}
