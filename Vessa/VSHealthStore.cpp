#include "Vessa/VSHealthStore.h"

#include "Vessa/VSHealthStoreConnection.h"
#include "Vessa/VSStoreSalvage.h"

VSResult<std::shared_ptr<VSHealthStore>> VSHealthStore::open(const std::filesystem::path& folder,
                                                             Options options) {
    auto core = VSStoreCore::open(folder, options);
    if (!core) return core.error();
    return std::shared_ptr<VSHealthStore>(std::make_shared<VSHealthStoreConnection>(*core));
}

VSResult<VSSalvageReport> VSHealthStore::salvage(const std::filesystem::path& damaged,
                                                 const std::filesystem::path& folder) {
    try {
        return VSSalvageStore(damaged, folder);
    } catch (const VSDatabaseFailure& failure) {
        return failure.error();
    }
}
