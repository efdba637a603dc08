#pragma once

#include <string>

/// A custom of a region in the use of units.
enum class VSUnitCustom {
    None,
    Pounds,            // body weight
    FeetAndInches,     // body height
    Miles,             // distances on the road
    Fahrenheit,        // temperatures of the body
    USFluidOunces,     // drinks
    Kilojoules,        // energy of food and exercise
    MillimolarGlucose  // blood glucose in mmol/L rather than mg/dL
};

/// Whether a custom holds in the region of a locale ("en_GB", "de", "ar_EG@calendar=gregorian"). A locale
/// without region stands for the region where most speak its language. Any thread.
bool VSRegionHasUnitCustom(const std::string& localeIdentifier, VSUnitCustom custom);
