#pragma once

#include <array>
#include <functional>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <unordered_map>
#include <vector>

#include "Vessa/VSMergedRollup.h"
#include "Vessa/VSNumberRanges.h"
#include "Vessa/VSObject.h"
#include "Vessa/VSSampleRow.h"
#include "Vessa/VSStoreMatcher.h"
#include "Vessa/VSStoreProvenances.h"

/// Changes samples and everything that follows from them (order, summaries, rollups) inside one writing
/// transaction after another: begin, changes, finish, and then the commit; or abandon after a rollback. Used
/// by the thread of its connection. Throws VSDatabaseFailure.
class VSStoreWriter {
 public:
    explicit VSStoreWriter(VSDatabase& database);

    /// REQUIRES: the transaction has begun.
    void begin();
    /// Writes down what was kept in memory; the commit comes next.
    void finish();
    void abandon();

    /// Saves a sample; a correlation with those members that are not in the store yet. An
    /// object given twice within a transaction, alone and as a member, is saved once. Returns its number.
    /// REQUIRES: the sample lives until the transaction ends; nothing is said against it (VSLimits.h).
    int64_t insert(const VSSample& sample, VSDate now);
    /// A sample of any kind without its members.
    int64_t insertAlone(const VSSample& sample, VSDate now);
    void insertMember(int64_t parent, int position, const VSMemberKey& member);
    /// The saved object that is meant: the one of its number, or without a number the newest equal one that
    /// is none of the others. 0: none.
    int64_t find(const VSSample& sample, const std::set<int64_t>& others = {});
    /// With a correlation's last member goes the correlation. False: there is no such object.
    bool remove(const VSObjectType* type, int64_t start, int64_t id);
    /// Of one source, or of all; returns how many, with the correlations that went with their last members.
    int64_t removeAll(const VSObjectType* type, std::optional<std::string> bundleIdentifier);
    /// Those of the type with these numbers that are accepted (all without `accept`); returns how many, with
    /// the correlations that went with their last members.
    int64_t removeNumbers(const VSObjectType* type, const VSNumberRanges& numbers,
                          const std::function<bool(const VSSampleRow&)>& accept = nullptr);
    /// Relates a saved sample to a saved workout, once. False: it belongs to too many.
    bool addToWorkout(int64_t workout, const VSMemberKey& sample);
    /// Notes a change of something that queries of the type watch.
    void touch(const VSObjectType* type);

    int64_t lastNumber() const { return last_; }
    VSStoreProvenances& provenances() { return provenances_; }
    VSStoreMetadata& metadata() { return metadata_; }
    VSStoreMatcher& matcher() { return matcher_; }
    VSDatabase& database() { return database_; }

 private:
    static constexpr size_t typeCodes = 128;
    struct TypeState {
        int64_t change = 0, longest = 0;
    };
    struct SourceChange {
        int64_t count = 0, firstStart = INT64_MAX, lastEnd = INT64_MIN;
        bool removed = false;
    };

    int64_t insertOnce(const VSSample& sample, VSDate now);
    SourceChange& sourceChange(int type, int64_t source);
    void insertWorkout(int64_t id, const VSWorkout& workout);
    /// Without what hangs on it.
    void removeRow(const VSObjectType* type, const VSSampleRow& row);
    void removeDetails(int64_t id);
    int64_t leaveParents(int64_t id);
    int64_t loseMember(const VSObjectType* type, const VSSampleRow& parent);
    /// Notes what follows from a row's end, but for its deletion record.
    void noteRemoved(int type, const VSSampleRow& row);
    void noteDeletion(int type, int64_t id);
    /// Whether so much of a type is wanted that it is faster to read all of it.
    bool isMostOf(int type, const VSNumberRanges& numbers);
    int64_t removeInOnePass(int type, const VSNumberRanges& numbers,
                            const std::function<bool(const VSSampleRow&)>& accept);
    void dropUnusedProvenances();
    bool isProvenanceUsed(int64_t provenance, const std::pair<int, int64_t>& removed);
    /// Some rows of the type from the number `next` on, which becomes that of the next ones or 0.
    std::vector<VSSampleRow> rowsNumbered(const VSObjectType* type, const VSNumberRanges& numbers,
                                          int64_t& next);
    void writeTypes();
    void writeTypeSources();
    void updateMergedRollups();
    void measureAgain(int type, int64_t source);

    VSDatabase& database_;
    VSStoreProvenances provenances_;
    VSStoreMetadata metadata_;
    VSStoreMatcher matcher_;
    VSRollupWriter rollups_;
    VSStatement insert_, insertDeleted_;

    std::function<bool(const VSSampleRow&)> isToGo_;  // what SQL calls by that name; null: nothing is

    int64_t last_ = 0;
    std::unordered_map<const VSSample*, int64_t> inserted_;  // the objects of this transaction
    std::array<TypeState, typeCodes> types_{};
    std::map<std::pair<int, int64_t>, SourceChange> sourceChanges_;
    std::pair<int, int64_t> recentKey_{-1, -1};
    SourceChange* recentChange_ = nullptr;
    std::map<int64_t, std::pair<int, int64_t>> removedFrom_;  // provenances, with a removed row's place
    int64_t recentRemovedFrom_ = 0;
};
