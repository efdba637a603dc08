#include <algorithm>
#include <exception>

#include "Vessa/VSStoreWriter.h"

// How samples leave the store: VSStoreWriter's removals.

namespace {

constexpr int rowsAtOnce = 4096;
/// Behind so many rows in a row that are not wanted, the next wanted number is looked up.
constexpr int patienceWithOthers = 256;

int codeOf(const VSObjectType* type) {
    return VSTypeCodeValue(type->code());
}

}  // namespace

bool VSStoreWriter::remove(const VSObjectType* type, int64_t start, int64_t id) {
    VSSampleRow row;
    if (!matcher_.row({type, start, id}, row)) return false;
    if (VSCanHaveMembers(type)) removeDetails(id);
    leaveParents(id);
    removeRow(type, row);
    return true;
}

void VSStoreWriter::removeRow(const VSObjectType* type, const VSSampleRow& row) {
    const int code = codeOf(type);
    database_.use("DELETE FROM samples WHERE type = ? AND start = ? AND id = ?")
        .bind(1, code)
        .bind(2, row.start)
        .bind(3, row.id)
        .run();
    noteRemoved(code, row);
    noteDeletion(code, row.id);
}

void VSStoreWriter::noteRemoved(int type, const VSSampleRow& row) {
    metadata_.release(row.metadata);
    const int64_t source = provenances_.sourceOfProvenance(row.provenance);
    SourceChange& summary = sourceChange(type, source);
    --summary.count;
    summary.removed = true;
    if (recentRemovedFrom_ != row.provenance) removedFrom_[row.provenance] = {type, row.start};
    recentRemovedFrom_ = row.provenance;
    rollups_.rebuild(type, source, row.start, row.duration);
}

void VSStoreWriter::noteDeletion(int type, int64_t id) {
    const int64_t change = ++last_;
    insertDeleted_.bind(1, change).bind(2, type).bind(3, id).run();
    types_[static_cast<size_t>(type)].change = change;
}

/// What hangs on a correlation or a workout.
void VSStoreWriter::removeDetails(int64_t id) {
    // Members stay, but being a member was a property of theirs that queries ask for.
    for (const VSMemberKey& member : matcher_.members(id)) touch(member.type);
    database_.use("DELETE FROM members WHERE parent = ?").bind(1, id).run();
    database_.use("DELETE FROM workouts WHERE workout = ?").bind(1, id).run();
    database_.use("DELETE FROM workout_events WHERE workout = ?").bind(1, id).run();
}

/// Takes a sample out of what it is a member of; returns how many correlations went with it.
int64_t VSStoreWriter::leaveParents(int64_t id) {
    std::set<int64_t> parents;
    {
        auto rows = database_.use("SELECT parent FROM members WHERE member = ?");
        rows.bind(1, id);
        while (rows.step()) parents.insert(rows.integer(0));
    }
    if (parents.empty()) return 0;
    database_.use("DELETE FROM members WHERE member = ?").bind(1, id).run();
    int64_t gone = 0;
    for (int64_t parent : parents) {
        for (const VSObjectType* type : VSObjectType::allTypes()) {
            if (!VSCanHaveMembers(type)) continue;
            auto row = database_.use("SELECT " VS_SAMPLE_COLUMNS
                                     " FROM samples INDEXED BY samples_by_id WHERE type = ? AND id = ?");
            if (!row.bind(1, codeOf(type)).bind(2, parent).step()) continue;
            const VSSampleRow found = VSReadSampleRow(row);
            row.reset();
            gone += loseMember(type, found);
        }
    }
    return gone;
}

/// A correlation without members says nothing and goes too; a workout says enough by itself.
int64_t VSStoreWriter::loseMember(const VSObjectType* type, const VSSampleRow& parent) {
    touch(type);
    if (type->kind() != VSTypeKind::Correlation) return 0;
    auto left = database_.use("SELECT 1 FROM members WHERE parent = ? LIMIT 1");
    if (left.bind(1, parent.id).step()) return 0;
    left.reset();
    const int64_t gone = leaveParents(parent.id);
    removeRow(type, parent);
    return gone + 1;
}

std::vector<VSSampleRow> VSStoreWriter::rowsNumbered(const VSObjectType* type, const VSNumberRanges& numbers,
                                                     int64_t& next) {
    std::vector<VSSampleRow> rows;
    auto statement = database_.use("SELECT " VS_SAMPLE_COLUMNS
                                   " FROM samples INDEXED BY samples_by_id WHERE type = ? AND id >= ? AND id "
                                   "<= ? ORDER BY id");
    statement.bind(1, codeOf(type)).bind(2, next).bind(3, numbers.last());
    int others = 0;
    next = 0;
    for (int seen = 0; statement.step(); ++seen) {
        const int64_t id = statement.integer(1);
        if (seen >= rowsAtOnce || others > patienceWithOthers) {
            next = numbers.nextFrom(id);
            break;
        }
        others = numbers.contains(id) ? 0 : others + 1;
        if (!others) rows.push_back(VSReadSampleRow(statement));
    }
    return rows;
}

bool VSStoreWriter::isMostOf(int type, const VSNumberRanges& numbers) {
    auto all = database_.use("SELECT coalesce(sum(count), 0) FROM type_sources WHERE type = ?");
    all.bind(1, type).step();
    auto rows = database_.use(
        "SELECT count(*) FROM samples INDEXED BY samples_by_id WHERE type = ? AND id BETWEEN ? AND ?");
    int64_t wanted = 0;
    for (const VSNumberRange& range : numbers.ranges()) {
        rows.bind(1, type).bind(2, range.first).bind(3, range.last).step();
        wanted += rows.integer(0);
        rows.reset();
    }
    return wanted > rowsAtOnce && wanted > all.integer(0) / 4;
}

int64_t VSStoreWriter::removeInOnePass(int type, const VSNumberRanges& numbers,
                                       const std::function<bool(const VSSampleRow&)>& accept) {
    provenances_.loadAll();  // the function below asks nothing of the database
    std::exception_ptr failure;
    std::vector<int64_t> ids;
    isToGo_ = [&](const VSSampleRow& row) {
        try {
            if (failure || !numbers.contains(row.id) || (accept && !accept(row))) return false;
            noteRemoved(type, row);
            ids.push_back(row.id);
            return true;
        } catch (...) {  // the store lacks a provenance, or no memory; not through SQLite
            failure = std::current_exception();
            return false;
        }
    };
    database_
        .use("DELETE FROM samples WHERE type = ? AND is_to_go(start, id, duration, provenance, metadata)")
        .bind(1, type)
        .run();
    isToGo_ = nullptr;
    if (failure) std::rethrow_exception(failure);
    std::sort(ids.begin(), ids.end());
    for (const int64_t id : ids) noteDeletion(type, id);
    return static_cast<int64_t>(ids.size());
}

int64_t VSStoreWriter::removeNumbers(const VSObjectType* type, const VSNumberRanges& numbers,
                                     const std::function<bool(const VSSampleRow&)>& accept) {
    auto member = database_.use("SELECT 1 FROM members WHERE type = ? LIMIT 1");
    const bool hasMembers = member.bind(1, codeOf(type)).step();
    member.reset();
    const int code = codeOf(type);
    if (!hasMembers && !VSCanHaveMembers(type) && isMostOf(code, numbers))
        return removeInOnePass(code, numbers, accept);
    int64_t removed = 0;
    for (int64_t next = numbers.nextFrom(1); next != 0;) {
        auto rows = rowsNumbered(type, numbers, next);
        if (accept) std::erase_if(rows, [&](const VSSampleRow& row) { return !accept(row); });
        // In the order in which they lie on the disk.
        std::sort(rows.begin(), rows.end(), [](const VSSampleRow& a, const VSSampleRow& b) {
            return std::pair(a.start, a.id) < std::pair(b.start, b.id);
        });
        for (const VSSampleRow& row : rows) {
            if (VSCanHaveMembers(type)) removeDetails(row.id);
            if (hasMembers) removed += leaveParents(row.id);
            removeRow(type, row);
        }
        removed += static_cast<int64_t>(rows.size());
    }
    return removed;
}

// What only removed samples told of where they came from goes with them: a device's name says who had it.

void VSStoreWriter::dropUnusedProvenances() {
    bool dropped = false;
    for (const auto& [provenance, removed] : removedFrom_) {
        if (isProvenanceUsed(provenance, removed)) continue;
        std::optional<int64_t> device;
        int64_t source = 0;
        {
            auto row = database_.use("SELECT source, device FROM provenances WHERE provenance = ?");
            if (!row.bind(1, provenance).step()) continue;
            source = row.integer(0);
            if (!row.isNull(1)) device = row.integer(1);
        }
        dropped = true;
        provenances_.dropRow("provenances", "provenance", provenance);
        auto ofDevice = database_.use("SELECT 1 FROM provenances WHERE device = ? LIMIT 1");
        if (device && !ofDevice.bind(1, *device).step()) provenances_.dropRow("devices", "device", *device);
        // The order that the person chose stays, with what it names.
        auto ofSource = database_.use(
            "SELECT 1 FROM provenances WHERE source = ?1 UNION ALL SELECT 1 FROM source_order WHERE source = "
            "?1 LIMIT 1");
        if (!ofSource.bind(1, source).step()) provenances_.dropRow("sources", "source", source);
    }
    removedFrom_.clear();
    if (dropped) provenances_.forgetNumbers();
}

/// Looks first where a removed sample was, then through the types of its source.
bool VSStoreWriter::isProvenanceUsed(int64_t provenance, const std::pair<int, int64_t>& removed) {
    auto near = database_.use(
        "SELECT 1 FROM (SELECT provenance FROM samples WHERE type = ?1 AND start >= ?2 ORDER BY start LIMIT "
        "1000) WHERE provenance = ?3 UNION ALL SELECT 1 FROM (SELECT provenance FROM samples WHERE type = ?1 "
        "AND start <= ?2 ORDER BY start DESC LIMIT 1000) WHERE provenance = ?3 LIMIT 1");
    if (near.bind(1, removed.first).bind(2, removed.second).bind(3, provenance).step()) return true;
    std::vector<int> types;
    auto ofSource = database_.use("SELECT type FROM type_sources WHERE source = ? ORDER BY count DESC");
    ofSource.bind(1, provenances_.sourceOfProvenance(provenance));
    while (ofSource.step()) types.push_back(static_cast<int>(ofSource.integer(0)));
    auto anywhere = database_.use("SELECT 1 FROM samples WHERE type = ? AND provenance = ? LIMIT 1");
    for (const int type : types) {
        if (anywhere.bind(1, type).bind(2, provenance).step()) return true;
        anywhere.reset();
    }
    return false;
}

int64_t VSStoreWriter::removeAll(const VSObjectType* type, std::optional<std::string> bundleIdentifier) {
    const VSNumberRanges all(1, last_);
    if (!bundleIdentifier) return removeNumbers(type, all);
    return removeNumbers(type, all, [&](const VSSampleRow& row) {
        return provenances_.provenance(row.provenance).revision->source.bundleIdentifier == *bundleIdentifier;
    });
}
