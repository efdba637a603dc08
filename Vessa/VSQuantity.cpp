#include "Vessa/VSQuantity.h"

#include <cassert>
#include <limits>

double VSQuantity::doubleValueForUnit(const VSUnit& unit) const {
    const auto value = unit_.convert(value_, unit);
    assert(value);
    return value.value_or(std::numeric_limits<double>::quiet_NaN());
}
