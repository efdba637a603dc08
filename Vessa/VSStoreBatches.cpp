#include "Vessa/VSStoreBatches.h"

#include "Vessa/VSStoreCharacteristics.h"

namespace {

std::vector<const VSObjectType*> recordedTypes(VSDatabase& database) {
    std::vector<const VSObjectType*> types;
    auto rows = database.use("SELECT DISTINCT type FROM type_sources ORDER BY type");
    while (rows.step()) {
        if (const auto* type = VSObjectType::dataTypeWithCode(static_cast<int>(rows.integer(0))))
            types.push_back(type);
    }
    return types;
}

/// How many of these numbers are samples of the store.
int64_t countPresent(VSDatabase& database, const std::vector<const VSObjectType*>& types,
                     const VSNumberRanges& numbers) {
    int64_t count = 0;
    auto rows = database.use(
        "SELECT count(*) FROM samples INDEXED BY samples_by_id WHERE type = ? AND id BETWEEN ? AND ?");
    for (const VSObjectType* type : types) {
        for (const VSNumberRange& range : numbers.ranges()) {
            rows.bind(1, VSTypeCodeValue(type->code())).bind(2, range.first).bind(3, range.last).step();
            count += rows.integer(0);
            rows.reset();
        }
    }
    return count;
}

VSNumberRanges rangesOf(VSStatement rows) {
    std::vector<VSNumberRange> ranges;
    while (rows.step()) ranges.push_back({rows.integer(0), rows.integer(1)});
    return VSNumberRanges::of(std::move(ranges));
}

/// A characteristic, or what stands for the Medical ID. None: not set.
std::optional<int64_t> currentValue(VSDatabase& database, int code) {
    if (code != VSBatchMedicalIDCode)
        return VSReadCharacteristic(database, VSObjectType::dataTypeWithCode(code));
    const auto data = VSReadMedicalID(database);
    return data ? std::optional(VSBatchMedicalIDValue(*data)) : std::nullopt;
}

void unset(VSStoreWriter& writer, int code) {
    if (code == VSBatchMedicalIDCode)
        writer.database().use("DELETE FROM medical_id").run();
    else
        VSWriteCharacteristic(writer, VSObjectType::dataTypeWithCode(code), std::nullopt);
}

/// Unsets what the batch set and no other one has; hands the rest on.
int64_t giveUpCharacteristics(VSStoreWriter& writer, int64_t batch) {
    struct Row {
        int code;
        int64_t value;
    };
    std::vector<Row> given;
    {
        auto rows = writer.database().use(
            "SELECT type, value FROM batch_characteristics WHERE batch = ? AND given = 1");
        rows.bind(1, batch);
        while (rows.step()) given.push_back({static_cast<int>(rows.integer(0)), rows.integer(1)});
    }
    writer.database().use("DELETE FROM batch_characteristics WHERE batch = ?").bind(1, batch).run();
    int64_t count = 0;
    for (const auto& [code, value] : given) {
        auto heir = writer.database().use(
            "UPDATE batch_characteristics SET given = 1 WHERE type = ?1 AND batch = (SELECT min(batch) FROM "
            "batch_characteristics WHERE type = ?1 AND value = ?2) RETURNING batch");
        if (heir.bind(1, code).bind(2, value).step()) continue;
        if (currentValue(writer.database(), code) != value) continue;
        unset(writer, code);
        ++count;
    }
    return count;
}

}  // namespace

int64_t VSBatchMedicalIDValue(const VSMedicalIDData& data) {
    uint64_t hash = 0xCBF29CE484222325;
    const auto add = [&hash](const auto& bytes) {
        for (const auto byte : bytes) hash = (hash ^ static_cast<uint8_t>(byte)) * 0x100000001B3;
    };
    add(VSValue(VSMedicalIDContent(data)).serialized());
    if (data.pictureData) add(*data.pictureData);
    return static_cast<int64_t>(hash);
}

void VSForgetBatchMedicalID(VSDatabase& database) {
    database.use("DELETE FROM batch_characteristics WHERE type = ?").bind(1, VSBatchMedicalIDCode).run();
}

void VSWriteBatch(VSDatabase& database, const VSNewBatch& batch) {
    auto insert = database.use(
        "INSERT INTO batches(name, date, first_id, last_id, added, undone) VALUES (?, ?, ?, ?, ?, 0) "
        "RETURNING batch");
    insert.bindText(1, batch.name)
        .bind(2, batch.date.microseconds())
        .bind(3, batch.numbers.first)
        .bind(4, batch.numbers.last)
        .bind(5, batch.added);
    if (!insert.step()) throw VSDatabaseFailure({VSErrorCode::Failed, "a batch got no number"});
    const int64_t number = insert.integer(0);
    insert.reset();
    auto claim = database.use("INSERT INTO batch_claims(batch, first_id, last_id) VALUES (?, ?, ?)");
    for (const VSNumberRange& range : batch.claims.ranges())
        claim.bind(1, number).bind(2, range.first).bind(3, range.last).run();
    auto characteristic =
        database.use("INSERT INTO batch_characteristics(batch, type, value, given) VALUES (?, ?, ?, ?)");
    for (const auto& [type, found] : batch.characteristics)
        characteristic.bind(1, number).bind(2, type).bind(3, found.value).bind(4, int64_t{found.given}).run();
}

std::vector<VSBatch> VSReadBatches(VSDatabase& database) {
    const auto types = recordedTypes(database);
    std::vector<VSBatch> batches;
    auto rows = database.use(
        "SELECT batch, name, date, first_id, last_id, added FROM batches WHERE undone = 0 ORDER BY batch");
    while (rows.step()) {
        const VSNumberRanges numbers(rows.integer(3), rows.integer(4));
        batches.push_back({rows.integer(0), rows.text(1), VSDate::fromMicroseconds(rows.integer(2)),
                           rows.integer(5), countPresent(database, types, numbers)});
    }
    return batches;
}

VSResult<VSUndoReport> VSUndoBatch(VSStoreWriter& writer, int64_t batch) {
    VSDatabase& database = writer.database();
    VSNumberRanges own;
    VSUndoReport report;
    {
        auto row =
            database.use("SELECT first_id, last_id, added FROM batches WHERE batch = ? AND undone = 0");
        if (!row.bind(1, batch).step())
            return VSError{VSErrorCode::NotFound, "there is no import " + std::to_string(batch)};
        own = VSNumberRanges(row.integer(0), row.integer(1));
        report.gone = row.integer(2);
    }
    const VSNumberRanges claims = rangesOf(
        std::move(database.use("SELECT first_id, last_id FROM batch_claims WHERE batch = ?").bind(1, batch)));
    const VSNumberRanges othersClaims = rangesOf(std::move(
        database.use("SELECT first_id, last_id FROM batch_claims WHERE batch <> ?").bind(1, batch)));
    // What was left of imports that were undone belongs to those that claim it.
    const VSNumberRanges orphans =
        rangesOf(database.use("SELECT first_id, last_id FROM batches WHERE undone = 1"));
    const VSNumberRanges held = own.united(claims.intersected(orphans));

    const auto types = recordedTypes(database);
    report.gone -= countPresent(database, types, own);
    report.kept = countPresent(database, types, held.intersected(othersClaims));
    const VSNumberRanges victims = held.without(othersClaims);
    for (const VSObjectType* type : types) report.removed += writer.removeNumbers(type, victims);
    report.characteristics = giveUpCharacteristics(writer, batch);

    database.use("DELETE FROM batch_claims WHERE batch = ?").bind(1, batch).run();
    database.use("UPDATE batches SET undone = 1, name = '' WHERE batch = ?").bind(1, batch).run();
    database
        .use(
            "DELETE FROM batches WHERE undone = 1 AND NOT EXISTS (SELECT 1 FROM batch_claims c WHERE "
            "c.first_id <= batches.last_id AND c.last_id >= batches.first_id)")
        .run();
    return report;
}
