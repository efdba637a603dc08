#include "Qelvar/Export/QVExportFiles.h"

#include <fcntl.h>

#include <cerrno>

#include "Vessa/VSDatabase.h"

namespace {

namespace fs = std::filesystem;

using Folder = VSResult<std::shared_ptr<const VSWorkFolder>>;

Folder openDocuments(const fs::path& documents) {
    // The way there may lead through links, the folder itself may not.
    const VSFileDescriptor parent(open(documents.parent_path().c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
    if (!parent.isOpen()) return VSErrorFromSystem(errno, documents.parent_path().string());
    auto folder = VSWorkFolder::open(documents.filename().string(), parent.get(), documents);
    if (!folder) return folder.error();
    return std::make_shared<const VSWorkFolder>(std::move(*folder));
}

VSStatus makeFile(int folder, const fs::path& path, VSFileDescriptor& file) {
    file = VSFileDescriptor(
        openat(folder, path.filename().c_str(), O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
    return file.isOpen() ? VSStatus() : VSErrorFromSystem(errno, path.string());
}

}  // namespace

VSResult<QVExportFiles> QVExportFiles::create(const QVExportPaths& paths,
                                              std::shared_ptr<const VSWorkFolder> folder) {
    const Folder held = folder ? Folder(std::move(folder)) : openDocuments(paths.documentsPath);
    if (!held) return held.error();
    QVExportFiles files(paths, *held);
    files.remove();
    if (VSStatus status = files.make(); !status) return status.error();
    return files;
}

void QVExportFiles::removeLeftovers(const QVExportPaths& paths) {
    std::error_code error;
    if (!fs::exists(paths.exportPath, error) && !fs::exists(paths.archivePath, error)) return;
    if (const Folder held = openDocuments(paths.documentsPath)) QVExportFiles(paths, *held).remove();
}

VSStatus QVExportFiles::make() {
    auto folder = folder_->makeFolder(paths_.exportPath.filename().string());
    if (!folder) return folder.error();
    export_ = std::move(*folder);
    if (VSStatus status = makeFile(export_.get(), paths_.filePath, records_); !status) return status;
    if (VSStatus status = makeFile(export_.get(), paths_.CDAFilePath, clinical_); !status) return status;
    return makeFile(folder_->descriptor(), paths_.archivePath, archive_);
}

void QVExportFiles::remove() const {
    if (!folder_) return;
    folder_->remove(paths_.exportPath.filename().string());
    folder_->remove(paths_.archivePath.filename().string());
}
