#pragma once

#include <map>
#include <string>
#include <vector>

#include "Vessa/VSBatch.h"
#include "Vessa/VSHealthStore.h"
#include "Vessa/VSNumberRanges.h"
#include "Vessa/VSStoreWriter.h"

// Imports in their tables. A batch owns the numbers that it gave and claims objects that were there before
// and that its documents hold as well. They throw VSDatabaseFailure.

/// What an import found about a characteristic that its documents tell.
struct VSBatchCharacteristic {
    int64_t value = 0;
    bool given = false;  // the import set it; else it had this value
};

/// Stands for the Medical ID in the place of a type's code. On disk; never change.
inline constexpr int VSBatchMedicalIDCode = -1;
/// The value that stands for a Medical ID's content (FNV-1a, 64 bits). On disk; never change.
int64_t VSBatchMedicalIDValue(const VSMedicalIDData& data);

struct VSNewBatch {
    std::string name;
    VSDate date;
    VSNumberRange numbers;  // empty where it added nothing
    int64_t added = 0;
    VSNumberRanges claims;
    std::map<int, VSBatchCharacteristic> characteristics;  // by type code

    /// It says nothing that the store could keep.
    bool isEmpty() const { return !added && claims.isEmpty() && characteristics.empty(); }
};

void VSWriteBatch(VSDatabase& database, const VSNewBatch& batch);
/// What the person says of the Medical ID is no import's any more.
void VSForgetBatchMedicalID(VSDatabase& database);
/// Those that were not undone, oldest first.
std::vector<VSBatch> VSReadBatches(VSDatabase& database);
/// NotFound: there is no such batch. Inside a writing transaction.
VSResult<VSUndoReport> VSUndoBatch(VSStoreWriter& writer, int64_t batch);
