#include "Vessa/VSStoreWriter.h"

#include <algorithm>

#include "Vessa/VSLimits.h"
#include "Vessa/VSStoreSchema.h"

namespace {

int codeOf(const VSObjectType* type) {
    return VSTypeCodeValue(type->code());
}

}  // namespace

VSStoreWriter::VSStoreWriter(VSDatabase& database)
    : database_(database),
      provenances_(database),
      metadata_(database),
      matcher_(database, provenances_, metadata_),
      rollups_(database),
      insert_(
          database.use("INSERT INTO samples(type, start, id, duration, value, provenance, created, metadata)"
                       " VALUES (?, ?, ?, ?, ?, ?, ?, ?)")),
      insertDeleted_(database.use("INSERT INTO deleted(change, type, id) VALUES (?, ?, ?)")) {
    database.define("is_to_go", 5, [this](const int64_t* row) {
        return isToGo_ && isToGo_({row[0], row[1], row[2], 0, row[3], 0, row[4]});
    });
}

void VSStoreWriter::begin() {
    if (database_.othersHaveCommitted()) {
        provenances_.forgetNumbers();
        metadata_.forgetNumbers();
    }
    inserted_.clear();
    last_ = database_.integer("SELECT last FROM state");
    types_.fill({});
    auto rows = database_.use("SELECT type, longest FROM types");
    while (rows.step()) {
        const auto type = static_cast<size_t>(rows.integer(0));
        if (type < typeCodes) types_[type].longest = rows.integer(1);
    }
}

void VSStoreWriter::abandon() {
    provenances_.forgetNumbers();
    metadata_.forgetNumbers();
    rollups_.clear();
    sourceChanges_.clear();
    recentChange_ = nullptr;
    removedFrom_.clear();
    recentRemovedFrom_ = 0;
}

void VSStoreWriter::finish() {
    writeTypes();
    metadata_.flush();
    rollups_.flush(provenances_);
    writeTypeSources();
    updateMergedRollups();
    dropUnusedProvenances();
    database_.use("UPDATE state SET last = ?").bind(1, last_).run();
}

int64_t VSStoreWriter::insertAlone(const VSSample& sample, VSDate now) {
    const int type = codeOf(sample.sampleType());
    const int64_t start = sample.startDate().microseconds();
    const int64_t duration = (sample.endDate() - sample.startDate()).count();
    const double value = VSStoredValue(sample);
    const int64_t provenance = provenances_.provenanceFor(sample.provenance());
    const int64_t metadata = metadata_.retain(sample.provenance().metadata);
    const int64_t id = ++last_;
    insert_.bind(1, type)
        .bind(2, start)
        .bind(3, id)
        .bind(4, duration)
        .bindNumber(5, value)
        .bind(6, provenance);
    insert_.bind(7, sample.creationDate().value_or(now).microseconds() - start);
    if (metadata)
        insert_.bind(8, metadata);
    else
        insert_.bindNull(8);
    insert_.run();

    TypeState& state = types_[static_cast<size_t>(type)];
    state.change = id;
    if (duration <= VSStoreSchema::longSpan.count()) state.longest = std::max(state.longest, duration);
    const int64_t source = provenances_.sourceOfProvenance(provenance);
    SourceChange& change = sourceChange(type, source);
    ++change.count;
    change.firstStart = std::min(change.firstStart, start);
    change.lastEnd = std::max(change.lastEnd, start + duration);
    rollups_.add(type, source, start, duration, value);
    if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample)) insertWorkout(id, *workout);
    return id;
}

int64_t VSStoreWriter::insertOnce(const VSSample& sample, VSDate now) {
    int64_t& id = inserted_[&sample];
    if (!id) id = insertAlone(sample, now);
    return id;
}

int64_t VSStoreWriter::insert(const VSSample& sample, VSDate now) {
    const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample);
    if (!correlation) return insertOnce(sample, now);
    if (const auto known = inserted_.find(&sample); known != inserted_.end()) return known->second;
    std::vector<VSMemberKey> members;
    for (const VSSamplePtr& object : correlation->objects()) {
        int64_t id = VSObjectIDValue(object->dataID()) ? find(*object) : 0;
        if (!id) id = insertOnce(*object, now);
        members.push_back({object->sampleType(), object->startDate().microseconds(), id});
    }
    const int64_t id = insertOnce(sample, now);
    for (size_t index = 0; index < members.size(); ++index)
        insertMember(id, static_cast<int>(index), members[index]);
    return id;
}

void VSStoreWriter::insertMember(int64_t parent, int position, const VSMemberKey& member) {
    database_.use("INSERT INTO members(parent, position, member, type, start) VALUES (?, ?, ?, ?, ?)")
        .bind(1, parent)
        .bind(2, position)
        .bind(3, member.id)
        .bind(4, codeOf(member.type))
        .bind(5, member.start)
        .run();
}

void VSStoreWriter::insertWorkout(int64_t id, const VSWorkout& workout) {
    static const VSUnit metre = VSUnit::fromString("m");
    auto insert =
        database_.use("INSERT INTO workouts(workout, duration, energy, distance) VALUES (?, ?, ?, ?)");
    insert.bind(1, id).bind(2, workout.duration().count());
    if (workout.totalEnergyBurned())
        insert.bindNumber(3, workout.totalEnergyBurned()->doubleValueForUnit(VSUnit::kilocalorieUnit()));
    if (workout.totalDistance()) insert.bindNumber(4, workout.totalDistance()->doubleValueForUnit(metre));
    insert.run();
    int position = 0;
    for (const VSWorkoutEvent& event : workout.workoutEvents()) {
        auto row =
            database_.use("INSERT INTO workout_events(workout, position, type, date) VALUES (?, ?, ?, ?)");
        row.bind(1, id).bind(2, position++).bind(3, event.type);
        if (event.date) row.bind(4, event.date->microseconds());
        row.run();
    }
}

int64_t VSStoreWriter::find(const VSSample& sample, const std::set<int64_t>& others) {
    const int64_t id = VSObjectIDValue(sample.dataID());
    if (id) {
        VSSampleRow row;
        return matcher_.row({sample.sampleType(), sample.startDate().microseconds(), id}, row) ? id : 0;
    }
    return matcher_.newest(sample, others);
}

bool VSStoreWriter::addToWorkout(int64_t workout, const VSMemberKey& sample) {
    auto parents = database_.use(
        "SELECT parent IN (SELECT workout FROM workouts), parent FROM members WHERE member = ?");
    parents.bind(1, sample.id);
    size_t workouts = 0;
    while (parents.step()) {
        if (parents.integer(1) == workout) return true;
        workouts += parents.integer(0) ? 1 : 0;
    }
    if (workouts >= VSLimits::mostWorkouts) return false;
    auto next = database_.use("SELECT coalesce(max(position), -1) + 1 FROM members WHERE parent = ?");
    next.bind(1, workout).step();
    insertMember(workout, static_cast<int>(next.integer(0)), sample);
    return true;
}

void VSStoreWriter::touch(const VSObjectType* type) {
    types_[static_cast<size_t>(codeOf(type))].change = ++last_;
}

void VSStoreWriter::updateMergedRollups() {
    std::map<int, std::map<int64_t, VSRollupWriter::Changed>> byType;
    for (const auto& [key, changed] : rollups_.takeChanges()) byType[key.first][key.second] = changed;
    VSMergedRollups merged(database_, provenances_);
    for (int type = 0; type < static_cast<int>(typeCodes); ++type) {
        if (types_[static_cast<size_t>(type)].change && VSTypeIsMerged(type))
            merged.update(type, byType[type]);
    }
}

VSStoreWriter::SourceChange& VSStoreWriter::sourceChange(int type, int64_t source) {
    const std::pair key{type, source};
    if (!recentChange_ || recentKey_ != key) {
        recentChange_ = &sourceChanges_[key];
        recentKey_ = key;
    }
    return *recentChange_;
}

void VSStoreWriter::writeTypes() {
    for (size_t type = 0; type < types_.size(); ++type) {
        if (!types_[type].change) continue;
        database_
            .use(
                "INSERT INTO types VALUES (?1, ?2, ?3) ON CONFLICT(type) DO UPDATE SET change = ?2, longest "
                "= ?3")
            .bind(1, static_cast<int64_t>(type))
            .bind(2, types_[type].change)
            .bind(3, types_[type].longest)
            .run();
    }
}

void VSStoreWriter::writeTypeSources() {
    for (const auto& [key, change] : sourceChanges_) {
        auto upsert = database_.use(
            "INSERT INTO type_sources VALUES (?1, ?2, ?3, ?4, ?5) ON CONFLICT(type, source) DO UPDATE SET"
            " count = count + ?3, first_start = min(first_start, ?4), last_end = max(last_end, ?5)");
        upsert.bind(1, key.first)
            .bind(2, key.second)
            .bind(3, change.count)
            .bind(4, change.firstStart)
            .bind(5, change.lastEnd)
            .run();
        if (change.removed) measureAgain(key.first, key.second);
    }
    sourceChanges_.clear();
    recentChange_ = nullptr;
    database_.use("DELETE FROM type_sources WHERE count <= 0").run();
}

/// Finds the first start and last end of a source anew, from the first and last day of its rollups and from
/// its long spans.
void VSStoreWriter::measureAgain(int type, int64_t source) {
    int64_t firstStart = INT64_MAX, lastEnd = INT64_MIN;
    const auto consider = [&](VSStatement& rows) {
        while (rows.step()) {
            if (provenances_.sourceOfProvenance(rows.integer(2)) != source) continue;
            firstStart = std::min(firstStart, rows.integer(0));
            lastEnd = std::max(lastEnd, rows.integer(0) + rows.integer(1));
        }
    };
    auto days = database_.use("SELECT min(slot), max(slot) FROM rollups WHERE slot BETWEEN ? AND ?");
    days.bind(1, VSRollupSlot(type, source, VSFloorDivide(INT64_MIN, VSDayMicroseconds)));
    days.bind(2, VSRollupSlot(type, source, VSFloorDivide(INT64_MAX, VSDayMicroseconds)));
    if (days.step() && !days.isNull(0)) {
        const int64_t longest = types_[static_cast<size_t>(type)].longest;
        for (int column : {0, 1}) {
            const int64_t dayStart = VSRollupDayOfSlot(days.integer(column)) * VSDayMicroseconds;
            auto rows = database_.use(
                "SELECT start, duration, provenance FROM samples WHERE type = ? AND start >= ? AND start < "
                "?");
            rows.bind(1, type).bind(2, dayStart - longest).bind(3, dayStart + VSDayMicroseconds);
            consider(rows);
        }
    }
    auto longSpans = database_.use(
        "SELECT start, duration, provenance FROM samples INDEXED BY samples_long WHERE type = ? AND duration "
        "> " VS_LONG_SPAN_SQL);
    longSpans.bind(1, type);
    consider(longSpans);
    if (firstStart == INT64_MAX) return;  // none left: the count says so
    database_.use("UPDATE type_sources SET first_start = ?, last_end = ? WHERE type = ? AND source = ?")
        .bind(1, firstStart)
        .bind(2, lastEnd)
        .bind(3, type)
        .bind(4, source)
        .run();
}
