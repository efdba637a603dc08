// Makes demodata.plist, the demo profile, from a month of real records and from believable made-up ones.
//
//   unzip -p wrist-2020-03.zip | make_demodata > demodata.plist
//
// The real month (steps, distance, energy, flights, heart rate, weight, workouts) becomes the last 31 days, ending
// today; the eleven months before it repeat its days, thinned out, scaled by season and shuffled. All else is drawn from a
// fixed seed, so the same input gives the same file. Entries of today end at 15:00.

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <iostream>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace {

constexpr int kDay = 86'400;
constexpr int kHour = 3'600;
constexpr int kEndOfToday = 15 * kHour;
constexpr int kOldestDay = -395;

/// A small generator of our own: the standard's distributions differ from library to library.
class Random {
   public:
    double uniform() {
        state_ = state_ * 6364136223846793005ULL + 1442695040888963407ULL;
        return static_cast<double>(state_ >> 11) * 0x1.0p-53;
    }
    double between(double low, double high) { return low + (high - low) * uniform(); }
    int whole(int low, int high) { return low + static_cast<int>(uniform() * (high - low + 1)); }
    bool chance(double probability) { return uniform() < probability; }
    /// Roughly normal: the sum of six uniforms.
    double normal(double mean, double deviation) {
        double sum = 0;
        for (int i = 0; i < 6; ++i) sum += uniform();
        return mean + (sum - 3) * std::sqrt(2.0) * deviation;
    }

   private:
    uint64_t state_ = 20200331;
};

struct Entry {
    std::string identifier;
    double value = 0;
    int64_t start = 0;
    std::optional<int64_t> end;
    std::string unit;                                         // empty: the type's demo unit
    std::vector<std::pair<std::string, std::string>> extras;  // further keys, the value as XML
};

class Profile {
   public:
    std::vector<Entry> entries;
    Random random;

    void quantity(const char* name, double value, int64_t start, std::optional<int64_t> end, const char* unit = "", double step = 0) {
        if (step > 0) value = std::round(value / step) * step;
        add({std::string("VSQuantityTypeIdentifier") + name, value, start, end, unit, {}});
    }
    void category(const char* name, int value, int64_t start, std::optional<int64_t> end) {
        add({std::string("VSCategoryTypeIdentifier") + name, double(value), start, end, "", {}});
    }
    void add(Entry entry) {
        if (entry.end.value_or(entry.start) > kEndOfToday) return;
        entries.push_back(std::move(entry));
    }
};

struct Record {
    std::string type;
    double value;
    int day;           // 0 is the last day of the month, -30 the first
    int start, end;    // seconds from that day's midnight
    double energy = 0, distance = 0;
};

std::string attribute(const std::string& line, const char* name) {
    const std::string key = std::string(" ") + name + "=\"";
    const auto at = line.find(key);
    if (at == std::string::npos) return {};
    const auto begin = at + key.size();
    return line.substr(begin, line.find('"', begin) - begin);
}

/// Days before 31 March and seconds of the day of "2020-03-04 05:06:07 +0100"; none outside the month.
std::optional<std::pair<int, int>> monthDay(const std::string& text) {
    int year = 0, month = 0, day = 0, hour = 0, minute = 0, second = 0;
    if (std::sscanf(text.c_str(), "%d-%d-%d %d:%d:%d", &year, &month, &day, &hour, &minute, &second) != 6) return {};
    const int seconds = hour * kHour + minute * 60 + second;
    if (year == 2020 && month == 4 && day == 1) return std::pair{1, seconds};
    if (year != 2020 || month != 3) return {};
    return std::pair{day - 31, seconds};
}

int activityNumber(const std::string& identifier) {
    static const std::map<std::string, int> numbers = {{"VSWorkoutActivityTypeWalking", 52}, {"VSWorkoutActivityTypeRunning", 37},
                                                       {"VSWorkoutActivityTypeCrossTraining", 11}, {"VSWorkoutActivityTypeCycling", 13}};
    const auto found = numbers.find(identifier);
    return found == numbers.end() ? 3000 : found->second;
}

std::vector<Record> readMonth(std::istream& in) {
    std::vector<Record> records;
    for (std::string line; std::getline(in, line);) {
        const bool workout = line.find("<Workout ") != std::string::npos;
        if (!workout && line.find("<Record ") == std::string::npos) continue;
        const auto start = monthDay(attribute(line, "startDate"));
        const auto end = monthDay(attribute(line, "endDate"));
        if (!start || !end) continue;
        Record record{};
        record.day = start->first;
        record.start = start->second;
        record.end = (end->first - start->first) * kDay + end->second;
        if (workout) {
            record.type = "Workout";
            record.value = activityNumber(attribute(line, "workoutActivityType"));
            record.energy = std::atof(attribute(line, "totalEnergyBurned").c_str());
            record.distance = std::atof(attribute(line, "totalDistance").c_str()) / 1.609344;
        } else {
            record.type = attribute(line, "type").substr(std::string("VSQuantityTypeIdentifier").size());
            record.value = std::atof(attribute(line, "value").c_str());
        }
        records.push_back(record);
    }
    return records;
}

void addRecord(Profile& profile, const Record& record, int day, double factor) {
    const int64_t start = int64_t{day} * kDay + record.start;
    const int64_t end = int64_t{day} * kDay + record.end;
    if (record.type == "Workout") {
        Entry entry{"VSWorkoutTypeIdentifier", record.value, start, end, "", {}};
        entry.extras.emplace_back("energyBurned", "<real>" + std::to_string(std::round(record.energy)) + "</real>");
        entry.extras.emplace_back("totalDistance", "<real>" + std::to_string(record.distance) + "</real>");
        profile.add(entry);
    } else if (record.type == "BodyMass") {
        profile.quantity("BodyMass", record.value / 0.45359237, start, end, "", 0.1);
    } else if (record.type == "DistanceWalkingRunning") {
        profile.quantity("DistanceWalkingRunning", record.value * factor, start, end, "km", 0.00001);
    } else {
        profile.quantity(record.type.c_str(), std::max(1.0, record.value * factor), start, end, "", 1);
    }
}

/// The real month. Heart rate, a reading a minute, is thinned to one in ten minutes (half an hour before the last week).
void addMonth(Profile& profile, const std::vector<Record>& records) {
    int64_t lastHeartRate = INT64_MIN;
    for (const auto& record : records) {
        if (record.type == "HeartRate") {
            const int64_t at = int64_t{record.day} * kDay + record.start;
            if (at - lastHeartRate < (record.day > -7 ? 600 : 1800)) continue;
            lastHeartRate = at;
        }
        if (record.type == "FlightsClimbed") {
            // The tracker counts floors over many hours, also over midnight; shown as climbed when it said so.
            Record climbed = record;
            climbed.start = record.end - 120;
            addRecord(profile, climbed, record.day, 1);
            continue;
        }
        addRecord(profile, record, record.day, 1);
    }
}

struct DayTotals {
    double steps = 0, distance = 0, energy = 0, flights = 0;
    double lowest = 0, highest = 0, heartSum = 0;
    int heartCount = 0;
};

/// The months before: each day takes the totals of a day of the real month, scaled by season, in a few spans.
void addOlderMonths(Profile& profile, const std::vector<Record>& records) {
    std::map<int, DayTotals> days;
    for (const auto& record : records) {
        auto& day = days[record.day];
        if (record.type == "StepCount") day.steps += record.value;
        if (record.type == "DistanceWalkingRunning") day.distance += record.value;
        if (record.type == "ActiveEnergyBurned") day.energy += record.value;
        if (record.type == "FlightsClimbed") day.flights += record.value;
        if (record.type == "HeartRate") {
            if (day.heartCount == 0 || record.value < day.lowest) day.lowest = record.value;
            day.highest = std::max(day.highest, record.value);
            day.heartSum += record.value;
            ++day.heartCount;
        }
    }
    std::vector<DayTotals> pool;
    for (const auto& [day, totals] : days)
        if (totals.heartCount > 0 && totals.steps > 0) pool.push_back(totals);
    if (pool.empty()) return;

    constexpr int kSpans[][2] = {{7, 9}, {11, 13}, {16, 18}, {19, 21}};
    constexpr double kShares[] = {0.2, 0.2, 0.35, 0.25};
    for (int day = kOldestDay; day < -30; ++day) {
        const auto& totals = pool[profile.random.whole(0, static_cast<int>(pool.size()) - 1)];
        const double season = (0.62 + 0.18 * std::sin(day / 58.0)) * profile.random.between(0.8, 1.2);
        const int64_t midnight = int64_t{day} * kDay;
        for (int i = 0; i < 4; ++i) {
            const int64_t start = midnight + kSpans[i][0] * kHour, end = midnight + kSpans[i][1] * kHour;
            const double share = kShares[i] * season;
            profile.quantity("StepCount", totals.steps * share, start, end, "", 1);
            profile.quantity("DistanceWalkingRunning", totals.distance * share, start, end, "km", 0.001);
            profile.quantity("ActiveEnergyBurned", totals.energy * share, start, end, "", 1);
        }
        if (totals.flights > 0) profile.quantity("FlightsClimbed", totals.flights, midnight + 8 * kHour, midnight + 9 * kHour);
        const double mean = totals.heartSum / totals.heartCount;
        const double readings[] = {totals.lowest, mean - 8, mean, mean + 6, mean + 0.6 * (totals.highest - mean), totals.highest};
        for (int i = 0; i < 6; ++i) profile.quantity("HeartRate", readings[i], midnight + (3 + 3 * i) * kHour, {}, "", 1);
    }
}

void addBodyMeasurements(Profile& profile) {
    auto& random = profile.random;
    profile.quantity("Height", 168, int64_t{kOldestDay} * kDay + 9 * kHour, {});
    profile.quantity("Height", 168, -20LL * kDay + 9 * kHour, {});
    profile.quantity("Height", 168, 8 * kHour, {});
    for (int day = kOldestDay; day <= 0; day += day < -31 ? 5 : (day < -7 ? 2 : 1)) {
        const int64_t at = int64_t{day} * kDay + 7 * kHour + random.whole(0, 40) * 60;
        const double trend = 133 + 9.0 * day / kOldestDay + 1.2 * std::sin(day / 19.0);
        const double pounds = trend - 9 + random.normal(0, 0.5);
        const double fat = 0.245 + 0.02 * day / kOldestDay + random.normal(0, 0.002);
        const double kilograms = pounds * 0.45359237;
        profile.quantity("BodyMass", pounds, at, {}, "", 0.1);
        profile.quantity("BodyMassIndex", kilograms / (1.68 * 1.68), at, {}, "", 0.1);
        profile.quantity("BodyFatPercentage", fat, at, {}, "%", 0.001);
        profile.quantity("LeanBodyMass", kilograms * (1 - fat), at, {}, "kg", 0.1);
        if (day % 3 == 0) profile.quantity("WaistCircumference", 74 + 3.0 * day / kOldestDay + random.normal(0, 0.4), at, {}, "cm", 0.5);
    }
}

/// Glucose over a day: a base with a hump after each meal and a dip at night.
double glucoseAt(double hour, Random& random) {
    double value = 96 + 5 * std::sin(hour / 24 * 6.283);
    for (const double meal : {7.5, 12.5, 18.5}) {
        const double since = hour - meal;
        if (since > 0 && since < 4) value += 48 * since * std::exp(1 - since * 1.25);
    }
    return value + random.normal(0, 5);
}

void addVitals(Profile& profile) {
    auto& random = profile.random;
    for (int day = kOldestDay; day <= 0; ++day) {
        const int64_t midnight = int64_t{day} * kDay;
        const bool recent = day > -31;
        const int glucoseStep = day > -8 ? 900 : (recent ? 3600 : 4 * kHour);
        if (recent || day % 3 == 0)
            for (int at = 0; at < kDay; at += glucoseStep) profile.quantity("BloodGlucose", glucoseAt(at / 3600.0, random), midnight + at, {}, "mg/dL", 1);
        if (recent || day % 4 == 0) {
            for (const int hour : {7, 13, 20}) {
                const int64_t at = midnight + hour * kHour + random.whole(0, 30) * 60;
                const double systolic = random.normal(118 + (hour == 20 ? 4 : 0), 5);
                profile.quantity("BloodPressureSystolic", systolic, at, {}, "", 1);
                profile.quantity("BloodPressureDiastolic", systolic * 0.645 + random.normal(0, 2.5), at, {}, "", 1);
                profile.add({"VSCorrelationTypeIdentifierBloodPressure", 0, at, {}, "", {}});
            }
            for (const int hour : {2, 6, 10, 14}) {
                profile.quantity("RespiratoryRate", random.normal(hour < 8 ? 13.5 : 16, 1), midnight + hour * kHour + 600, {}, "count/min", 0.5);
                profile.quantity("OxygenSaturation", std::min(1.0, random.normal(0.972, 0.007)), midnight + hour * kHour + 900, {}, "%", 0.01);
            }
            for (const int hour : {7, 11, 14}) profile.quantity("BodyTemperature", random.normal(36.5 + 0.02 * hour, 0.15), midnight + hour * kHour, {}, "degC", 0.1);
            profile.quantity("PeripheralPerfusionIndex", random.between(0.02, 0.06), midnight + 8 * kHour, {}, "%", 0.001);
            profile.quantity("ForcedVitalCapacity", random.normal(3.9, 0.08), midnight + 8 * kHour + 300, {}, "L", 0.01);
            profile.quantity("ForcedExpiratoryVolume1", random.normal(3.2, 0.08), midnight + 8 * kHour + 360, {}, "L", 0.01);
            profile.quantity("PeakExpiratoryFlowRate", random.normal(430, 15), midnight + 8 * kHour + 420, {}, "L/min", 1);
            for (const int hour : {8, 14}) profile.quantity("InhalerUsage", random.whole(1, 2), midnight + hour * kHour + 480, {}, "count");
            profile.quantity("UVExposure", random.whole(1, 6), midnight + 12 * kHour, midnight + 14 * kHour, "count");
            if (day % 6 == 0 || day == 0) profile.quantity("BloodAlcoholContent", random.between(0.0, 0.0004), midnight + 1 * kHour, {}, "%", 0.0001);
            if (day % 10 == 0) profile.quantity("NumberOfTimesFallen", 1, midnight + 11 * kHour, {}, "count");
        }
        // The basal temperature rises by a third of a degree after ovulation, on day 14 of a cycle of 28.
        const int cycleDay = ((day % 28) + 28 + 6) % 28;
        profile.quantity("BasalBodyTemperature", (cycleDay >= 14 ? 36.75 : 36.4) + random.normal(0, 0.06), midnight + 6 * kHour + 1800, {}, "degC", 0.01);
    }
}

void addActivity(Profile& profile) {
    auto& random = profile.random;
    for (int day = kOldestDay; day <= 0; ++day) {
        const int64_t midnight = int64_t{day} * kDay;
        const bool recent = day > -31;
        if (recent)
            for (int hour = 0; hour < 24; ++hour) profile.quantity("BasalEnergyBurned", random.normal(58, 1.5), midnight + hour * kHour, midnight + (hour + 1) * kHour, "", 0.1);
        else
            profile.quantity("BasalEnergyBurned", random.normal(1390, 20), midnight, midnight + kDay, "", 1);
        for (int hour = 7; hour < 22; ++hour)
            if (day > -62) profile.category("ZentroStandHour", random.chance(0.8) ? 0 : 1, midnight + hour * kHour, midnight + (hour + 1) * kHour);
        if (day % 2 == 0) {
            profile.quantity("DistanceCycling", random.between(2, 5), midnight + 7 * kHour + 1800, midnight + 8 * kHour, "km", 0.01);
            profile.quantity("DistanceCycling", random.between(2, 14), midnight + 17 * kHour, midnight + 17 * kHour + 2400, "km", 0.01);
        }
        profile.quantity("NikeFuel", random.whole(300, 900), midnight + 8 * kHour, midnight + 9 * kHour, "count");
        if (!recent && day % 3 == 0) {
            Entry workout{"VSWorkoutTypeIdentifier", double(day % 2 ? 37 : 52), midnight + 17 * kHour, midnight + 17 * kHour + random.whole(25, 80) * 60, "", {}};
            workout.extras.emplace_back("energyBurned", "<integer>" + std::to_string(random.whole(180, 480)) + "</integer>");
            profile.add(workout);
        }
    }
    profile.add({"VSWorkoutTypeIdentifier", 37, 7 * kHour, 7 * kHour + 2100, "", {{"energyBurned", "<integer>310</integer>"}, {"totalDistance", "<real>3.4</real>"}}});
}

void addSleepAndCycle(Profile& profile) {
    auto& random = profile.random;
    bool bleedingBefore = false;
    for (int day = kOldestDay; day <= 0; ++day) {
        const int64_t midnight = int64_t{day} * kDay;
        const int64_t bed = midnight - 3600 + random.whole(-40, 50) * 60, up = midnight + 6 * kHour + 1800 + random.whole(-30, 60) * 60;
        const int64_t wake = bed + (up - bed) / 2 + random.whole(-40, 40) * 60;
        profile.category("SleepAnalysis", 0, bed, up);
        profile.category("SleepAnalysis", 1, bed + random.whole(8, 25) * 60, wake);
        profile.category("SleepAnalysis", 1, wake + random.whole(4, 20) * 60, up - random.whole(2, 12) * 60);

        const int cycleDay = ((day % 28) + 28 + 6) % 28;
        const int64_t noon = midnight + 9 * kHour;
        const bool bleeding = cycleDay < 5;
        if (bleeding) {
            if (!bleedingBefore) profile.category("MenstrualFlow", 1, noon, {});  // marks the start of a cycle
            profile.category("MenstrualFlow", cycleDay == 1 ? 4 : (cycleDay < 3 ? 3 : 2), noon, {});
        }
        bleedingBefore = bleeding;
        if (cycleDay == 20 || cycleDay == 6) profile.category("IntermenstrualBleeding", 0, noon + 60, {});
        if (cycleDay >= 8 && cycleDay <= 16) profile.category("CervicalMucusQuality", cycleDay < 10 ? 2 : (cycleDay < 12 ? 3 : (cycleDay < 13 ? 4 : 5)), noon + 120, {});
        if (cycleDay >= 11 && cycleDay <= 14) profile.category("OvulationTestResult", cycleDay == 13 ? 2 : (cycleDay == 14 ? 3 : 1), noon + 180, {});
        if (day % 4 == 0) profile.category("SexualActivity", random.whole(1, 3), midnight + 1800, {});
    }
}

struct Nutrient { const char* name; double perDay; const char* unit; };

/// A day's intake of an adult, by meals: roughly the reference intakes of nutrition tables.
constexpr Nutrient kNutrients[] = {
    {"DietaryEnergyConsumed", 2000, ""}, {"DietaryFatTotal", 70, "g"}, {"DietaryFatPolyunsaturated", 16, "g"}, {"DietaryFatMonounsaturated", 27, "g"},
    {"DietaryFatSaturated", 20, "g"}, {"DietaryCholesterol", 240, "mg"}, {"DietarySodium", 2100, "mg"}, {"DietaryCarbohydrates", 250, "g"},
    {"DietaryFiber", 27, "g"}, {"DietarySugar", 60, "g"}, {"DietaryProtein", 78, "g"}, {"DietaryVitaminA", 800, "mcg"}, {"DietaryVitaminB6", 1.4, "mg"},
    {"DietaryVitaminB12", 3.5, "mcg"}, {"DietaryVitaminC", 92, "mg"}, {"DietaryVitaminD", 9, "mcg"}, {"DietaryVitaminE", 12, "mg"}, {"DietaryVitaminK", 85, "mcg"},
    {"DietaryCalcium", 950, "mg"}, {"DietaryIron", 13, "mg"}, {"DietaryThiamin", 1.2, "mg"}, {"DietaryRiboflavin", 1.5, "mg"}, {"DietaryNiacin", 17, "mg"},
    {"DietaryFolate", 290, "mcg"}, {"DietaryBiotin", 38, "mcg"}, {"DietaryPantothenicAcid", 5.4, "mg"}, {"DietaryPhosphorus", 1150, "mg"}, {"DietaryIodine", 145, "mcg"},
    {"DietaryMagnesium", 330, "mg"}, {"DietaryZinc", 10, "mg"}, {"DietarySelenium", 58, "mcg"}, {"DietaryCopper", 1.2, "mg"}, {"DietaryManganese", 2.6, "mg"},
    {"DietaryChromium", 36, "mcg"}, {"DietaryMolybdenum", 55, "mcg"}, {"DietaryChloride", 2200, "mg"}, {"DietaryPotassium", 3000, "mg"}, {"DietaryCaffeine", 180, "mg"},
    {"DietaryWater", 1900, ""},
};

void addNutrition(Profile& profile) {
    auto& random = profile.random;
    constexpr int kMeals[] = {7 * kHour + 1800, 12 * kHour + 1800, 18 * kHour + 1800};
    constexpr double kShares[] = {0.27, 0.33, 0.40};
    for (int day = kOldestDay; day <= 0; ++day) {
        if (day <= -31 && day % 7 != 0) continue;
        for (int meal = 0; meal < 3; ++meal) {
            if (day <= -31 && meal != 2) continue;
            const double share = day <= -31 ? 1 : kShares[meal];
            for (const auto& nutrient : kNutrients) {
                // Only the main ones are kept at each meal of the whole month; the rest in the last week.
                const bool main = &nutrient - kNutrients < 11 || std::string(nutrient.name) == "DietaryWater" || std::string(nutrient.name) == "DietaryCaffeine";
                if (!main && day > -31 && day < -7 && meal != 1) continue;
                const double amount = nutrient.perDay * share * random.between(0.75, 1.25);
                const double step = std::pow(10.0, std::floor(std::log10(amount)) - 1);
                profile.quantity(nutrient.name, amount, int64_t{day} * kDay + kMeals[meal], {}, nutrient.unit, step);
            }
        }
    }
}

void writeNumber(double value) {
    if (value == std::floor(value) && std::abs(value) < 1e15)
        std::printf("<integer>%lld</integer>", static_cast<long long>(value));
    else
        std::printf("<real>%.10g</real>", value);
}

void write(const Profile& profile) {
    std::puts(R"(<?xml version="1.0" encoding="UTF-8"?>
<!-- Made by generator/make_demodata.cpp. Steps, distance, energy, flights, heart rate, weight and workouts of the last 31
     days are real: OpenFitnessDataset, data.private.garmin, Kent Madsen, CC BY 4.0 (thinned out, moved in time). -->
<plist version="1.0">
<dict>
<key>medicalID</key>
<dict>
<key>name</key><string>Robin Lindqvist</string>
<key>birthdate</key><date>1986-04-12T00:00:00Z</date>
<key>medicalConditions</key><string>Type 1 diabetes; mild asthma</string>
<key>medicalNotes</key><string>Wears a glucose sensor on the left upper arm.</string>
<key>allergyInfo</key><string>Penicillin; hazelnuts</string>
<key>medicationInfo</key><string>Insulin (pump); salbutamol inhaler when needed</string>
</dict>
<key>dashboardDataUnitGroups</key>
<array>)");
    for (const char* identifier : {"VSQuantityTypeIdentifierStepCount", "VSQuantityTypeIdentifierDistanceWalkingRunning", "VSQuantityTypeIdentifierFlightsClimbed",
                                   "VSQuantityTypeIdentifierActiveEnergyBurned", "VSQuantityTypeIdentifierHeartRate", "VSQuantityTypeIdentifierBodyMass",
                                   "VSQuantityTypeIdentifierBloodGlucose", "VSCategoryTypeIdentifierSleepAnalysis", "VSWorkoutTypeIdentifier",
                                   "VSCategoryTypeIdentifierZentroStandHour", "VSCategoryTypeIdentifierMenstrualFlow",
                                   "VSCategoryTypeIdentifierIntermenstrualBleeding", "VSCategoryTypeIdentifierOvulationTestResult",
                                   "VSCategoryTypeIdentifierCervicalMucusQuality", "VSQuantityTypeIdentifierBasalBodyTemperature",
                                   "VSCategoryTypeIdentifierSexualActivity"})
        std::printf("<string>%s</string>\n", identifier);
    std::puts("</array>\n<key>samples</key>\n<array>");
    for (const auto& entry : profile.entries) {
        std::printf("<dict><key>dataTypeIdentifier</key><string>%s</string><key>value</key>", entry.identifier.c_str());
        writeNumber(entry.value);
        std::printf("<key>dateOffsetInterval</key><integer>%lld</integer>", static_cast<long long>(entry.start));
        if (entry.end && *entry.end != entry.start) std::printf("<key>dateOffsetIntervalEnd</key><integer>%lld</integer>", static_cast<long long>(*entry.end));
        if (!entry.unit.empty()) std::printf("<key>unit</key><string>%s</string>", entry.unit.c_str());
        for (const auto& [key, value] : entry.extras) std::printf("<key>%s</key>%s", key.c_str(), value.c_str());
        std::puts("</dict>");
    }
    std::puts("</array>\n</dict>\n</plist>");
}

}  // namespace

int main() {
    const auto records = readMonth(std::cin);
    if (records.empty()) {
        std::fputs("make_demodata: no records on standard input\n", stderr);
        return 1;
    }
    Profile profile;
    addMonth(profile, records);
    addOlderMonths(profile, records);
    addBodyMeasurements(profile);
    addVitals(profile);
    addActivity(profile);
    addSleepAndCycle(profile);
    addNutrition(profile);
    write(profile);
}
