#pragma once

#include <atomic>
#include <filesystem>

#include "Vessa/Base/VSError.h"

// Giving a finished archive the place that a person chose. An older file there is replaced as a whole or not
// at all; what is there when these return well outlives a lost power supply. They wait.

/// The file that is meant: what a link leads to. Invalid: there is something else than a file; NotFound: its
/// folder is not there.
VSResult<std::filesystem::path> QVExportTargetFile(const std::filesystem::path& given);

/// REQUIRES: both are on one disk.
VSStatus QVMoveExportArchive(const std::filesystem::path& archive, const std::filesystem::path& target);

/// The copy is for its owner only. Cancelled soon after *cancel became true.
VSStatus QVCopyExportArchive(const std::filesystem::path& archive, const std::filesystem::path& target,
                             const std::atomic<bool>& cancel);
