#pragma once

#include <cstdint>
#include <functional>

#include "Qelvar/Export/QVXMLWriter.h"
#include "Vessa/Base/VSError.h"

/// Called with the bytes that were read so far; false ends the packing with Cancelled.
using QVExportPackingProgress = std::function<bool(uint64_t bytes)>;

/// Packs the files of an open folder into a zip archive, each under its bare name, readable by all who may
/// read the archive. The archive's file is empty; it is on the disk as a whole when this returns well. A
/// comment at its end says that it is an export of this program. DiskFull, Failed and what the system says: a
/// file could not be read whole or the archive not be written whole.
VSStatus QVArchiveExportDirectory(const QVExportFile& folder, const QVExportFile& archive,
                                  const QVExportPackingProgress& progress);

/// Whether the open file is an archive that an export of this program has made, as a whole.
bool QVIsExportArchive(int file);
