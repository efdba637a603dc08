#pragma once

#include <optional>

#include "Vessa/VSMedicalID.h"
#include "Vessa/VSStoreWriter.h"

// The characteristics and the Medical ID in their tables. They throw VSDatabaseFailure.

/// None: not set.
std::optional<int64_t> VSReadCharacteristic(VSDatabase& database, const VSObjectType* type);
/// None clears it.
void VSWriteCharacteristic(VSStoreWriter& writer, const VSObjectType* type, std::optional<int64_t> value);

std::optional<VSMedicalIDData> VSReadMedicalID(VSDatabase& database);
void VSWriteMedicalID(VSDatabase& database, const VSMedicalIDData& data);
