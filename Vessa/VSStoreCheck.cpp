#include "Vessa/VSStoreCheck.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <unordered_map>
#include <unordered_set>

#include "Vessa/VSLimits.h"
#include "Vessa/VSNumberSet.h"
#include "Vessa/VSRollupBuilder.h"
#include "Vessa/VSStoreSchema.h"

namespace {

class Check {
 public:
    explicit Check(VSStoreReader& reader) : reader_(reader), database_(reader.database()) {}

    VSCheckReport run() {
        checkPages();
        checkReferences();
        checkBatches();
        checkSamples();
        checkSummaries();
        checkRollups();
        return std::move(report_);
    }

 private:
    void problem(std::string text) {
        if (report_.problems.size() < 100) report_.problems.push_back(std::move(text));
    }

    void checkPages() {
        auto rows = database_.use("PRAGMA integrity_check(20)");
        while (rows.step()) {
            if (rows.text(0) != "ok") problem("file: " + rows.text(0));
        }
    }

    void count(const char* sql, const char* what) {
        if (const int64_t found = database_.integer(sql)) problem(std::to_string(found) + " " + what);
    }

    /// What small tables, or indexes, can tell. Nothing here reads all samples.
    void checkReferences() {
        count("SELECT count(*) FROM provenances WHERE source NOT IN (SELECT source FROM sources)",
              "provenances without source");
        count(
            "SELECT count(*) FROM provenances WHERE device NOTNULL AND device NOT IN (SELECT device FROM "
            "devices)",
            "provenances without device");
        count(
            "SELECT count(*) FROM members m WHERE NOT EXISTS (SELECT 1 FROM samples s WHERE s.type = m.type "
            "AND s.start = m.start AND s.id = m.member)",
            "members that are not in the store");
        count(("SELECT count(*) FROM members WHERE parent NOT IN (SELECT id FROM samples WHERE type IN (" +
               VSTypesWithMembers() + "))")
                  .c_str(),
              "members of what is not in the store");
        count("SELECT count(*) FROM workouts WHERE workout NOT IN (SELECT id FROM samples WHERE type = 79)",
              "workout details without workout");
        count("SELECT count(*) FROM samples WHERE type = 79 AND id NOT IN (SELECT workout FROM workouts)",
              "workouts without their details");
        count("SELECT count(*) FROM workout_events WHERE workout NOT IN (SELECT workout FROM workouts)",
              "events without their workout");
        for (const char* table : {"source_order", "type_sources"})
            count((std::string("SELECT count(*) FROM ") + table +
                   " WHERE source NOT IN (SELECT source FROM sources)")
                      .c_str(),
                  "sources of an order or summary that are not there");
        count("SELECT count(*) FROM characteristics WHERE type NOT IN (64, 65, 66, 88)",
              "characteristics of an unknown type");
        count(
            "SELECT count(*) FROM authorizations WHERE status NOT BETWEEN 100 AND 104 OR reading NOT IN (0, "
            "1) OR "
            "sharing NOT IN (0, 1)",
            "permissions that say nothing");
        checkTexts("SELECT value FROM defaults", false, "default values that cannot be read");
        checkTexts("SELECT content FROM medical_id", true, "Medical IDs that cannot be read");
    }

    void checkTexts(const char* sql, bool dictionary, const char* what) {
        int64_t bad = 0;
        auto rows = database_.use(sql);
        while (rows.step()) {
            const auto value = VSValue::fromSerialized(rows.text(0));
            if (!value || (dictionary && !value->dictionary())) ++bad;
        }
        if (bad) problem(std::to_string(bad) + " " + what);
    }

    /// An import had the only writer, so that the numbers of batches do not overlap; what it claims was there
    /// before.
    void checkBatches() {
        const int64_t last = database_.integer("SELECT last FROM state");
        int64_t before = 0, bad = 0;
        auto rows = database_.use("SELECT first_id, last_id, added, undone FROM batches ORDER BY batch");
        while (rows.step()) {
            const int64_t first = rows.integer(0), to = rows.integer(1);
            if (first <= before || to < first - 1 || to > last || rows.integer(2) < 0 ||
                rows.integer(2) > to - first + 1 || (rows.integer(3) != 0 && rows.integer(3) != 1))
                ++bad;
            before = std::max(before, to);
        }
        if (bad) problem(std::to_string(bad) + " batches with impossible numbers");
        count(
            "SELECT count(*) FROM batches WHERE batch > (SELECT seq FROM sqlite_sequence WHERE name = "
            "'batches')",
            "batches whose number would be given again");
        count(
            "SELECT count(*) FROM batch_claims c LEFT JOIN batches b ON b.batch = c.batch AND b.undone = 0 "
            "WHERE "
            "b.batch IS NULL OR c.first_id < 1 OR c.last_id < c.first_id OR c.last_id >= b.first_id",
            "claims of batches that are not there, or of what came later");
        count(
            "SELECT count(*) FROM batch_characteristics c LEFT JOIN batches b ON b.batch = c.batch AND "
            "b.undone = "
            "0 WHERE b.batch IS NULL OR c.given NOT IN (0, 1)",
            "characteristics of batches that are not there");
    }

    /// Reads every sample once, for the summaries, the numbers, and what it refers to. Memory: a bit for each
    /// number, and a count for each dictionary.
    void checkSamples() {
        const int64_t last = database_.integer("SELECT last FROM state");
        std::unordered_set<int64_t> provenances;
        {
            auto rows = database_.use("SELECT provenance FROM provenances");
            while (rows.step()) provenances.insert(rows.integer(0));
        }
        int64_t impossible = 0, doubled = 0, homeless = 0;
        auto rows =
            database_.use("SELECT type, start, duration, provenance, id, metadata, value FROM samples");
        while (rows.step()) {
            ++report_.samples;
            const int type = static_cast<int>(rows.integer(0));
            const int64_t start = rows.integer(1), duration = rows.integer(2), id = rows.integer(4);
            const auto* known = VSObjectType::dataTypeWithCode(type);
            if (!known || !known->isSampleType() || id < 1 || id > last || duration < 0 ||
                start < VSLimits::earliestDate.microseconds() ||
                start > VSLimits::latestDate.microseconds() - duration || !std::isfinite(rows.real(6))) {
                ++impossible;
                continue;
            }
            if (!numbers_.insert(id)) ++doubled;
            if (const int64_t metadata = rows.integer(5)) ++metadataUses_[metadata];
            int64_t& newest = newest_[type];
            newest = std::max(newest, id);
            if (!provenances.contains(rows.integer(3))) {
                ++homeless;
                continue;
            }
            const int64_t source = reader_.provenances().sourceOfProvenance(rows.integer(3));
            Summary& summary = summaries_[{type, source}];
            ++summary.count;
            summary.firstStart = std::min(summary.firstStart, start);
            summary.lastEnd = std::max(summary.lastEnd, start + duration);
            if (duration > VSStoreSchema::longSpan.count()) continue;
            int64_t& longest = longest_[type];
            longest = std::max(longest, duration);
        }
        if (impossible)
            problem(std::to_string(impossible) + " samples with an impossible type, number, span or value");
        if (homeless) problem(std::to_string(homeless) + " samples without provenance");
        checkDeletions(last, doubled);
        checkMetadata();
    }

    void checkDeletions(int64_t last, int64_t doubled) {
        int64_t impossible = 0, present = 0;
        auto rows = database_.use("SELECT change, type, id FROM deleted");
        while (rows.step()) {
            const int64_t change = rows.integer(0), id = rows.integer(2);
            if (change > last || id < 1 || id >= change) {
                ++impossible;
                continue;
            }
            if (numbers_.contains(id)) ++present;
            if (!numbers_.insert(change)) ++doubled;
            int64_t& newest = newest_[static_cast<int>(rows.integer(1))];
            newest = std::max(newest, change);
        }
        if (impossible) problem(std::to_string(impossible) + " deletions with impossible numbers");
        if (present) problem(std::to_string(present) + " samples that are noted as deleted");
        if (doubled) problem(std::to_string(doubled) + " samples or deletions share a number");
    }

    void checkMetadata() {
        int64_t miscounted = 0, unreadable = 0;
        int64_t highest = 0;
        auto rows = database_.use("SELECT metadata, uses, content FROM metadata");
        while (rows.step()) {
            highest = std::max(highest, rows.integer(0));
            const auto found = metadataUses_.find(rows.integer(0));
            if (rows.integer(1) != (found == metadataUses_.end() ? 0 : found->second)) ++miscounted;
            if (found != metadataUses_.end()) metadataUses_.erase(found);
            const auto value = VSValue::fromSerialized(rows.text(2));
            if (!value || !value->dictionary()) ++unreadable;
        }
        if (miscounted) problem(std::to_string(miscounted) + " metadata with a wrong count of users");
        if (unreadable) problem(std::to_string(unreadable) + " metadata that cannot be read");
        if (!metadataUses_.empty())
            problem(std::to_string(metadataUses_.size()) +
                    " metadata that samples have are not in the store");
        if (highest > database_.integer("SELECT last_metadata FROM state"))
            problem("a number of metadata would be given again");
    }

    void checkSummaries() {
        auto types = database_.use("SELECT type, longest, change FROM types");
        std::map<int, int64_t> noted, changes;
        while (types.step()) {
            noted[static_cast<int>(types.integer(0))] = types.integer(1);
            changes[static_cast<int>(types.integer(0))] = types.integer(2);
        }
        for (const auto& [type, newest] : newest_) {
            if (changes[type] < newest)
                problem("type " + std::to_string(type) + ": its last change is not noted");
        }
        for (const auto& [type, longest] : longest_) {
            if (!noted.contains(type) || noted[type] < longest)
                problem("type " + std::to_string(type) + ": a span is longer than noted");
        }
        auto rows = database_.use("SELECT type, source, count, first_start, last_end FROM type_sources");
        while (rows.step()) {
            const auto found = summaries_.find({static_cast<int>(rows.integer(0)), rows.integer(1)});
            const bool same = found != summaries_.end() && found->second.count == rows.integer(2) &&
                              found->second.firstStart == rows.integer(3) &&
                              found->second.lastEnd == rows.integer(4);
            if (!same)
                problem("the summary of type " + rows.text(0) + ", source " + rows.text(1) + " is wrong");
            if (found != summaries_.end()) summaries_.erase(found);
        }
        for (const auto& [key, summary] : summaries_)
            problem("there is no summary of type " + std::to_string(key.first) + ", source " +
                    std::to_string(key.second));
    }

    /// Makes every row anew from the samples and compares.
    void checkRollups() {
        std::unordered_set<int64_t> made;
        VSRollupBuilder builder(database_, reader_.provenances(),
                                [&](int64_t slot, const std::string& bytes) {
                                    made.insert(slot);
                                    auto row = database_.use("SELECT quarters FROM rollups WHERE slot = ?");
                                    if (!row.bind(1, slot).step())
                                        problem("the rollup " + describe(slot) + " is missing");
                                    else if (row.blob(0) != bytes)
                                        problem("the rollup " + describe(slot) + " differs from its samples");
                                });
        auto rows = database_.use(
            "SELECT type, start, duration, value, provenance FROM samples ORDER BY type, start, id");
        while (rows.step())
            builder.add(static_cast<int>(rows.integer(0)), rows.integer(1), rows.integer(2), rows.real(3),
                        rows.integer(4));
        builder.finish();
        auto slots = database_.use("SELECT slot FROM rollups");
        while (slots.step()) {
            if (!made.contains(slots.integer(0)))
                problem("the rollup " + describe(slots.integer(0)) + " differs from its samples");
        }
        for (int type = 0; type < 128; ++type) {
            const auto order = builder.orders().find(type);
            const bool same = VSOrderOfMergedRows(database_, type) ==
                              (order == builder.orders().end() ? std::vector<int64_t>() : order->second);
            if (!same)
                problem("type " + std::to_string(type) +
                        ": its rollups were merged in another order of sources");
        }
    }

    static std::string describe(int64_t slot) {
        return "of type " + std::to_string(VSRollupTypeOfSlot(slot)) + ", source " +
               std::to_string(VSRollupSourceOfSlot(slot)) + ", day " +
               std::to_string(VSRollupDayOfSlot(slot));
    }

    struct Summary {
        int64_t count = 0, firstStart = INT64_MAX, lastEnd = INT64_MIN;
    };
    VSStoreReader& reader_;
    VSDatabase& database_;
    VSCheckReport report_;
    std::map<std::pair<int, int64_t>, Summary> summaries_;
    std::map<int, int64_t> longest_, newest_;  // by type; the number of its newest sample or deletion
    VSNumberSet numbers_;
    std::unordered_map<int64_t, int64_t> metadataUses_;
};

}  // namespace

VSCheckReport VSCheckStore(VSStoreReader& reader) {
    return Check(reader).run();
}
