#pragma once

#include <map>
#include <memory>
#include <unordered_map>
#include <vector>

#include "Vessa/VSHealthStore.h"
#include "Vessa/VSStoreBatches.h"
#include "Vessa/VSStoreCore.h"
#include "Vessa/VSStoreHolder.h"

/// An import into a store, on a writing connection of its own. Used by one thread.
class VSImportTransaction final : public VSHealthStore::ImportTransaction {
 public:
    /// Waits for the writer, at most `patience` and until *giveUp.
    static VSResult<std::unique_ptr<VSHealthStore::ImportTransaction>> begin(
        std::shared_ptr<VSStoreCore> core, const std::string& name, VSDuration patience,
        const std::atomic<bool>* giveUp);
    ~VSImportTransaction() override;

    using VSHealthStore::ImportTransaction::add;
    VSResult<Outcome> add(const VSSample& sample, const VSImportRelations& relations) override;
    VSStatus endDocument() override;
    VSResult<int> setCharacteristicsIfUnset(std::optional<VSBirthDate> birthDate, int biologicalSex,
                                            int bloodType, int skinType) override;
    VSResult<bool> setMedicalIDIfUnset(const VSMedicalIDData& data) override;
    VSStatus commit() override;

 private:
    VSImportTransaction(std::shared_ptr<VSStoreCore> core, std::unique_ptr<VSDatabase> database,
                        const std::string& name);

    /// Which records of the document a row stands for: one at the top level, and one member of a correlation.
    enum Use : uint8_t { TopLevel = 1, Member = 2 };
    class Uses {
     public:
        bool has(int64_t id, Use use) const;
        void set(int64_t id, Use use);
        /// The rows up to this number that are used at all.
        VSNumberRanges usedUpTo(int64_t last) const;

     private:
        std::vector<uint8_t> bits_;  // two bits a number, four numbers a byte
    };

    struct Added {
        int64_t id = 0;
        Outcome outcome = Outcome::Added;
    };
    Added addRecord(const VSSample& sample);
    Added addCorrelation(const VSCorrelation& correlation, const std::vector<int64_t>& memberNumbers);
    VSMemberKey addMember(const VSSample& member, int64_t number);
    void relate(const VSSample& sample, int64_t id, const VSImportRelations& relations);
    void relateToWorkouts();
    /// Does block() unless the import has ended, and ends it with its failure.
    template <typename Block>
    auto attempt(Block block) -> VSResult<decltype(block())>;
    int64_t insert(const VSSample& sample);
    bool mayBePresent(const VSSample& sample, Use use) const;
    VSError ended() const;

    const std::shared_ptr<VSStoreCore> core_;
    std::unique_ptr<VSDatabase> database_;
    VSStoreWriter writer_;
    std::unique_ptr<VSTransaction> transaction_;
    const std::string name_;
    const VSDate date_;
    int64_t lastBefore_ = 0;                            // numbers up to here were in the store before
    std::vector<bool> hadSamples_;                      // by type: there were samples of it before
    std::vector<bool> hasNewTopLevel_, hasNewMembers_;  // by type: this import added such rows
    Uses uses_;
    int64_t added_ = 0;
    /// Of the document: the records that others name, by their numbers.
    std::unordered_map<int64_t, VSMemberKey> numbered_;
    int pendingRelations_ = 0;
    std::map<int, VSBatchCharacteristic> characteristics_;  // by type code
    bool changedCharacteristics_ = false;
    std::optional<VSError> failure_;    // after the first one nothing goes on
    std::optional<VSHolderNote> note_;  // last: it goes before the transaction
};
