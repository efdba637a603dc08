#include "Vessa/VSHealthStoreConnection.h"

#include <algorithm>

#include "Vessa/VSAuthorization.h"

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
        [type](VSStoreReader& reader) {
            std::vector<VSSource> sources;
            for (int64_t id : reader.orderedSources(type)) sources.push_back(reader.provenances().source(id));
            return sources;
        },
        std::move(completion));
}

void VSHealthStoreConnection::setOrderedSources(std::vector<VSSource> sources, const VSObjectType* type,
                                                Completion completion) {
    core_->write([sources = std::move(sources),
                  type](VSStoreWriter& writer) { return writeOrder(writer, sources, type); },
                 std::move(completion));
}

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

void VSHealthStoreConnection::allSources(std::function<void(const VSResult<std::vector<VSSource>>&)>) {}
void VSHealthStoreConnection::devices(std::vector<std::string>,
                                      std::function<void(const VSResult<std::vector<VSDevice>>&)>) {}
void VSHealthStoreConnection::authorizationRecords(
    const VSObjectType*, std::function<void(const VSResult<std::vector<VSAuthorizationRecord>>&)>) {}
void VSHealthStoreConnection::setAuthorizationStatuses(std::map<const VSObjectType*, VSAuthorizationStatus>,
                                                       std::string, Completion) {}
void VSHealthStoreConnection::requestAuthorization(std::vector<const VSObjectType*>,
                                                   std::vector<const VSObjectType*>, Completion) {}
