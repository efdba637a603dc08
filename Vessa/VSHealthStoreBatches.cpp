#include "Vessa/VSHealthStoreConnection.h"
#include "Vessa/VSImportTransaction.h"
#include "Vessa/VSStoreBatches.h"
#include "Vessa/VSStoreHolder.h"

VSResult<std::unique_ptr<VSHealthStore::ImportTransaction>> VSHealthStoreConnection::beginImport(
    const std::string& name, VSDuration patience, const std::atomic<bool>* giveUp) {
    if (auto objection = core_->access.objectionToManaging()) return *objection;
    return VSImportTransaction::begin(core_, name, patience, giveUp);
}

VSResult<std::vector<VSBatch>> VSHealthStoreConnection::batches() {
    if (auto objection = core_->access.objectionToManaging()) return *objection;
    return core_->readers.read([](VSStoreReader& reader) { return VSReadBatches(reader.database()); });
}

VSResult<VSUndoReport> VSHealthStoreConnection::undoBatch(int64_t batch) {
    if (auto objection = core_->access.objectionToManaging()) return *objection;
    VSUndoReport report;
    const VSStatus status =
        core_->writeAndWait([&report, batch, folder = core_->folder](VSStoreWriter& writer) {
            const VSHolderNote note(folder, VSStoreHolder::Work::Undo, std::to_string(batch));
            auto undone = VSUndoBatch(writer, batch);
            if (!undone) return VSStatus(undone.error());
            report = *undone;
            return VSStatus();
        });
    if (!status) return status.error();
    return report;
}
