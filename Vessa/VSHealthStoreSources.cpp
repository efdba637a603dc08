#include "Vessa/VSHealthStoreConnection.h"

#include <algorithm>

#include "Vessa/VSStoreAuthorizations.h"

namespace {

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

}  // namespace

void VSHealthStoreConnection::orderedSources(
    const VSObjectType* type, std::function<void(const VSResult<std::vector<VSSource>>&)> completion) {
    core_->readLater(
        [&access = core_->access, type](VSStoreReader& reader) {
            access.requireReading(reader.database(), type, {});
            std::vector<VSSource> sources;
            for (int64_t id : reader.orderedSources(type)) sources.push_back(reader.provenances().source(id));
            return sources;
        },
        std::move(completion));
}

void VSHealthStoreConnection::setOrderedSources(std::vector<VSSource> sources, const VSObjectType* type,
                                                Completion completion) {
    writeAsOwner([sources = std::move(sources),
                  type](VSStoreWriter& writer) { return writeOrder(writer, sources, type); },
                 std::move(completion));
}

VSResult<std::vector<VSHealthStore::SourceSummary>> VSHealthStoreConnection::sourceSummaries() {
    return core_->readers.read([&access = core_->access](VSStoreReader& reader) {
        std::map<int64_t, VSStoreReader::Extent> bySource;
        for (const auto& [type, all] : reader.extents()) {
            for (int64_t source : reader.orderedSources(type)) {
                VSPredicate ofSource;
                ofSource.sources = {reader.provenances().source(source)};
                if (!access.mayRead(reader.database(), type, ofSource)) continue;
                const auto extent = reader.extent(type, source);
                VSStoreReader::Extent& summary = bySource[source];
                summary.count += extent.count;
                summary.firstStart = std::min(summary.firstStart, extent.firstStart);
                summary.lastEnd = std::max(summary.lastEnd, extent.lastEnd);
            }
        }
        std::vector<SourceSummary> summaries;
        for (const auto& [source, extent] : bySource)
            summaries.push_back({reader.provenances().source(source), extent.count,
                                 VSDate::fromMicroseconds(extent.firstStart),
                                 VSDate::fromMicroseconds(extent.lastEnd)});
        return summaries;
    });
}

void VSHealthStoreConnection::allSources(
    std::function<void(const VSResult<std::vector<VSSource>>&)> completion) {
    core_->readLater(
        [](VSStoreReader& reader) {
            std::vector<VSSource> sources;
            auto rows = reader.database().use(
                "SELECT name, bundle FROM sources WHERE source IN (SELECT source FROM provenances) UNION "
                "SELECT name, bundle FROM authorizations ORDER BY name, bundle");
            while (rows.step()) sources.push_back({rows.text(0), rows.text(1)});
            return sources;
        },
        std::move(completion));
}

void VSHealthStoreConnection::devices(
    std::vector<std::string> localIdentifiers,
    std::function<void(const VSResult<std::vector<VSDevice>>&)> completion) {
    core_->readLater(
        [wanted = std::move(localIdentifiers)](VSStoreReader& reader) {
            std::vector<VSDevice> devices;
            for (VSDevice& device : reader.provenances().allDevices()) {
                const auto& local = device.localIdentifier;
                if (wanted.empty() ||
                    (local && std::find(wanted.begin(), wanted.end(), *local) != wanted.end()))
                    devices.push_back(std::move(device));
            }
            std::sort(devices.begin(), devices.end());
            return devices;
        },
        std::move(completion));
}

void VSHealthStoreConnection::authorizationRecords(
    const VSObjectType* type,
    std::function<void(const VSResult<std::vector<VSAuthorizationRecord>>&)> completion) {
    core_->readLater(
        [&access = core_->access, type](VSStoreReader& reader) {
            auto records = VSReadAuthorizationRecords(reader.database(), type);
            if (!access.isOwner())
                std::erase_if(records, [&](const VSAuthorizationRecord& record) {
                    return record.source.bundleIdentifier != access.source().bundleIdentifier;
                });
            return records;
        },
        std::move(completion));
}

void VSHealthStoreConnection::setAuthorizationStatuses(
    std::map<const VSObjectType*, VSAuthorizationStatus> statuses, std::string bundleIdentifier,
    Completion completion) {
    writeAsOwner(
        [statuses = std::move(statuses), bundle = std::move(bundleIdentifier)](VSStoreWriter& writer) {
            if (bundle == VSSource::application().bundleIdentifier)
                return VSStatus(VSError{VSErrorCode::Invalid, "this application needs no permission"});
            for (const auto& [type, status] : statuses) {
                VSWriteAuthorizationStatus(writer.database(), bundle, type, status);
                writer.touch(type);
            }
            return VSStatus();
        },
        std::move(completion));
}

void VSHealthStoreConnection::requestAuthorization(std::vector<const VSObjectType*> toShare,
                                                   std::vector<const VSObjectType*> toRead,
                                                   Completion completion) {
    core_->write(
        [&access = core_->access, toShare = std::move(toShare),
         toRead = std::move(toRead)](VSStoreWriter& writer) {
            for (const bool sharing : {true, false}) {
                for (const VSObjectType* type : sharing ? toShare : toRead) {
                    if (access.request(writer.database(), type, sharing, !sharing)) writer.touch(type);
                }
            }
            return VSStatus();
        },
        std::move(completion));
}
