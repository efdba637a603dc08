#pragma once

#include "Vessa/VSUnit.h"

/// A number with its unit. Plain value.
class VSQuantity {
 public:
    VSQuantity(VSUnit unit, double value) : unit_(unit), value_(value) {}

    const VSUnit& unit() const { return unit_; }
    /// The number in the quantity's own unit.
    double value() const { return value_; }
    bool isCompatibleWith(const VSUnit& unit) const { return unit_.isCompatibleWith(unit); }
    /// REQUIRES: isCompatibleWith(unit).
    double doubleValueForUnit(const VSUnit& unit) const;

 private:
    VSUnit unit_;
    double value_;
};
