#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Vessa/VSAuthorization.h"
#include "Vessa/VSDatabase.h"
#include "Vessa/VSPredicate.h"

// The table `authorizations`, and what it allows. They throw VSDatabaseFailure.

/// What one application may do with the store. The owner, this application itself, may do everything.
class VSStoreAccess {
 public:
    /// The name: for requests of this application; empty: its identifier.
    VSStoreAccess(std::string identifier, std::string name);

    bool isOwner() const { return owner_; }
    /// The source of what this application saves.
    const VSSource& source() const { return source_; }

    /// Whether samples of the type that match the predicate may be seen: with permission to read, or where
    /// the predicate asks for this application's own samples only.
    bool mayRead(VSDatabase& database, const VSObjectType* type, const VSPredicate& predicate) const;
    /// Throws Refused where it may not.
    void requireReading(VSDatabase& database, const VSObjectType* type, const VSPredicate& predicate) const;
    /// None: the object may be saved. Refused: there is no permission to share its type (a correlation: and
    /// those of its members), or it claims to come from another source.
    std::optional<VSError> objectionToSaving(VSDatabase& database, const VSSample& object) const;
    /// None: saved objects of this source may be deleted, or related to others. Others than the owner do that
    /// only with what is theirs.
    std::optional<VSError> objectionToChanging(const VSSource& source) const;
    /// None: this application is the owner.
    std::optional<VSError> objectionToManaging() const;
    /// None: the application may change what it shares of the type.
    std::optional<VSError> objectionToSharing(VSDatabase& database, const VSObjectType* type) const;

    /// Notes what this application wants of a type; returns whether that is new. The owner has no records.
    bool request(VSDatabase& database, const VSObjectType* type, bool sharing, bool reading) const;

 private:
    bool isOwn(const VSPredicate& predicate) const;
    const VSSource source_;
    const bool owner_;
};

/// The records of a type, by name and bundle identifier.
std::vector<VSAuthorizationRecord> VSReadAuthorizationRecords(VSDatabase& database, const VSObjectType* type);
/// Makes a record where there is none.
void VSWriteAuthorizationStatus(VSDatabase& database, const std::string& bundleIdentifier,
                                const VSObjectType* type, VSAuthorizationStatus status);
