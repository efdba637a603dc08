#pragma once

#include <functional>
#include <map>
#include <optional>
#include <set>
#include <tuple>
#include <unordered_map>
#include <vector>

#include "Vessa/VSCrowdedStart.h"
#include "Vessa/VSObject.h"
#include "Vessa/VSSampleRow.h"
#include "Vessa/VSStoreProvenances.h"

/// The value of a sample as `samples` keeps it.
double VSStoredValue(const VSSample& sample);
/// Whether two stored values are the same number but for the rounding of a unit conversion.
bool VSSameStoredValue(double a, double b);

/// Correlations and workouts have members.
bool VSCanHaveMembers(const VSObjectType* type);
/// The codes of such types, as a list for SQL.
std::string VSTypesWithMembers();

/// A member of a saved correlation, by its key.
struct VSMemberKey {
    const VSObjectType* type;
    int64_t start, id;
};

/// Finds rows that say the same as a sample: type, span, value, source with version, device, metadata and
/// content (workout totals and events; members). The creation date counts, to the second that documents give,
/// where the sample has one. The time-zone offset does not: a document writes all its dates with the offset
/// of the day on which it was made, so that one made in summer says the same of a record as one made in
/// winter. A quantity of at most six digits is also what an export left of a stored one that has more, in the
/// unit of the document: a row that rounds to it is taken where no row has that very value. A row that agrees
/// in every bit, also of the offset and the creation, is taken before all others.
class VSStoreMatcher {
 public:
    VSStoreMatcher(VSDatabase& database, VSStoreProvenances& provenances, VSStoreMetadata& metadata)
        : database_(database), provenances_(provenances), metadata_(metadata) {}

    using Accept = std::function<bool(int64_t id)>;
    /// The row that is most like the sample, the newest of several, but none of the others; 0: none.
    int64_t newest(const VSSample& sample, const std::set<int64_t>& others);
    /// Calls accept(id) for equal rows, the most alike and of these the oldest first, until it returns true;
    /// returns that id, or 0. However many rows share a start, the searches of one transaction look at few
    /// of them. `purpose` tells searches of different acceptance apart. REQUIRES: what was not accepted once
    /// never is for the same purpose; every row added meanwhile is told with `added`.
    int64_t findAmongMany(const VSSample& sample, int purpose, const Accept& accept);
    void added(const VSSample& sample, int64_t id);
    std::vector<VSMemberKey> members(int64_t parent);
    bool row(const VSMemberKey& key, VSSampleRow& row);
    /// Whether the row of that place is equal to the sample.
    bool isSame(const VSSample& sample, const VSMemberKey& key);

 private:
    using CrowdKey = std::tuple<int, int64_t, int>;  // type, start, purpose
    /// What a row or a sample says, without its exact value: equal ones have a fingerprint in common.
    struct Traits {
        int64_t duration, metadata, bucket;
        size_t origin;
        /// The creation's second; none: any.
        uint64_t fingerprint(std::optional<int64_t> second) const;
        /// Of a row that agrees in every bit.
        uint64_t exactFingerprint(double value, int64_t creation, std::optional<int> offset) const;
    };

    enum class Likeness { None, Rounded, Same, Identical };

    template <typename Visit>
    void forEachRow(const VSSample& sample, Visit visit);
    /// Calls search(isWanted) for each likeness that there is, the greatest first, until one is found.
    template <typename Search>
    static int64_t closest(Search search);
    int64_t findInCrowd(const VSSample& sample, int64_t metadata, VSCrowdedStart& crowd,
                        const Accept& accept);
    static Likeness likenessOfValues(const VSSample& sample, double stored);
    Likeness likeness(const VSSample& sample, int64_t metadata, const VSSampleRow& row);
    void makeCrowd(const VSSample& sample, int purpose);
    void addTo(VSCrowdedStart& crowd, const VSSampleRow& row);
    size_t originOf(int64_t provenance);
    Likeness likenessOfRow(const VSSample& sample, int64_t metadata, const VSSampleRow& row);
    bool sameWorkout(const VSWorkout& workout, int64_t id);
    Likeness likenessOfMembers(const VSCorrelation& correlation, int64_t id);

    VSDatabase& database_;
    VSStoreProvenances& provenances_;
    VSStoreMetadata& metadata_;
    std::map<CrowdKey, VSCrowdedStart> crowds_;
    size_t crowdsSize_ = 0;
    std::unordered_map<int64_t, size_t> origins_;  // by provenance
};
