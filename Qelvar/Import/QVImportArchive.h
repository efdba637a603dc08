#pragma once

#include "Qelvar/Import/QVImportFile.h"
#include "Qelvar/Import/QVImportFileDescriptor.h"

/// The documents of a .zip. Invalid: not readable as one (truncated, damaged).
VSResult<std::unique_ptr<QVImportFile>> QVOpenImportArchive(const std::filesystem::path& path,
                                                            QVImportFileDescriptor file, uint64_t size);
