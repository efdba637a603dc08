#include "FaultyFileSystem.h"

#include <sqlite3.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <new>

namespace test {

namespace {

using Kind = FaultyFileSystem::Kind;
using Event = FaultyFileSystem::Event;

FaultyFileSystem* current = nullptr;

/// What SQLite holds of an open file: ours, and behind it in the same memory the real one's.
struct OpenFile {
    sqlite3_file base;
    std::string* path;  // null: a temporary file
    sqlite3_file* real() { return reinterpret_cast<sqlite3_file*>(this + 1); }
};

OpenFile& own(sqlite3_file* file) {
    return *reinterpret_cast<OpenFile*>(file);
}

int closeFile(sqlite3_file* file) {
    OpenFile& open = own(file);
    const int code = open.real()->pMethods ? open.real()->pMethods->xClose(open.real()) : SQLITE_OK;
    delete open.path;
    open.path = nullptr;
    return code;
}

int readFile(sqlite3_file* file, void* bytes, int size, sqlite3_int64 offset) {
    if (current->fails(Kind::Read)) return SQLITE_IOERR_READ;
    return own(file).real()->pMethods->xRead(own(file).real(), bytes, size, offset);
}

int writeFile(sqlite3_file* file, const void* bytes, int size, sqlite3_int64 offset) {
    OpenFile& open = own(file);
    const auto write = [&](int count) {
        const int code = open.real()->pMethods->xWrite(open.real(), bytes, count, offset);
        if (open.path)
            current->note(
                {Event::Write, {}, offset, {static_cast<const char*>(bytes), static_cast<size_t>(count)}},
                *open.path);
        return code;
    };
    sqlite3_int64 length = 0;
    open.real()->pMethods->xFileSize(open.real(), &length);
    if (!current->fails(offset + size > length ? Kind::Grow : Kind::Write)) return write(size);
    const int reason = errno;
    if (size > 1) write(size / 2);
    errno = reason;
    return current->isFull() ? SQLITE_FULL : SQLITE_IOERR_WRITE;
}

int truncateFile(sqlite3_file* file, sqlite3_int64 size) {
    OpenFile& open = own(file);
    if (current->fails(Kind::Truncate)) return SQLITE_IOERR_TRUNCATE;
    if (open.path) current->note({Event::Truncate, {}, size, {}}, *open.path);
    return open.real()->pMethods->xTruncate(open.real(), size);
}

/// The machine does not stop in a test, so the real disk need not be waited for.
int syncFile(sqlite3_file* file, int) {
    OpenFile& open = own(file);
    if (current->fails(Kind::Sync)) return SQLITE_IOERR_FSYNC;
    if (open.path) current->note({Event::Sync, {}, 0, {}}, *open.path);
    return SQLITE_OK;
}

int fileSize(sqlite3_file* file, sqlite3_int64* size) {
    return own(file).real()->pMethods->xFileSize(own(file).real(), size);
}
int lock(sqlite3_file* file, int level) {
    return own(file).real()->pMethods->xLock(own(file).real(), level);
}
int unlock(sqlite3_file* file, int level) {
    return own(file).real()->pMethods->xUnlock(own(file).real(), level);
}
int checkReservedLock(sqlite3_file* file, int* locked) {
    return own(file).real()->pMethods->xCheckReservedLock(own(file).real(), locked);
}
int fileControl(sqlite3_file* file, int operation, void* argument) {
    return own(file).real()->pMethods->xFileControl(own(file).real(), operation, argument);
}
int sectorSize(sqlite3_file*) {
    return 512;
}
int characteristics(sqlite3_file* file) {
    return own(file).real()->pMethods->xDeviceCharacteristics(own(file).real());
}
int mapMemory(sqlite3_file* file, int region, int size, int extend, void volatile** memory) {
    if (current->fails(Kind::SharedMemory)) return SQLITE_IOERR_SHMSIZE;
    return own(file).real()->pMethods->xShmMap(own(file).real(), region, size, extend, memory);
}
int lockMemory(sqlite3_file* file, int offset, int count, int flags) {
    return own(file).real()->pMethods->xShmLock(own(file).real(), offset, count, flags);
}
void memoryBarrier(sqlite3_file* file) {
    own(file).real()->pMethods->xShmBarrier(own(file).real());
}
int unmapMemory(sqlite3_file* file, int remove) {
    return own(file).real()->pMethods->xShmUnmap(own(file).real(), remove);
}

constexpr sqlite3_io_methods methods{
    2,          closeFile,     readFile,          writeFile,   truncateFile, syncFile,        fileSize,
    lock,       unlock,        checkReservedLock, fileControl, sectorSize,   characteristics, mapMemory,
    lockMemory, memoryBarrier, unmapMemory,       nullptr,     nullptr};

int openFile(sqlite3_vfs*, const char* name, sqlite3_file* file, int flags, int* outFlags) {
    auto* open = new (file) OpenFile{{nullptr}, nullptr};
    std::memset(open->real(), 0, static_cast<size_t>(current->real()->szOsFile));
    int exists = 1;
    if (name) current->real()->xAccess(current->real(), name, SQLITE_ACCESS_EXISTS, &exists);
    if (current->isReadOnly() && name) {
        // As SQLite's own does where the system refuses to open a file for writing.
        if (!exists) return SQLITE_CANTOPEN;
        flags = (flags & ~(SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE)) | SQLITE_OPEN_READONLY;
    }
    if (current->fails(exists ? Kind::Open : Kind::Create)) return SQLITE_CANTOPEN;
    const int code = current->real()->xOpen(current->real(), name, open->real(), flags, outFlags);
    if (open->real()->pMethods) open->base.pMethods = &methods;
    if (name) open->path = new std::string(name);
    if (code == SQLITE_OK && !exists) current->note({Event::Open, {}, 0, {}}, name);
    return code;
}

int deleteFile(sqlite3_vfs*, const char* name, int syncFolder) {
    if (current->isReadOnly() || current->fails(Kind::Delete)) return SQLITE_IOERR_DELETE;
    const int code = current->real()->xDelete(current->real(), name, syncFolder);
    if (code == SQLITE_OK) {
        current->note({Event::Delete, {}, 0, {}}, name);
        if (syncFolder) current->note({Event::SyncFolder, {}, 0, {}}, name);
    }
    return code;
}

int access(sqlite3_vfs*, const char* name, int flags, int* result) {
    return current->real()->xAccess(current->real(), name, flags, result);
}
int fullPathname(sqlite3_vfs*, const char* name, int size, char* out) {
    return current->real()->xFullPathname(current->real(), name, size, out);
}
int randomness(sqlite3_vfs*, int size, char* out) {
    return current->real()->xRandomness(current->real(), size, out);
}
int sleep(sqlite3_vfs*, int microseconds) {
    return current->real()->xSleep(current->real(), microseconds);
}
int currentTime(sqlite3_vfs*, double* time) {
    return current->real()->xCurrentTime(current->real(), time);
}
int lastSystemError(sqlite3_vfs*, int, char*) {
    return errno;
}
int currentTimeInteger(sqlite3_vfs*, sqlite3_int64* time) {
    return current->real()->xCurrentTimeInt64(current->real(), time);
}

}  // namespace

FaultyFileSystem::FaultyFileSystem() : real_(sqlite3_vfs_find(nullptr)), vfs_(new sqlite3_vfs{}) {
    vfs_->iVersion = 2;
    vfs_->szOsFile = static_cast<int>(sizeof(OpenFile)) + real_->szOsFile;
    vfs_->mxPathname = real_->mxPathname;
    vfs_->zName = "faulty";
    vfs_->xOpen = openFile;
    vfs_->xDelete = deleteFile;
    vfs_->xAccess = access;
    vfs_->xFullPathname = fullPathname;
    vfs_->xRandomness = randomness;
    vfs_->xSleep = sleep;
    vfs_->xCurrentTime = currentTime;
    vfs_->xGetLastError = lastSystemError;
    vfs_->xCurrentTimeInt64 = currentTimeInteger;
    current = this;
    sqlite3_vfs_register(vfs_.get(), 1);
}

FaultyFileSystem::~FaultyFileSystem() {
    sqlite3_vfs_register(real_, 1);
    sqlite3_vfs_unregister(vfs_.get());
    current = nullptr;
}

void FaultyFileSystem::failAt(int n, Fault fault, bool reads) {
    std::lock_guard lock(mutex_);
    armed_ = true;
    reads_ = reads;
    failing_ = n;
    fault_ = fault;
    count_ = 0;
}

void FaultyFileSystem::heal() {
    std::lock_guard lock(mutex_);
    armed_ = false;
    count_ = 0;
}

int FaultyFileSystem::operations() const {
    std::lock_guard lock(mutex_);
    return count_;
}

bool FaultyFileSystem::fails(Kind kind) {
    std::lock_guard lock(mutex_);
    if (kind == Kind::Read && !reads_) return false;
    const int number = count_++;
    if (!armed_ || number < failing_) return false;
    bool failing = false;
    switch (fault_) {
        case Fault::OneFailure:
            failing = number == failing_;
            break;
        case Fault::BrokenDisk:
            failing = true;
            break;
        case Fault::FullDisk:
            failing = kind == Kind::Create || kind == Kind::Grow || kind == Kind::SharedMemory;
            break;
        case Fault::ReadOnlyDisk:
            failing = kind == Kind::Create || kind == Kind::Write || kind == Kind::Grow ||
                      kind == Kind::Truncate || kind == Kind::SharedMemory;
            break;
    }
    if (failing) errno = fault_ == Fault::FullDisk ? ENOSPC : EIO;
    return failing;
}

bool FaultyFileSystem::isFull() const {
    std::lock_guard lock(mutex_);
    return armed_ && fault_ == Fault::FullDisk;
}

bool FaultyFileSystem::isReadOnly() const {
    std::lock_guard lock(mutex_);
    return armed_ && fault_ == Fault::ReadOnlyDisk;
}

void FaultyFileSystem::startRecording(const std::filesystem::path& folder) {
    std::lock_guard lock(mutex_);
    recording_ = true;
    folder_ = folder.string();
    events_.clear();
}

std::vector<Event> FaultyFileSystem::recorded() const {
    std::lock_guard lock(mutex_);
    return events_;
}

size_t FaultyFileSystem::recordedCount() const {
    std::lock_guard lock(mutex_);
    return events_.size();
}

void FaultyFileSystem::note(Event event, const std::string& path) {
    std::lock_guard lock(mutex_);
    if (!recording_ || std::filesystem::path(path).parent_path() != folder_) return;
    event.name = std::filesystem::path(path).filename();
    events_.push_back(std::move(event));
}

// DiskModel

DiskModel::DiskModel(const std::filesystem::path& folder) {
    for (const auto& entry : std::filesystem::directory_iterator(folder)) {
        std::ifstream stream(entry.path(), std::ios::binary);
        auto file = std::make_shared<File>();
        file->durable = {std::istreambuf_iterator<char>(stream), {}};
        files_[entry.path().filename()] = file;
    }
    durable_ = files_;
}

void DiskModel::syncFolder() {
    durable_ = files_;
    for (const auto& [name, file] : files_) file->entryPending = false;
}

void DiskModel::play(const FaultyFileSystem::Event& event) {
    switch (event.kind) {
        case FaultyFileSystem::Event::Open:
            files_[event.name] = std::make_shared<File>();
            files_[event.name]->entryPending = true;
            return;
        case FaultyFileSystem::Event::Delete:
            files_.erase(event.name);
            return;
        case FaultyFileSystem::Event::SyncFolder:
            syncFolder();
            return;
        default:
            break;
    }
    auto& file = files_[event.name];
    if (!file) file = std::make_shared<File>();  // made by other means
    if (event.kind != FaultyFileSystem::Event::Sync) {
        file->pending.push_back(event);
        return;
    }
    for (const auto& pending : file->pending) apply(file->durable, pending, nullptr);
    file->pending.clear();
    // SQLite's own file system syncs the folder with the first sync of a journal or log that it made.
    if (file->entryPending) syncFolder();
}

void DiskModel::apply(std::string& bytes, const FaultyFileSystem::Event& event, std::mt19937* torn) {
    constexpr size_t sector = 512;
    const auto offset = static_cast<size_t>(event.offset);
    if (event.kind == FaultyFileSystem::Event::Truncate) {
        if (bytes.size() > offset) bytes.resize(offset);
        return;
    }
    for (size_t at = 0; at < event.bytes.size();) {
        const size_t size = std::min(sector - (offset + at) % sector, event.bytes.size() - at);
        if (!torn || (*torn)() % 2) {
            if (bytes.size() < offset + at + size) bytes.resize(offset + at + size);
            std::memcpy(bytes.data() + offset + at, event.bytes.data() + at, size);
        }
        at += size;
    }
}

void DiskModel::cut(const std::filesystem::path& into, std::mt19937& random) const {
    // Names: each change since the folder's last sync has landed or not.
    std::map<std::string, std::shared_ptr<File>> names = durable_;
    for (const auto& [name, file] : files_) {
        const auto known = durable_.find(name);
        if (known != durable_.end() && known->second == file) continue;
        if (random() % 2) names[name] = file;
    }
    for (const auto& [name, file] : durable_) {
        if (!files_.contains(name) && random() % 2) names.erase(name);
    }
    for (const auto& [name, file] : names) {
        if (name.ends_with("-shm")) continue;  // made anew by whoever comes first
        std::string bytes = file->durable;
        const unsigned manner = random() % 4;  // nothing, all, some whole, some torn
        for (const auto& event : file->pending) {
            if (manner == 0 || (manner >= 2 && random() % 2)) continue;
            apply(bytes, event, manner == 3 ? &random : nullptr);
        }
        std::ofstream(into / name, std::ios::binary) << bytes;
    }
}

}  // namespace test
