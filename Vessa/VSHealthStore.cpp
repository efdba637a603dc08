#include "Vessa/VSHealthStore.h"

#include "Vessa/VSHealthStoreConnection.h"

VSResult<std::shared_ptr<VSHealthStore>> VSHealthStore::open(const std::filesystem::path& folder,
                                                             Options options) {
    auto core = VSStoreCore::open(folder, options);
    if (!core) return core.error();
    return std::shared_ptr<VSHealthStore>(std::make_shared<VSHealthStoreConnection>(*core));
}

VSResult<VSSalvageReport> VSHealthStore::salvage(const std::filesystem::path&, const std::filesystem::path&) {
    return VSError{VSErrorCode::Failed, "not there yet"};
}
