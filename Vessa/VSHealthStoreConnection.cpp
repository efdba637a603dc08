#include "Vessa/VSHealthStoreConnection.h"

#include <algorithm>

#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/VSStoreCheck.h"
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

}  // namespace

void VSHealthStoreConnection::saveObjects(std::vector<VSSamplePtr> objects, Completion completion) {
    core_->write([objects = std::move(objects)](VSStoreWriter& writer) { return insertAll(writer, objects); },
                 std::move(completion));
}

VSStatus VSHealthStoreConnection::saveObjectsAndWait(std::vector<VSSamplePtr> objects) {
    return core_->writeAndWait(
        [objects = std::move(objects)](VSStoreWriter& writer) { return insertAll(writer, objects); });
}

void VSHealthStoreConnection::deleteObjects(std::vector<VSSamplePtr> objects, Completion completion) {
    core_->write([objects = std::move(objects)](VSStoreWriter& writer) { return removeAll(writer, objects); },
                 std::move(completion));
}

void VSHealthStoreConnection::deleteAllSamples(std::vector<const VSObjectType*> types,
                                               std::optional<std::string> sourceBundleIdentifier,
                                               Completion completion) {
    core_->write(
        [types = std::move(types), source = std::move(sourceBundleIdentifier)](VSStoreWriter& writer) {
            for (const VSObjectType* type : types) writer.removeAll(type, source);
            return VSStatus();
        },
        std::move(completion));
}

void VSHealthStoreConnection::addSamplesToWorkout(std::vector<VSSamplePtr> samples, VSSamplePtr workout,
                                                  Completion completion) {
    core_->write([samples = std::move(samples), workout = std::move(workout)](
                     VSStoreWriter& writer) { return relate(writer, samples, *workout); },
                 std::move(completion));
}

VSResult<std::vector<VSSamplePtr>> VSHealthStoreConnection::samples(
    const VSObjectType* type, const VSPredicate& predicate, int limit,
    const std::vector<VSSortDescriptor>& sort) {
    return core_->readers.read(
        [&](VSStoreReader& reader) { return reader.samples(type, predicate, limit, sort); });
}

VSResult<VSCheckReport> VSHealthStoreConnection::check() {
    return core_->readers.read([](VSStoreReader& reader) { return VSCheckStore(reader); });
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
