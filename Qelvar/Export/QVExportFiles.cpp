#include "Qelvar/Export/QVExportFiles.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>

#include <cerrno>

#include "Vessa/VSDatabase.h"

namespace {

namespace fs = std::filesystem;

/// With the folders above it, each for its owner only.
VSStatus makeFolder(const fs::path& folder) {
    std::error_code error;
    if (fs::is_directory(folder, error)) return {};
    if (folder.has_parent_path() && folder.parent_path() != folder) {
        if (VSStatus status = makeFolder(folder.parent_path()); !status) return status;
    }
    if (mkdir(folder.c_str(), 0700) != 0 && errno != EEXIST) return VSErrorFromSystem(errno, folder.string());
    return {};
}

VSStatus makeFile(const fs::path& file) {
    const int descriptor = open(file.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC | O_NOFOLLOW, 0600);
    if (descriptor < 0) return VSErrorFromSystem(errno, file.string());
    close(descriptor);
    return {};
}

bool isSameFile(int descriptor, const fs::path& path) {
    struct stat open {
    }, named{};
    return fstat(descriptor, &open) == 0 && stat(path.c_str(), &named) == 0 && open.st_ino == named.st_ino &&
           open.st_dev == named.st_dev;
}

}  // namespace

VSResult<QVImportFileDescriptor> QVExportFiles::lock(const fs::path& folder) {
    QVImportFileDescriptor descriptor(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (descriptor.get() < 0) return VSErrorFromSystem(errno, folder.string());
    // Where the file system knows no such locks, as over some networks, nobody is kept out.
    const bool isLocked = flock(descriptor.get(), LOCK_EX | LOCK_NB) == 0 || errno != EWOULDBLOCK;
    // An export that ended this moment may have removed the folder after it was opened here.
    if (isLocked && isSameFile(descriptor.get(), folder)) return descriptor;
    return VSError{VSErrorCode::NotAccessible, "another export is under way in " + folder.string(), true};
}

VSResult<QVExportFiles> QVExportFiles::create(const QVExportPaths& paths) {
    if (VSStatus status = makeFolder(paths.documentsPath); !status) return status.error();
    auto held = lock(paths.documentsPath);
    if (!held) return held.error();
    QVExportFiles files(paths, std::move(*held));
    files.remove();
    if (VSStatus status = files.make(); !status) return status.error();
    return files;
}

void QVExportFiles::removeLeftovers(const QVExportPaths& paths) {
    std::error_code error;
    if (!fs::exists(paths.exportPath, error) && !fs::exists(paths.archivePath, error)) return;
    if (auto held = lock(paths.documentsPath)) QVExportFiles(paths, std::move(*held)).remove();
}

QVExportFiles::QVExportFiles(QVExportFiles&& other) noexcept
    : paths_(std::exchange(other.paths_, std::nullopt)), lock_(std::move(other.lock_)) {}

VSStatus QVExportFiles::make() {
    if (VSStatus status = makeFolder(paths_->exportPath); !status) return status;
    for (const fs::path* file : {&paths_->filePath, &paths_->CDAFilePath, &paths_->archivePath}) {
        if (VSStatus status = makeFile(*file); !status) return status;
    }
    return {};
}

void QVExportFiles::removeDocuments() {
    std::error_code ignored;
    if (paths_) fs::remove_all(paths_->exportPath, ignored);
}

void QVExportFiles::remove() {
    std::error_code ignored;
    removeDocuments();
    if (paths_) fs::remove(paths_->archivePath, ignored);
}
