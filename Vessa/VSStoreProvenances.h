#pragma once

#include <map>
#include <memory>
#include <optional>
#include <tuple>
#include <unordered_map>
#include <vector>

#include "Vessa/VSDatabase.h"
#include "Vessa/VSObject.h"
#include "Vessa/VSSource.h"

/// The sources, devices and provenances (source, version, device and time-zone offset together) of one
/// connection's database. Their rows never change and their numbers are never reused, so what was read once
/// stays true. Used by the connection's thread. Throws VSDatabaseFailure.
class VSStoreProvenances {
 public:
    explicit VSStoreProvenances(VSDatabase& database) : database_(database) {}

    struct Entry {
        int64_t source = 0;
        std::shared_ptr<const VSSourceRevision> revision;
        std::shared_ptr<const VSDevice> device;
        std::optional<int> timeZoneOffset;
    };
    /// Valid while this lives.
    const Entry& provenance(int64_t id);
    int64_t sourceOfProvenance(int64_t id) { return provenance(id).source; }
    /// Valid while this lives.
    const VSSource& source(int64_t id);
    /// Those of all objects that ever were.
    std::vector<VSDevice> allDevices();
    /// None: no object ever came from it.
    std::optional<int64_t> findSource(const VSSource& source);

    /// Reads every provenance at once.
    void loadAll();

    // Inside a writing transaction:
    int64_t provenanceFor(const VSProvenance& provenance);
    int64_t sourceFor(const VSSource& source);
    /// Removes a row that nothing uses any more; its number never comes again. Then call forgetNumbers.
    void dropRow(const std::string& table, const std::string& column, int64_t number);
    /// Forgets the numbers given in a transaction that was rolled back, and what others may have added.
    void forgetNumbers();

 private:
    void loadNumbers();
    int64_t nextNumber(const std::string& table, const std::string& column);
    std::shared_ptr<const VSDevice> device(int64_t id);
    int64_t deviceFor(const VSDevice& device);

    struct Key {
        int64_t source;
        std::string version;
        int64_t device;  // 0: none
        std::optional<int> zone;
        auto operator<=>(const Key&) const = default;
    };

    VSDatabase& database_;
    std::unordered_map<int64_t, std::unique_ptr<Entry>> provenances_;
    std::unordered_map<int64_t, std::unique_ptr<VSSource>> sources_;
    std::unordered_map<int64_t, std::shared_ptr<const VSDevice>> devices_;

    // For writing: the numbers of all rows.
    bool numbersLoaded_ = false;
    std::map<Key, int64_t> provenanceNumbers_;
    std::map<VSSource, int64_t> sourceNumbers_;
    std::map<VSDevice, int64_t> deviceNumbers_;
    // The last ones asked for; the pointers are held so that an address cannot come to mean something else.
    struct Recent {
        std::shared_ptr<const VSSourceRevision> revision;
        std::shared_ptr<const VSDevice> device;
        std::optional<int> zone;
        int64_t provenance = 0;
    } recent_;
};

/// The metadata dictionaries of one connection's database, each kept once with the number of its users.
class VSStoreMetadata {
 public:
    explicit VSStoreMetadata(VSDatabase& database) : database_(database) {}
    /// The dictionary of a number; 0 is none (null). Throws Corrupt where it is missing.
    std::shared_ptr<const VSMetadata> metadata(int64_t id);

    // Inside a writing transaction:
    /// The number of a dictionary, made where it is new, with one more user; 0 for none or an empty one.
    int64_t retain(const std::shared_ptr<const VSMetadata>& metadata);
    /// The number, without a user more; none: the database has no such dictionary.
    std::optional<int64_t> find(const std::shared_ptr<const VSMetadata>& metadata);
    void release(int64_t id);
    void flush();
    void forgetNumbers();

 private:
    VSDatabase& database_;
    std::unordered_map<int64_t, std::shared_ptr<const VSMetadata>> read_;
    std::unordered_map<std::string, int64_t> numbers_;  // by content
    std::unordered_map<int64_t, int64_t> usesChanged_;
    std::optional<int64_t> last_;
};
