#pragma once

#include <span>
#include <string_view>

#include "Vessa/VSObjectType.h"

/// One row of the catalogue of data types.
struct VSTypeRow {
    int code;
    VSTypeKind kind;
    std::string_view name;                                            // the identifier without its prefix
    VSAggregationStyle aggregation = VSAggregationStyle::Cumulative;  // of quantity types
    std::string_view canonicalUnit = {};                              // of quantity types
};

/// The identifiers of the values of a category type or characteristic.
struct VSTypeValueRow {
    int code;
    int value;
    std::string_view identifier;
};

/// By code, ascending.
std::span<const VSTypeRow> VSTypeRows();
/// By code, then value, ascending.
std::span<const VSTypeValueRow> VSTypeValueRows();
/// Codes that no type has, ascending.
std::span<const int> VSReservedTypeCodes();
/// Names of the workout activities 1, 2, 3 ...
std::span<const std::string_view> VSWorkoutActivityNames();
inline constexpr int VSWorkoutActivityOther = 3000;
