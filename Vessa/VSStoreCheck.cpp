#include "Vessa/VSStoreCheck.h"

#include <map>
#include <set>
#include <unordered_map>

#include "Vessa/VSRollup.h"
#include "Vessa/VSStoreSchema.h"

namespace {

class Check {
 public:
    explicit Check(VSStoreReader& reader) : reader_(reader), database_(reader.database()) {}

    VSCheckReport run() {
        checkPages();
        checkReferences();
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

    void checkReferences() {
        count("SELECT count(*) FROM samples WHERE provenance NOT IN (SELECT provenance FROM provenances)",
              "samples without provenance");
        count(
            "SELECT count(*) FROM samples WHERE metadata NOTNULL AND metadata NOT IN (SELECT metadata FROM "
            "metadata)",
            "samples without their metadata");
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
        count("SELECT count(*) FROM samples WHERE id > (SELECT last FROM state) OR duration < 0",
              "samples with an impossible number or span");
        count(
            "SELECT count(*) FROM deleted d WHERE EXISTS (SELECT 1 FROM samples s WHERE s.type = d.type AND "
            "s.id = d.id)",
            "samples that are noted as deleted");
        count(
            "SELECT count(*) FROM (SELECT id FROM samples UNION ALL SELECT change FROM deleted) GROUP BY id "
            "HAVING count(*) > 1 LIMIT 1",
            "or more samples or deletions share a number");
        count(
            "SELECT count(*) FROM metadata m WHERE uses <> (SELECT count(*) FROM samples s WHERE s.metadata "
            "= m.metadata)",
            "metadata with a wrong count of users");
        count("SELECT count(*) FROM workouts WHERE workout NOT IN (SELECT id FROM samples WHERE type = 79)",
              "workout details without workout");
    }

    /// Reads every sample once, for the summaries and the rollups' days.
    void checkSamples() {
        auto rows = database_.use("SELECT type, start, duration, provenance FROM samples");
        while (rows.step()) {
            ++report_.samples;
            const int type = static_cast<int>(rows.integer(0));
            const int64_t start = rows.integer(1), duration = rows.integer(2);
            const int64_t source = reader_.provenances().sourceOfProvenance(rows.integer(3));
            Summary& summary = summaries_[{type, source}];
            ++summary.count;
            summary.firstStart = std::min(summary.firstStart, start);
            summary.lastEnd = std::max(summary.lastEnd, start + duration);
            if (duration > VSStoreSchema::longSpan.count()) continue;
            int64_t& longest = longest_[type];
            longest = std::max(longest, duration);
            const int64_t last = VSFloorDivide(duration ? start + duration - 1 : start, VSDayMicroseconds);
            for (int64_t day = VSFloorDivide(start, VSDayMicroseconds); day <= last; ++day)
                days_.insert(VSRollupSlot(type, source, day));
        }
    }

    void checkSummaries() {
        auto types = database_.use("SELECT type, longest FROM types");
        std::map<int, int64_t> noted;
        while (types.step()) noted[static_cast<int>(types.integer(0))] = types.integer(1);
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

    void checkRollups() {
        auto rows = database_.use("SELECT slot, quarters FROM rollups ORDER BY slot");
        while (rows.step()) {
            const int64_t slot = rows.integer(0);
            days_.erase(slot);
            const VSDayRollup made =
                VSRollupFromSamples(database_, reader_.provenances(), VSRollupTypeOfSlot(slot),
                                    VSRollupSourceOfSlot(slot), VSRollupDayOfSlot(slot));
            bool same = false;
            try {
                same = made == VSDayRollup::decoded(rows.blob(1));
            } catch (const VSDatabaseFailure&) {
                same = false;  // told below
            }
            if (!same) problem("the rollup " + describe(slot) + " differs from its samples");
        }
        for (int64_t slot : days_) problem("the rollup " + describe(slot) + " is missing");
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
    std::map<int, int64_t> longest_;
    std::set<int64_t> days_;
};

}  // namespace

VSCheckReport VSCheckStore(VSStoreReader& reader) {
    return Check(reader).run();
}
