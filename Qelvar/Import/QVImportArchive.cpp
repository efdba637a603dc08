#include "Qelvar/Import/QVImportArchive.h"

#include <archive.h>
#include <archive_entry.h>

#include <algorithm>
#include <cstring>

#include "Qelvar/Import/QVImportText.h"
#include "Qelvar/Import/QVUtf8Locale.h"

namespace {

// A real document shrinks to a twentieth or a fortieth. More than a hundred times an archive's size is a trap
// and not a record of anything; small archives may be as repetitive as they like.
constexpr uint64_t kAlwaysAllowedBytes = 100'000'000;
constexpr uint64_t kGreatestExpansion = 100;
constexpr size_t kBlockSize = 256 * 1024;
constexpr size_t kSniffedBytes = 1024;
constexpr size_t kListedNotes = 100;

struct ArchiveCloser {
    void operator()(archive* a) const { archive_read_free(a); }
};
using ArchivePointer = std::unique_ptr<archive, ArchiveCloser>;

/// Whether a path would leave the folder that it is unpacked in. Nothing is unpacked here; but an archive
/// that tries it is not what it says.
bool leavesItsFolder(std::string_view name) {
    if (name.empty()) return false;
    if (name[0] == '/' || name[0] == '\\') return true;
    if (name.size() >= 2 && name[1] == ':' && (name.size() == 2 || name[2] == '\\' || name[2] == '/'))
        return true;
    while (true) {
        const size_t end = name.find_first_of("/\\");
        if (name.substr(0, end) == "..") return true;
        if (end == std::string_view::npos) return false;
        name.remove_prefix(end + 1);
    }
}

/// Whether the bytes may begin an XML document: "<" after a byte order mark and blanks, in 8 or 16 bits.
bool looksLikeMarkup(std::string_view bytes) {
    for (const std::string_view mark : {"\xEF\xBB\xBF", "\xFF\xFE", "\xFE\xFF"}) {
        if (bytes.starts_with(mark)) bytes.remove_prefix(mark.size());
    }
    for (const char c : bytes) {
        if (c == '<') return true;
        if (c != ' ' && c != '\t' && c != '\r' && c != '\n' && c != '\0') return false;
    }
    return false;
}

class ArchiveFile final : public QVImportFile {
 public:
    ArchiveFile(const std::filesystem::path& path, QVImportFileDescriptor file, uint64_t size)
        : name_(path.filename().string()),
          size_(size),
          file_(std::move(file)),
          archive_(archive_read_new()) {}

    VSStatus open() {
        // Only by the directory at its end: what a truncated archive still holds is not all that its writer
        // put in.
        if (archive_read_support_format_zip_seekable(archive_.get()) != ARCHIVE_OK ||
            lseek(file_.get(), 0, SEEK_SET) != 0 ||
            archive_read_open_fd(archive_.get(), file_.get(), kBlockSize) != ARCHIVE_OK) {
            return invalid("the archive cannot be read: it is truncated or damaged");
        }
        return {};
    }

    VSResult<bool> nextDocument() override {
        const QVUtf8Locale locale;
        while (true) {
            archive_entry* entry = nullptr;
            const int result = archive_read_next_header(archive_.get(), &entry);
            if (result == ARCHIVE_EOF) return false;
            if (result != ARCHIVE_OK && result != ARCHIVE_WARN) return damaged();
            auto taken = takeEntry(entry);
            if (!taken || *taken) return taken;
        }
    }

    VSResult<size_t> read(char* buffer, size_t size) override {
        if (!beginning_.empty()) {
            const size_t count = std::min(size, beginning_.size());
            std::memcpy(buffer, beginning_.data(), count);
            beginning_.erase(0, count);
            return count;
        }
        return inflate(buffer, size);
    }

    const std::string& documentName() const override { return documentName_; }
    bool isArchive() const override { return true; }
    uint64_t bytesDone() const override {
        const int64_t done = archive_filter_bytes(archive_.get(), -1);
        return std::clamp<uint64_t>(done < 0 ? 0 : static_cast<uint64_t>(done), 0, size_);
    }
    uint64_t bytesTotal() const override { return size_; }
    const std::vector<std::string>& notes() const override { return notes_; }

 private:
    VSError invalid(const std::string& text) const {
        return VSError{VSErrorCode::Invalid, name_ + ": " + text};
    }
    VSError damaged() const {
        const char* text = archive_error_string(archive_.get());
        return invalid(std::string("the archive is damaged") + (text ? std::string(" (") + text + ")" : ""));
    }
    void note(const std::string& text) {
        if (notes_.size() < kListedNotes) notes_.push_back(documentName_ + ": " + text);
    }

    /// Begins an entry; false when it is none to read.
    VSResult<bool> takeEntry(archive_entry* entry) {
        const char* text = archive_entry_pathname(entry);
        const std::string entryName = text ? text : "";
        documentName_ = name_ + ":" + entryName;
        if (leavesItsFolder(entryName))
            return invalid("the entry " + QVImportQuoted(entryName) + " names a place outside the archive");
        if (archive_entry_filetype(entry) == AE_IFDIR) return false;
        if (archive_entry_filetype(entry) != AE_IFREG) return skipped("not a file; passed over");
        if (archive_entry_is_encrypted(entry))
            return invalid("the entry " + QVImportQuoted(entryName) + " is encrypted");
        beginning_.resize(kSniffedBytes);
        const auto count = inflate(beginning_.data(), beginning_.size());
        if (!count) return count.error();
        beginning_.resize(*count);
        if (!looksLikeMarkup(beginning_)) return skipped("not an XML document; passed over");
        return true;
    }

    VSResult<bool> skipped(const std::string& why) {
        note(why);
        return false;
    }

    VSResult<size_t> inflate(char* buffer, size_t size) {
        const la_ssize_t count = archive_read_data(archive_.get(), buffer, size);
        if (count < 0) return damaged();
        inflated_ += static_cast<uint64_t>(count);
        if (inflated_ > kAlwaysAllowedBytes && inflated_ / kGreatestExpansion > size_) {
            return invalid("the archive expands to more than " + std::to_string(kGreatestExpansion) +
                           " times its size; it holds no real records");
        }
        return static_cast<size_t>(count);
    }

    const std::string name_;
    const uint64_t size_;
    QVImportFileDescriptor file_;
    ArchivePointer archive_;
    std::string documentName_;
    std::string beginning_;
    uint64_t inflated_ = 0;
    std::vector<std::string> notes_;
};

}  // namespace

VSResult<std::unique_ptr<QVImportFile>> QVOpenImportArchive(const std::filesystem::path& path,
                                                            QVImportFileDescriptor file, uint64_t size) {
    auto archive = std::make_unique<ArchiveFile>(path, std::move(file), size);
    if (const VSStatus status = archive->open(); !status) return status.error();
    return std::unique_ptr<QVImportFile>(std::move(archive));
}
