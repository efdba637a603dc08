#include "Qelvar/Export/QVExportTarget.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <string>
#include <vector>

#include "Qelvar/Export/QVExportArchive.h"
#include "Vessa/VSDatabase.h"

namespace {

namespace fs = std::filesystem;

constexpr size_t kCopySize = 256 * 1024;
constexpr const char* kCopyName = "export.zip";

VSStatus writeAll(int file, const char* bytes, size_t size, const fs::path& path) {
    while (size > 0) {
        const ssize_t count = write(file, bytes, size);
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) return VSErrorFromSystem(errno, path.string());
        bytes += count;
        size -= static_cast<size_t>(count);
    }
    return {};
}

VSStatus copyContent(const fs::path& archive, int to, const fs::path& target,
                     const std::atomic<bool>& cancel) {
    const VSFileDescriptor from(open(archive.c_str(), O_RDONLY | O_CLOEXEC));
    if (!from.isOpen()) return VSErrorFromSystem(errno, archive.string());
    std::vector<char> buffer(kCopySize);
    while (true) {
        if (cancel) return VSError{VSErrorCode::Cancelled, "cancelled"};
        const ssize_t count = read(from.get(), buffer.data(), buffer.size());
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) return VSErrorFromSystem(errno, archive.string());
        if (count == 0) break;
        if (VSStatus status = writeAll(to, buffer.data(), static_cast<size_t>(count), target); !status)
            return status;
    }
    return fsync(to) == 0 ? VSStatus() : VSErrorFromSystem(errno, target.string());
}

/// Gives a file without a name that of the copy.
VSStatus nameCopy(int file, const VSWorkFolder& folder, const fs::path& target) {
    const std::string self = "/proc/self/fd/" + std::to_string(file);
    const bool isNamed =
        linkat(AT_FDCWD, self.c_str(), folder.descriptor(), kCopyName, AT_SYMLINK_FOLLOW) == 0;
    return isNamed ? VSStatus() : VSErrorFromSystem(errno, target.string());
}

VSError isInTheWay(const fs::path& target) {
    return {VSErrorCode::Refused,
            target.string() + " is there already and is no export of Qelvar; it is left as it is"};
}

const char* kindOf(mode_t mode) {
    if (S_ISDIR(mode)) return " is a folder; name a file in it";
    if (S_ISFIFO(mode)) return " is a pipe; an archive needs a file";
    return S_ISSOCK(mode) ? " is a socket; an archive needs a file" : " is a device; an archive needs a file";
}

}  // namespace

VSResult<QVExportTarget> QVExportTarget::open(const fs::path& given, const fs::path& store) {
    // First of all: what standard output and the like lead to has a name only where it is a file.
    struct stat status {};
    if (stat(given.c_str(), &status) == 0 && !S_ISREG(status.st_mode))
        return VSError{VSErrorCode::Invalid, given.string() + kindOf(status.st_mode)};
    const auto path = VSResolvedPath(given);
    if (!path) return path.error();
    if (!path->has_filename())
        return VSError{VSErrorCode::Invalid, given.string() + " is the name of a folder, not of a file"};
    std::error_code error;
    if (fs::is_symlink(*path, error))
        return VSError{VSErrorCode::NotFound, given.string() + " is a link to what is not there"};
    QVExportTarget target(VSStoreGuard(store), *path);
    if (VSStatus opened = target.openFolder(); !opened) return opened.error();
    if (VSStatus checked = target.check(); !checked) return checked.error();
    return target;
}

bool QVExportTarget::isInStore(const fs::path& given, const fs::path& store) {
    const auto path = VSResolvedPath(given);
    if (!path) return false;
    const VSFileDescriptor folder(::open(path->parent_path().c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
    const VSStoreGuard guard(store);
    return folder.isOpen() && (!guard.checkFolder(folder.get(), *path) ||
                               guard.checkFile(folder.get(), path->filename().string(), *path)
                                       .optionalError()
                                       .value_or(VSError{})
                                       .code == VSErrorCode::Refused);
}

VSStatus QVExportTarget::openFolder() {
    const fs::path folder = path_.parent_path();
    folder_ = VSFileDescriptor(::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    // A folder may be written to though nobody may list it.
    if (!folder_.isOpen() && errno == EACCES)
        folder_ = VSFileDescriptor(::open(folder.c_str(), O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    if (folder_.isOpen()) return {};
    if (errno == ENOENT) return VSError{VSErrorCode::NotFound, "there is no folder " + folder.string()};
    return VSErrorFromSystem(errno, folder.string());
}

/// What may be replaced changes between the choice and the moment in which it is replaced, so that this is
/// asked at both.
VSStatus QVExportTarget::check() {
    if (VSStatus status = guard_.checkFolder(folder_.get(), path_); !status) return status;
    if (VSStatus status = guard_.checkFile(folder_.get(), name(), path_); !status) return status;
    struct stat status {};
    isThere_ = fstatat(folder_.get(), name().c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0;
    holdsSomethingElse_ = false;
    if (!isThere_) return errno == ENOENT ? VSStatus() : VSErrorFromSystem(errno, path_.string());
    if (!S_ISREG(status.st_mode))
        return VSError{VSErrorCode::Invalid, path_.string() + kindOf(status.st_mode)};
    const VSFileDescriptor file(
        openat(folder_.get(), name().c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
    if (!file.isOpen() || fstat(file.get(), &status) != 0) return VSErrorFromSystem(errno, path_.string());
    holdsSomethingElse_ = status.st_size > 0 && !QVIsExportArchive(file.get());
    return {};
}

VSResult<std::shared_ptr<const VSWorkFolder>> QVExportTarget::makeWorkFolder() const {
    auto folder = VSWorkFolder::makeFor(name(), folder_.get(), path_);
    if (!folder) return folder.error();
    return std::make_shared<const VSWorkFolder>(std::move(*folder));
}

VSStatus QVExportTarget::take(const VSWorkFolder& folder, const std::string& given) {
    if (VSStatus status = check(); !status) return status;
    if (holdsSomethingElse_ && !mayReplace_) return isInTheWay(path_);
    const std::string own = name();
    const auto rename = [&](unsigned flags) {
        return renameat2(folder.descriptor(), given.c_str(), folder_.get(), own.c_str(), flags) == 0;
    };
    // A file that appeared since is nobody's to replace. Not every file system can make sure of that.
    bool isTaken = rename(isThere_ ? 0 : RENAME_NOREPLACE);
    if (!isTaken && !isThere_ && (errno == EINVAL || errno == ENOSYS)) isTaken = rename(0);
    if (!isTaken && errno == EEXIST) return isInTheWay(path_);
    if (!isTaken) return VSErrorFromSystem(errno, path_.string());
    const bool canSync = (fcntl(folder_.get(), F_GETFL) & O_PATH) == 0;
    return !canSync || fsync(folder_.get()) == 0 ? VSStatus() : VSErrorFromSystem(errno, path_.string());
}

VSStatus QVExportTarget::takeCopy(const fs::path& archive, const std::atomic<bool>& cancel) {
    const auto folder = makeWorkFolder();
    if (!folder) return folder.error();
    constexpr int flags = O_WRONLY | O_CLOEXEC;
    // A file without a name until it is whole, which a killed process leaves nothing of, where the file
    // system has such.
    VSFileDescriptor file(openat((*folder)->descriptor(), ".", O_TMPFILE | flags, 0600));
    const bool isUnnamed = file.isOpen();
    if (!isUnnamed)
        file = VSFileDescriptor(
            openat((*folder)->descriptor(), kCopyName, O_CREAT | O_EXCL | O_NOFOLLOW | flags, 0600));
    if (!file.isOpen()) return VSErrorFromSystem(errno, path_.string());
    VSStatus status = copyContent(archive, file.get(), path_, cancel);
    if (status && isUnnamed) status = nameCopy(file.get(), **folder, path_);
    return status ? take(**folder, kCopyName) : status;
}
