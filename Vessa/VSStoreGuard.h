#pragma once

#include <filesystem>
#include <string>

#include "Vessa/Base/VSError.h"
#include "Vessa/Base/VSFileDescriptor.h"

/// Keeps what goes to places that people name out of stores. A folder is a store's when a file of one is in
/// it; whatever lies below it belongs to that store. Folders and files are told by device and inode, not by
/// their names, so that links, mounts and ways around lead nowhere. Every refusal is Refused and says which
/// place and which store it is about. Any thread.
class VSStoreGuard {
 public:
    /// `store`: the folder of the store at work, also where its files have been moved away by links or only a
    /// part of it is seen through a mount; empty: none.
    explicit VSStoreGuard(std::filesystem::path store = {}) : store_(std::move(store)) {}

    /// Whether something may be written into the open folder. `place` is what the person named.
    VSStatus checkFolder(int folder, const std::filesystem::path& place) const;
    /// Whether a store may be made in the folder: not in another one's. Well where there is one already.
    static VSStatus checkNewStore(const std::filesystem::path& folder);
    /// Whether the name in the open folder may be given to another file. A name that is not there is checked
    /// too: some are those of a store. Links are refused: whoever follows them asks about what they lead to.
    VSStatus checkFile(int folder, const std::string& name, const std::filesystem::path& place) const;
    /// Whether something may be written into the open file, such as standard output. REQUIRES: this process
    /// has no store open.
    VSStatus checkOpenFile(int file, const std::filesystem::path& place) const;

    /// Opens a folder, and makes it and those above it where they are missing (`mode`, less the umask), none
    /// of them in a store. `isNew` (may be null): it was made.
    VSResult<VSFileDescriptor> makeFolder(const std::filesystem::path& folder, unsigned mode,
                                          bool* isNew = nullptr) const;

 private:
    const std::filesystem::path store_;
};

/// The path of a folder or file with all its links resolved, as far as it is there. As the system says.
VSResult<std::filesystem::path> VSResolvedPath(const std::filesystem::path& given);

/// Whether it is a file of a store that this process has open. Such a file must not be opened and closed once
/// more: with that the system takes away all locks that the process has on it, those of SQLite.
bool VSIsOpenStoreFile(const std::filesystem::path& file);
