#include "Vessa/VSHealthStore.h"

#include <algorithm>

#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/VSImportTransaction.h"
#include "Vessa/VSStatisticsEngine.h"
#include "Vessa/VSStoreCharacteristics.h"
#include "Vessa/VSStoreCheck.h"
#include "Vessa/VSStoreCore.h"
#include "Vessa/VSStoreSchema.h"

namespace {

VSStatus insertAll(VSStoreWriter& writer, const std::vector<VSSamplePtr>& objects) {
    for (const VSSamplePtr& object : objects) {
        if (!object) return VSError{VSErrorCode::Invalid, "there is no object to save"};
        if (auto objection = VSStoreWriter::objection(*object)) return *objection;
    }
    const VSDate now = VSEnvironment::current()->now();
    for (const VSSamplePtr& object : objects) writer.insert(*object, now);
    return {};
}

VSStatus removeAll(VSStoreWriter& writer, const std::vector<VSSamplePtr>& objects) {
    for (const VSSamplePtr& object : objects) {
        const int64_t id = object ? writer.find(*object) : 0;
        if (!id || !writer.remove(object->sampleType(), object->startDate().microseconds(), id))
            return VSError{VSErrorCode::NotFound, "an object to delete is not in the store"};
    }
    return {};
}

VSStatus relate(VSStoreWriter& writer, const std::vector<VSSamplePtr>& samples, const VSSample& workout) {
    const int64_t parent = writer.find(workout);
    if (!parent) return VSError{VSErrorCode::NotFound, "the workout is not in the store"};
    const VSDate now = VSEnvironment::current()->now();
    for (const VSSamplePtr& sample : samples) {
        if (auto objection = VSStoreWriter::objection(*sample)) return *objection;
        int64_t id = writer.find(*sample);
        if (!id) id = writer.insert(*sample, now);
        writer.addToWorkout(parent, {sample->sampleType(), sample->startDate().microseconds(), id});
    }
    writer.touch(workout.sampleType());
    return {};
}

VSStatus writeOrder(VSStoreWriter& writer, const std::vector<VSSource>& sources, const VSObjectType* type) {
    const int code = VSTypeCodeValue(type->code());
    writer.database().use("DELETE FROM source_order WHERE type = ?").bind(1, code).run();
    int position = 0;
    std::vector<int64_t> known;
    for (const VSSource& source : sources) {
        const int64_t number = writer.provenances().sourceFor(source);
        if (std::find(known.begin(), known.end(), number) != known.end()) continue;
        known.push_back(number);
        writer.database()
            .use("INSERT INTO source_order VALUES (?, ?, ?)")
            .bind(1, code)
            .bind(2, position++)
            .bind(3, number)
            .run();
    }
    writer.touch(type);
    return {};
}

/// The store of one folder as its users see it; the work is the core's.
class VSHealthStoreConnection final : public VSHealthStore {
 public:
    explicit VSHealthStoreConnection(std::shared_ptr<VSStoreCore> core) : core_(std::move(core)) {}
    ~VSHealthStoreConnection() override { core_->close(); }

    void executeQuery(std::shared_ptr<VSQuery> query) override { core_->queries.execute(std::move(query)); }
    void stopQuery(const std::shared_ptr<VSQuery>& query) override { core_->queries.stop(query.get()); }

    void saveObjects(std::vector<VSSamplePtr> objects, Completion completion) override {
        core_->write(
            [objects = std::move(objects)](VSStoreWriter& writer) { return insertAll(writer, objects); },
            std::move(completion));
    }
    VSStatus saveObjectsAndWait(std::vector<VSSamplePtr> objects) override {
        return core_->writeAndWait(
            [objects = std::move(objects)](VSStoreWriter& writer) { return insertAll(writer, objects); });
    }
    void deleteObjects(std::vector<VSSamplePtr> objects, Completion completion) override {
        core_->write(
            [objects = std::move(objects)](VSStoreWriter& writer) { return removeAll(writer, objects); },
            std::move(completion));
    }
    void deleteAllSamples(std::vector<const VSObjectType*> types,
                          std::optional<std::string> sourceBundleIdentifier, Completion completion) override {
        core_->write(
            [types = std::move(types), source = std::move(sourceBundleIdentifier)](VSStoreWriter& writer) {
                for (const VSObjectType* type : types) writer.removeAll(type, source);
                return VSStatus();
            },
            std::move(completion));
    }
    void addSamplesToWorkout(std::vector<VSSamplePtr> samples, VSSamplePtr workout,
                             Completion completion) override {
        core_->write([samples = std::move(samples), workout = std::move(workout)](
                         VSStoreWriter& writer) { return relate(writer, samples, *workout); },
                     std::move(completion));
    }

    VSResult<std::optional<VSBirthDate>> dateOfBirth() override {
        return core_->readers.read([](VSStoreReader& reader) -> std::optional<VSBirthDate> {
            const auto value =
                VSReadCharacteristic(reader.database(), VSObjectType::dataTypeWithCode(VSCode::DateOfBirth));
            if (!value) return std::nullopt;
            return VSBirthDateFromStored(*value);
        });
    }
    VSResult<int> biologicalSex() override { return characteristic(VSCode::BiologicalSex); }
    VSResult<int> bloodType() override { return characteristic(VSCode::BloodType); }
    VSResult<int> fitzpatrickSkinType() override { return characteristic(VSCode::FitzpatrickSkinType); }
    void setDateOfBirth(std::optional<VSBirthDate> date, Completion completion) override {
        std::optional<int64_t> value;
        if (date) value = VSStoredBirthDate(*date);
        writeCharacteristic(VSObjectType::dataTypeWithCode(VSCode::DateOfBirth), value,
                            std::move(completion));
    }
    void setCharacteristic(const VSObjectType* type, int value, Completion completion) override {
        writeCharacteristic(type, value ? std::optional<int64_t>(value) : std::nullopt,
                            std::move(completion));
    }

    void fetchMedicalIDData(
        std::function<void(const VSResult<std::optional<VSMedicalIDData>>&)> completion) override {
        core_->readLater([](VSStoreReader& reader) { return VSReadMedicalID(reader.database()); },
                         std::move(completion));
    }
    void updateMedicalIDData(VSMedicalIDData data, Completion completion) override {
        core_->write(
            [data = std::move(data)](VSStoreWriter& writer) {
                VSWriteMedicalID(writer.database(), data);
                return VSStatus();
            },
            std::move(completion));
    }

    void setDefaultValue(VSValue value, std::string key, Completion completion) override {
        core_->write(
            [application = core_->options.applicationIdentifier, value = std::move(value),
             key = std::move(key)](VSStoreWriter& writer) {
                writer.database()
                    .use(
                        "INSERT INTO defaults VALUES (?1, ?2, ?3) ON CONFLICT(application, key) DO UPDATE "
                        "SET value = ?3")
                    .bindText(1, application)
                    .bindText(2, key)
                    .bindText(3, value.serialized())
                    .run();
                return VSStatus();
            },
            std::move(completion));
    }
    void getDefaultValue(std::string key,
                         std::function<void(const VSResult<std::optional<VSValue>>&)> handler) override {
        core_->readLater(
            [application = core_->options.applicationIdentifier,
             key = std::move(key)](VSStoreReader& reader) -> std::optional<VSValue> {
                auto row =
                    reader.database().use("SELECT value FROM defaults WHERE application = ? AND key = ?");
                if (!row.bindText(1, application).bindText(2, key).step()) return std::nullopt;
                auto value = VSValue::fromSerialized(row.text(0));
                if (!value)
                    throw VSDatabaseFailure(
                        {VSErrorCode::Corrupt, "the default value " + key + " cannot be read"});
                return value;
            },
            std::move(handler));
    }

    void orderedSources(const VSObjectType* type,
                        std::function<void(const VSResult<std::vector<VSSource>>&)> completion) override {
        core_->readLater(
            [type](VSStoreReader& reader) {
                std::vector<VSSource> sources;
                for (int64_t id : reader.orderedSources(type))
                    sources.push_back(reader.provenances().source(id));
                return sources;
            },
            std::move(completion));
    }
    void setOrderedSources(std::vector<VSSource> sources, const VSObjectType* type,
                           Completion completion) override {
        core_->write([sources = std::move(sources),
                      type](VSStoreWriter& writer) { return writeOrder(writer, sources, type); },
                     std::move(completion));
    }

    VSResult<std::vector<VSSamplePtr>> samples(const VSObjectType* type, const VSPredicate& predicate,
                                               int limit,
                                               const std::vector<VSSortDescriptor>& sort) override {
        return core_->readers.read(
            [&](VSStoreReader& reader) { return reader.samples(type, predicate, limit, sort); });
    }
    VSResult<VSStatistics> statistics(const VSObjectType* type, const VSPredicate& predicate,
                                      int options) override {
        return core_->readers.read([&](VSStoreReader& reader) {
            return VSStatisticsEngine(reader, type, predicate, options).statistics();
        });
    }
    VSResult<std::shared_ptr<const VSStatisticsCollection>> statisticsCollection(
        const VSObjectType* type, const VSPredicate& predicate, int options, VSDate anchor,
        const VSDateComponents& interval) override {
        return core_->readers.read(
            [&](VSStoreReader& reader) -> std::shared_ptr<const VSStatisticsCollection> {
                const VSCalendar calendar = VSCalendar::current();
                return std::make_shared<VSStatisticsCollection>(
                    type, anchor, interval, calendar,
                    VSStatisticsEngine(reader, type, predicate, options).buckets(anchor, interval, calendar));
            });
    }
    VSResult<std::vector<SourceSummary>> sourceSummaries() override;
    VSResult<std::vector<TypeSummary>> typeSummaries() override;
    VSResult<VSCheckReport> check() override {
        return core_->readers.read([](VSStoreReader& reader) { return VSCheckStore(reader); });
    }
    VSResult<std::unique_ptr<ImportTransaction>> beginImport(const std::string& name,
                                                             VSDuration patience) override {
        return VSImportTransaction::begin(core_, name, patience);
    }
    VSResult<int64_t> databaseSizeInBytes() override;
    const std::filesystem::path& folder() const override { return core_->folder; }

 private:
    VSResult<int> characteristic(VSTypeCode code) {
        return core_->readers.read([code](VSStoreReader& reader) {
            return static_cast<int>(
                VSReadCharacteristic(reader.database(), VSObjectType::dataTypeWithCode(code)).value_or(0));
        });
    }
    void writeCharacteristic(const VSObjectType* type, std::optional<int64_t> value, Completion completion) {
        core_->write(
            [type, value](VSStoreWriter& writer) {
                VSWriteCharacteristic(writer, type, value);
                return VSStatus();
            },
            std::move(completion));
    }

    const std::shared_ptr<VSStoreCore> core_;
};

VSResult<std::vector<VSHealthStore::SourceSummary>> VSHealthStoreConnection::sourceSummaries() {
    return core_->readers.read([](VSStoreReader& reader) {
        std::vector<SourceSummary> summaries;
        auto rows = reader.database().use(
            "SELECT source, sum(count), min(first_start), max(last_end) FROM type_sources GROUP BY source "
            "ORDER BY source");
        while (rows.step())
            summaries.push_back({reader.provenances().source(rows.integer(0)), rows.integer(1),
                                 VSDate::fromMicroseconds(rows.integer(2)),
                                 VSDate::fromMicroseconds(rows.integer(3))});
        return summaries;
    });
}

VSResult<std::vector<VSHealthStore::TypeSummary>> VSHealthStoreConnection::typeSummaries() {
    return core_->readers.read([](VSStoreReader& reader) {
        std::vector<TypeSummary> summaries;
        auto rows = reader.database().use(
            "SELECT type, sum(count), min(first_start), max(last_end) FROM type_sources GROUP BY type ORDER "
            "BY type");
        while (rows.step())
            summaries.push_back({VSObjectType::dataTypeWithCode(static_cast<int>(rows.integer(0))),
                                 rows.integer(1), VSDate::fromMicroseconds(rows.integer(2)),
                                 VSDate::fromMicroseconds(rows.integer(3))});
        return summaries;
    });
}

VSResult<int64_t> VSHealthStoreConnection::databaseSizeInBytes() {
    const auto file = core_->folder / VSStoreSchema::fileName;
    int64_t size = 0;
    for (const char* suffix : {"", "-wal"}) {
        std::error_code error;
        const auto bytes = std::filesystem::file_size(file.string() + suffix, error);
        if (!error)
            size += static_cast<int64_t>(bytes);
        else if (!*suffix)
            return VSError{VSErrorCode::NotAccessible, file.string() + ": " + error.message()};
    }
    return size;
}

}  // namespace

VSResult<std::shared_ptr<VSHealthStore>> VSHealthStore::open(const std::filesystem::path& folder,
                                                             Options options) {
    auto core = VSStoreCore::open(folder, options);
    if (!core) return core.error();
    return std::shared_ptr<VSHealthStore>(std::make_shared<VSHealthStoreConnection>(*core));
}
