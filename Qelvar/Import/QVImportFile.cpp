#include "Qelvar/Import/QVImportFile.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "Qelvar/Import/QVImportArchive.h"
#include "Qelvar/Import/QVImportFileDescriptor.h"
#include "Vessa/VSStoreGuard.h"

namespace {

constexpr int kPollMilliseconds = 100;
constexpr size_t kSniffedBytes = 1024;

VSError systemError(const std::filesystem::path& path, int error) {
    const VSErrorCode code = error == ENOENT || error == ENOTDIR ? VSErrorCode::NotFound
                             : error == EACCES || error == EPERM ? VSErrorCode::Refused
                                                                 : VSErrorCode::Failed;
    return VSError{code, path.string() + ": " + std::strerror(error)};
}

/// A plain file or a pipe: one document.
class PlainFile final : public QVImportFile {
 public:
    PlainFile(const std::filesystem::path& path, QVImportFileDescriptor file, uint64_t size,
              std::string beginning, const std::atomic<bool>* cancel)
        : path_(path),
          cancel_(cancel),
          name_(path.filename().string()),
          size_(size),
          file_(std::move(file)),
          beginning_(std::move(beginning)) {}

    VSResult<bool> nextDocument() override { return !std::exchange(begun_, true); }
    VSResult<size_t> read(char* buffer, size_t size) override {
        if (!beginning_.empty()) {
            const size_t count = std::min(size, beginning_.size());
            std::memcpy(buffer, beginning_.data(), count);
            beginning_.erase(0, count);
            done_ += count;
            return count;
        }
        auto count = QVReadWaiting(file_, path_, buffer, size, cancel_);
        if (count) done_ += *count;
        return count;
    }
    const std::string& documentName() const override { return name_; }
    bool isArchive() const override { return false; }
    uint64_t bytesDone() const override { return done_; }
    uint64_t bytesTotal() const override { return size_; }
    const std::vector<std::string>& notes() const override { return notes_; }

 private:
    const std::filesystem::path path_;
    const std::atomic<bool>* const cancel_;
    const std::string name_;
    const uint64_t size_;
    const std::vector<std::string> notes_;
    QVImportFileDescriptor file_;
    std::string beginning_;  // what was read to see what the file is
    uint64_t done_ = 0;
    bool begun_ = false;
};

bool isArchiveMagic(std::string_view beginning) {
    return beginning.starts_with(std::string_view("PK\x03\x04", 4));
}

/// What tells what the file is; fewer bytes when it is shorter.
VSResult<std::string> firstBytes(const QVImportFileDescriptor& file, const std::filesystem::path& path,
                                 const std::atomic<bool>* cancel) {
    std::string beginning;
    char buffer[kSniffedBytes];
    while (beginning.size() < kSniffedBytes) {
        const auto count = QVReadWaiting(file, path, buffer, kSniffedBytes - beginning.size(), cancel);
        if (!count) return count.error();
        if (*count == 0) break;
        beginning.append(buffer, *count);
    }
    return beginning;
}

}  // namespace

VSResult<size_t> QVReadWaiting(const QVImportFileDescriptor& file, const std::filesystem::path& path,
                               char* buffer, size_t size, const std::atomic<bool>* cancel) {
    while (true) {
        if (cancel && cancel->load(std::memory_order_relaxed))
            return VSError{VSErrorCode::Cancelled, "cancelled"};
        pollfd wait{file.get(), POLLIN, 0};
        const int ready = poll(&wait, 1, kPollMilliseconds);
        if (ready == 0 || (ready < 0 && errno == EINTR)) continue;
        const ssize_t count = ::read(file.get(), buffer, size);
        if (count >= 0) return static_cast<size_t>(count);
        if (errno != EINTR && errno != EAGAIN) return systemError(path, errno);
    }
}

VSResult<std::unique_ptr<QVImportFile>> QVImportFile::open(const std::filesystem::path& path,
                                                           const std::atomic<bool>* cancel,
                                                           QVRecognisedFile* recognised) {
    // The store that takes the records, most likely. To open and close its files here would take SQLite's
    // locks.
    if (VSIsOpenStoreFile(path))
        return VSError{VSErrorCode::Refused, path.string() + ": is a file of the store that is open"};
    // Non-blocking, so that a pipe that nobody writes to can be given up; regular files do not care.
    QVImportFileDescriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY | O_NONBLOCK));
    if (file.get() < 0) return systemError(path, errno);
    struct stat status {};
    if (fstat(file.get(), &status) != 0) return systemError(path, errno);
    const std::string name = path.filename().string();
    if (S_ISDIR(status.st_mode)) return QVUnfitFileError(path.string(), {QVFileKind::Folder, {}});
    const bool regular = S_ISREG(status.st_mode);
    auto beginning = firstBytes(file, path, cancel);
    if (!beginning) return beginning.error();
    const QVRecognisedFile looks = QVRecogniseBytes(*beginning);
    if (recognised) *recognised = looks;
    if (!looks.mayHoldRecords()) return QVUnfitFileError(name, looks);
    const uint64_t size = regular ? static_cast<uint64_t>(status.st_size) : 0;
    if (isArchiveMagic(*beginning)) {
        if (!regular)
            return VSError{VSErrorCode::Invalid,
                           path.string() + ": an archive can be read from a file only, not from a pipe"};
        return QVOpenImportArchive(path, std::move(file), size);
    }
    return std::unique_ptr<QVImportFile>(
        std::make_unique<PlainFile>(path, std::move(file), size, std::move(*beginning), cancel));
}

uint64_t QVImportFileSize(const std::filesystem::path& path) {
    std::error_code error;
    if (!std::filesystem::is_regular_file(path, error)) return 0;
    const auto size = std::filesystem::file_size(path, error);
    return error ? 0 : size;
}
