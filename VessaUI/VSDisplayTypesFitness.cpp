#include "VessaUI/VSUnitChoices.h"

// Display types of the category of fitness. IDs are kept on disk and never reused. Totals are shown as they
// are, however great: a month of them stands in a bar of the year. The ranges of entries are of one entry,
// which is a day at most.

namespace {
using namespace VSUnitChoices;
constexpr double open = VSRowRange::open;

constexpr int all = VSDataUnitRow::allValues;
constexpr int stood = 0;  // of the values of stand hours
}  // namespace

std::span<const VSDataUnitGroupRow> VSFitnessDisplayTypes() {
    static const VSDataUnitGroupRow rows[] = {
        // The record over 24 hours, 319.6 km (Aleksandr Sorokin, 2022), is some 300,000 steps; a marathon
        // about 42,000 run or 60,000 walked.
        {.id = VSGroupID::Steps,
         .category = VSCategoryID::Fitness,
         .nameKey = "DISPLAY_TYPE_STEPS",
         .units = {{.type = "StepCount",
                    .units = Steps,
                    .displayRange = {0, open},
                    .absoluteRange = {0, 400000},
                    .confirmRange = {1, 60000}}},
         .charting = &VSChartingProfiles::Bars,
         .hierarchical = true},

        // 319.6 km in 24 hours, as above; 100 km is a long day of the trained.
        {.id = VSGroupID::WalkingRunningDistance,
         .category = VSCategoryID::Fitness,
         .nameKey = "DISPLAY_TYPE_WALKING_RUNNING_DISTANCE",
         .units = {{.type = "DistanceWalkingRunning",
                    .units = Distance,
                    .displayRange = {0, open},
                    .absoluteRange = {0, 350},
                    .confirmRange = {0.01, 100}}},
         .charting = &VSChartingProfiles::Bars,
         .hierarchical = true,
         .unitOnYAxis = true},

        // 1,026 km in 24 hours (Christoph Strasser, 2021); 300 km is the longest one-day race of
        // professionals.
        {.id = VSGroupID::CyclingDistance,
         .category = VSCategoryID::Fitness,
         .nameKey = "DISPLAY_TYPE_CYCLING_DISTANCE",
         .units = {{.type = "DistanceCycling",
                    .units = Distance,
                    .displayRange = {0, open},
                    .absoluteRange = {0, 1200},
                    .confirmRange = {0.01, 300}}},
         .charting = &VSChartingProfiles::Bars,
         .hierarchical = true,
         .unitOnYAxis = true},

        // Mountain stages and polar marches cost 8,000 to 10,000 kcal a day, the hardest races of 24 hours
        // up to twice that (see Thurber et al. 2019 on what can be kept up). 5,000 is beyond what amateurs
        // reach.
        {.id = VSGroupID::ActiveEnergy,
         .category = VSCategoryID::Fitness,
         .nameKey = "DISPLAY_TYPE_ACTIVE_ENERGY",
         .units = {{.type = "ActiveEnergyBurned",
                    .units = Energy,
                    .displayRange = {0, open},
                    .absoluteRange = {0, 20000},
                    .confirmRange = {1, 5000}}},
         .charting = &VSChartingProfiles::Bars,
         .hierarchical = true},

        // A body of 200 kg rests at about 3,000 kcal a day and one of 635 kg below 8,000 by the equations
        // of Mifflin and St Jeor; an entry may cover an hour, so there is no lower limit.
        {.id = 9,
         .category = VSCategoryID::Fitness,
         .nameKey = "DISPLAY_TYPE_RESTING_ENERGY",
         .units = {{.type = "BasalEnergyBurned",
                    .units = Energy,
                    .displayRange = {0, open},
                    .absoluteRange = {0, 8000},
                    .confirmRange = {1, 3500}}},
         .charting = &VSChartingProfiles::Bars,
         .hierarchical = true},

        // A floor is 3 m. 24 hours of stair climbing brings up to 20,000 m, 7,000 floors; the tallest
        // building has 163, and 300 is the climb of a mountain.
        {.id = VSGroupID::FlightsClimbed,
         .category = VSCategoryID::Fitness,
         .nameKey = "DISPLAY_TYPE_FLIGHTS_CLIMBED",
         .units = {{.type = "FlightsClimbed",
                    .units = Floors,
                    .displayRange = {0, open},
                    .absoluteRange = {0, 8000},
                    .confirmRange = {1, 300}}},
         .charting = &VSChartingProfiles::Bars,
         .hierarchical = true},

        // Points that a wristband counts; nobody enters them.
        {.id = 11,
         .category = VSCategoryID::Fitness,
         .nameKey = "DISPLAY_TYPE_NIKE_FUEL",
         .units = {{.type = "NikeFuel", .units = BareNumber, .displayRange = {0, open}}},
         .charting = &VSChartingProfiles::Bars,
         .manualEntry = false,
         .hierarchical = true,
         .unitIcon = "nikefuel_unit",
         .groupIcon = "nikefuel"},

        // Hours of the day in which the person stood for a while, told by a watch. The day shows both rows,
        // stood and idle; every total counts the hours stood.
        {.id = VSGroupID::StandHours,
         .category = VSCategoryID::Fitness,
         .nameKey = "DISPLAY_TYPE_STAND_HOURS",
         .units = {{.type = "ZentroStandHour",
                    .displayRange = {0, open},
                    .chartedValue = {all, all, stood, stood, stood}}},
         .charting = &VSChartingProfiles::StackedPeriods,
         .manualEntry = false,
         .hierarchical = true},

        {.id = VSGroupID::Workouts,
         .category = VSCategoryID::Fitness,
         .nameKey = "DISPLAY_TYPE_WORKOUTS",
         .units = {{.type = "Workout", .displayRange = {0, open}}},
         .charting = &VSChartingProfiles::Periods},
    };
    return rows;
}
