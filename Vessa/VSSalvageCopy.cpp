#include "Vessa/VSSalvageCopy.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <bit>
#include <cerrno>
#include <cstring>
#include <optional>
#include <vector>

#include "Vessa/VSDatabase.h"

namespace {

namespace fs = std::filesystem;

[[noreturn]] void failWithSystem(const fs::path& file) {
    throw VSDatabaseFailure(VSErrorFromSystem(errno, file.string()));
}

class File {
 public:
    File(const fs::path& path, int flags) : path_(path) {
        descriptor_ = ::open(path.c_str(), flags | O_CLOEXEC, 0600);
    }
    ~File() {
        if (descriptor_ >= 0) ::close(descriptor_);
    }
    File(const File&) = delete;
    File& operator=(const File&) = delete;
    bool isOpen() const { return descriptor_ >= 0; }
    int descriptor() const { return descriptor_; }
    const fs::path& path() const { return path_; }

    /// How much could be read; less at the end of the file. A sector that the disk cannot read is zeroes.
    size_t read(void* bytes, size_t size, int64_t offset) const {
        size_t done = 0;
        while (done < size) {
            const ssize_t count = ::pread(descriptor_, static_cast<char*>(bytes) + done, size - done,
                                          offset + static_cast<int64_t>(done));
            if (count == 0) break;
            if (count < 0 && errno == EINTR) continue;
            if (count < 0 && errno != EIO) failWithSystem(path_);
            if (count < 0) {
                constexpr size_t sector = 4096;
                const size_t part = std::min(sector, size - done);
                std::memset(static_cast<char*>(bytes) + done, 0, part);
                done += part;
                continue;
            }
            done += static_cast<size_t>(count);
        }
        return done;
    }
    void write(const void* bytes, size_t size, int64_t offset) const {
        for (size_t done = 0; done < size;) {
            const ssize_t count = ::pwrite(descriptor_, static_cast<const char*>(bytes) + done, size - done,
                                           offset + static_cast<int64_t>(done));
            if (count < 0 && errno == EINTR) continue;
            if (count <= 0) failWithSystem(path_);
            done += static_cast<size_t>(count);
        }
    }

 private:
    const fs::path path_;
    int descriptor_ = -1;
};

/// SQLite's lock of whoever has the file open in write-ahead mode: these bytes, shared.
struct flock sharedLock(short kind) {
    struct flock lock {};
    lock.l_type = kind;
    lock.l_whence = SEEK_SET;
    lock.l_start = 0x40000000 + 2;
    lock.l_len = 510;
    return lock;
}

void keepOthersOut(const File& file, bool writable) {
    struct flock lock = sharedLock(F_WRLCK);
    if (::fcntl(file.descriptor(), F_GETLK, &lock) == 0 && lock.l_type != F_UNLCK)
        throw VSDatabaseFailure({VSErrorCode::NotAccessible,
                                 file.path().string() + " is open in another program; close it first"});
    lock = sharedLock(F_WRLCK);
    if (writable && ::fcntl(file.descriptor(), F_SETLK, &lock) != 0)
        throw VSDatabaseFailure({VSErrorCode::NotAccessible,
                                 file.path().string() + " is open in another program; close it first"});
}

void copyAll(const File& from, const File& to) {
    struct stat status {};
    if (::fstat(from.descriptor(), &status) != 0) failWithSystem(from.path());
    std::vector<char> buffer(1 << 20);
    for (int64_t offset = 0; offset < status.st_size;) {
        const size_t count = from.read(buffer.data(), buffer.size(), offset);
        if (count == 0) break;
        to.write(buffer.data(), count, offset);
        offset += static_cast<int64_t>(count);
    }
}

uint32_t bigEndian(const uint8_t* bytes) {
    return uint32_t{bytes[0]} << 24 | uint32_t{bytes[1]} << 16 | uint32_t{bytes[2]} << 8 | bytes[3];
}

/// The log's running checksum.
struct Checksum {
    uint32_t first = 0, second = 0;
    void add(const uint8_t* bytes, size_t size, bool bigEndianWords) {
        const auto word = [&](size_t at) {
            const uint32_t value = bigEndian(bytes + at);
            return bigEndianWords ? value : __builtin_bswap32(value);
        };
        for (size_t at = 0; at + 8 <= size; at += 8) {
            first += word(at) + second;
            second += word(at + 4) + first;
        }
    }
    bool is(const uint8_t* bytes) const {
        return bigEndian(bytes) == first && bigEndian(bytes + 4) == second;
    }
};

/// Writes the pages of the log's commits into the copy, as whoever opened the store next would have done: up
/// to the last whole commit before the first frame that is damaged or of an older turn of the log.
void applyLog(const File& log, const File& copy) {
    constexpr size_t headSize = 32, frameHeadSize = 24;
    std::array<uint8_t, headSize> head{};
    if (log.read(head.data(), headSize, 0) != headSize) return;
    const uint32_t magic = bigEndian(head.data());
    const uint32_t pageSize = bigEndian(head.data() + 8);
    if ((magic | 1) != 0x377f0683 || pageSize < 512 || pageSize > 65536 || !std::has_single_bit(pageSize))
        return;
    const bool bigEndianWords = magic & 1;
    Checksum start;
    start.add(head.data(), 24, bigEndianWords);
    if (!start.is(head.data() + 24)) return;

    std::vector<uint8_t> frame(frameHeadSize + pageSize);
    /// Calls block(page, pages of the file after this commit or 0) for the frames that hold, in order.
    const auto forEachFrame = [&](size_t limit, const auto& block) {
        Checksum sum = start;
        for (size_t index = 0; index < limit; ++index) {
            const auto offset = static_cast<int64_t>(headSize + index * frame.size());
            if (log.read(frame.data(), frame.size(), offset) != frame.size()) return;
            if (std::memcmp(frame.data() + 8, head.data() + 16, 8) != 0) return;
            sum.add(frame.data(), 8, bigEndianWords);
            sum.add(frame.data() + frameHeadSize, pageSize, bigEndianWords);
            if (!sum.is(frame.data() + 16)) return;
            block(index, bigEndian(frame.data()), bigEndian(frame.data() + 4));
        }
    };
    size_t committed = 0;
    int64_t pages = 0;
    forEachFrame(SIZE_MAX, [&](size_t index, uint32_t, uint32_t size) {
        if (!size) return;
        committed = index + 1;
        pages = size;
    });
    if (!committed) return;
    forEachFrame(committed, [&](size_t, uint32_t page, uint32_t) {
        if (page) copy.write(frame.data() + frameHeadSize, pageSize, int64_t{page - 1} * pageSize);
    });
    if (::ftruncate(copy.descriptor(), pages * pageSize) != 0) failWithSystem(copy.path());
}

/// A journal is of a commit that was cut off: SQLite takes it back, where it can open the copy at all.
void rollBackJournal(const File& journal, const fs::path& copy) {
    {
        const File journalCopy(copy.string() + "-journal", O_WRONLY | O_CREAT | O_TRUNC);
        if (!journalCopy.isOpen()) failWithSystem(journalCopy.path());
        copyAll(journal, journalCopy);
    }
    try {
        VSDatabase(copy, VSDatabase::Mode::Write, VSDuration(0)).integer("PRAGMA user_version");
    } catch (const VSDatabaseFailure&) {
        // Then its pages are read as they are.
    }
}

}  // namespace

void VSCopyForSalvage(const std::filesystem::path& file, const std::filesystem::path& copy) {
    const File log(file.string() + "-wal", O_RDONLY), journal(file.string() + "-journal", O_RDONLY);
    {
        const File to(copy, O_RDWR | O_CREAT | O_TRUNC);
        if (!to.isOpen()) failWithSystem(copy);
        const File writable(file, O_RDWR);
        if (writable.isOpen()) {
            keepOthersOut(writable, true);
            copyAll(writable, to);
            if (log.isOpen()) applyLog(log, to);
        } else {
            const File from(file, O_RDONLY);
            if (!from.isOpen() && (errno != ENOENT || !log.isOpen())) failWithSystem(file);
            if (from.isOpen()) {
                keepOthersOut(from, false);
                copyAll(from, to);
            }
            if (log.isOpen()) applyLog(log, to);
        }
    }
    struct stat status {};
    if (journal.isOpen() && ::fstat(journal.descriptor(), &status) == 0 && status.st_size > 0)
        rollBackJournal(journal, copy);
}
