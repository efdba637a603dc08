#pragma once

#include <filesystem>

#include "Vessa/VSHealthStore.h"

/// VSHealthStore::salvage. Throws VSDatabaseFailure. REQUIRES: this process does not have the damaged store
/// open.
VSSalvageReport VSSalvageStore(const std::filesystem::path& damaged, const std::filesystem::path& folder);
