#pragma once

#include <chrono>
#include <filesystem>
#include <vector>

#include "Vessa/Base/VSDate.h"

/// Brings a store of an older format to this program's. Step n brings version n to n + 1.
namespace VSStoreMigration {

/// How long the migration of a large store by another process is waited for.
inline constexpr VSDuration patienceForOthers = std::chrono::minutes(2);

/// Waits until no other program has the store open, at most `patience`, and keeps it to itself until it is
/// done; one that another process is bringing to the new format is waited for longer. First a complete copy
/// (with what is in the log) is kept beside it under a name of its own, "vessa.version-1.sqlite", mode 0600;
/// then all steps are one transaction. Does nothing where another process was faster. Throws
/// VSDatabaseFailure, and then the store is as it was and no copy is kept: NotAccessible where others have it
/// open, DiskFull where the copy or the new format has no room. Only a commit that failed leaves the copy,
/// since the new format may turn out to be there. REQUIRES: no connection of the caller has the file open;
/// its format is one of this program's.
void migrate(const std::filesystem::path& file, VSDuration patience);

/// Whether a migration of this file may be under way in another process (or was killed).
bool mayBeUnderWay(const std::filesystem::path& file);
/// Removes what a migration leaves that was killed when all was done.
/// REQUIRES: a connection of the caller has read that the file has the current format.
void clearUp(const std::filesystem::path& file);

/// The copies that migrations kept of the store in a folder, by name. They hold what was deleted since.
std::vector<std::filesystem::path> keptCopies(const std::filesystem::path& folder);

}  // namespace VSStoreMigration
