#include "Qelvar/Export/QVExportArchive.h"

#include <archive.h>
#include <archive_entry.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <memory>
#include <optional>
#include <vector>

#include "Qelvar/Import/QVImportFileDescriptor.h"
#include "Qelvar/Import/QVUtf8Locale.h"
#include "Vessa/VSDatabase.h"

namespace {

namespace fs = std::filesystem;

constexpr size_t kReadSize = 8192;

struct WriterFree {
    void operator()(archive* a) const { archive_write_free(a); }
};
struct EntryFree {
    void operator()(archive_entry* entry) const { archive_entry_free(entry); }
};

class Packing {
 public:
    Packing(const fs::path& file, const QVExportPackingProgress& progress)
        : path_(file), progress_(progress) {}

    VSStatus open() {
        file_.emplace(::open(path_.c_str(), O_WRONLY | O_TRUNC | O_CLOEXEC | O_NOFOLLOW));
        if (file_->get() < 0) return VSErrorFromSystem(errno, path_.string());
        archive_.reset(archive_write_new());
        if (archive_write_set_format_zip(archive_.get()) != ARCHIVE_OK ||
            archive_write_open_fd(archive_.get(), file_->get()) != ARCHIVE_OK)
            return failure();
        return {};
    }

    VSStatus add(const fs::path& file) {
        const QVImportFileDescriptor source(::open(file.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW));
        struct statx status {};
        if (source.get() < 0 ||
            statx(source.get(), "", AT_EMPTY_PATH, STATX_BASIC_STATS | STATX_BTIME, &status) != 0)
            return VSErrorFromSystem(errno, file.string());
        const std::unique_ptr<archive_entry, EntryFree> entry(archive_entry_new());
        archive_entry_set_pathname_utf8(entry.get(), file.filename().c_str());
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
        if (fsync(file_->get()) != 0) return VSErrorFromSystem(errno, path_.string());
        return {};
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

    VSStatus failure() const {
        const int reason = archive_errno(archive_.get());
        if (reason > 0) return VSErrorFromSystem(reason, path_.string());
        const char* text = archive_error_string(archive_.get());
        return VSError{VSErrorCode::Failed,
                       path_.string() + ": " + (text ? text : "the archive cannot be written")};
    }

    const fs::path& path_;
    const QVExportPackingProgress& progress_;
    std::optional<QVImportFileDescriptor> file_;
    std::unique_ptr<archive, WriterFree> archive_;
    uint64_t packed_ = 0;
};

}  // namespace

VSStatus QVArchiveExportDirectory(const fs::path& folder, const fs::path& archive,
                                  const QVExportPackingProgress& progress) {
    const QVUtf8Locale locale;
    std::error_code error;
    std::vector<fs::path> files;
    for (fs::directory_iterator entries(folder, error), end; !error && entries != end;
         entries.increment(error))
        files.push_back(entries->path());
    if (error) return VSErrorFromSystem(error.value(), folder.string());
    std::sort(files.begin(), files.end());
    Packing packing(archive, progress);
    if (VSStatus status = packing.open(); !status) return status;
    for (const fs::path& file : files) {
        if (VSStatus status = packing.add(file); !status) return status;
    }
    return packing.close();
}
