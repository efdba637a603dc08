#pragma once

#include <atomic>
#include <filesystem>
#include <memory>

#include "Vessa/Base/VSError.h"
#include "Vessa/VSStoreGuard.h"
#include "Vessa/VSWorkFolder.h"

/// The place that a person chose for a finished archive. Its folder is held open, so that the archive goes
/// where the checks were made. An older export there is replaced as a whole or not at all; nothing of a store
/// ever is. What is there when an operation returns well outlives a lost power supply. They wait; one thread
/// at a time.
class QVExportTarget {
 public:
    /// The file that is meant: what a link leads to. `store` is the folder of the store that is exported.
    /// Refused: it is in a store or a file of one, or there is no permission; Invalid: there is something
    /// else than a file, or the name cannot be one; NotFound: its folder is not there.
    static VSResult<QVExportTarget> open(const std::filesystem::path& given,
                                         const std::filesystem::path& store);

    /// Whether it is a store that keeps others from writing there.
    static bool isInStore(const std::filesystem::path& given, const std::filesystem::path& store);

    const std::filesystem::path& path() const { return path_; }
    /// The file holds something, and that is no export of this program.
    bool holdsSomethingElse() const { return holdsSomethingElse_; }
    /// Something else may be replaced too, but never a store.
    void allowReplacing() { mayReplace_ = true; }

    /// A folder in which an archive for this target is made.
    VSResult<std::shared_ptr<const VSWorkFolder>> makeWorkFolder() const;
    /// Gives a file of the work folder the target's name, after a check of what is there now.
    VSStatus take(const VSWorkFolder& folder, const std::string& name);
    /// Makes a copy and gives it the target's name; it is for its owner only. Cancelled soon after *cancel
    /// became true.
    VSStatus takeCopy(const std::filesystem::path& archive, const std::atomic<bool>& cancel);

 private:
    QVExportTarget(VSStoreGuard guard, std::filesystem::path path)
        : guard_(std::move(guard)), path_(std::move(path)) {}
    VSStatus openFolder();
    VSStatus check();
    std::string name() const { return path_.filename().string(); }

    VSStoreGuard guard_;
    std::filesystem::path path_;  // without links
    VSFileDescriptor folder_;
    bool isThere_ = false;  // as check() has seen it
    bool holdsSomethingElse_ = false;
    bool mayReplace_ = false;
};
