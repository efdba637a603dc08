#include "Vessa/VSStoreAuthorizations.h"

#include <algorithm>

namespace {

int codeOf(const VSObjectType* type) {
    return VSTypeCodeValue(type->code());
}

/// A status that a newer program may have written allows nothing here.
VSAuthorizationStatus statusFromStored(int64_t value) {
    return static_cast<VSAuthorizationStatus>(static_cast<int>(value));
}

std::optional<VSAuthorizationStatus> statusOf(VSDatabase& database, const std::string& bundleIdentifier,
                                              const VSObjectType* type) {
    auto row = database.use("SELECT status FROM authorizations WHERE bundle = ? AND type = ?");
    if (!row.bindText(1, bundleIdentifier).bind(2, codeOf(type)).step()) return std::nullopt;
    return statusFromStored(row.integer(0));
}

/// The name that an application is known by: that of its requests, else of what it saved, else its
/// identifier.
std::string nameOf(VSDatabase& database, const std::string& bundleIdentifier) {
    for (const char* sql : {"SELECT name FROM authorizations WHERE bundle = ? LIMIT 1",
                            "SELECT name FROM sources WHERE bundle = ? ORDER BY source DESC LIMIT 1"}) {
        auto row = database.use(sql);
        if (row.bindText(1, bundleIdentifier).step()) return row.text(0);
    }
    return bundleIdentifier;
}

}  // namespace

VSStoreAccess::VSStoreAccess(std::string identifier, std::string name)
    : source_(identifier == VSSource::application().bundleIdentifier
                  ? VSSource::application()
                  : VSSource{name.empty() ? identifier : std::move(name), identifier}),
      owner_(source_.isApplication()) {}

bool VSStoreAccess::isOwn(const VSPredicate& predicate) const {
    return !predicate.sources.empty() &&
           std::all_of(predicate.sources.begin(), predicate.sources.end(), [&](const VSSource& source) {
               return source.bundleIdentifier == source_.bundleIdentifier;
           });
}

bool VSStoreAccess::mayRead(VSDatabase& database, const VSObjectType* type,
                            const VSPredicate& predicate) const {
    if (owner_ || isOwn(predicate)) return true;
    const auto status = statusOf(database, source_.bundleIdentifier, type);
    return status && VSAuthorizationStatusAllowsReading(*status);
}

void VSStoreAccess::requireReading(VSDatabase& database, const VSObjectType* type,
                                   const VSPredicate& predicate) const {
    if (!mayRead(database, type, predicate))
        throw VSDatabaseFailure(
            {VSErrorCode::Refused, source_.name + " has no permission to read " + type->identifier()});
}

std::optional<VSError> VSStoreAccess::objectionToSharing(VSDatabase& database,
                                                         const VSObjectType* type) const {
    if (owner_) return std::nullopt;
    const auto status = statusOf(database, source_.bundleIdentifier, type);
    if (status && VSAuthorizationStatusAllowsSharing(*status)) return std::nullopt;
    return VSError{VSErrorCode::Refused, source_.name + " has no permission to share " + type->identifier()};
}

std::optional<VSError> VSStoreAccess::objectionToSaving(VSDatabase& database, const VSSample& object) const {
    if (owner_) return std::nullopt;
    if (object.sourceRevision().source.bundleIdentifier != source_.bundleIdentifier)
        return VSError{VSErrorCode::Refused,
                       source_.name + " may not save in the name of " + object.sourceRevision().source.name};
    if (auto objection = objectionToSharing(database, object.sampleType())) return objection;
    if (const auto* correlation = dynamic_cast<const VSCorrelation*>(&object)) {
        for (const VSSamplePtr& member : correlation->objects()) {
            if (auto objection = objectionToSaving(database, *member)) return objection;
        }
    }
    return std::nullopt;
}

std::optional<VSError> VSStoreAccess::objectionToChanging(const VSSource& source) const {
    if (owner_ || source.bundleIdentifier == source_.bundleIdentifier) return std::nullopt;
    return VSError{VSErrorCode::Refused, source_.name + " may change and delete only what it saved"};
}

std::optional<VSError> VSStoreAccess::objectionToManaging() const {
    if (owner_) return std::nullopt;
    return VSError{VSErrorCode::Refused,
                   "only " + VSSource::application().name + " may do this, not " + source_.name};
}

bool VSStoreAccess::request(VSDatabase& database, const VSObjectType* type, bool sharing,
                            bool reading) const {
    if (owner_) return false;
    auto known =
        database.use("SELECT sharing, reading, name FROM authorizations WHERE bundle = ? AND type = ?");
    if (known.bindText(1, source_.bundleIdentifier).bind(2, codeOf(type)).step()) {
        sharing = sharing || known.integer(0);
        reading = reading || known.integer(1);
        if (sharing == (known.integer(0) != 0) && reading == (known.integer(1) != 0) &&
            known.text(2) == source_.name)
            return false;
    }
    database
        .use(
            "INSERT INTO authorizations(bundle, type, name, status, reading, sharing) VALUES (?1, ?2, ?3, "
            "?4, "
            "?5, ?6) ON CONFLICT(bundle, type) DO UPDATE SET name = ?3, reading = ?5, sharing = ?6")
        .bindText(1, source_.bundleIdentifier)
        .bind(2, codeOf(type))
        .bindText(3, source_.name)
        .bind(4, static_cast<int>(VSAuthorizationStatus::Undetermined))
        .bind(5, reading)
        .bind(6, sharing)
        .run();
    return true;
}

std::vector<VSAuthorizationRecord> VSReadAuthorizationRecords(VSDatabase& database,
                                                              const VSObjectType* type) {
    std::vector<VSAuthorizationRecord> records;
    auto rows = database.use(
        "SELECT name, bundle, status, reading, sharing FROM authorizations WHERE type = ? ORDER BY name, "
        "bundle");
    rows.bind(1, codeOf(type));
    while (rows.step())
        records.push_back({type,
                           {rows.text(0), rows.text(1)},
                           statusFromStored(rows.integer(2)),
                           rows.integer(3) != 0,
                           rows.integer(4) != 0});
    return records;
}

void VSWriteAuthorizationStatus(VSDatabase& database, const std::string& bundleIdentifier,
                                const VSObjectType* type, VSAuthorizationStatus status) {
    database
        .use(
            "INSERT INTO authorizations(bundle, type, name, status, reading, sharing) VALUES (?1, ?2, ?3, "
            "?4, "
            "0, 0) ON CONFLICT(bundle, type) DO UPDATE SET status = ?4")
        .bindText(1, bundleIdentifier)
        .bind(2, codeOf(type))
        .bindText(3, nameOf(database, bundleIdentifier))
        .bind(4, static_cast<int>(status))
        .run();
}
