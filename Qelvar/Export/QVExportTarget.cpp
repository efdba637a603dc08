#include "Qelvar/Export/QVExportTarget.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "Qelvar/Import/QVImportFileDescriptor.h"
#include "Vessa/VSDatabase.h"

namespace {

namespace fs = std::filesystem;

constexpr size_t kCopySize = 256 * 1024;

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
    const QVImportFileDescriptor from(open(archive.c_str(), O_RDONLY | O_CLOEXEC));
    if (from.get() < 0) return VSErrorFromSystem(errno, archive.string());
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

/// Gives a file without a name this one.
VSStatus nameFile(int file, const std::string& name, const fs::path& target) {
    unlink(name.c_str());  // what a killed process of the same number had
    const std::string self = "/proc/self/fd/" + std::to_string(file);
    const bool isNamed = linkat(AT_FDCWD, self.c_str(), AT_FDCWD, name.c_str(), AT_SYMLINK_FOLLOW) == 0;
    return isNamed ? VSStatus() : VSErrorFromSystem(errno, target.string());
}

}  // namespace

VSResult<fs::path> QVExportTargetFile(const fs::path& given) {
    std::error_code error;
    const fs::path target = fs::weakly_canonical(fs::absolute(given, error), error);
    if (error) return VSErrorFromSystem(error.value(), given.string());
    if (fs::is_symlink(target, error))
        return VSError{VSErrorCode::NotFound, given.string() + " is a link to what is not there"};
    const auto type = fs::status(target, error).type();
    if (type != fs::file_type::not_found && type != fs::file_type::regular)
        return VSError{VSErrorCode::Invalid, given.string() + " is no file"};
    if (!fs::is_directory(target.parent_path(), error))
        return VSError{VSErrorCode::NotFound, "there is no folder " + target.parent_path().string()};
    return target;
}

VSStatus QVMoveExportArchive(const fs::path& archive, const fs::path& target) {
    if (rename(archive.c_str(), target.c_str()) != 0) return VSErrorFromSystem(errno, target.string());
    const fs::path folder = target.parent_path();
    const QVImportFileDescriptor descriptor(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    const bool isKept = descriptor.get() >= 0 && fsync(descriptor.get()) == 0;
    return isKept ? VSStatus() : VSErrorFromSystem(errno, folder.string());
}

VSStatus QVCopyExportArchive(const fs::path& archive, const fs::path& target,
                             const std::atomic<bool>& cancel) {
    const fs::path folder = target.parent_path();
    std::string copy = (folder / ("." + target.filename().string() + ".XXXXXX")).string();
    // A file without a name until it is whole, which a killed process leaves nothing of, where the file
    // system has such.
    const QVImportFileDescriptor unnamed(open(folder.c_str(), O_TMPFILE | O_WRONLY | O_CLOEXEC, 0600));
    VSStatus status;
    if (unnamed.get() >= 0) {
        status = copyContent(archive, unnamed.get(), target, cancel);
        if (!status) return status;
        copy.replace(copy.size() - 6, 6, std::to_string(getpid()));
        status = nameFile(unnamed.get(), copy, target);
    } else {
        const QVImportFileDescriptor file(mkostemp(copy.data(), O_CLOEXEC));  // of mode 0600
        if (file.get() < 0) return VSErrorFromSystem(errno, target.string());
        status = copyContent(archive, file.get(), target, cancel);
    }
    if (status) status = QVMoveExportArchive(copy, target);
    if (!status) unlink(copy.c_str());
    return status;
}
