#include "Vessa/VSHealthStoreConnection.h"

#include <algorithm>
#include <set>

#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/VSLimits.h"
#include "Vessa/VSStoreCheck.h"
#include "Vessa/VSStoreHolder.h"
#include "Vessa/VSStoreSchema.h"

namespace {

/// Whose a saved object is says the store, not the object.
std::optional<VSError> objectionToChanging(VSStoreWriter& writer, const VSStoreAccess& access,
                                           const VSMemberKey& key) {
    VSSampleRow row;
    if (access.isOwner() || !writer.matcher().row(key, row)) return std::nullopt;
    return access.objectionToChanging(writer.provenances().provenance(row.provenance).revision->source);
}

VSMemberKey keyOf(const VSSample& sample, int64_t id) {
    return {sample.sampleType(), sample.startDate().microseconds(), id};
}

/// What speaks against a sample that is to be saved, with those of its members that are in the store.
std::optional<VSError> objectionToSaving(VSStoreWriter& writer, const VSStoreAccess& access,
                                         const VSSample& sample) {
    if (auto objection = VSObjectionToSample(sample)) return objection;
    if (auto objection = access.objectionToSaving(writer.database(), sample)) return objection;
    if (const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample)) {
        for (const VSSamplePtr& member : correlation->objects()) {
            const VSMemberKey key = keyOf(*member, VSObjectIDValue(member->dataID()));
            if (auto objection = objectionToChanging(writer, access, key)) return objection;
        }
    }
    return std::nullopt;
}

VSStatus insertAll(VSStoreWriter& writer, const VSStoreAccess& access,
                   const std::vector<VSSamplePtr>& objects) {
    for (const VSSamplePtr& object : objects) {
        if (!object) return VSError{VSErrorCode::Invalid, "there is no object to save"};
        if (auto objection = objectionToSaving(writer, access, *object)) return *objection;
    }
    const VSDate now = VSEnvironment::current()->now();
    for (const VSSamplePtr& object : objects) writer.insert(*object, now);
    return {};
}

/// Finds all before any is removed: a correlation is known by its members. Equal objects without number mean
/// different ones of the store; one that is listed twice is meant once.
VSStatus removeAll(VSStoreWriter& writer, const VSStoreAccess& access,
                   const std::vector<VSSamplePtr>& objects) {
    std::vector<VSMemberKey> keys;
    std::set<int64_t> meant;
    std::set<const VSSample*> seen;
    for (const bool numbered : {true, false}) {
        for (const VSSamplePtr& object : objects) {
            if (object && (VSObjectIDValue(object->dataID()) != 0) != numbered) continue;
            if (object && !seen.insert(object.get()).second) continue;
            const int64_t id = object ? writer.find(*object, meant) : 0;
            if (!id) return VSError{VSErrorCode::NotFound, "an object to delete is not in the store"};
            if (!meant.insert(id).second) continue;
            keys.push_back(keyOf(*object, id));
            if (auto objection = objectionToChanging(writer, access, keys.back())) return *objection;
        }
    }
    for (const VSMemberKey& key : keys) writer.remove(key.type, key.start, key.id);
    return {};
}

VSStatus relate(VSStoreWriter& writer, const VSStoreAccess& access, const std::vector<VSSamplePtr>& samples,
                const VSSample& workout) {
    const int64_t parent = writer.find(workout);
    if (!parent) return VSError{VSErrorCode::NotFound, "the workout is not in the store"};
    if (auto objection = access.objectionToSaving(writer.database(), workout)) return *objection;
    if (auto objection = objectionToChanging(writer, access, keyOf(workout, parent))) return *objection;
    const VSDate now = VSEnvironment::current()->now();
    for (const VSSamplePtr& sample : samples) {
        if (auto objection = objectionToSaving(writer, access, *sample)) return *objection;
        int64_t id = writer.find(*sample);
        if (!id) id = writer.insert(*sample, now);
        const VSMemberKey key = keyOf(*sample, id);
        if (auto objection = objectionToChanging(writer, access, key)) return *objection;
        if (!writer.addToWorkout(parent, key))
            return VSError{VSErrorCode::Invalid, "a sample belongs to more than " +
                                                     std::to_string(VSLimits::mostWorkouts) + " workouts"};
    }
    writer.touch(workout.sampleType());
    return {};
}

}  // namespace

void VSHealthStoreConnection::saveObjects(std::vector<VSSamplePtr> objects, Completion completion) {
    core_->write([&access = core_->access, objects = std::move(objects)](
                     VSStoreWriter& writer) { return insertAll(writer, access, objects); },
                 std::move(completion));
}

VSStatus VSHealthStoreConnection::saveObjectsAndWait(std::vector<VSSamplePtr> objects) {
    return core_->writeAndWait([&access = core_->access, objects = std::move(objects)](
                                   VSStoreWriter& writer) { return insertAll(writer, access, objects); });
}

void VSHealthStoreConnection::deleteObjects(std::vector<VSSamplePtr> objects, Completion completion) {
    core_->write([&access = core_->access, objects = std::move(objects)](
                     VSStoreWriter& writer) { return removeAll(writer, access, objects); },
                 std::move(completion));
}

void VSHealthStoreConnection::deleteAllSamples(std::vector<const VSObjectType*> types,
                                               std::optional<std::string> sourceBundleIdentifier,
                                               Completion completion) {
    core_->write(
        [&access = core_->access, types = std::move(types), source = std::move(sourceBundleIdentifier),
         folder = core_->folder](VSStoreWriter& writer) {
            if (auto objection = access.objectionToChanging({"", source.value_or("")}))
                return VSStatus(*objection);
            const VSHolderNote note(folder, VSStoreHolder::Work::Deletion, "");
            for (const VSObjectType* type : types) writer.removeAll(type, source);
            return VSStatus();
        },
        std::move(completion));
}

void VSHealthStoreConnection::addSamplesToWorkout(std::vector<VSSamplePtr> samples, VSSamplePtr workout,
                                                  Completion completion) {
    core_->write([&access = core_->access, samples = std::move(samples), workout = std::move(workout)](
                     VSStoreWriter& writer) { return relate(writer, access, samples, *workout); },
                 std::move(completion));
}

VSResult<std::vector<VSSamplePtr>> VSHealthStoreConnection::samples(
    const VSObjectType* type, const VSPredicate& predicate, int limit,
    const std::vector<VSSortDescriptor>& sort) {
    return readOf(type, predicate,
                  [&](VSStoreReader& reader) { return reader.samples(type, predicate, limit, sort); });
}

VSResult<VSCheckReport> VSHealthStoreConnection::check() {
    if (auto objection = core_->access.objectionToManaging()) return *objection;
    return core_->readers.read([](VSStoreReader& reader) { return VSCheckStore(reader); });
}

VSResult<std::vector<VSHealthStore::TypeSummary>> VSHealthStoreConnection::typeSummaries() {
    return core_->readers.read([&access = core_->access](VSStoreReader& reader) {
        std::vector<TypeSummary> summaries;
        for (const auto& [type, extent] : reader.extents()) {
            if (access.mayRead(reader.database(), type, {}))
                summaries.push_back({type, extent.count, VSDate::fromMicroseconds(extent.firstStart),
                                     VSDate::fromMicroseconds(extent.lastEnd)});
        }
        std::sort(summaries.begin(), summaries.end(),
                  [](const TypeSummary& a, const TypeSummary& b) { return a.type->code() < b.type->code(); });
        return summaries;
    });
}

void VSHealthStoreConnection::writeAsOwner(VSStoreCore::Change change, Completion completion) {
    core_->write(
        [&access = core_->access, change = std::move(change)](VSStoreWriter& writer) {
            if (auto objection = access.objectionToManaging()) return VSStatus(*objection);
            return change(writer);
        },
        std::move(completion));
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
