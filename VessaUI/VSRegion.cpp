#include "VessaUI/VSRegion.h"

#include <unicode/uloc.h>
#include <unicode/ulocdata.h>

#include <algorithm>
#include <array>
#include <string_view>

namespace {

std::string regionOfLocale(const std::string& identifier) {
    UErrorCode error = U_ZERO_ERROR;
    std::array<char, ULOC_FULLNAME_CAPACITY> full{};
    uloc_addLikelySubtags(identifier.c_str(), full.data(), full.size(), &error);
    if (U_FAILURE(error)) return {};
    std::array<char, ULOC_COUNTRY_CAPACITY> region{};
    uloc_getCountry(full.data(), region.data(), region.size(), &error);
    return U_FAILURE(error) ? std::string{} : std::string(region.data());
}

UMeasurementSystem measurementSystem(const std::string& identifier) {
    UErrorCode error = U_ZERO_ERROR;
    const UMeasurementSystem system = ulocdata_getMeasurementSystem(identifier.c_str(), &error);
    return U_FAILURE(error) ? UMS_SI : system;
}

struct Region {
    std::string locale;
    std::string code;
    UMeasurementSystem system = UMS_SI;
};

/// Asked for with every value that is shown, so that a thread keeps its last answer.
const Region& regionOf(const std::string& localeIdentifier) {
    thread_local Region last;
    if (last.code.empty() || last.locale != localeIdentifier)
        last = {localeIdentifier, regionOfLocale(localeIdentifier), measurementSystem(localeIdentifier)};
    return last;
}

template <size_t N>
bool isOneOf(const std::array<std::string_view, N>& regions, const std::string& region) {
    return std::find(regions.begin(), regions.end(), region) != regions.end();
}

// Weather and fever are told in Fahrenheit in the United States and its territories, and in these others.
constexpr std::array<std::string_view, 16> fahrenheitRegions{"US", "AS", "BS", "BZ", "FM", "GU", "KY", "LR",
                                                             "MH", "MP", "PR", "PW", "TC", "UM", "VG", "VI"};

// Where laboratories and meters report glucose in mmol/L. Elsewhere, Germany, France, Italy, Spain, Poland,
// Egypt, India, Japan and both Americas but Canada among them, mg/dL is usual.
constexpr std::array<std::string_view, 43> millimolarRegions{
    "AU", "BA", "BG", "BH", "BN", "BW", "CA", "CH", "CN", "CZ", "DK", "EE", "FI", "FO", "GB",
    "GG", "GL", "HK", "HR", "HU", "IE", "IM", "IS", "JE", "KE", "KZ", "LK", "LT", "LV", "MK",
    "MN", "MT", "MY", "NL", "NO", "NZ", "QA", "RS", "RU", "SE", "SI", "SK", "ZA"};

// Food labels and energy advice in kilojoules first.
constexpr std::array<std::string_view, 3> kilojouleRegions{"AU", "NZ", "ZA"};

// Where US customary measures are everyday measures, whatever a newer official standard says.
constexpr std::array<std::string_view, 3> customaryRegions{"US", "LR", "MM"};

}  // namespace

bool VSRegionHasUnitCustom(const std::string& localeIdentifier, VSUnitCustom custom) {
    const std::string& region = regionOf(localeIdentifier).code;
    const UMeasurementSystem system = regionOf(localeIdentifier).system;
    const bool customary = system == UMS_US || isOneOf(customaryRegions, region);
    switch (custom) {
        case VSUnitCustom::None:
            return false;
        case VSUnitCustom::Pounds:
            return customary;
        // The British tell height in feet and roads in miles; doctors and scales there speak of kilograms.
        case VSUnitCustom::FeetAndInches:
        case VSUnitCustom::Miles:
            return customary || system == UMS_UK;
        case VSUnitCustom::Fahrenheit:
            return isOneOf(fahrenheitRegions, region);
        case VSUnitCustom::USFluidOunces:
            return system == UMS_US;
        case VSUnitCustom::Kilojoules:
            return isOneOf(kilojouleRegions, region);
        case VSUnitCustom::MillimolarGlucose:
            return isOneOf(millimolarRegions, region);
    }
    return false;
}
