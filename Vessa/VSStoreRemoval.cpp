#include <algorithm>

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
    metadata_.release(row.metadata);
    const int64_t change = ++last_;
    database_.use("INSERT INTO deleted(change, type, id) VALUES (?, ?, ?)")
        .bind(1, change)
        .bind(2, code)
        .bind(3, row.id)
        .run();
    types_[static_cast<size_t>(code)].change = change;
    const int64_t source = provenances_.sourceOfProvenance(row.provenance);
    SourceChange& summary = sourceChange(code, source);
    --summary.count;
    summary.removed = true;
    rollups_.rebuild(code, source, row.start, row.duration);
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

int64_t VSStoreWriter::removeNumbers(const VSObjectType* type, const VSNumberRanges& numbers,
                                     const std::function<bool(const VSSampleRow&)>& accept) {
    auto member = database_.use("SELECT 1 FROM members WHERE type = ? LIMIT 1");
    const bool hasMembers = member.bind(1, codeOf(type)).step();
    member.reset();
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

int64_t VSStoreWriter::removeAll(const VSObjectType* type, std::optional<std::string> bundleIdentifier) {
    const VSNumberRanges all(1, last_);
    if (!bundleIdentifier) return removeNumbers(type, all);
    return removeNumbers(type, all, [&](const VSSampleRow& row) {
        return provenances_.provenance(row.provenance).revision->source.bundleIdentifier == *bundleIdentifier;
    });
}
