#pragma once

#include <functional>
#include <vector>

#include "Vessa/VSObject.h"
#include "Vessa/VSSampleRow.h"
#include "Vessa/VSStoreProvenances.h"

/// The value of a sample as `samples` keeps it.
double VSStoredValue(const VSSample& sample);
/// Whether two stored values are the same number but for the rounding of a unit conversion.
bool VSSameStoredValue(double a, double b);

/// A member of a saved correlation, by its key.
struct VSMemberKey {
    const VSObjectType* type;
    int64_t start, id;
};

/// Finds rows that say the same as a sample: type, span, value, source with version, device, metadata and
/// content (workout totals and events; members). The creation date counts, to the second that documents give,
/// where the sample has one. The time-zone offset does not: a document writes all its dates with the offset
/// of the day on which it was made, so that one made in summer says the same of a record as one made in
/// winter.
class VSStoreMatcher {
 public:
    VSStoreMatcher(VSDatabase& database, VSStoreProvenances& provenances, VSStoreMetadata& metadata)
        : database_(database), provenances_(provenances), metadata_(metadata) {}

    /// Calls accept(id) for each equal row, oldest first, until it returns true; returns that id, or 0.
    int64_t find(const VSSample& sample, const std::function<bool(int64_t id)>& accept);
    std::vector<VSMemberKey> members(int64_t parent);
    bool row(const VSMemberKey& key, VSSampleRow& row);

 private:
    bool sameRow(const VSSample& sample, int64_t metadata, const VSSampleRow& row);
    bool sameWorkout(const VSWorkout& workout, int64_t id);
    bool sameMembers(const VSCorrelation& correlation, int64_t id);

    VSDatabase& database_;
    VSStoreProvenances& provenances_;
    VSStoreMetadata& metadata_;
};
