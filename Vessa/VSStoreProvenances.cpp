#include "Vessa/VSStoreProvenances.h"

namespace {

constexpr size_t metadataKept = 4096;

[[noreturn]] void corrupt(const char* what, int64_t id) {
    throw VSDatabaseFailure(
        {VSErrorCode::Corrupt, std::string("the store lacks its ") + what + " " + std::to_string(id)});
}

VSDevice readDevice(const VSStatement& row, int column) {
    return {row.optionalText(column),     row.optionalText(column + 1), row.optionalText(column + 2),
            row.optionalText(column + 3), row.optionalText(column + 4), row.optionalText(column + 5),
            row.optionalText(column + 6), row.optionalText(column + 7)};
}

}  // namespace

const VSStoreProvenances::Entry& VSStoreProvenances::provenance(int64_t id) {
    auto& entry = provenances_[id];
    if (entry) return *entry;
    auto row = database_.use("SELECT source, version, device, zone FROM provenances WHERE provenance = ?");
    row.bind(1, id);
    if (!row.step()) corrupt("provenance", id);
    auto made = std::make_unique<Entry>();
    made->source = row.integer(0);
    made->revision =
        std::make_shared<const VSSourceRevision>(VSSourceRevision{source(row.integer(0)), row.text(1)});
    if (!row.isNull(2)) made->device = device(row.integer(2));
    if (!row.isNull(3)) made->timeZoneOffset = static_cast<int>(row.integer(3));
    entry = std::move(made);
    return *entry;
}

const VSSource& VSStoreProvenances::source(int64_t id) {
    auto& entry = sources_[id];
    if (entry) return *entry;
    auto row = database_.use("SELECT name, bundle FROM sources WHERE source = ?");
    row.bind(1, id);
    if (!row.step()) corrupt("source", id);
    entry = std::make_unique<VSSource>(VSSource{row.text(0), row.text(1)});
    return *entry;
}

void VSStoreProvenances::loadAll() {
    auto rows = database_.use("SELECT provenance FROM provenances");
    while (rows.step()) provenance(rows.integer(0));
}

std::vector<VSDevice> VSStoreProvenances::allDevices() {
    std::vector<VSDevice> devices;
    auto rows = database_.use(
        "SELECT name, manufacturer, model, hardware, firmware, software, local, udi FROM devices");
    while (rows.step()) devices.push_back(readDevice(rows, 0));
    return devices;
}

std::shared_ptr<const VSDevice> VSStoreProvenances::device(int64_t id) {
    auto& entry = devices_[id];
    if (entry) return entry;
    auto row = database_.use(
        "SELECT name, manufacturer, model, hardware, firmware, software, local, udi FROM devices WHERE "
        "device = ?");
    row.bind(1, id);
    if (!row.step()) corrupt("device", id);
    entry = std::make_shared<const VSDevice>(readDevice(row, 0));
    return entry;
}

std::optional<int64_t> VSStoreProvenances::findSource(const VSSource& source) {
    auto row = database_.use("SELECT source FROM sources WHERE bundle = ? AND name = ?");
    row.bindText(1, source.bundleIdentifier).bindText(2, source.name);
    if (!row.step()) return std::nullopt;
    return row.integer(0);
}

void VSStoreProvenances::loadNumbers() {
    if (numbersLoaded_) return;
    auto sources = database_.use("SELECT source, name, bundle FROM sources");
    while (sources.step()) sourceNumbers_[{sources.text(1), sources.text(2)}] = sources.integer(0);
    auto devices = database_.use(
        "SELECT device, name, manufacturer, model, hardware, firmware, software, local, udi FROM devices");
    while (devices.step()) deviceNumbers_[readDevice(devices, 1)] = devices.integer(0);
    auto rows = database_.use("SELECT provenance, source, version, device, zone FROM provenances");
    while (rows.step()) {
        Key key{rows.integer(1), rows.text(2), rows.integer(3), std::nullopt};
        if (!rows.isNull(4)) key.zone = static_cast<int>(rows.integer(4));
        provenanceNumbers_[key] = rows.integer(0);
    }
    numbersLoaded_ = true;
}

void VSStoreProvenances::forgetNumbers() {
    numbersLoaded_ = false;
    provenanceNumbers_.clear();
    sourceNumbers_.clear();
    deviceNumbers_.clear();
    // Rows of a transaction that was rolled back are not there any more, and their numbers may come again.
    provenances_.clear();
    sources_.clear();
    devices_.clear();
    recent_ = {};
}

int64_t VSStoreProvenances::nextNumber(const std::string& table, const std::string& column) {
    return database_.integer("SELECT max((SELECT coalesce(max(" + column + "), 0) FROM " + table +
                             "), (SELECT coalesce(max(seq), 0) FROM sqlite_sequence WHERE name = '" + table +
                             "')) + 1");
}

void VSStoreProvenances::dropRow(const std::string& table, const std::string& column, int64_t number) {
    auto note = database_.use("UPDATE sqlite_sequence SET seq = max(seq, ?2) WHERE name = ?1 RETURNING seq");
    if (!note.bindText(1, table).bind(2, number).step())
        database_.use("INSERT INTO sqlite_sequence(name, seq) VALUES (?, ?)")
            .bindText(1, table)
            .bind(2, number)
            .run();
    note.reset();
    database_.use("DELETE FROM " + table + " WHERE " + column + " = ?").bind(1, number).run();
}

int64_t VSStoreProvenances::sourceFor(const VSSource& source) {
    loadNumbers();
    if (auto found = sourceNumbers_.find(source); found != sourceNumbers_.end()) return found->second;
    const int64_t id = nextNumber("sources", "source");
    database_.use("INSERT INTO sources(source, name, bundle) VALUES (?, ?, ?)")
        .bind(1, id)
        .bindText(2, source.name)
        .bindText(3, source.bundleIdentifier)
        .run();
    sourceNumbers_[source] = id;
    return id;
}

int64_t VSStoreProvenances::deviceFor(const VSDevice& device) {
    if (auto found = deviceNumbers_.find(device); found != deviceNumbers_.end()) return found->second;
    const int64_t id = nextNumber("devices", "device");
    auto insert = database_.use("INSERT INTO devices VALUES (?, ?, ?, ?, ?, ?, ?, ?, ?)");
    insert.bind(1, id)
        .bindOptionalText(2, device.name)
        .bindOptionalText(3, device.manufacturer)
        .bindOptionalText(4, device.model)
        .bindOptionalText(5, device.hardwareVersion)
        .bindOptionalText(6, device.firmwareVersion)
        .bindOptionalText(7, device.softwareVersion)
        .bindOptionalText(8, device.localIdentifier)
        .bindOptionalText(9, device.udiDeviceIdentifier)
        .run();
    deviceNumbers_[device] = id;
    return id;
}

int64_t VSStoreProvenances::provenanceFor(const VSProvenance& provenance) {
    if (recent_.provenance && recent_.revision == provenance.sourceRevision &&
        recent_.device == provenance.device && recent_.zone == provenance.timeZoneOffset)
        return recent_.provenance;
    loadNumbers();
    const VSSourceRevision own{VSSource::application(), ""};
    const VSSourceRevision& revision = provenance.sourceRevision ? *provenance.sourceRevision : own;
    const Key key{sourceFor(revision.source), revision.version,
                  provenance.device ? deviceFor(*provenance.device) : 0, provenance.timeZoneOffset};
    auto [place, isNew] = provenanceNumbers_.try_emplace(key, 0);
    if (isNew) {
        place->second = nextNumber("provenances", "provenance");
        auto insert = database_.use("INSERT INTO provenances VALUES (?, ?, ?, ?, ?)");
        insert.bind(1, place->second).bind(2, key.source).bindText(3, key.version);
        if (key.device) insert.bind(4, key.device);
        if (key.zone) insert.bind(5, int64_t{*key.zone});
        insert.run();
    }
    recent_ = {provenance.sourceRevision, provenance.device, provenance.timeZoneOffset, place->second};
    return place->second;
}

// VSStoreMetadata

std::shared_ptr<const VSMetadata> VSStoreMetadata::metadata(int64_t id) {
    if (id == 0) return nullptr;
    if (auto found = read_.find(id); found != read_.end()) return found->second;
    auto row = database_.use("SELECT content FROM metadata WHERE metadata = ?");
    row.bind(1, id);
    if (!row.step()) corrupt("metadata", id);
    const auto value = VSValue::fromSerialized(row.text(0));
    if (!value || !value->dictionary()) corrupt("metadata", id);
    if (read_.size() >= metadataKept) read_.clear();
    return read_[id] = std::make_shared<const VSMetadata>(*value->dictionary());
}

std::optional<int64_t> VSStoreMetadata::find(const std::shared_ptr<const VSMetadata>& metadata) {
    if (!metadata || metadata->empty()) return 0;
    const std::string content = VSValue(*metadata).serialized();
    if (auto found = numbers_.find(content); found != numbers_.end()) return found->second;
    auto row = database_.use("SELECT metadata FROM metadata WHERE content = ?");
    row.bindText(1, content);
    if (!row.step()) return std::nullopt;
    if (numbers_.size() >= metadataKept) numbers_.clear();
    return numbers_[content] = row.integer(0);
}

int64_t VSStoreMetadata::retain(const std::shared_ptr<const VSMetadata>& metadata) {
    auto id = find(metadata);
    if (!id) {
        if (!last_) last_ = database_.integer("SELECT last_metadata FROM state");
        id = ++*last_;
        const std::string content = VSValue(*metadata).serialized();
        database_.use("INSERT INTO metadata VALUES (?, ?, 0)").bind(1, *id).bindText(2, content).run();
        numbers_[content] = *id;
    }
    if (*id) ++usesChanged_[*id];
    return *id;
}

void VSStoreMetadata::release(int64_t id) {
    if (id) --usesChanged_[id];
}

void VSStoreMetadata::flush() {
    std::vector<int64_t> unused;
    {
        auto update = database_.use("UPDATE metadata SET uses = uses + ? WHERE metadata = ? RETURNING uses");
        for (auto [id, change] : usesChanged_) {
            update.bind(1, change).bind(2, id);
            if (update.step() && update.integer(0) <= 0) unused.push_back(id);
            update.reset();
        }
    }
    usesChanged_.clear();
    auto remove = database_.use("DELETE FROM metadata WHERE metadata = ?");
    for (const int64_t id : unused) remove.bind(1, id).run();
    if (!unused.empty()) numbers_.clear();
    if (last_) database_.use("UPDATE state SET last_metadata = ?").bind(1, *last_).run();
    last_.reset();
}

void VSStoreMetadata::forgetNumbers() {
    read_.clear();
    numbers_.clear();
    usesChanged_.clear();
    last_.reset();
}
