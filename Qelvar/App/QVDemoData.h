#pragma once

#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Platform/UserDefaults.h"
#include "Vessa/VSHealthStore.h"
#include "VessaUI/VSUnitController.h"

/// Whether the application shows prepared records in place of the user's: the local default "UseDemoData".
bool QVUsesDemoData();

/// The built-in document of prepared records. Any thread.
VSResult<VSValue::Dictionary> QVDemoDataDictionary();
/// What stands in it before its samples (the dashboard's selection among others): read much faster.
std::optional<VSValue::Dictionary> QVDemoDataHead();

/// The unit of a quantity type's demonstration values: by type, what the user prefers where the document's
/// units are not fixed.
using QVDemoUnits = std::map<const VSObjectType*, VSUnit>;
QVDemoUnits QVMakeDemoUnits(const VSUnitController& unitController);

/// Makes the samples of the document's entries, relative to `anchor` (the start of today), and hands them
/// over in batches of `batchSize`, or somewhat smaller to keep the values of a blood pressure with it; the
/// last one may be empty. Entries of unknown types and
/// without a usable value are passed over. Any thread.
void QVBuildDemoSamples(const VSValue::Array& entries, VSDate anchor, const QVDemoUnits& units,
                        size_t batchSize,
                        const std::function<void(std::vector<VSSamplePtr> batch, bool isLast)>& handler);

/// Replaces everything in a store by the demonstration's records, at most once a day and variant. Main thread
/// only.
class QVDemoData {
 public:
    /// `didSave` is called on the main thread after each batch that the store has taken.
    QVDemoData(std::shared_ptr<VSHealthStore> healthStore, std::shared_ptr<VSUnitController> unitController,
               std::function<void()> didSave = {});
    ~QVDemoData();

    /// Whether the last rebuild was for another variant or not today.
    bool isDue(const std::string& demoDataSex) const;
    /// Rebuilds when it is due; returns at once. `demoDataSex` "Female" chooses the female variant, anything
    /// else the male one. When the old records cannot be deleted nothing is recorded and the next activation
    /// tries again.
    void resetDemoData(VSValue::Dictionary dictionary, const std::string& demoDataSex);
    /// A rebuild is under way.
    bool isResetting() const { return resetting_; }

 private:
    void updateMedicalID(const VSValue::Dictionary& dictionary, bool isFemale);
    void updateCharacteristics(const VSValue::Dictionary& dictionary, bool isFemale);
    void finished(const std::string& demoDataSex);

    const std::shared_ptr<VSHealthStore> healthStore_;
    const std::shared_ptr<VSUnitController> unitController_;
    const std::function<void()> didSave_;
    bool resetting_ = false;
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
};
