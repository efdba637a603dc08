#pragma once

#include <atomic>
#include <filesystem>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Vessa/Base/VSError.h"
#include "Vessa/Base/VSValue.h"
#include "Vessa/VSAuthorization.h"
#include "Vessa/VSBatch.h"
#include "Vessa/VSObject.h"
#include "Vessa/VSQuery.h"
#include "Vessa/VSStatisticsExplanation.h"

/// Values of the characteristics; the numbers are those of the enumerated values of their types.
struct VSBirthDate {
    int year = 0, month = 0, day = 0;
    friend bool operator==(const VSBirthDate&, const VSBirthDate&) = default;
};

struct VSMedicalIDData {
    std::optional<std::string> name, medicalConditions, medicalNotes, allergyInfo, medicationInfo;
    std::optional<VSBirthDate> birthdate;
    std::optional<VSValue::Data> pictureData;  // a JPEG or PNG file
    VSValue::Dictionary other;                 // further fields by name
    friend bool operator==(const VSMedicalIDData&, const VSMedicalIDData&) = default;
};

struct VSCheckReport {
    std::vector<std::string> problems;
    int64_t samples = 0;
};

/// How a top-level record of a document belongs to others of it. The numbers are the document's own, from 1.
struct VSImportRelations {
    int64_t number = 0;             // that others name it by; 0: none does
    std::vector<int64_t> workouts;  // that it belongs to, wherever they stand in the document
    /// Of a correlation: which records its members are, in their order; 0: any equal one that is no other's.
    std::vector<int64_t> members;
};

/// What was saved out of a damaged store.
struct VSSalvageReport {
    int64_t samples = 0;  // that are in the new store
    std::optional<int64_t>
        lost;  // samples known to have been there whose content could not be read; none: unknown
    std::vector<std::string> losses;  // what was lost, in words, with the time it lies in where that is known
};

/// A connection to the store of one folder. Several connections, in one process or many, may be open on the
/// same folder.
///
/// - Threads: all operations may be called on any thread and return at once unless their comment says that
///   they wait. Completions run on the store's threads: those of changes one after another in the order of
///   the calls, those of questions on others. A completion may be empty. A question with a completion
///   sees the changes that were asked for before it on the same connection; where these wait for other
///   programs that hold the store it gets NotAccessible after ten seconds at most (or `patience` if that is
///   less), since the answer could be an old one. Queries and operations that wait see the changes that were
///   acknowledged. An operation that waits is not for the main thread.
/// - Ownership: the connection is its user's; its end stops queries, does the changes that were accepted, and
///   may come in a handler. Arguments and answers are values; samples are immutable and shared.
/// - Units: an object is saved in any unit that converts to its type's; what comes back is in the canonical
///   unit of the type, bit for bit as it was stored. Dates and durations carry their own.
/// - Failures: a change is done whole or not at all, and was not done when its completion tells an error. But
///   where the disk failed at the very moment of the commit it may be there as a whole after a restart. Any
///   operation may fail with NotAccessible (other programs hold the store for longer than `patience`, it
///   cannot be reached, or a change is asked of a connection for reading), Corrupt (what is on disk is
///   damaged), Failed (other trouble of the system); a change with DiskFull too. The comments name the rest.
/// - Permissions: Refused is what programs other than the owner get for what they may not do. They need
///   permission to read to see samples of a type or a characteristic, but not for samples that they saved
///   themselves (a predicate whose sources are all their own); permission to share to save, under their own
///   name, and they delete only what is theirs. A correlation is read with the permission of its own type and
///   saved with those of its type and its members' types. Source orders, permissions, imports and the Medical
///   ID are the owner's. This keeps honest programs apart; who may write the file may do anything.
/// - What was acknowledged survives a killed process and a lost power supply.
class VSHealthStore {
 public:
    struct Options {
        bool readOnly = false;
        bool createIfMissing = true;
        /// Of the program that uses the connection: whose default values and permissions are meant. The
        /// owner of the store is this application itself; others read and share what they were allowed to.
        std::string applicationIdentifier = "org.qelvar.Qelvar";
        std::string
            applicationName;  // under which another program asks for permission; empty: its identifier
        /// False: a lost power supply may take the last saves with it, never more; a killed process loses
        /// nothing either way.
        bool survivesPowerLoss = true;
        /// How long an operation that changes something waits for other programs that hold the store.
        VSDuration patience = std::chrono::minutes(2);
        /// After a change and so long a time in which nothing was asked, the connection cleans the store's
        /// files as `cleanUp` does, a little at a time. The longest duration: never by itself.
        VSDuration quiet = std::chrono::seconds(1);
    };
    /// Waits. Opens or makes the database in the folder (made with mode 0700). A store of an older format is
    /// brought to this one after a copy was kept beside it, which may take a while; NotAccessible while other
    /// programs have it open, DiskFull where the copy has no room. Refused: a newer schema, an older one when
    /// opened for reading, not our file. Corrupt: a damaged file (it is never changed). NotAccessible: cannot
    /// be locked or reached.
    static VSResult<std::shared_ptr<VSHealthStore>> open(const std::filesystem::path& folder,
                                                         Options options);
    static VSResult<std::shared_ptr<VSHealthStore>> open(const std::filesystem::path& folder) {
        return open(folder, {});
    }
    /// Waits. Reads whatever can be read of the store in `damaged` (also one that cannot be opened) and makes
    /// a sound store of it in `folder`, which holds none yet. Nothing in `damaged` is changed. NotAccessible:
    /// there is no store, or it is in use; Refused: `folder` holds a store, or `damaged` is of another
    /// program or newer.
    static VSResult<VSSalvageReport> salvage(const std::filesystem::path& damaged,
                                             const std::filesystem::path& folder);
    virtual ~VSHealthStore() = default;

    using Completion = std::function<void(const VSStatus&)>;

    // Queries: see VSQuery.h.
    virtual void executeQuery(std::shared_ptr<VSQuery> query) = 0;
    virtual void stopQuery(const std::shared_ptr<VSQuery>& query) = 0;

    // Writing: all or nothing. Invalid: an object that breaks its type's rules or is beyond the limits
    // (VSLimits.h; the message says which and why).
    /// Gives each object its number; the objects given stay as they are. A correlation brings those of its
    /// members that are not in the store yet. Without a creation date it is now.
    virtual void saveObjects(std::vector<VSSamplePtr> objects, Completion completion) = 0;
    void saveObject(VSSamplePtr object, Completion completion) {
        saveObjects({std::move(object)}, std::move(completion));
    }
    /// A correlation or workout goes alone; its members stay unless they are in the list too. An object
    /// without number means the newest equal one. NotFound: one of them is not in the store.
    virtual void deleteObjects(std::vector<VSSamplePtr> objects, Completion completion) = 0;
    void deleteObject(VSSamplePtr object, Completion completion) {
        deleteObjects({std::move(object)}, std::move(completion));
    }
    /// Of the given types; from one source's bundle identifier, or from all.
    virtual void deleteAllSamples(std::vector<const VSObjectType*> types,
                                  std::optional<std::string> sourceBundleIdentifier,
                                  Completion completion) = 0;
    /// Relates samples to a saved workout, saving those that are not saved yet. NotFound: there is no such
    /// workout.
    virtual void addSamplesToWorkout(std::vector<VSSamplePtr> samples, VSSamplePtr workout,
                                     Completion completion) = 0;

    // Characteristics. The reading ones wait (one row); none: not set. Refused to programs without permission
    // to read, or share, the characteristic's type.
    virtual VSResult<std::optional<VSBirthDate>> dateOfBirth() = 0;
    virtual VSResult<int> biologicalSex() = 0;        // 0 not set
    virtual VSResult<int> bloodType() = 0;            // 0 not set
    virtual VSResult<int> fitzpatrickSkinType() = 0;  // 0 not set
    // Invalid: no such day; not one of the characteristic's values.
    virtual void setDateOfBirth(std::optional<VSBirthDate> date, Completion completion) = 0;
    /// REQUIRES: an enumerated characteristic.
    virtual void setCharacteristic(const VSObjectType* type, int value, Completion completion) = 0;

    // Medical ID. The owner's only.
    /// A new, empty one; nothing is saved.
    static VSMedicalIDData createMedicalIDData() { return {}; }
    /// None: there is no Medical ID.
    virtual void fetchMedicalIDData(
        std::function<void(const VSResult<std::optional<VSMedicalIDData>>&)> completion) = 0;
    /// Makes or replaces it. Invalid: beyond the limits (VSLimits.h).
    virtual void updateMedicalIDData(VSMedicalIDData data, Completion completion) = 0;
    /// Also when there is none.
    virtual void deleteMedicalIDData(Completion completion) = 0;

    // Default values of the application of the connection; each has its own. None: not set.
    virtual void setDefaultValue(VSValue value, std::string key, Completion completion) = 0;
    /// Reads, changes and writes in one transaction, so that nothing that others wrote is lost. `change` gets
    /// the value and answers the new one (none: it stays as it is), on the store's thread; the completion
    /// gets what is stored then.
    using DefaultValueChange = std::function<std::optional<VSValue>(const std::optional<VSValue>& current)>;
    virtual void updateDefaultValue(
        std::string key, DefaultValueChange change,
        std::function<void(const VSResult<std::optional<VSValue>>&)> completion) = 0;
    /// Calls the handler with the key of each default value that was changed, by this or another process,
    /// until the answer and all its copies are gone (a call that is under way goes on). On a thread of the
    /// store's.
    [[nodiscard]] virtual std::shared_ptr<const void> observeDefaultValues(
        std::function<void(const std::string& key)> handler) = 0;
    virtual void getDefaultValue(std::string key,
                                 std::function<void(const VSResult<std::optional<VSValue>>&)> handler) = 0;

    // Sources, devices and permissions
    /// All that ever wrote, by name and bundle identifier, and the applications that asked for a permission.
    virtual void allSources(std::function<void(const VSResult<std::vector<VSSource>>&)> completion) = 0;
    /// The devices of samples; only those with one of these local identifiers when any is given.
    virtual void devices(std::vector<std::string> localIdentifiers,
                         std::function<void(const VSResult<std::vector<VSDevice>>&)> completion) = 0;
    /// The records of every application that asked for the type (also a characteristic's) or was given a
    /// status, by name.
    virtual void authorizationRecords(
        const VSObjectType* type,
        std::function<void(const VSResult<std::vector<VSAuthorizationRecord>>&)> completion) = 0;
    /// Of one application; types that it did not ask for get a record that asks for nothing. Running queries
    /// of the types answer again. Invalid: the owner, who needs none.
    virtual void setAuthorizationStatuses(std::map<const VSObjectType*, VSAuthorizationStatus> statuses,
                                          std::string bundleIdentifier, Completion completion) = 0;
    /// Notes what the application of this connection wants; types that it asked for before keep their status.
    /// Of the owner nothing is noted.
    virtual void requestAuthorization(std::vector<const VSObjectType*> toShare,
                                      std::vector<const VSObjectType*> toRead, Completion completion) = 0;
    /// The order in which sources of a type count: the user's, else this application's own entries first,
    /// then by the date of their first sample. Sources that are new since the user chose stand at the end.
    virtual void orderedSources(const VSObjectType* type,
                                std::function<void(const VSResult<std::vector<VSSource>>&)> completion) = 0;
    virtual void setOrderedSources(std::vector<VSSource> sources, const VSObjectType* type,
                                   Completion completion) = 0;

    // Waiting forms for the command line, the import and tests: they answer as the queries of VSQuery.h do.
    virtual VSResult<std::vector<VSSamplePtr>> samples(const VSObjectType* type, const VSPredicate& predicate,
                                                       int limit,
                                                       const std::vector<VSSortDescriptor>& sort) = 0;
    virtual VSResult<VSStatistics> statistics(const VSObjectType* type, const VSPredicate& predicate,
                                              int options) = 0;
    virtual VSResult<std::shared_ptr<const VSStatisticsCollection>> statisticsCollection(
        const VSObjectType* type, const VSPredicate& predicate, int options, VSDate anchor,
        const VSDateComponents& interval) = 0;
    /// Every sample of the predicate's range with what of it counted: the statistics of the same predicate
    /// and options, taken apart.
    virtual VSResult<VSStatisticsExplanation> explainStatistics(const VSObjectType* type,
                                                                const VSPredicate& predicate,
                                                                int options) = 0;
    struct SourceSummary {
        VSSource source;
        int64_t count = 0;
        VSDate firstStart, lastEnd;
    };
    virtual VSResult<std::vector<SourceSummary>> sourceSummaries() = 0;
    struct TypeSummary {
        const VSObjectType* type;
        int64_t count = 0;
        VSDate firstStart, lastEnd;
    };
    /// Types that have samples, by code.
    virtual VSResult<std::vector<TypeSummary>> typeSummaries() = 0;
    virtual VSResult<VSCheckReport> check() = 0;
    virtual VSStatus saveObjectsAndWait(std::vector<VSSamplePtr> objects) = 0;

    /// An import: one transaction on the writer, driven by the calling thread. Until commit nobody sees
    /// anything of it; destruction without commit leaves no trace. While it lives, saves of this and other
    /// connections wait for it.
    class ImportTransaction {
     public:
        virtual ~ImportTransaction() = default;
        enum class Outcome { Added, AlreadyPresent };
        /// A top-level record of a document. Identical records of the document are told apart by number: the
        /// n-th of them is AlreadyPresent when the store held n of them before. An absent creation date or
        /// time-zone offset equals any. The members of a correlation join with equal top-level records,
        /// before or after it. Where a row of the store agrees in every bit it is preferred.
        virtual VSResult<Outcome> add(const VSSample& sample, const VSImportRelations& relations) = 0;
        VSResult<Outcome> add(const VSSample& sample) { return add(sample, {}); }
        /// Relates what was added to its workouts; numbers begin anew. Objects that both were in the store
        /// before stay related as they were.
        virtual VSStatus endDocument() = 0;
        /// Sets the characteristics that are not set yet; returns how many were set.
        virtual VSResult<int> setCharacteristicsIfUnset(std::optional<VSBirthDate> birthDate,
                                                        int biologicalSex, int bloodType, int skinType) = 0;
        /// Sets the Medical ID as a whole when there is none or an empty one; whether it did. Invalid: beyond
        /// the limits.
        virtual VSResult<bool> setMedicalIDIfUnset(const VSMedicalIDData& data) = 0;
        /// Ends the document, commits and tells everyone, in all processes.
        virtual VSStatus commit() = 0;
    };
    /// Waits for the writer, at most `patience`; NotAccessible when another process holds it longer, and
    /// soon after `giveUp` became true. It may be null, and must outlive the call.
    virtual VSResult<std::unique_ptr<ImportTransaction>> beginImport(
        const std::string& name, VSDuration patience = std::chrono::seconds(30),
        const std::atomic<bool>* giveUp = nullptr) = 0;

    // Batches. They wait.
    /// The imports that were not taken back, oldest first.
    virtual VSResult<std::vector<VSBatch>> batches() = 0;
    /// Takes an import back: what it added and no other import had as well is deleted (anchored queries get
    /// it as deleted objects), and so is what only it still held of an import that was taken back before.
    /// What was not imported is never touched. The characteristics and the Medical ID that it set, that still
    /// have its value and that no other import told are unset. NotFound: there is no such batch.
    virtual VSResult<VSUndoReport> undoBatch(int64_t batch) = 0;

    /// Waits. What is deleted is overwritten in the database file at once; this cuts the log, which may hold
    /// copies, and gives free space back to the disk. NotAccessible: others read or write just now.
    virtual VSStatus cleanUp() = 0;
    virtual VSResult<int64_t> databaseSizeInBytes() = 0;
    virtual const std::filesystem::path& folder() const = 0;
};
