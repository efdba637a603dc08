#include "Vessa/VSHealthStoreConnection.h"

#include "Vessa/VSImportTransaction.h"

VSResult<std::unique_ptr<VSHealthStore::ImportTransaction>> VSHealthStoreConnection::beginImport(
    const std::string& name, VSDuration patience) {
    return VSImportTransaction::begin(core_, name, patience);
}

VSResult<std::vector<VSBatch>> VSHealthStoreConnection::batches() {
    return VSError{VSErrorCode::Failed, "not there yet"};
}
VSResult<VSUndoReport> VSHealthStoreConnection::undoBatch(int64_t) {
    return VSError{VSErrorCode::Failed, "not there yet"};
}
