#include "Vessa/VSStoreMatcher.h"

#include <algorithm>
#include <cmath>

namespace {

double inUnit(const VSQuantity& quantity, const VSUnit& unit) {
    return quantity.unit() == unit ? quantity.value() : quantity.doubleValueForUnit(unit);
}

bool sameTotal(const std::optional<VSQuantity>& total, const VSUnit& unit, const VSStatement& row,
               int column) {
    if (!total) return row.isNull(column);
    return !row.isNull(column) && VSSameStoredValue(inUnit(*total, unit), row.real(column));
}

/// Whether a row was created when the sample says. Documents give whole seconds and cut off the rest.
bool sameCreation(const VSSampleRow& row, VSDate sought) {
    constexpr int64_t kSecond = 1'000'000;
    const int64_t created = row.start + row.created, wanted = sought.microseconds();
    if (created == wanted) return true;
    const int64_t rest = (created % kSecond + kSecond) % kSecond;
    return created - rest == wanted;
}

}  // namespace

double VSStoredValue(const VSSample& sample) {
    if (const auto* quantity = dynamic_cast<const VSQuantitySample*>(&sample))
        return inUnit(quantity->quantity(), sample.sampleType()->canonicalUnit());
    if (const auto* category = dynamic_cast<const VSCategorySample*>(&sample)) return category->value();
    if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample)) return workout->workoutActivityType();
    return 0;
}

bool VSSameStoredValue(double a, double b) {
    return a == b || std::abs(a - b) <= 1e-12 * std::max(std::abs(a), std::abs(b));
}

int64_t VSStoreMatcher::find(const VSSample& sample, const std::function<bool(int64_t id)>& accept) {
    const auto metadata = metadata_.find(sample.provenance().metadata);
    if (!metadata) return 0;
    auto rows =
        database_.use("SELECT " VS_SAMPLE_COLUMNS " FROM samples WHERE type = ? AND start = ? ORDER BY id");
    rows.bind(1, VSTypeCodeValue(sample.sampleType()->code())).bind(2, sample.startDate().microseconds());
    while (rows.step()) {
        const VSSampleRow row = VSReadSampleRow(rows);
        if (!sameRow(sample, *metadata, row)) continue;
        if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample);
            workout && !sameWorkout(*workout, row.id))
            continue;
        if (const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample);
            correlation && !sameMembers(*correlation, row.id))
            continue;
        if (accept(row.id)) return row.id;
    }
    return 0;
}

bool VSStoreMatcher::sameRow(const VSSample& sample, int64_t metadata, const VSSampleRow& row) {
    if (row.duration != (sample.endDate() - sample.startDate()).count() || row.metadata != metadata)
        return false;
    if (!VSSameStoredValue(row.value, VSStoredValue(sample))) return false;
    if (sample.creationDate() && !sameCreation(row, *sample.creationDate())) return false;
    const auto& entry = provenances_.provenance(row.provenance);
    const VSProvenance& sought = sample.provenance();
    if (entry.revision != sought.sourceRevision && *entry.revision != sample.sourceRevision()) return false;
    return !entry.device == !sought.device &&
           (!entry.device || entry.device == sought.device || *entry.device == *sought.device);
}

bool VSStoreMatcher::sameWorkout(const VSWorkout& workout, int64_t id) {
    auto row = database_.use("SELECT duration, energy, distance FROM workouts WHERE workout = ?");
    row.bind(1, id);
    if (!row.step()) return false;
    static const VSUnit metre = VSUnit::fromString("m");
    if (row.integer(0) != workout.duration().count() ||
        !sameTotal(workout.totalEnergyBurned(), VSUnit::kilocalorieUnit(), row, 1) ||
        !sameTotal(workout.totalDistance(), metre, row, 2))
        return false;
    auto events = database_.use("SELECT type, date FROM workout_events WHERE workout = ? ORDER BY position");
    events.bind(1, id);
    for (const VSWorkoutEvent& event : workout.workoutEvents()) {
        if (!events.step() || events.integer(0) != event.type || events.isNull(1) == event.date.has_value())
            return false;
        if (event.date && events.integer(1) != event.date->microseconds()) return false;
    }
    return !events.step();
}

std::vector<VSMemberKey> VSStoreMatcher::members(int64_t parent) {
    std::vector<VSMemberKey> keys;
    auto rows = database_.use("SELECT type, start, member FROM members WHERE parent = ? ORDER BY position");
    rows.bind(1, parent);
    while (rows.step()) {
        const auto* type = VSObjectType::dataTypeWithCode(static_cast<int>(rows.integer(0)));
        if (!type)
            throw VSDatabaseFailure({VSErrorCode::Corrupt, "the store has members of an unknown type"});
        keys.push_back({type, rows.integer(1), rows.integer(2)});
    }
    return keys;
}

bool VSStoreMatcher::row(const VSMemberKey& key, VSSampleRow& row) {
    auto statement =
        database_.use("SELECT " VS_SAMPLE_COLUMNS " FROM samples WHERE type = ? AND start = ? AND id = ?");
    statement.bind(1, VSTypeCodeValue(key.type->code())).bind(2, key.start).bind(3, key.id);
    if (!statement.step()) return false;
    row = VSReadSampleRow(statement);
    return true;
}

bool VSStoreMatcher::sameMembers(const VSCorrelation& correlation, int64_t id) {
    auto keys = members(id);
    if (keys.size() != correlation.objects().size()) return false;
    for (const VSSamplePtr& object : correlation.objects()) {
        const auto metadata = metadata_.find(object->provenance().metadata);
        if (!metadata) return false;
        const auto found = std::find_if(keys.begin(), keys.end(), [&](const VSMemberKey& key) {
            VSSampleRow stored;
            return key.type == object->sampleType() && key.start == object->startDate().microseconds() &&
                   row(key, stored) && sameRow(*object, *metadata, stored);
        });
        if (found == keys.end()) return false;
        keys.erase(found);
    }
    return true;
}
