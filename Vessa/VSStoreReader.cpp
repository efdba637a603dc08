#include "Vessa/VSStoreReader.h"

#include <algorithm>
#include <queue>

#include "Vessa/VSMergedRollup.h"
#include "Vessa/VSStoreSchema.h"

namespace {

int codeOf(const VSObjectType* type) {
    return VSTypeCodeValue(type->code());
}

int64_t lowerSum(int64_t a, int64_t b) {
    return a < INT64_MIN / 2 ? INT64_MIN : a - b;
}

/// Whether a stands before b in the order asked for; ties fall by number, in the direction of the first key.
class RowOrder {
 public:
    explicit RowOrder(const std::vector<VSSortDescriptor>& sort) : sort_(sort) {}
    bool operator()(const VSSampleRow& a, const VSSampleRow& b) const {
        for (const VSSortDescriptor& key : sort_) {
            const int64_t x = valueOf(a, key), y = valueOf(b, key);
            if (x != y) return key.ascending ? x < y : x > y;
        }
        return sort_.empty() || sort_.front().ascending ? a.id < b.id : a.id > b.id;
    }

 private:
    static int64_t valueOf(const VSSampleRow& row, const VSSortDescriptor& key) {
        if (key.key == VSSampleSortIdentifierStartDate) return row.start;
        if (key.key == VSSampleSortIdentifierEndDate) return row.end();
        return row.id;
    }
    const std::vector<VSSortDescriptor>& sort_;
};

void refuseUnknownKeys(const std::vector<VSSortDescriptor>& sort) {
    for (const VSSortDescriptor& key : sort) {
        if (key.key != VSSampleSortIdentifierStartDate && key.key != VSSampleSortIdentifierEndDate &&
            key.key != VSObjectSortIdentifierDataID)
            throw VSDatabaseFailure({VSErrorCode::Invalid, "nothing sorts by " + key.key});
    }
}

}  // namespace

VSDateFilter::VSDateFilter(const VSPredicate& predicate) {
    const auto later = [](int64_t& bound, const std::optional<VSDate>& date) {
        if (date) bound = std::max(bound, date->microseconds());
    };
    const auto earlier = [](int64_t& bound, const std::optional<VSDate>& date) {
        if (date) bound = std::min(bound, date->microseconds());
    };
    later(start_, predicate.startDate);
    later(startsFrom_, predicate.startsFrom);
    if (predicate.dateOptions & VSQueryOptionStrictStartDate) later(startsFrom_, predicate.startDate);
    earlier(startsBefore_, predicate.endDate);
    earlier(startsBefore_, predicate.startsBefore);
    earlier(endsBy_, predicate.endsBy);
    if (predicate.dateOptions & VSQueryOptionStrictEndDate) earlier(endsBy_, predicate.endDate);
}

class VSStoreReader::Conditions {
 public:
    Conditions(VSStoreReader& reader, const VSPredicate& predicate)
        : reader_(reader),
          predicate_(predicate),
          byProvenance_(!predicate.sources.empty() || predicate.device),
          byMetadata_(!predicate.metadata.empty() || !predicate.metadataKeys.empty()) {}

    bool match(const VSSampleRow& row) {
        if (predicate_.categoryValue && row.value != *predicate_.categoryValue) return false;
        if (byProvenance_ && !matchesProvenance(row.provenance)) return false;
        if (byMetadata_ && !matchesMetadata(row.metadata)) return false;
        return !predicate_.noCorrelation || !isMember(row.id);
    }

 private:
    bool matchesProvenance(int64_t id) {
        if (auto known = provenances_.find(id); known != provenances_.end()) return known->second;
        const auto& entry = reader_.provenances_.provenance(id);
        bool matches =
            predicate_.sources.empty() || std::find(predicate_.sources.begin(), predicate_.sources.end(),
                                                    entry.revision->source) != predicate_.sources.end();
        if (predicate_.device) matches = matches && entry.device && *entry.device == *predicate_.device;
        return provenances_[id] = matches;
    }
    bool matchesMetadata(int64_t id) {
        if (id == 0) return false;
        if (auto known = metadata_.find(id); known != metadata_.end()) return known->second;
        const auto metadata = reader_.metadata_.metadata(id);
        const auto has = [&](const std::string& key) { return metadata->find(key) != metadata->end(); };
        const bool matches =
            std::all_of(predicate_.metadataKeys.begin(), predicate_.metadataKeys.end(), has) &&
            std::all_of(predicate_.metadata.begin(), predicate_.metadata.end(), [&](const auto& entry) {
                const auto found = metadata->find(entry.first);
                return found != metadata->end() && found->second == entry.second;
            });
        return metadata_[id] = matches;
    }
    bool isMember(int64_t id) {
        auto row = reader_.database_.use(
            "SELECT 1 FROM members WHERE member = ? AND parent NOT IN (SELECT workout FROM workouts) LIMIT "
            "1");
        return row.bind(1, id).step();
    }

    VSStoreReader& reader_;
    const VSPredicate& predicate_;
    const bool byProvenance_, byMetadata_;
    std::unordered_map<int64_t, bool> provenances_, metadata_;
};

VSStoreReader::VSStoreReader(VSDatabase& database)
    : database_(database),
      provenances_(database),
      metadata_(database),
      matcher_(database, provenances_, metadata_) {}

int64_t VSStoreReader::longest(const VSObjectType* type) {
    auto row = database_.use("SELECT longest FROM types WHERE type = ?");
    return row.bind(1, codeOf(type)).step() ? row.integer(0) : 0;
}

template <typename Accept>
bool VSStoreReader::scanRows(VSStatement& rows, Accept accept) {
    while (rows.step()) {
        if (!accept(VSReadSampleRow(rows))) return false;
    }
    return true;
}

void VSStoreReader::scan(const VSObjectType* type, const VSPredicate& predicate, bool ascending,
                         const std::function<bool(const VSSampleRow&)>& block) {
    const VSDateFilter filter(predicate);
    Conditions conditions(*this, predicate);
    const auto accept = [&](const VSSampleRow& row) {
        return !filter.matches(row.start, row.duration) || !conditions.match(row) || block(row);
    };
    // Long spans that began before the part of the table that is read come from their own index.
    const int64_t from = std::max(filter.startsFrom(), lowerSum(filter.start(), longest(type)));
    const auto scanLong = [&] {
        if (from == filter.startsFrom()) return true;
        auto rows =
            database_.use(ascending ? "SELECT " VS_SAMPLE_COLUMNS
                                      " FROM samples INDEXED BY samples_long WHERE type = ? AND start < ?"
                                      " AND duration > " VS_LONG_SPAN_SQL " ORDER BY start, id"
                                    : "SELECT " VS_SAMPLE_COLUMNS
                                      " FROM samples INDEXED BY samples_long WHERE type = ? AND start < ?"
                                      " AND duration > " VS_LONG_SPAN_SQL " ORDER BY start DESC, id DESC");
        rows.bind(1, codeOf(type)).bind(2, std::min(from, filter.startsBefore()));
        return scanRows(rows, accept);
    };
    const auto scanRange = [&] {
        auto rows = database_.use(
            ascending
                ? "SELECT " VS_SAMPLE_COLUMNS
                  " FROM samples WHERE type = ? AND start >= ? AND start < ? ORDER BY start, id"
                : "SELECT " VS_SAMPLE_COLUMNS
                  " FROM samples WHERE type = ? AND start >= ? AND start < ? ORDER BY start DESC, id DESC");
        rows.bind(1, codeOf(type)).bind(2, from).bind(3, filter.startsBefore());
        return scanRows(rows, accept);
    };
    if (ascending) {
        if (scanLong()) scanRange();
    } else if (scanRange()) {
        scanLong();
    }
}

/// The first `limit` rows by start or end date, reading no more of the table than needed.
std::vector<VSSampleRow> VSStoreReader::firstRows(const VSObjectType* type, const VSPredicate& predicate,
                                                  int limit, const VSSortDescriptor& key) {
    const bool byEnd = key.key == VSSampleSortIdentifierEndDate;
    const int64_t reach = byEnd && !key.ascending ? longest(type) : 0;
    std::vector<VSSampleRow> rows;
    std::priority_queue<int64_t> worst;  // keys of the best `limit` rows, negated when descending
    const auto consider = [&](const VSSampleRow& row, bool inOrder) {
        const int64_t value = byEnd ? row.end() : row.start;
        if (limit > 0 && static_cast<int>(worst.size()) == limit) {
            // Rows further on cannot be better than the worst that we have (equal ones may be, by number).
            const bool past = key.ascending ? row.start > worst.top() : row.start + reach < -worst.top();
            if (inOrder && past) return false;
        }
        const int64_t rank = key.ascending ? value : -value;
        if (limit > 0) {
            if (static_cast<int>(worst.size()) == limit && rank > worst.top()) return true;
            worst.push(rank);
            if (static_cast<int>(worst.size()) > limit) worst.pop();
        }
        rows.push_back(row);
        return true;
    };
    if (byEnd && !key.ascending && limit > 0) {
        // A long span may end last and start early.
        const VSDateFilter filter(predicate);
        Conditions conditions(*this, predicate);
        auto longRows = database_.use(
            "SELECT " VS_SAMPLE_COLUMNS
            " FROM samples INDEXED BY samples_long WHERE type = ? AND duration > " VS_LONG_SPAN_SQL);
        longRows.bind(1, codeOf(type));
        scanRows(longRows, [&](const VSSampleRow& row) {
            return !filter.matches(row.start, row.duration) || !conditions.match(row) || consider(row, false);
        });
        scan(type, predicate, false, [&](const VSSampleRow& row) {
            return row.duration > VSStoreSchema::longSpan.count() || consider(row, true);
        });
    } else {
        scan(type, predicate, key.ascending, [&](const VSSampleRow& row) { return consider(row, true); });
    }
    return rows;
}

std::vector<VSSampleRow> VSStoreReader::rowsByNumber(const VSObjectType* type, const VSPredicate& predicate,
                                                     int limit, bool ascending) {
    const VSDateFilter filter(predicate);
    Conditions conditions(*this, predicate);
    std::vector<VSSampleRow> rows;
    auto statement =
        database_.use(ascending ? "SELECT " VS_SAMPLE_COLUMNS
                                  " FROM samples INDEXED BY samples_by_id WHERE type = ? ORDER BY id"
                                : "SELECT " VS_SAMPLE_COLUMNS
                                  " FROM samples INDEXED BY samples_by_id WHERE type = ? ORDER BY id DESC");
    statement.bind(1, codeOf(type));
    scanRows(statement, [&](const VSSampleRow& row) {
        if (filter.matches(row.start, row.duration) && conditions.match(row)) rows.push_back(row);
        return limit <= 0 || static_cast<int>(rows.size()) < limit;
    });
    return rows;
}

std::vector<VSSamplePtr> VSStoreReader::samples(const VSObjectType* type, const VSPredicate& predicate,
                                                int limit, const std::vector<VSSortDescriptor>& sort) {
    refuseUnknownKeys(sort);
    const bool byNumber = sort.empty() || sort.front().key == VSObjectSortIdentifierDataID;
    const bool hasDates = predicate.startDate || predicate.endDate;
    std::vector<VSSampleRow> rows;
    if (byNumber && !hasDates) {
        rows = rowsByNumber(type, predicate, limit, sort.empty() || sort.front().ascending);
    } else {
        rows = firstRows(type, predicate, byNumber ? 0 : limit,
                         byNumber ? VSSortDescriptor{VSSampleSortIdentifierStartDate, true} : sort.front());
    }
    std::sort(rows.begin(), rows.end(), RowOrder(sort));
    if (limit > 0 && rows.size() > static_cast<size_t>(limit)) rows.resize(static_cast<size_t>(limit));
    std::vector<VSSamplePtr> objects;
    objects.reserve(rows.size());
    for (const VSSampleRow& row : rows) objects.push_back(object(type, row));
    return objects;
}

VSSamplePtr VSStoreReader::object(const VSObjectType* type, const VSSampleRow& row) {
    const auto& entry = provenances_.provenance(row.provenance);
    VSProvenance provenance{entry.revision, entry.device, metadata_.metadata(row.metadata),
                            VSDate::fromMicroseconds(row.start + row.created), entry.timeZoneOffset};
    const VSDate start = VSDate::fromMicroseconds(row.start), end = VSDate::fromMicroseconds(row.end());
    const VSObjectID id{row.id};
    switch (type->kind()) {
        case VSTypeKind::Quantity:
            return std::make_shared<VSQuantitySample>(type, VSQuantity(type->canonicalUnit(), row.value),
                                                      start, end, std::move(provenance), id);
        case VSTypeKind::Category:
            return std::make_shared<VSCategorySample>(type, static_cast<int>(row.value), start, end,
                                                      std::move(provenance), id);
        case VSTypeKind::Workout: {
            static const VSUnit metre = VSUnit::fromString("m");
            auto details = database_.use("SELECT duration, energy, distance FROM workouts WHERE workout = ?");
            details.bind(1, row.id);
            if (!details.step())
                throw VSDatabaseFailure(
                    {VSErrorCode::Corrupt, "a workout of the store has lost its details"});
            std::optional<VSQuantity> energy, distance;
            if (!details.isNull(1)) energy = VSQuantity(VSUnit::kilocalorieUnit(), details.real(1));
            if (!details.isNull(2)) distance = VSQuantity(metre, details.real(2));
            std::vector<VSWorkoutEvent> events;
            auto rows =
                database_.use("SELECT type, date FROM workout_events WHERE workout = ? ORDER BY position");
            rows.bind(1, row.id);
            while (rows.step()) {
                VSWorkoutEvent event{static_cast<int>(rows.integer(0)), std::nullopt};
                if (!rows.isNull(1)) event.date = VSDate::fromMicroseconds(rows.integer(1));
                events.push_back(event);
            }
            return std::make_shared<VSWorkout>(static_cast<int>(row.value), start, end,
                                               VSDuration(details.integer(0)), energy, distance,
                                               std::move(events), std::move(provenance), id);
        }
        case VSTypeKind::Correlation: {
            std::vector<VSSamplePtr> members;
            for (const VSMemberKey& key : matcher_.members(row.id)) {
                VSSampleRow member;
                if (!matcher_.row(key, member))
                    throw VSDatabaseFailure(
                        {VSErrorCode::Corrupt, "a correlation of the store has lost a member"});
                members.push_back(object(key.type, member));
            }
            return std::make_shared<VSCorrelation>(type, start, end, std::move(members),
                                                   std::move(provenance), id);
        }
        case VSTypeKind::Characteristic:
            break;
    }
    throw VSDatabaseFailure({VSErrorCode::Corrupt, "the store has samples of a type that has none"});
}

VSAnchoredObjectQuery::Answer VSStoreReader::changes(const VSObjectType* type, const VSPredicate& predicate,
                                                     VSQueryAnchor anchor, int limit) {
    VSAnchoredObjectQuery::Answer answer;
    const int64_t last = lastNumber();
    if (anchor.value >= last) {  // an anchor beyond all objects means now
        answer.anchor = {last};
        return answer;
    }
    const VSDateFilter filter(predicate);
    Conditions conditions(*this, predicate);
    int64_t reached = last;
    auto added =
        database_.use("SELECT " VS_SAMPLE_COLUMNS
                      " FROM samples INDEXED BY samples_by_id WHERE type = ? AND id > ? ORDER BY id");
    added.bind(1, codeOf(type)).bind(2, anchor.value);
    scanRows(added, [&](const VSSampleRow& row) {
        if (!filter.matches(row.start, row.duration) || !conditions.match(row)) return true;
        answer.added.push_back(object(type, row));
        if (limit <= 0 || static_cast<int>(answer.added.size()) < limit) return true;
        reached = row.id;
        return false;
    });
    // Of objects that came and went since the anchor nothing is told.
    auto deleted = database_.use(
        "SELECT id FROM deleted WHERE type = ?1 AND change > ?2 AND change <= ?3 AND id <= ?2 ORDER BY "
        "change");
    deleted.bind(1, codeOf(type)).bind(2, anchor.value).bind(3, reached);
    while (deleted.step()) answer.deleted.push_back({VSObjectID{deleted.integer(0)}, type});
    answer.anchor = {reached};
    return answer;
}

std::vector<VSSource> VSStoreReader::sources(const VSObjectType* type, const VSPredicate& predicate) {
    std::vector<VSSource> sources;
    const bool everything = predicate.isDateRangeOnly() && !predicate.startDate && !predicate.endDate;
    for (int64_t source : orderedSources(type)) {
        const VSSource& candidate = provenances_.source(source);
        bool found = everything;
        if (!found) {
            VSPredicate ofSource = predicate;
            ofSource.sources = {candidate};
            if (!predicate.sources.empty() && std::find(predicate.sources.begin(), predicate.sources.end(),
                                                        candidate) == predicate.sources.end())
                continue;
            scan(type, ofSource, true, [&](const VSSampleRow&) {
                found = true;
                return false;
            });
        }
        if (found) sources.push_back(candidate);
    }
    return sources;
}

std::vector<int64_t> VSStoreReader::orderedSources(const VSObjectType* type) {
    return VSOrderedSources(database_, provenances_, codeOf(type));
}

VSStoreReader::Extent VSStoreReader::extent(const VSObjectType* type, int64_t source) {
    auto row =
        database_.use("SELECT count, first_start, last_end FROM type_sources WHERE type = ? AND source = ?");
    if (!row.bind(1, codeOf(type)).bind(2, source).step()) return {};
    return {row.integer(0), row.integer(1), row.integer(2)};
}

VSStoreReader::Extent VSStoreReader::extent(const VSObjectType* type) {
    auto row =
        database_.use("SELECT sum(count), min(first_start), max(last_end) FROM type_sources WHERE type = ?");
    if (!row.bind(1, codeOf(type)).step() || row.isNull(0)) return {};
    return {row.integer(0), row.integer(1), row.integer(2)};
}

std::map<const VSObjectType*, VSStoreReader::Extent> VSStoreReader::extents() {
    std::map<const VSObjectType*, Extent> extents;
    auto rows = database_.use(
        "SELECT type, sum(count), min(first_start), max(last_end) FROM type_sources GROUP BY type");
    while (rows.step()) {
        if (const auto* type = VSObjectType::dataTypeWithCode(static_cast<int>(rows.integer(0))))
            extents[type] = {rows.integer(1), rows.integer(2), rows.integer(3)};
    }
    return extents;
}

std::map<int, int64_t> VSStoreReader::typeChanges() {
    std::map<int, int64_t> changes;
    auto rows = database_.use("SELECT type, change FROM types");
    while (rows.step()) changes[static_cast<int>(rows.integer(0))] = rows.integer(1);
    return changes;
}

std::map<std::string, std::string> VSStoreReader::defaultTexts(const std::string& application) {
    std::map<std::string, std::string> texts;
    auto rows = database_.use("SELECT key, value FROM defaults WHERE application = ?");
    rows.bindText(1, application);
    while (rows.step()) texts[rows.text(0)] = rows.text(1);
    return texts;
}

int64_t VSStoreReader::lastChange(const VSObjectType* type) {
    auto row = database_.use("SELECT change FROM types WHERE type = ?");
    return row.bind(1, codeOf(type)).step() ? row.integer(0) : 0;
}
