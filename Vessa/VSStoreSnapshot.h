#pragma once

#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <unordered_map>
#include <unordered_set>
#include <utility>
#include <vector>

#include "Vessa/VSHealthStore.h"

/// One moment of a whole store, to be read at leisure: what others save or delete meanwhile is not in it.
/// It has a connection of its own, so that it may outlive the store that it was taken of, and keeps none of
/// the store's threads busy. While it lives the store's log cannot shrink: do not keep it for hours. Used by
/// one thread at a time; every operation waits and may fail with NotAccessible, Corrupt or Failed.
class VSStoreSnapshot {
 public:
    /// What was acknowledged before the call is in it. Refused: the connection is not the owner's.
    static VSResult<std::unique_ptr<VSStoreSnapshot>> take(const VSHealthStore& store);
    ~VSStoreSnapshot();
    VSStoreSnapshot(const VSStoreSnapshot&) = delete;
    VSStoreSnapshot& operator=(const VSStoreSnapshot&) = delete;

    VSResult<std::optional<VSBirthDate>> dateOfBirth();
    /// The value of an enumerated characteristic; 0: not set.
    VSResult<int> characteristic(VSTypeCode code);
    VSResult<std::optional<VSMedicalIDData>> medicalID();

    struct Extent {
        int64_t count = 0;
        VSDate lastEnd;  // REQUIRES: count > 0
    };
    /// Of each type that has samples.
    VSResult<std::map<const VSObjectType*, Extent>> extents();

    /// Which samples belong together beyond what they say themselves.
    struct Relations {
        /// The workouts that have samples, by their object, numbered from 1 in the order of their end.
        std::unordered_map<VSObjectID, int64_t> workouts;
        /// A sample and the number of a workout that it belongs to, ascending.
        std::vector<std::pair<VSObjectID, int64_t>> samplesOfWorkouts;
        /// The members of correlations that need a name to be told from equal ones: they are members more
        /// than once, or belong to a workout too.
        std::unordered_set<VSObjectID> namedMembers;
    };
    /// Memory holds all of them: some 16 bytes for each sample of a workout, 40 for each other member.
    VSResult<Relations> relations();

    enum class Order { EndDate, Insertion };
    /// Gets so many samples at a time; false ends the reading.
    using PageHandler = std::function<bool(std::vector<VSSamplePtr> page)>;
    /// All samples of a type, page by page: memory holds a page, and of the rest what overlaps in time. By
    /// end date samples that end together stand in the order of insertion. Correlations come with their
    /// members.
    VSStatus readSamples(const VSObjectType* type, Order order, size_t pageSize, const PageHandler& handler);

 private:
    struct Connection;
    explicit VSStoreSnapshot(std::unique_ptr<Connection> connection);
    /// Runs block(VSStoreReader&) and turns a failure into the error.
    template <typename Block>
    auto read(Block block) -> VSResult<decltype(block(std::declval<class VSStoreReader&>()))>;

    const std::unique_ptr<Connection> connection_;
};
