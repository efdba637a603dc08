#pragma once

#include <functional>
#include <map>
#include <memory>
#include <optional>
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
