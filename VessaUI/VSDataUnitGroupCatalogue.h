#pragma once

#include <array>
#include <limits>
#include <memory>
#include <optional>
#include <span>
#include <unordered_map>
#include <vector>

#include "VessaUI/VSDataCategory.h"
#include "VessaUI/VSDataUnitGroup.h"
#include "VessaUI/VSRegion.h"

// The catalogue as data. The rows stand in VSDisplayTypes*.cpp, one file a subject; this header says what a
// row may hold. Everything that the program knows about a display type beyond its samples is written there.

/// One unit that a person may choose for a display type. The first of a list is the default; a later one
/// takes its place where `defaultWhere` names a custom of the user's region.
struct VSUnitChoice {
    const char* unit;
    int precision = 0;           // fraction digits shown and entered
    const char* nameKey = "";    // empty: a bare number
    bool nameHasPlural = false;  // the text of the key has a plural form
    VSUnitCustom defaultWhere = VSUnitCustom::None;
};

/// A range of a row, in the row's first unit, as shown. {0, 0} is no range; a maximum of `open` is no
/// maximum.
struct VSRowRange {
    static constexpr double open = std::numeric_limits<double>::infinity();
    double minimum = 0, maximum = 0;

    std::optional<VSValueRange> range() const {
        if (minimum == 0 && maximum == 0) return std::nullopt;
        return VSValueRange{minimum, maximum == open ? std::nullopt : std::optional(maximum)};
    }
};

/// What is charted, per time scope 0 to 4.
struct VSChartingProfile {
    VSChartStyle style;  // the default one, by which the kind of provider is chosen
    std::array<VSChartStyle, 5> styles;
    std::array<VSDateComponents, 5> intervals;
    std::array<double, 5> pointRadius;     // points
    std::array<double, 5> pointLineWidth;  // points
    bool startDayAtNoon = false;
    bool hideAverageLine = false;
};

/// One data type of a display type.
struct VSDataUnitRow {
    const char* type = nullptr;  // the type's identifier without prefix
    const char* labelKey = "";
    std::span<const VSUnitChoice> units = {};  // empty: not a quantity
    double factor = 1;                         // shown = stored * factor: 100 for percentages
    VSRowRange displayRange = {};              // beyond it a card says "more than"
    VSRowRange absoluteRange = {};             // an entry beyond it is refused
    VSRowRange confirmRange = {};              // an entry beyond it is asked about
    static constexpr int allValues = -1;       // no value of a category is negative
    std::array<int, 5> chartedValue{allValues, allValues, allValues, allValues,
                                    allValues};  // in each time scope
};

struct VSDataUnitGroupRow {
    int id;
    int category;
    const char* nameKey;  // and "<nameKey>_SUMMARY", "<nameKey>_KEYWORDS"
    std::vector<VSDataUnitRow> units;
    const VSChartingProfile* charting;
    const char* joinKey = "";
    bool manualEntry = true;
    bool hierarchical = false;
    bool unitOnYAxis = false;
    bool confirmUnitChange = false;
    const char* unitIcon = "";
    const char* groupIcon = "";
};

// The tables. Display types are listed and searched in this order.
std::span<const VSDataUnitGroupRow> VSBodyMeasurementDisplayTypes();
std::span<const VSDataUnitGroupRow> VSFitnessDisplayTypes();
std::span<const VSDataUnitGroupRow> VSVitalsDisplayTypes();
std::span<const VSDataUnitGroupRow> VSNutritionDisplayTypes();
std::span<const VSDataUnitGroupRow> VSResultsDisplayTypes();
std::span<const VSDataUnitGroupRow> VSSleepDisplayTypes();
std::span<const VSDataUnitGroupRow> VSReproductiveHealthDisplayTypes();
std::span<const VSDataUnitGroupRow> VSMeDisplayTypes();

namespace VSChartingProfiles {
extern const VSChartingProfile Bars;              // what adds up: steps, energy, nutrients
extern const VSChartingProfile Line;              // single readings: weight, temperature
extern const VSChartingProfile MinMax;            // readings whose spread matters: heart rate, glucose
extern const VSChartingProfile BasalTemperature;  // a line, and ranges over the months of a year
extern const VSChartingProfile Periods;           // spans of time: workouts
extern const VSChartingProfile NoonPeriods;       // the same, in days from noon to noon: sleep
extern const VSChartingProfile StackedPeriods;    // spans by value: stand hours
extern const VSChartingProfile Presence;          // days on which something was recorded
extern const VSChartingProfile Counts;            // how often something happened
extern const VSChartingProfile NotCharted;        // characteristics
}  // namespace VSChartingProfiles

/// Builds the display types from the tables, once; they live until the process ends.
struct VSDataUnitGroupCatalogue {
    static const VSDataUnitGroupCatalogue& shared();

    std::vector<const VSDataUnitGroup*> groups;
    std::unordered_map<int, const VSDataUnitGroup*> byID;
    std::unordered_map<const VSObjectType*, const VSDataUnitGroup*> byType;

 private:
    VSDataUnitGroupCatalogue();
    ~VSDataUnitGroupCatalogue();
    void add(const VSDataUnitGroupRow& row);
    std::unique_ptr<VSDataUnit> makeUnit(const VSDataUnitRow& row, const VSDataUnitGroup* group) const;
    static std::unique_ptr<const VSDataUnitGroupChartingRules> makeRules(const VSDataUnitGroupRow& row);
    std::vector<std::unique_ptr<VSDataUnitGroup>> ownedGroups_;
    std::vector<std::unique_ptr<VSDataUnit>> ownedUnits_;
};
