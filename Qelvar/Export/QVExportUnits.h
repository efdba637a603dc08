#pragma once

#include <map>

#include "Vessa/VSObjectType.h"

/// The units in which an export writes quantities: those that the person sees. Types that are not in it are
/// written in their canonical unit. Plain value.
class QVExportUnits {
 public:
    QVExportUnits() = default;
    explicit QVExportUnits(std::map<const VSObjectType*, VSUnit> units) : units_(std::move(units)) {}

    /// REQUIRES: a quantity type.
    const VSUnit& preferredUnitForObjectType(const VSObjectType* type) const {
        const auto found = units_.find(type);
        const bool fits = found != units_.end() && found->second.isCompatibleWith(type->canonicalUnit());
        return fits ? found->second : type->canonicalUnit();
    }

 private:
    std::map<const VSObjectType*, VSUnit> units_;
};
