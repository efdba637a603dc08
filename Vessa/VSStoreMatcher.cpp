#include "Vessa/VSStoreMatcher.h"

#include <algorithm>
#include <array>
#include <bit>
#include <charconv>
#include <cmath>
#include <cstdio>

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
constexpr size_t mostCrowded = 1'500'000;  // places kept, three a row
constexpr int64_t kSecond = 1'000'000;

int codeOf(const VSSample& sample) {
    return VSTypeCodeValue(sample.sampleType()->code());
}

/// Numbers as an export writes them have so many digits.
constexpr int writtenDigits = 6;

/// Whether the number is what writing the stored one leaves of it.
bool isWrittenForm(double number, double stored) {
    if (number == 0 || stored == 0 || !(std::abs(number - stored) <= 1e-5 * std::abs(stored))) return false;
    std::array<char, 40> text{};
    std::snprintf(text.data(), text.size(), "%.*e", writtenDigits - 1, number);
    double kept = 0;
    std::from_chars(text.data(), text.data() + text.size(), kept);
    if (kept != number) return false;
    const double lastDigit = std::pow(10, std::floor(std::log10(std::abs(stored))) - (writtenDigits - 1));
    return std::abs(number - stored) <= 0.5 * lastDigit * (1 + 1e-6);
}

/// Values that are the same but for rounding lie in the same bucket or in neighbouring ones.
int64_t valueBucket(double value) {
    constexpr int roundedBits = 36;  // 16 of 52 are left: steps of 7.6e-6 to 1.5e-5; digits lost: up to 5e-6
    return value == 0 ? 0 : std::bit_cast<int64_t>(value) >> roundedBits;
}

size_t originHash(const VSSourceRevision& revision) {
    const std::hash<std::string> hash;
    return hash(revision.source.bundleIdentifier) * 31 + hash(revision.source.name) * 7 +
           hash(revision.version);
}

/// Whether a row was created when the sample says. Documents of others give whole seconds and cut off the
/// rest.
bool sameCreation(const VSSampleRow& row, VSDate sought) {
    const int64_t created = row.start + row.created, wanted = sought.microseconds();
    const int64_t second = VSFloorDivide(created, kSecond) * kSecond;
    return created == wanted || second == wanted ||
           (created == second && second == VSFloorDivide(wanted, kSecond) * kSecond);
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

VSStoreMatcher::Likeness VSStoreMatcher::likenessOfValues(const VSSample& sample, double stored) {
    const double value = VSStoredValue(sample);
    if (std::bit_cast<int64_t>(stored) == std::bit_cast<int64_t>(value)) return Likeness::Identical;
    if (VSSameStoredValue(stored, value)) return Likeness::Same;
    const auto* quantitySample = dynamic_cast<const VSQuantitySample*>(&sample);
    if (!quantitySample) return Likeness::None;
    const VSQuantity& quantity = quantitySample->quantity();
    const VSQuantity kept(sample.sampleType()->canonicalUnit(), stored);
    return isWrittenForm(quantity.value(), inUnit(kept, quantity.unit())) ? Likeness::Rounded
                                                                          : Likeness::None;
}

template <typename Visit>
void VSStoreMatcher::forEachRow(const VSSample& sample, Visit visit) {
    auto rows =
        database_.use("SELECT " VS_SAMPLE_COLUMNS " FROM samples WHERE type = ? AND start = ? ORDER BY id");
    rows.bind(1, codeOf(sample)).bind(2, sample.startDate().microseconds());
    while (rows.step() && visit(VSReadSampleRow(rows))) {
    }
}

template <typename Search>
int64_t VSStoreMatcher::closest(Search search) {
    constexpr std::array levels{Likeness::Identical, Likeness::Same, Likeness::Rounded};
    std::array<bool, 4> seen{};
    for (const Likeness level : levels) {
        if (level != levels.front() && !seen[static_cast<size_t>(level)]) continue;
        const int64_t found = search([&](Likeness likeness) {
            seen[static_cast<size_t>(likeness)] = true;
            return likeness == level;
        });
        if (found) return found;
    }
    return 0;
}

int64_t VSStoreMatcher::newest(const VSSample& sample, const std::set<int64_t>& others) {
    const auto metadata = metadata_.find(sample.provenance().metadata);
    if (!metadata) return 0;
    int64_t found = 0;
    Likeness best = Likeness::None;
    forEachRow(sample, [&](const VSSampleRow& row) {
        const Likeness ofRow = likeness(sample, *metadata, row);
        if (ofRow != Likeness::None && ofRow >= best && !others.contains(row.id)) {
            best = ofRow;
            found = row.id;
        }
        return true;
    });
    return found;
}

int64_t VSStoreMatcher::findAmongMany(const VSSample& sample, int purpose, const Accept& accept) {
    const auto metadata = metadata_.find(sample.provenance().metadata);
    if (!metadata) return 0;
    const CrowdKey key{codeOf(sample), sample.startDate().microseconds(), purpose};
    if (!crowds_.contains(key)) {
        int mostSeen = 0;
        const int64_t found = closest([&](const auto& isWanted) {
            int64_t match = 0;
            int seen = 0;
            forEachRow(sample, [&](const VSSampleRow& row) {
                if (++seen > fewRows) return false;
                if (isWanted(likeness(sample, *metadata, row)) && accept(row.id)) match = row.id;
                return !match;
            });
            mostSeen = std::max(mostSeen, seen);
            return match;
        });
        if (found || mostSeen <= fewRows) return found;
        makeCrowd(sample, purpose);
    }
    return findInCrowd(sample, *metadata, crowds_.at(key), accept);
}

int64_t VSStoreMatcher::findInCrowd(const VSSample& sample, int64_t metadata, VSCrowdedStart& crowd,
                                    const Accept& accept) {
    const VSSourceRevision revision = sample.sourceRevision();
    const Traits traits{(sample.endDate() - sample.startDate()).count(), metadata,
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
    bool sawRounded = false;
    const auto search = [&](const std::vector<uint64_t>& places, Likeness level) {
        return crowd.find(places, [&](int64_t id) {
            if (!accept(id)) return Verdict::NeverAgain;
            VSSampleRow stored;
            if (!row({sample.sampleType(), sample.startDate().microseconds(), id}, stored))
                return Verdict::NotThis;
            const Likeness found = likeness(sample, metadata, stored);
            sawRounded = sawRounded || found == Likeness::Rounded;
            return found >= level ? Verdict::Wanted : Verdict::NotThis;
        });
    };
    // The rows that agree in every bit have a place of their own: else each search would pass by all that
    // nearly do.
    if (sample.creationDate()) {
        const uint64_t exact = traits.exactFingerprint(
            VSStoredValue(sample), sample.creationDate()->microseconds(), sample.timeZoneOffset());
        if (const int64_t found = search({exact}, Likeness::Identical)) return found;
    }
    const int64_t found = search(fingerprints, Likeness::Same);
    return found || !sawRounded ? found : search(fingerprints, Likeness::Rounded);
}

VSStoreMatcher::Likeness VSStoreMatcher::likeness(const VSSample& sample, int64_t metadata,
                                                  const VSSampleRow& row) {
    const Likeness ofRow = likenessOfRow(sample, metadata, row);
    if (ofRow == Likeness::None) return ofRow;
    if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample))
        return sameWorkout(*workout, row.id) ? ofRow : Likeness::None;
    const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample);
    return correlation ? std::min(ofRow, likenessOfMembers(*correlation, row.id)) : ofRow;
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

void VSStoreMatcher::makeCrowd(const VSSample& sample, int purpose) {
    if (crowdsSize_ > mostCrowded) {
        crowds_.clear();
        crowdsSize_ = 0;
    }
    VSCrowdedStart& made = crowds_[{codeOf(sample), sample.startDate().microseconds(), purpose}];
    forEachRow(sample, [&](const VSSampleRow& row) {
        addTo(made, row);
        return true;
    });
}

void VSStoreMatcher::addTo(VSCrowdedStart& crowd, const VSSampleRow& row) {
    const Traits traits{row.duration, row.metadata, valueBucket(row.value), originOf(row.provenance)};
    crowd.add(traits.fingerprint(VSFloorDivide(row.start + row.created, kSecond)), row.id);
    crowd.add(traits.fingerprint(std::nullopt), row.id);
    crowd.add(traits.exactFingerprint(row.value, row.start + row.created,
                                      provenances_.provenance(row.provenance).timeZoneOffset),
              row.id);
    crowdsSize_ += 3;
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

uint64_t VSStoreMatcher::Traits::exactFingerprint(double value, int64_t creation,
                                                  std::optional<int> offset) const {
    uint64_t hash = fingerprint(std::nullopt);
    for (const uint64_t part : {std::bit_cast<uint64_t>(value), static_cast<uint64_t>(creation),
                                offset ? static_cast<uint64_t>(*offset) : ~uint64_t{0}}) {
        hash = (hash ^ part) * 0x9E3779B97F4A7C15;
        hash ^= hash >> 32;
    }
    return hash;
}

VSStoreMatcher::Likeness VSStoreMatcher::likenessOfRow(const VSSample& sample, int64_t metadata,
                                                       const VSSampleRow& row) {
    if (row.duration != (sample.endDate() - sample.startDate()).count() || row.metadata != metadata)
        return Likeness::None;
    const Likeness ofValues = likenessOfValues(sample, row.value);
    if (ofValues == Likeness::None) return ofValues;
    const auto creation = sample.creationDate();
    if (creation && !sameCreation(row, *creation)) return Likeness::None;
    const auto& entry = provenances_.provenance(row.provenance);
    const VSProvenance& sought = sample.provenance();
    if (entry.revision != sought.sourceRevision && *entry.revision != sample.sourceRevision())
        return Likeness::None;
    const bool sameDevice =
        !entry.device == !sought.device &&
        (!entry.device || entry.device == sought.device || *entry.device == *sought.device);
    if (!sameDevice) return Likeness::None;
    const bool sameMoment = !creation || creation->microseconds() == row.start + row.created;
    const bool sameOffset = !sought.timeZoneOffset || entry.timeZoneOffset == sought.timeZoneOffset;
    return sameMoment && sameOffset ? ofValues : std::min(ofValues, Likeness::Same);
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

VSStoreMatcher::Likeness VSStoreMatcher::likenessOfMembers(const VSCorrelation& correlation, int64_t id) {
    auto keys = members(id);
    if (keys.size() != correlation.objects().size()) return Likeness::None;
    Likeness least = Likeness::Identical;
    for (const VSSamplePtr& object : correlation.objects()) {
        const auto metadata = metadata_.find(object->provenance().metadata);
        if (!metadata) return Likeness::None;
        Likeness best = Likeness::None;
        size_t closestMember = 0;
        for (size_t i = 0; i < keys.size() && best != Likeness::Identical; ++i) {
            VSSampleRow stored;
            if (keys[i].type != object->sampleType() || keys[i].start != object->startDate().microseconds() ||
                !row(keys[i], stored))
                continue;
            const Likeness ofMember = likenessOfRow(*object, *metadata, stored);
            if (ofMember > best) closestMember = i;
            best = std::max(best, ofMember);
        }
        if (best == Likeness::None) return best;
        keys.erase(keys.begin() + static_cast<std::ptrdiff_t>(closestMember));
        least = std::min(least, best);
    }
    return least;
}

bool VSStoreMatcher::isSame(const VSSample& sample, const VSMemberKey& key) {
    const auto metadata = metadata_.find(sample.provenance().metadata);
    VSSampleRow stored;
    return metadata && key.start == sample.startDate().microseconds() && row(key, stored) &&
           likenessOfRow(sample, *metadata, stored) != Likeness::None;
}
