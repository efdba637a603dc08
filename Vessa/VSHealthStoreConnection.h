#pragma once

#include "Vessa/VSHealthStore.h"
#include "Vessa/VSStoreCore.h"

/// The store of one folder as its users see it; the work is the core's. Its operations are defined by subject
/// in VSHealthStoreConnection.cpp (samples and queries), VSHealthStoreStatistics.cpp,
/// VSHealthStoreSources.cpp, VSHealthStoreBatches.cpp and VSHealthStoreValues.cpp (characteristics, Medical
/// ID, default values).
class VSHealthStoreConnection final : public VSHealthStore {
 public:
    explicit VSHealthStoreConnection(std::shared_ptr<VSStoreCore> core) : core_(std::move(core)) {}
    ~VSHealthStoreConnection() override { core_->close(); }
    /// For what reads the store beside its threads.
    const VSStoreCore& core() const { return *core_; }
    void executeQuery(std::shared_ptr<VSQuery> query) override { core_->queries.execute(std::move(query)); }
    void stopQuery(const std::shared_ptr<VSQuery>& query) override { core_->queries.stop(query.get()); }
    void saveObjects(std::vector<VSSamplePtr> objects, Completion completion) override;
    VSStatus saveObjectsAndWait(std::vector<VSSamplePtr> objects) override;
    void deleteObjects(std::vector<VSSamplePtr> objects, Completion completion) override;
    void deleteAllSamples(std::vector<const VSObjectType*> types,
                          std::optional<std::string> sourceBundleIdentifier, Completion completion) override;
    void addSamplesToWorkout(std::vector<VSSamplePtr> samples, VSSamplePtr workout,
                             Completion completion) override;
    VSResult<std::optional<VSBirthDate>> dateOfBirth() override;
    VSResult<int> biologicalSex() override { return characteristic(VSCode::BiologicalSex); }
    VSResult<int> bloodType() override { return characteristic(VSCode::BloodType); }
    VSResult<int> fitzpatrickSkinType() override { return characteristic(VSCode::FitzpatrickSkinType); }
    void setDateOfBirth(std::optional<VSBirthDate> date, Completion completion) override;
    void setCharacteristic(const VSObjectType* type, int value, Completion completion) override;
    void fetchMedicalIDData(
        std::function<void(const VSResult<std::optional<VSMedicalIDData>>&)> completion) override;
    void updateMedicalIDData(VSMedicalIDData data, Completion completion) override;
    void setDefaultValue(VSValue value, std::string key, Completion completion) override;
    void updateDefaultValue(std::string key, DefaultValueChange change,
                            std::function<void(const VSResult<std::optional<VSValue>>&)> completion) override;
    std::shared_ptr<const void> observeDefaultValues(
        std::function<void(const std::string& key)> handler) override {
        return core_->observeDefaultValues(std::move(handler));
    }
    void getDefaultValue(std::string key,
                         std::function<void(const VSResult<std::optional<VSValue>>&)> handler) override;
    void orderedSources(const VSObjectType* type,
                        std::function<void(const VSResult<std::vector<VSSource>>&)> completion) override;
    void setOrderedSources(std::vector<VSSource> sources, const VSObjectType* type,
                           Completion completion) override;
    VSResult<std::vector<VSSamplePtr>> samples(const VSObjectType* type, const VSPredicate& predicate,
                                               int limit, const std::vector<VSSortDescriptor>& sort) override;
    VSResult<VSStatistics> statistics(const VSObjectType* type, const VSPredicate& predicate,
                                      int options) override;
    VSResult<std::shared_ptr<const VSStatisticsCollection>> statisticsCollection(
        const VSObjectType* type, const VSPredicate& predicate, int options, VSDate anchor,
        const VSDateComponents& interval) override;
    VSResult<std::vector<SourceSummary>> sourceSummaries() override;
    VSResult<std::vector<TypeSummary>> typeSummaries() override;
    VSResult<VSCheckReport> check() override;
    VSResult<std::unique_ptr<ImportTransaction>> beginImport(const std::string& name, VSDuration patience,
                                                             const std::atomic<bool>* giveUp) override;
    VSStatus cleanUp() override { return core_->cleanUp(); }
    VSResult<int64_t> databaseSizeInBytes() override;
    const std::filesystem::path& folder() const override { return core_->folder; }
    void allSources(std::function<void(const VSResult<std::vector<VSSource>>&)> completion) override;
    void devices(std::vector<std::string> localIdentifiers,
                 std::function<void(const VSResult<std::vector<VSDevice>>&)> completion) override;
    void authorizationRecords(
        const VSObjectType* type,
        std::function<void(const VSResult<std::vector<VSAuthorizationRecord>>&)> completion) override;
    void setAuthorizationStatuses(std::map<const VSObjectType*, VSAuthorizationStatus> statuses,
                                  std::string bundleIdentifier, Completion completion) override;
    void requestAuthorization(std::vector<const VSObjectType*> toShare,
                              std::vector<const VSObjectType*> toRead, Completion completion) override;
    void deleteMedicalIDData(Completion completion) override;
    VSResult<VSStatisticsExplanation> explainStatistics(const VSObjectType* type,
                                                        const VSPredicate& predicate, int options) override;
    VSResult<std::vector<VSBatch>> batches() override;
    VSResult<VSUndoReport> undoBatch(int64_t batch) override;

 private:
    /// Runs block(VSStoreReader&) in one snapshot, if this application may see such samples; else Refused.
    template <typename Block>
    auto readOf(const VSObjectType* type, const VSPredicate& predicate, Block block) {
        return core_->readers.read([&](VSStoreReader& reader) {
            core_->access.requireReading(reader.database(), type, predicate);
            return block(reader);
        });
    }
    /// A change that only the owner of the store may make.
    void writeAsOwner(VSStoreCore::Change change, Completion completion);
    VSResult<int> characteristic(VSTypeCode code);
    void writeCharacteristic(const VSObjectType* type, std::optional<int64_t> value,
                             const std::optional<VSError>& objectionToValue, Completion completion);
    const std::shared_ptr<VSStoreCore> core_;
};
