#pragma once

#include <atomic>
#include <filesystem>

#include "Vessa/Base/VSError.h"
#include "Vessa/Base/VSFileDescriptor.h"

using QVImportFileDescriptor = VSFileDescriptor;

/// Reads what is there, waiting for it as long as `cancel` (may be null) is not set; 0 at the end.
VSResult<size_t> QVReadWaiting(const QVImportFileDescriptor& file, const std::filesystem::path& path,
                               char* buffer, size_t size, const std::atomic<bool>* cancel);
