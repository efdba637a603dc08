#include "Qelvar/Export/QVExportArchive.h"

#include <archive.h>
#include <archive_entry.h>
#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "Qelvar/Import/QVUtf8Locale.h"
#include "Vessa/Base/VSFileDescriptor.h"
#include "Vessa/VSDatabase.h"

namespace {

namespace fs = std::filesystem;

constexpr size_t kReadSize = 8192;
/// The archive's comment. Never change it: what is not known as an export is not replaced unasked.
constexpr std::string_view kComment = "Qelvar export";
/// The last part of a zip archive without a comment: its signature, ..., the comment's length in two bytes.
constexpr size_t kEndSize = 22;
constexpr std::string_view kEndSignature = "PK\5\6", kBeginSignature = "PK\3\4";

struct WriterFree {
    void operator()(archive* a) const { archive_write_free(a); }
};
struct EntryFree {
    void operator()(archive_entry* entry) const { archive_entry_free(entry); }
};

class Packing {
 public:
    Packing(const QVExportFile& file, const QVExportPackingProgress& progress)
        : file_(file), progress_(progress) {}

    VSStatus open() {
        archive_.reset(archive_write_new());
        if (archive_write_set_format_zip(archive_.get()) != ARCHIVE_OK ||
            archive_write_open_fd(archive_.get(), file_.descriptor) != ARCHIVE_OK)
            return failure();
        return {};
    }

    VSStatus add(const QVExportFile& folder, const std::string& name) {
        const fs::path file = folder.path / name;
        const VSFileDescriptor source(
            openat(folder.descriptor, name.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW));
        struct statx status {};
        if (source.get() < 0 ||
            statx(source.get(), "", AT_EMPTY_PATH, STATX_BASIC_STATS | STATX_BTIME, &status) != 0)
            return VSErrorFromSystem(errno, file.string());
        const std::unique_ptr<archive_entry, EntryFree> entry(archive_entry_new());
        archive_entry_set_pathname_utf8(entry.get(), name.c_str());
        archive_entry_set_size(entry.get(), static_cast<int64_t>(status.stx_size));
        archive_entry_set_filetype(entry.get(), AE_IFREG);
        archive_entry_set_perm(entry.get(), 0644);
        archive_entry_set_mtime(entry.get(), status.stx_mtime.tv_sec, status.stx_mtime.tv_nsec);
        if (status.stx_mask & STATX_BTIME)
            archive_entry_set_birthtime(entry.get(), status.stx_btime.tv_sec, status.stx_btime.tv_nsec);
        if (archive_write_header(archive_.get(), entry.get()) != ARCHIVE_OK) return failure();
        return copy(source.get(), file, status.stx_size);
    }

    VSStatus close() {
        if (archive_write_close(archive_.get()) != ARCHIVE_OK) return failure();
        archive_.reset();
        if (VSStatus status = writeComment(); !status) return status;
        return fsync(file_.descriptor) == 0 ? VSStatus() : systemFailure();
    }

 private:
    VSStatus copy(int source, const fs::path& file, uint64_t size) {
        std::array<char, kReadSize> buffer;
        uint64_t done = 0;
        while (true) {
            const ssize_t count = read(source, buffer.data(), buffer.size());
            if (count < 0 && errno == EINTR) continue;
            if (count < 0) return VSErrorFromSystem(errno, file.string());
            if (count == 0) break;
            const auto bytes = static_cast<size_t>(count);
            if (archive_write_data(archive_.get(), buffer.data(), bytes) != count) return failure();
            done += bytes;
            packed_ += bytes;
            if (!progress_(packed_)) return VSError{VSErrorCode::Cancelled, "cancelled"};
        }
        if (done != size)
            return VSError{VSErrorCode::Failed, file.string() + ": the file could not be read as a whole"};
        return archive_write_finish_entry(archive_.get()) == ARCHIVE_OK ? VSStatus() : failure();
    }

    VSStatus writeComment() const {
        struct stat status {};
        if (fstat(file_.descriptor, &status) != 0) return systemFailure();
        const std::string comment = std::string{static_cast<char>(kComment.size()), 0}.append(kComment);
        const auto written = pwrite(file_.descriptor, comment.data(), comment.size(), status.st_size - 2);
        if (written < 0) return systemFailure();
        if (static_cast<size_t>(written) != comment.size() || !QVIsExportArchive(file_.descriptor))
            return VSErrorFromSystem(ENOSPC, file_.path.string());
        return {};
    }

    VSStatus systemFailure() const { return VSErrorFromSystem(errno, file_.path.string()); }

    VSStatus failure() const {
        const int reason = archive_errno(archive_.get());
        if (reason > 0) return VSErrorFromSystem(reason, file_.path.string());
        const char* text = archive_error_string(archive_.get());
        return VSError{VSErrorCode::Failed,
                       file_.path.string() + ": " + (text ? text : "the archive cannot be written")};
    }

    const QVExportFile& file_;
    const QVExportPackingProgress& progress_;
    std::unique_ptr<archive, WriterFree> archive_;
    uint64_t packed_ = 0;
};

/// In the order of their names.
VSResult<std::vector<std::string>> filesIn(const QVExportFile& folder) {
    const int copy = openat(folder.descriptor, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    const std::unique_ptr<DIR, int (*)(DIR*)> entries(copy < 0 ? nullptr : fdopendir(copy), closedir);
    if (!entries) return VSErrorFromSystem(errno, folder.path.string());
    std::vector<std::string> names;
    while (const dirent* entry = readdir(entries.get()))
        if (entry->d_name[0] != '.') names.emplace_back(entry->d_name);
    std::sort(names.begin(), names.end());
    return names;
}

}  // namespace

VSStatus QVArchiveExportDirectory(const QVExportFile& folder, const QVExportFile& archive,
                                  const QVExportPackingProgress& progress) {
    const QVUtf8Locale locale;
    const auto files = filesIn(folder);
    if (!files) return files.error();
    Packing packing(archive, progress);
    if (VSStatus status = packing.open(); !status) return status;
    for (const std::string& file : *files) {
        if (VSStatus status = packing.add(folder, file); !status) return status;
    }
    return packing.close();
}

bool QVIsExportArchive(int file) {
    struct stat status {};
    std::array<char, kEndSize + kComment.size()> end{};
    std::array<char, kBeginSignature.size()> begin{};
    if (fstat(file, &status) != 0 || status.st_size < static_cast<off_t>(end.size())) return false;
    const off_t at = status.st_size - static_cast<off_t>(end.size());
    if (pread(file, end.data(), end.size(), at) != static_cast<ssize_t>(end.size()) ||
        pread(file, begin.data(), begin.size(), 0) != static_cast<ssize_t>(begin.size()))
        return false;
    const std::string_view last(end.data(), end.size());
    return std::string_view(begin.data(), begin.size()) == kBeginSignature &&
           last.starts_with(kEndSignature) && static_cast<size_t>(last[kEndSize - 2]) == kComment.size() &&
           last[kEndSize - 1] == 0 && last.ends_with(kComment);
}
