#include "Vessa/VSStoreSalvage.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <map>
#include <optional>
#include <unordered_map>
#include <unordered_set>
#include <utility>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/VSNumberSet.h"
#include "Vessa/VSRollup.h"
#include "Vessa/VSSalvageCopy.h"
#include "Vessa/VSSalvageReader.h"
#include "Vessa/VSStoreGuard.h"
#include "Vessa/VSStoreMatcher.h"
#include "Vessa/VSStoreSchema.h"
#include "Vessa/VSWorkFolder.h"

namespace {

namespace fs = std::filesystem;
using Table = VSSalvageTable;

constexpr VSDuration patience = std::chrono::seconds(10);
constexpr const char* recoveredName = "Recovered";

constexpr const char* workName = "salvage.unfinished";

template <typename T>
T valueOf(VSResult<T> result) {
    if (!result) throw VSDatabaseFailure(result.error());
    return std::move(*result);
}

/// The folder in which a salvage works; goes with everything in it.
class WorkFolder {
 public:
    /// `target`: the folder in which it is made, open.
    WorkFolder(int target, const fs::path& path)
        : target_(target), folder_(valueOf(VSWorkFolder::open(workName, target, path / workName))) {
        folder_.removeAll();  // what a killed salvage left
    }
    ~WorkFolder() {
        folder_.removeAll();
        ::unlinkat(target_, workName, AT_REMOVEDIR);
    }
    WorkFolder(const WorkFolder&) = delete;
    WorkFolder& operator=(const WorkFolder&) = delete;
    const fs::path& path() const { return folder_.path(); }
    int descriptor() const { return folder_.descriptor(); }

 private:
    const int target_;
    const VSWorkFolder folder_;
};

void bindField(VSStatement& statement, int index, const VSPageField& field) {
    switch (field.kind) {
        case VSPageField::Kind::Null:
            statement.bindNull(index);
            return;
        case VSPageField::Kind::Integer:
            statement.bind(index, field.integer);
            return;
        case VSPageField::Kind::Real:
            statement.bindReal(index, field.real);
            return;
        case VSPageField::Kind::Text:
            statement.bindText(index, field.bytes);
            return;
        case VSPageField::Kind::Blob:
            statement.bindBlob(index, field.bytes.empty() ? "" : field.bytes.data(), field.bytes.size());
            return;
    }
}

bool isDictionary(std::string_view text) {
    const auto value = VSValue::fromSerialized(text);
    return value && value->dictionary();
}

/// Fills a new, empty store with what the reader finds of a damaged one, inside one transaction.
class Salvage {
 public:
    Salvage(VSSalvageReader& damaged, VSDatabase& database) : damaged_(damaged), database_(database) {}

    VSSalvageReport run() {
        readNumbers();
        copyProvenances();
        copyMetadata();
        copySamples();
        copyWorkouts();
        copyMembers();
        copyDeletions();
        copyBatches();
        copyValues();
        makeSummaries();
        tellOfLostSamples();
        tellOfDamagedTables();
        return std::move(report_);
    }

 private:
    void lost(std::string what) { report_.losses.push_back(std::move(what)); }
    void lost(int64_t count, const char* what) {
        if (count) lost(std::to_string(count) + " " + what);
    }
    void noteNumber(int64_t number) { last_ = std::max(last_, number); }
    bool isPossible(int64_t number) const { return number <= trustedLast_; }

    /// Copies the rows of a table as they are, those that `accept` takes. The first of several with one key
    /// counts.
    template <typename Accept>
    void copyRows(Table table, int columns, Accept accept) {
        std::string sql = std::string("INSERT OR IGNORE INTO ") + VSSalvageTableName(table) + " VALUES (?";
        for (int i = 1; i < columns; ++i) sql += ", ?";
        auto insert = database_.use(sql + ")");
        damaged_.forEachRow(table, [&](const VSPageRow& row) {
            if (!accept(row)) return;
            for (int i = 0; i < columns; ++i) {
                const auto column = static_cast<size_t>(i);
                if (column >= row.fields.size())
                    insert.bind(i + 1, 0);  // a column that came with a later format
                else if (i == 0 && row.fields[0].isNull())
                    insert.bind(1, row.number);
                else
                    bindField(insert, i + 1, row.fields[column]);
            }
            insert.run();
        });
    }

    void readNumbers() {
        damaged_.forEachRow(Table::State, [&](const VSPageRow& row) {
            if (row.number != 1) return;
            noteNumber(row.fields[1].integer);
            lastMetadata_ = std::max(lastMetadata_, row.fields[2].integer);
            // A number above the last one given cannot be right.
            if (!damaged_.isDamaged(Table::State)) trustedLast_ = row.fields[1].integer;
        });
        damaged_.forEachRow(Table::Deleted, [&](const VSPageRow& row) {
            if (isPossible(row.number)) deleted_.insert(row.fields[2].integer);
        });
    }

    void copyProvenances() {
        copyRows(Table::Sources, 3,
                 [&](const VSPageRow& row) { return row.number > 0 && sources_.insert(row.number).second; });
        copyRows(Table::Devices, 9,
                 [&](const VSPageRow& row) { return row.number > 0 && devices_.insert(row.number).second; });
        auto insert = database_.use("INSERT INTO provenances VALUES (?, ?, ?, ?, ?)");
        damaged_.forEachRow(Table::Provenances, [&](const VSPageRow& row) {
            if (row.number <= 0 || provenances_.contains(row.number)) return;
            const int64_t source = row.fields[1].integer;
            provenances_[row.number] = sources_.contains(source) ? source : recoveredSource();
            insert.bind(1, row.number).bind(2, provenances_[row.number]);
            bindField(insert, 3, row.fields[2]);
            const bool hasDevice = !row.fields[3].isNull();
            if (hasDevice && devices_.contains(row.fields[3].integer))
                insert.bind(4, row.fields[3].integer);
            else
                insert.bindNull(4);
            if (hasDevice && !devices_.contains(row.fields[3].integer)) ++withoutDevice_;
            bindField(insert, 5, row.fields[4]);
            insert.run();
        });
        lost(withoutDevice_, "combinations of source and device have lost their device");
    }

    /// The source of samples whose own is lost.
    int64_t recoveredSource() {
        if (recovered_) return recovered_;
        const VSSource source = VSSource::forImportedName(recoveredName);
        auto known = database_.use("SELECT source FROM sources WHERE bundle = ? AND name = ?");
        if (known.bindText(1, source.bundleIdentifier).bindText(2, source.name).step())
            return recovered_ = known.integer(0);
        // Not a number that the lost sources may have had: the user's order of sources speaks of those.
        recovered_ = std::max<int64_t>(sources_.empty() ? 0 : *sources_.rbegin(), highestSourceUsed()) + 1;
        database_.use("INSERT INTO sources VALUES (?, ?, ?)")
            .bind(1, recovered_)
            .bindText(2, source.name)
            .bindText(3, source.bundleIdentifier)
            .run();
        sources_.insert(recovered_);
        return recovered_;
    }

    int64_t highestSourceUsed() {
        int64_t highest = 0;
        constexpr int64_t limit = 1 << 19;  // rollups have room for a million
        const auto see = [&](int64_t source) {
            if (source < limit) highest = std::max(highest, source);
        };
        damaged_.forEachRow(Table::Provenances, [&](const VSPageRow& row) { see(row.fields[1].integer); });
        damaged_.forEachRow(Table::SourceOrder, [&](const VSPageRow& row) { see(row.fields[2].integer); });
        damaged_.forEachRow(Table::TypeSources, [&](const VSPageRow& row) { see(row.fields[1].integer); });
        return highest;
    }

    void copyMetadata() {
        copyRows(Table::Metadata, 3, [&](const VSPageRow& row) {
            if (row.number <= 0 || !isDictionary(row.fields[1].bytes)) return false;
            lastMetadata_ = std::max(lastMetadata_, row.number);
            return metadata_.insert(row.number).second;
        });
    }

    /// The numbers that several rows have, with the type and start that the index of numbers tells.
    std::unordered_map<int64_t, std::optional<std::pair<int64_t, int64_t>>> numbersGivenTwice() {
        std::unordered_map<int64_t, std::optional<std::pair<int64_t, int64_t>>> doubles;
        VSNumberSet seen;
        damaged_.forEachRow(Table::Samples, [&](const VSPageRow& row) {
            const int64_t id = row.fields[2].integer;
            if (isPossible(id) && !seen.insert(id)) doubles.try_emplace(id);
        });
        if (doubles.empty()) return doubles;
        damaged_.forEachRow(Table::SamplesByID, [&](const VSPageRow& row) {
            const auto found = doubles.find(row.fields[1].integer);
            if (found != doubles.end() && !found->second)
                found->second = {row.fields[0].integer, row.fields[2].integer};
        });
        return doubles;
    }

    void copySamples() {
        auto insert = database_.use("INSERT OR IGNORE INTO samples VALUES (?, ?, ?, ?, ?, ?, ?, ?)");
        int64_t withoutSource = 0, withoutMetadata = 0;
        const auto doubles = numbersGivenTwice();
        damaged_.forEachRow(Table::Samples, [&](const VSPageRow& row) {
            const int64_t id = row.fields[2].integer;
            if (!isPossible(id) || deleted_.contains(id)) return;
            // Of several the one that the index knows: a broken bit may have given a row another's number.
            const auto known = doubles.find(id);
            if (known != doubles.end() && known->second &&
                *known->second != std::pair(row.fields[0].integer, row.fields[1].integer))
                return;
            if (!samples_.insert(id)) return;
            for (int column = 0; column < 8; ++column)
                bindField(insert, column + 1, row.fields[static_cast<size_t>(column)]);
            const int64_t provenance = row.fields[5].integer;
            if (!provenances_.contains(provenance)) {
                provenances_[provenance] = recoveredSource();
                database_.use("INSERT INTO provenances VALUES (?, ?, '', NULL, NULL)")
                    .bind(1, provenance)
                    .bind(2, recoveredSource())
                    .run();
            }
            withoutSource += provenances_[provenance] == recovered_;
            if (!row.fields[7].isNull() && !metadata_.contains(row.fields[7].integer)) {
                insert.bindNull(8);
                ++withoutMetadata;
            }
            insert.run();
            noteNumber(id);
            ++report_.samples;
        });
        lost(withoutSource, "samples have lost their source; they are now of one named \"Recovered\"");
        lost(withoutMetadata, "samples have lost their metadata");
    }

    void copyWorkouts() {
        copyRows(Table::Workouts, 4, [&](const VSPageRow& row) { return samples_.contains(row.number); });
        copyRows(Table::WorkoutEvents, 4,
                 [&](const VSPageRow& row) { return samples_.contains(row.fields[0].integer); });
        database_.execute(
            "DELETE FROM workouts WHERE workout NOT IN (SELECT id FROM samples WHERE type = 79)");
        database_.execute("DELETE FROM workout_events WHERE workout NOT IN (SELECT workout FROM workouts)");
        database_
            .use(
                "INSERT INTO workouts SELECT id, duration, NULL, NULL FROM samples WHERE type = 79 AND id "
                "NOT IN "
                "(SELECT workout FROM workouts)")
            .run();
        lost(database_.changes(), "workouts have lost their duration, energy and distance");
    }

    void copyMembers() {
        copyRows(Table::Members, 5, [&](const VSPageRow& row) {
            return samples_.contains(row.fields[0].integer) && isPossible(row.fields[2].integer);
        });
        const std::string parents = "(SELECT id FROM samples WHERE type IN (" + VSTypesWithMembers() + "))";
        database_.use("DELETE FROM members WHERE parent NOT IN " + parents).run();
        database_
            .use(
                "DELETE FROM members WHERE NOT EXISTS (SELECT 1 FROM samples s WHERE s.type = members.type "
                "AND s.start = members.start AND s.id = members.member)")
            .run();
        lost(database_.changes(), "members of correlations and workouts are lost");
    }

    void copyDeletions() {
        copyRows(Table::Deleted, 3, [&](const VSPageRow& row) {
            if (!isPossible(row.number) || samples_.contains(row.number)) return false;
            noteNumber(row.number);
            return true;
        });
    }

    void copyBatches() {
        // What a batch of the first format added is counted.
        auto insert = database_.use(
            "INSERT OR IGNORE INTO batches(batch, name, date, first_id, last_id, added, undone) "
            "VALUES (?1, ?2, ?3, ?4, ?5, coalesce(?6, (SELECT count(*) FROM samples WHERE id BETWEEN ?4 AND "
            "?5)"
            " + (SELECT count(*) FROM deleted WHERE id BETWEEN ?4 AND ?5)), ?7)");
        std::unordered_set<int64_t> known;
        damaged_.forEachRow(Table::Batches, [&](const VSPageRow& row) {
            if (row.number <= 0 || !known.insert(row.number).second || !isPossible(row.fields[4].integer))
                return;
            insert.bind(1, row.number);
            for (int column = 1; column < 5; ++column)
                bindField(insert, column + 1, row.fields[static_cast<size_t>(column)]);
            if (row.fields.size() > 5)
                bindField(insert, 6, row.fields[5]);
            else
                insert.bindNull(6);
            insert.bind(7, row.fields.size() > 6 ? row.fields[6].integer : 0);
            insert.run();
            noteNumber(row.fields[4].integer);
        });
        copyRows(Table::BatchClaims, 3, [&](const VSPageRow& row) {
            return known.contains(row.fields[0].integer) && isPossible(row.fields[2].integer) &&
                   row.fields[1].integer <= row.fields[2].integer;
        });
        copyRows(Table::BatchCharacteristics, 4,
                 [&](const VSPageRow& row) { return known.contains(row.fields[0].integer); });
        int64_t lastBatch = 0;
        damaged_.forEachRow(Table::BatchNumbers, [&](const VSPageRow& row) {
            if (row.fields[0].bytes == "batches") lastBatch = std::max(lastBatch, row.fields[1].integer);
        });
        database_.execute(
            "INSERT INTO sqlite_sequence(name, seq) SELECT 'batches', 0 WHERE NOT EXISTS (SELECT 1 "
            "FROM sqlite_sequence WHERE name = 'batches')");
        database_.use("UPDATE sqlite_sequence SET seq = max(seq, ?) WHERE name = 'batches'")
            .bind(1, lastBatch)
            .run();
    }

    void copyValues() {
        copyRows(Table::Authorizations, 6, [](const VSPageRow&) { return true; });
        copyRows(Table::Defaults, 3, [](const VSPageRow& row) {
            return VSValue::fromSerialized(row.fields[2].bytes).has_value();
        });
        copyRows(Table::Characteristics, 2, [](const VSPageRow& row) {
            if (row.number < 0 || row.number > 1000) return false;
            const auto* type = VSObjectType::dataTypeWithCode(static_cast<int>(row.number));
            return type && type->kind() == VSTypeKind::Characteristic;
        });
        copyRows(Table::MedicalID, 3,
                 [](const VSPageRow& row) { return row.number == 1 && isDictionary(row.fields[1].bytes); });
        copyRows(Table::SourceOrder, 3,
                 [&](const VSPageRow& row) { return sources_.contains(row.fields[2].integer); });
    }

    /// All that follows from the rest.
    void makeSummaries() {
        std::map<int64_t, int64_t> changes;
        damaged_.forEachRow(Table::Types, [&](const VSPageRow& row) {
            if (row.number >= 0 && row.number < 128 && isPossible(row.fields[1].integer) &&
                !damaged_.isDamaged(Table::Types))
                changes[row.number] = row.fields[1].integer;
        });
        database_.execute(
            "INSERT INTO types SELECT type, max(change), max(longest) FROM (SELECT type, max(id) AS change, "
            "max(CASE WHEN duration <= " VS_LONG_SPAN_SQL
            " THEN duration ELSE 0 END) AS longest FROM samples GROUP BY type UNION ALL "
            "SELECT type, max(change), 0 FROM deleted GROUP BY type) GROUP BY type");
        for (const auto& [type, change] : changes) {
            noteNumber(change);
            database_
                .use(
                    "INSERT INTO types VALUES (?1, ?2, 0) ON CONFLICT(type) DO UPDATE SET change = "
                    "max(change, ?2)")
                .bind(1, type)
                .bind(2, change)
                .run();
        }
        database_.use("UPDATE state SET last = ?, last_metadata = ?")
            .bind(1, last_)
            .bind(2, lastMetadata_)
            .run();
        // Counted in one pass: `metadata` can be long.
        database_.execute(
            "UPDATE metadata SET uses = 0; UPDATE metadata SET uses = n FROM (SELECT metadata AS m, count(*) "
            "AS n "
            "FROM samples WHERE metadata NOTNULL GROUP BY metadata) WHERE metadata = m; "
            "DELETE FROM metadata WHERE uses = 0;");
        database_.execute(
            "INSERT INTO type_sources SELECT s.type, p.source, count(*), min(s.start), max(s.start + "
            "s.duration) "
            "FROM samples s JOIN provenances p ON p.provenance = s.provenance GROUP BY s.type, p.source");
        VSRebuildAllRollups(database_);
    }

    std::string nameOf(int64_t type) const {
        const auto* known = VSObjectType::dataTypeWithCode(static_cast<int>(type));
        return known ? std::string(known->name()) : "type " + std::to_string(type);
    }

    void tellOfLostSamples() {
        report_.lost = 0;
        if (!damaged_.isDamaged(Table::Samples)) return;
        const bool indexWhole = !damaged_.isDamaged(Table::SamplesByID);
        const std::map<int64_t, int64_t> lostByIndex = lostOfIndex();
        std::map<int64_t, int64_t> expected;
        const bool countsKnown = !damaged_.isDamaged(Table::TypeSources);
        damaged_.forEachRow(Table::TypeSources, [&](const VSPageRow& row) {
            expected[row.fields[0].integer] += row.fields[2].integer;
        });
        if (indexWhole) {
            for (const auto& [type, count] : lostByIndex) *report_.lost += count;
            return;
        }
        if (!countsKnown) {
            report_.lost.reset();
            lost("how many more samples are lost cannot be told: what counts them is damaged too");
            return;
        }
        auto present = database_.use("SELECT coalesce(sum(count), 0) FROM type_sources WHERE type = ?");
        for (const auto& [type, count] : expected) {
            present.bind(1, type).step();
            const int64_t missing = std::max<int64_t>(0, count - present.integer(0));
            present.reset();
            *report_.lost += missing;
            const auto told = lostByIndex.find(type);
            const int64_t more = missing - (told == lostByIndex.end() ? 0 : told->second);
            if (more > 0) lost(std::to_string(more) + " samples of " + nameOf(type) + " of unknown times");
        }
    }

    /// By type how many samples the index of numbers knows that are not there, told with their times.
    std::map<int64_t, int64_t> lostOfIndex() {
        database_.execute("CREATE TEMP TABLE known(type, id, start, PRIMARY KEY (type, id)) WITHOUT ROWID");
        {
            auto insert = database_.use("INSERT OR IGNORE INTO temp.known VALUES (?, ?, ?)");
            damaged_.forEachRow(Table::SamplesByID, [&](const VSPageRow& row) {
                const int64_t id = row.fields[1].integer;
                if (!isPossible(id) || deleted_.contains(id) || samples_.contains(id)) return;
                insert.bind(1, row.fields[0].integer).bind(2, id).bind(3, row.fields[2].integer).run();
                noteNumber(id);
            });
        }
        std::map<int64_t, int64_t> counts;
        const VSCalendar calendar = VSCalendar::current();
        auto rows = database_.use(
            "SELECT type, count(*), min(start), max(start) FROM temp.known GROUP BY type ORDER BY type");
        while (rows.step()) {
            counts[rows.integer(0)] = rows.integer(1);
            lost(std::to_string(rows.integer(1)) + " samples of " + nameOf(rows.integer(0)) + " from " +
                 VSISO8601FromDate(VSDate::fromMicroseconds(rows.integer(2)), calendar) + " to " +
                 VSISO8601FromDate(VSDate::fromMicroseconds(rows.integer(3)), calendar));
        }
        rows.reset();
        database_.use("UPDATE state SET last = max(last, ?)").bind(1, last_).run();
        return counts;
    }

    void tellOfDamagedTables() {
        constexpr std::pair<Table, const char*> names[] = {
            {Table::Members, "the members of correlations and workouts"},
            {Table::Workouts, "the durations, energies and distances of workouts"},
            {Table::WorkoutEvents, "the pauses of workouts"},
            {Table::Deleted, "the list of what was deleted"},
            {Table::Sources, "the sources"},
            {Table::Devices, "the devices"},
            {Table::Provenances, "the combinations of source, version and device"},
            {Table::Metadata, "the metadata"},
            {Table::SourceOrder, "the order of sources"},
            {Table::Batches, "the list of imports"},
            {Table::BatchClaims, "what imports had in common"},
            {Table::BatchCharacteristics, "the characteristics that imports set"},
            {Table::Authorizations, "the permissions"},
            {Table::Defaults, "the default values of applications"},
            {Table::Characteristics, "the characteristics of the person"},
            {Table::MedicalID, "the Medical ID"},
        };
        for (const auto& [table, name] : names) {
            if (damaged_.isDamaged(table)) lost(std::string(name) + " may be incomplete");
        }
    }

    VSSalvageReader& damaged_;
    VSDatabase& database_;
    VSSalvageReport report_;
    int64_t last_ = 0, lastMetadata_ = 0, trustedLast_ = INT64_MAX;
    VSNumberSet samples_;
    std::unordered_set<int64_t> deleted_, metadata_;
    std::set<int64_t> sources_, devices_;
    std::map<int64_t, int64_t> provenances_;  // and their sources
    int64_t recovered_ = 0;                   // the number of that source; 0: not needed yet
    int64_t withoutDevice_ = 0;
};

/// Another program's database, or a newer store: as far as a head that may be damaged can say.
void refuseStrangers(const fs::path& copy, const fs::path& file, const VSSalvageReader& reader) {
    int64_t identity = 0, version = 0;
    try {
        VSDatabase database(copy, VSDatabase::Mode::Read, VSDuration(0));
        identity = database.integer("PRAGMA application_id");
        version = database.integer("PRAGMA user_version");
        database.integer("SELECT count(*) FROM sqlite_master");
    } catch (const VSDatabaseFailure&) {
        identity = VSStoreSchema::applicationID;  // damaged: the pages must tell
    }
    const bool ours = identity == VSStoreSchema::applicationID || reader.found(Table::Samples);
    if (!ours)
        throw VSDatabaseFailure({VSErrorCode::Refused, file.string() + " is a database of another program"});
    if (version > VSStoreSchema::currentVersion && version < 1000)
        throw VSDatabaseFailure(
            {VSErrorCode::Refused, file.string() + " was written by a newer version of this program"});
    for (const Table table : {Table::Samples, Table::Sources, Table::Provenances, Table::Defaults,
                              Table::MedicalID, Table::Characteristics})
        if (reader.found(table)) return;
    throw VSDatabaseFailure({VSErrorCode::Corrupt, "nothing of a store can be found in " + file.string()});
}

/// Gives the new store its place, which nobody else may have taken meanwhile.
void putInPlace(int from, int target, const fs::path& folder) {
    const std::string made = std::string("made/") + VSStoreSchema::fileName;
    const auto rename = [&](unsigned flags) {
        return ::renameat2(from, made.c_str(), target, VSStoreSchema::fileName, flags) == 0;
    };
    bool isPlaced = rename(RENAME_NOREPLACE);
    // Not every file system can make sure of that.
    struct stat status {};
    if (!isPlaced && (errno == EINVAL || errno == ENOSYS) &&
        ::fstatat(target, VSStoreSchema::fileName, &status, AT_SYMLINK_NOFOLLOW) != 0)
        isPlaced = rename(0);
    if (!isPlaced) throw VSDatabaseFailure(VSErrorFromSystem(errno, folder.string()));
    ::fsync(target);
}

/// `target` is the folder, open.
VSSalvageReport salvageInto(int target, const fs::path& folder, const fs::path& file) {
    std::error_code error;
    const WorkFolder work(target, folder);
    const fs::path copy = work.path() / "damaged.sqlite", layout = work.path() / "layout",
                   made = work.path() / "made";
    VSCopyForSalvage(file, copy);
    VSStoreSchema::openForWriting(layout, true, false, patience);
    VSSalvageReport report;
    {
        VSSalvageReader reader(copy, layout / VSStoreSchema::fileName);
        if (reader.error()) throw VSDatabaseFailure({VSErrorCode::Failed, *reader.error()});
        refuseStrangers(copy, file, reader);
        const auto database = VSStoreSchema::openForWriting(made, true, true, patience);
        database->execute("PRAGMA temp_store = FILE");
        VSTransaction transaction(*database, VSTransaction::Kind::Write);
        report = Salvage(reader, *database).run();
        transaction.commit();
    }
    // It takes its place when it is complete: with its log in the file.
    if (fs::exists(made / (std::string(VSStoreSchema::fileName) + "-wal"), error))
        throw VSDatabaseFailure(
            {fs::space(folder, error).available < (16 << 20) ? VSErrorCode::DiskFull : VSErrorCode::Failed,
             folder.string() + ": the new store could not be completed"});
    putInPlace(work.descriptor(), target, folder);
    return report;
}

}  // namespace

VSSalvageReport VSSalvageStore(const fs::path& damaged, const fs::path& folder) {
    const fs::path file = damaged / VSStoreSchema::fileName;
    std::error_code error;
    if (!fs::exists(file, error) && !fs::exists(file.string() + "-wal", error))
        throw VSDatabaseFailure({VSErrorCode::NotAccessible, "there is no store in " + damaged.string()});
    bool isNew = false;
    const auto place = valueOf(VSResolvedPath(folder));
    const auto target = valueOf(VSStoreGuard(damaged).makeFolder(place, 0700, &isNew));
    try {
        return salvageInto(target.get(), place, file);
    } catch (const VSDatabaseFailure&) {
        if (isNew) ::rmdir(place.c_str());
        throw;
    }
}
