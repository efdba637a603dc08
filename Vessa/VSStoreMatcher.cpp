#include "Vessa/VSStoreMatcher.h"

#include <algorithm>
#include <bit>
#include <cmath>

#include "Vessa/VSRollup.h"

namespace {

double inUnit(const VSQuantity& quantity, const VSUnit& unit) {
    return quantity.unit() == unit ? quantity.value() : quantity.doubleValueForUnit(unit);
}

bool sameTotal(const std::optional<VSQuantity>& total, const VSUnit& unit, const VSStatement& row,
               int column) {
    if (!total) return row.isNull(column);
    return !row.isNull(column) && VSSameStoredValue(inUnit(*total, unit), row.real(column));
}

/// Searches that met no more rows than these need no help.
constexpr int fewRows = 64;
constexpr size_t mostCrowded = 1'000'000;  // places kept, two a row
constexpr int64_t kSecond = 1'000'000;

int codeOf(const VSSample& sample) {
    return VSTypeCodeValue(sample.sampleType()->code());
}

/// Values that are the same but for rounding lie in the same bucket or in neighbouring ones.
int64_t valueBucket(double value) {
    constexpr int roundedBits = 14;  // 38 of 52 are left: steps of at least 1.8e-12
    return value == 0 ? 0 : std::bit_cast<int64_t>(value) >> roundedBits;
}

size_t originHash(const VSSourceRevision& revision) {
    const std::hash<std::string> hash;
    return hash(revision.source.bundleIdentifier) * 31 + hash(revision.source.name) * 7 +
           hash(revision.version);
}

/// Whether a row was created when the sample says. Documents give whole seconds and cut off the rest.
bool sameCreation(const VSSampleRow& row, VSDate sought) {
    const int64_t created = row.start + row.created, wanted = sought.microseconds();
    if (created == wanted) return true;
    const int64_t rest = (created % kSecond + kSecond) % kSecond;
    return created - rest == wanted;
}

}  // namespace

bool VSCanHaveMembers(const VSObjectType* type) {
    return type->kind() == VSTypeKind::Correlation || type->kind() == VSTypeKind::Workout;
}

std::string VSTypesWithMembers() {
    std::string codes;
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        if (VSCanHaveMembers(type))
            codes += (codes.empty() ? "" : ", ") + std::to_string(VSTypeCodeValue(type->code()));
    }
    return codes;
}

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

template <typename Visit>
void VSStoreMatcher::forEachRow(const VSSample& sample, Visit visit) {
    auto rows =
        database_.use("SELECT " VS_SAMPLE_COLUMNS " FROM samples WHERE type = ? AND start = ? ORDER BY id");
    rows.bind(1, codeOf(sample)).bind(2, sample.startDate().microseconds());
    while (rows.step() && visit(VSReadSampleRow(rows))) {
    }
}

int64_t VSStoreMatcher::find(const VSSample& sample, const Accept& accept) {
    const auto metadata = metadata_.find(sample.provenance().metadata);
    if (!metadata) return 0;
    int64_t found = 0;
    forEachRow(sample, [&](const VSSampleRow& row) {
        if (same(sample, *metadata, row) && accept(row.id)) found = row.id;
        return !found;
    });
    return found;
}

int64_t VSStoreMatcher::findAmongMany(const VSSample& sample, int purpose, const Accept& accept) {
    const auto metadata = metadata_.find(sample.provenance().metadata);
    if (!metadata) return 0;
    const auto place = crowds_.find({codeOf(sample), sample.startDate().microseconds(), purpose});
    VSCrowdedStart* known = place == crowds_.end() ? nullptr : &place->second;
    if (!known) {
        int64_t found = 0;
        int seen = 0;
        forEachRow(sample, [&](const VSSampleRow& row) {
            if (++seen > fewRows) return false;
            if (same(sample, *metadata, row) && accept(row.id)) found = row.id;
            return !found;
        });
        if (found || seen <= fewRows) return found;
        known = &makeCrowd(sample, purpose);
    }
    const VSSourceRevision revision = sample.sourceRevision();
    Traits traits{(sample.endDate() - sample.startDate()).count(), *metadata,
                  valueBucket(VSStoredValue(sample)), originHash(revision)};
    std::optional<int64_t> second;
    if (sample.creationDate()) second = VSFloorDivide(sample.creationDate()->microseconds(), kSecond);
    std::vector<uint64_t> fingerprints;
    for (const int64_t bucket : {traits.bucket - 1, traits.bucket, traits.bucket + 1}) {
        Traits near = traits;
        near.bucket = bucket;
        fingerprints.push_back(near.fingerprint(second));
    }
    using Verdict = VSCrowdedStart::Verdict;
    return known->find(fingerprints, [&](int64_t id) {
        if (!accept(id)) return Verdict::NeverAgain;
        VSSampleRow stored;
        const bool there = row({sample.sampleType(), sample.startDate().microseconds(), id}, stored);
        return there && same(sample, *metadata, stored) ? Verdict::Wanted : Verdict::NotThis;
    });
}

bool VSStoreMatcher::same(const VSSample& sample, int64_t metadata, const VSSampleRow& row) {
    if (!sameRow(sample, metadata, row)) return false;
    if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample)) return sameWorkout(*workout, row.id);
    const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample);
    return !correlation || sameMembers(*correlation, row.id);
}

void VSStoreMatcher::added(const VSSample& sample, int64_t id) {
    if (crowds_.empty()) return;
    const CrowdKey first{codeOf(sample), sample.startDate().microseconds(), 0};
    for (auto place = crowds_.lower_bound(first); place != crowds_.end(); ++place) {
        const auto& [type, start, purpose] = place->first;
        if (type != std::get<0>(first) || start != std::get<1>(first)) return;
        VSSampleRow stored;
        if (row({sample.sampleType(), start, id}, stored)) addTo(place->second, stored);
    }
}

VSCrowdedStart& VSStoreMatcher::makeCrowd(const VSSample& sample, int purpose) {
    if (crowdsSize_ > mostCrowded) {
        crowds_.clear();
        crowdsSize_ = 0;
    }
    VSCrowdedStart& made = crowds_[{codeOf(sample), sample.startDate().microseconds(), purpose}];
    forEachRow(sample, [&](const VSSampleRow& row) {
        addTo(made, row);
        return true;
    });
    return made;
}

void VSStoreMatcher::addTo(VSCrowdedStart& crowd, const VSSampleRow& row) {
    const Traits traits{row.duration, row.metadata, valueBucket(row.value), originOf(row.provenance)};
    crowd.add(traits.fingerprint(VSFloorDivide(row.start + row.created, kSecond)), row.id);
    crowd.add(traits.fingerprint(std::nullopt), row.id);
    crowdsSize_ += 2;
}

size_t VSStoreMatcher::originOf(int64_t provenance) {
    const auto [place, isNew] = origins_.try_emplace(provenance, 0);
    if (isNew) place->second = originHash(*provenances_.provenance(provenance).revision);
    return place->second;
}

uint64_t VSStoreMatcher::Traits::fingerprint(std::optional<int64_t> second) const {
    uint64_t hash = second ? 1 : 2;
    for (const auto part :
         {static_cast<uint64_t>(duration), static_cast<uint64_t>(metadata), static_cast<uint64_t>(bucket),
          static_cast<uint64_t>(origin), static_cast<uint64_t>(second.value_or(0))}) {
        hash = (hash ^ part) * 0x9E3779B97F4A7C15;
        hash ^= hash >> 32;
    }
    return hash;
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
