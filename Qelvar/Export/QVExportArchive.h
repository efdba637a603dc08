#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>

#include "Vessa/Base/VSError.h"

/// Called with the bytes that were read so far; false ends the packing with Cancelled.
using QVExportPackingProgress = std::function<bool(uint64_t bytes)>;

/// Packs the files of a folder into a zip archive, each under its bare name, readable by all who may read the
/// archive. The archive's file is there already; it is written over and is on the disk as a whole when this
/// returns well. DiskFull, NotAccessible, Failed: a file could not be read whole or the archive not be
/// written whole.
VSStatus QVArchiveExportDirectory(const std::filesystem::path& folder, const std::filesystem::path& archive,
                                  const QVExportPackingProgress& progress);
