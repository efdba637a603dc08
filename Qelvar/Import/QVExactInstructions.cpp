#include "Qelvar/Import/QVExactInstructions.h"

#include <algorithm>
#include <array>
#include <cmath>

#include "Qelvar/Import/QVXMLText.h"
#include "Vessa/VSLimits.h"

namespace {

constexpr size_t kLongestInstruction = 9'000'000;  // the parser takes ten
constexpr size_t kLongestMedicalID = 2 * VSLimits::largestPicture + 4 * VSLimits::longestMetadata;
constexpr int64_t kSecond = 1'000'000;

}  // namespace

const std::optional<std::string>& QVExactSources::identifierOf(std::string_view name) const {
    static const std::optional<std::string> ofName;
    const auto found = identifiers_.find(name);
    return found == identifiers_.end() ? ofName : found->second;
}

void QVExactSources::set(const std::string& name, const std::optional<std::string>& identifier) {
    if (identifiers_.size() >= kMostNames && !identifiers_.contains(name)) identifiers_.clear();
    identifiers_[name] = identifier;
}

void QVExactInstructions::read(std::string_view content) {
    const size_t blank = content.find(' ');
    if (isForeign_ || blank == std::string_view::npos || content.size() > kLongestInstruction) return;
    const std::string_view name = content.substr(0, blank);
    auto value = VSValue::fromSerialized(content.substr(blank + 1));
    if (!value) return;
    if (name == kQVExactVersionName)
        isForeign_ = value->integer() && *value->integer() > kQVExactVersion;
    else if (name == kQVExactTimeZone)
        readTimeZone(*value);
    else if (name == kQVExactSource)
        readSource(*value);
    else if (name == kQVExactWorkouts)
        readWorkouts(*value);
    else if (name == kQVExactMicroseconds)
        readMicroseconds(*value);
    else if (name == kQVExactNumber)
        next_.number = std::max<int64_t>(value->integer().value_or(0), 0);
    else if (name == kQVExactMedicalID && value->string() &&
             next_.medicalID.size() + value->string()->size() <= kLongestMedicalID)
        next_.medicalID += *value->string();
    else
        readAttribute(name, std::move(*value));
}

void QVExactInstructions::readTimeZone(const VSValue& value) {
    if (const auto* word = value.string(); word && *word == kQVExactUnknownTimeZone)
        timeZone_.emplace(std::nullopt);
    else if (const auto offset = value.integer(); offset && *offset >= -VSLimits::greatestTimeZoneOffset &&
                                                  *offset <= VSLimits::greatestTimeZoneOffset)
        timeZone_.emplace(static_cast<int>(*offset));
}

/// ["name", "identifier"]; without the identifier: that of the name.
void QVExactInstructions::readSource(const VSValue& value) {
    const auto* pair = value.array();
    if (!pair || pair->empty() || pair->size() > 2 || !pair->front().string() || !pair->back().string())
        return;
    const bool isNamed = pair->size() == 2;
    sources_.set(*pair->front().string(), isNamed ? std::optional(*pair->back().string()) : std::nullopt);
}

void QVExactInstructions::readWorkouts(const VSValue& value) {
    const auto* numbers = value.array();
    if (!numbers || numbers->size() > VSLimits::mostWorkouts) return;
    workouts_.clear();
    for (const VSValue& number : *numbers) {
        if (number.integer() && *number.integer() > 0) workouts_.push_back(*number.integer());
    }
    std::sort(workouts_.begin(), workouts_.end());
    workouts_.erase(std::unique(workouts_.begin(), workouts_.end()), workouts_.end());
}

void QVExactInstructions::readMicroseconds(const VSValue& value) {
    const auto* dates = value.array();
    if (!dates || dates->size() > QVExactDateCount) return;
    std::vector<int> microseconds;
    for (const VSValue& date : *dates) {
        if (!date.integer() || *date.integer() < 0 || *date.integer() >= kSecond) return;
        microseconds.push_back(static_cast<int>(*date.integer()));
    }
    next_.microseconds = std::move(microseconds);
}

void QVExactInstructions::readAttribute(std::string_view name, VSValue value) {
    const auto found = std::find(kQVAttributeNames.begin(), kQVAttributeNames.end(), name);
    if (found == kQVAttributeNames.end()) return;
    next_.attributes[static_cast<QVAttributeName>(found - kQVAttributeNames.begin())] = std::move(value);
}

bool QVExactAgrees(const std::string& exact, std::string_view attribute) {
    return exact == attribute || QVXMLText(exact) == attribute;
}

bool QVExactAgrees(double exact, const VSUnit& canonical, double attribute, const VSUnit& unit, int digits) {
    const auto converted = canonical.convert(exact, unit);
    if (!converted) return false;
    if (*converted == attribute) return true;
    const double size = std::max(std::fabs(*converted), std::fabs(attribute));
    // The last digit may be rounded either way where machines reckon differently.
    const double lastDigit = std::pow(10, std::floor(std::log10(size)) - (digits - 1));
    return std::fabs(*converted - attribute) <= 0.500001 * lastDigit;
}
