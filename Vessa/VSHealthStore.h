#pragma once

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

/// What was saved out of a damaged store.
struct VSSalvageReport {
    int64_t samples = 0;  // that are in the new store
    std::optional<int64_t>
        lost;  // samples known to have been there whose content could not be read; none: unknown
    std::vector<std::string> losses;  // what was lost, in words, with the time it lies in where that is known
};

/// A connection to the store of one folder. Several connections, in one process or many, may be open on the
/// same folder. All operations may be called on any thread and return at once unless their comment says that
/// they wait; completions run on the store's threads, in the order of the calls for writes. A completion may
/// be empty. What was acknowledged survives a killed process and a lost power supply.
class VSHealthStore {
 public:
    struct Options {
        bool readOnly = false;
        bool createIfMissing = true;
        std::string applicationIdentifier = "org.qelvar.Qelvar";  // whose default values are meant
        /// False: a lost power supply may take the last saves with it, never more; a killed process loses
        /// nothing either way.
        bool survivesPowerLoss = true;
        /// How long an operation that changes something waits for other programs that hold the store.
        VSDuration patience = std::chrono::minutes(2);
    };
    /// Waits. Opens or makes the database in the folder (made with mode 0700). Refused: a newer schema, not
    /// our file. Corrupt: a damaged file (it is never changed). NotAccessible: cannot be locked or reached.
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

    // Queries
    virtual void executeQuery(std::shared_ptr<VSQuery> query) = 0;
    virtual void stopQuery(const std::shared_ptr<VSQuery>& query) = 0;

    // Writing: all or nothing. Invalid: an object that breaks its type's rules (the message says which and
    // why).
    virtual void saveObjects(std::vector<VSSamplePtr> objects, Completion completion) = 0;
    void saveObject(VSSamplePtr object, Completion completion) {
        saveObjects({std::move(object)}, std::move(completion));
    }
    /// A correlation or workout goes alone; its members stay. NotFound when one of them is not in the store.
    virtual void deleteObjects(std::vector<VSSamplePtr> objects, Completion completion) = 0;
    void deleteObject(VSSamplePtr object, Completion completion) {
        deleteObjects({std::move(object)}, std::move(completion));
    }
    /// Of the given types; from one source's bundle identifier, or from all.
    virtual void deleteAllSamples(std::vector<const VSObjectType*> types,
                                  std::optional<std::string> sourceBundleIdentifier,
                                  Completion completion) = 0;
    /// Relates samples to a saved workout, saving those that are not saved yet.
    virtual void addSamplesToWorkout(std::vector<VSSamplePtr> samples, VSSamplePtr workout,
                                     Completion completion) = 0;

    // Characteristics. They wait (one row); none: not set.
    virtual VSResult<std::optional<VSBirthDate>> dateOfBirth() = 0;
    virtual VSResult<int> biologicalSex() = 0;        // 0 not set
    virtual VSResult<int> bloodType() = 0;            // 0 not set
    virtual VSResult<int> fitzpatrickSkinType() = 0;  // 0 not set
    virtual void setDateOfBirth(std::optional<VSBirthDate> date, Completion completion) = 0;
    /// REQUIRES: an enumerated characteristic and one of its values.
    virtual void setCharacteristic(const VSObjectType* type, int value, Completion completion) = 0;

    // Medical ID
    virtual void fetchMedicalIDData(
        std::function<void(const VSResult<std::optional<VSMedicalIDData>>&)> completion) = 0;
    virtual void updateMedicalIDData(VSMedicalIDData data, Completion completion) = 0;
    virtual void deleteMedicalIDData(Completion completion) = 0;

    // Default values of an application
    virtual void setDefaultValue(VSValue value, std::string key, Completion completion) = 0;
    virtual void getDefaultValue(std::string key,
                                 std::function<void(const VSResult<std::optional<VSValue>>&)> handler) = 0;

    // Sources, devices and permissions
    /// All that ever wrote, by name and bundle identifier, and the applications that asked for a permission.
    virtual void allSources(std::function<void(const VSResult<std::vector<VSSource>>&)> completion) = 0;
    /// The devices of samples; only those with one of these local identifiers when any is given.
    virtual void devices(std::vector<std::string> localIdentifiers,
                         std::function<void(const VSResult<std::vector<VSDevice>>&)> completion) = 0;
    /// The records of every application that asked for the type.
    virtual void authorizationRecords(
        const VSObjectType* type,
        std::function<void(const VSResult<std::vector<VSAuthorizationRecord>>&)> completion) = 0;
    /// Of one application; types that it did not ask for get a record that asks for nothing.
    virtual void setAuthorizationStatuses(std::map<const VSObjectType*, VSAuthorizationStatus> statuses,
                                          std::string bundleIdentifier, Completion completion) = 0;
    /// Notes what the application of this connection wants; types that it asked for before keep their status.
    virtual void requestAuthorization(std::vector<const VSObjectType*> toShare,
                                      std::vector<const VSObjectType*> toRead, Completion completion) = 0;
    /// The order in which sources of a type count: the user's, else this application's own entries first,
    /// then by the date of their first sample. Sources that are new since the user chose stand at the end.
    virtual void orderedSources(const VSObjectType* type,
                                std::function<void(const VSResult<std::vector<VSSource>>&)> completion) = 0;
    virtual void setOrderedSources(std::vector<VSSource> sources, const VSObjectType* type,
                                   Completion completion) = 0;

    // Waiting forms for the command line, the import and tests
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
        /// before or after it.
        virtual VSResult<Outcome> add(const VSSample& sample) = 0;
        /// Sets the characteristics that are not set yet; returns how many were set.
        virtual VSResult<int> setCharacteristicsIfUnset(std::optional<VSBirthDate> birthDate,
                                                        int biologicalSex, int bloodType, int skinType) = 0;
        /// Commits and tells everyone, in all processes.
        virtual VSStatus commit() = 0;
    };
    /// Waits for the writer, at most `patience`; NotAccessible when another process holds it longer.
    virtual VSResult<std::unique_ptr<ImportTransaction>> beginImport(
        const std::string& name, VSDuration patience = std::chrono::seconds(30)) = 0;

    // Batches. They wait.
    /// The imports that were not taken back, oldest first.
    virtual VSResult<std::vector<VSBatch>> batches() = 0;
    /// Takes an import back: what it added and no later import had as well is deleted (anchored queries get
    /// it as deleted objects), the characteristics that it set are unset. NotFound: there is no such batch.
    virtual VSResult<VSUndoReport> undoBatch(int64_t batch) = 0;

    virtual VSResult<int64_t> databaseSizeInBytes() = 0;
    virtual const std::filesystem::path& folder() const = 0;
};
