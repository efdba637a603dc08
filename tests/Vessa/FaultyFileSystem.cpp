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

FaultyFileSystem* current = nullptr;  // the one that lives

/// What we know of an open file, behind what the real file system knows of it in the memory that SQLite
/// gives. Its functions are the real ones but for those that may fail.
struct OpenFile {
    const sqlite3_io_methods* real = nullptr;
    sqlite3_io_methods ours{};
    std::string path;  // empty: a temporary file
};

OpenFile& own(sqlite3_file* file) {
    return *reinterpret_cast<OpenFile*>(reinterpret_cast<char*>(file) + current->real()->szOsFile);
}

void note(sqlite3_file* file, Event event) {
    if (!own(file).path.empty()) current->note(std::move(event), own(file).path);
}

int closeFile(sqlite3_file* file) {
    const int code = own(file).real->xClose(file);
    own(file).~OpenFile();
    return code;
}

int readFile(sqlite3_file* file, void* bytes, int size, sqlite3_int64 offset) {
    if (current->fails(Kind::Read)) return SQLITE_IOERR_READ;
    return own(file).real->xRead(file, bytes, size, offset);
}

int writeFile(sqlite3_file* file, const void* bytes, int size, sqlite3_int64 offset) {
    const auto write = [&](int count) {
        const int code = own(file).real->xWrite(file, bytes, count, offset);
        note(file, {Event::Write, {}, offset, {static_cast<const char*>(bytes), static_cast<size_t>(count)}});
        return code;
    };
    sqlite3_int64 length = 0;
    own(file).real->xFileSize(file, &length);
    if (!current->fails(offset + size > length ? Kind::Grow : Kind::Write)) return write(size);
    const int reason = errno;
    if (size > 1) write(size / 2);
    errno = reason;
    return current->isFull() ? SQLITE_FULL : SQLITE_IOERR_WRITE;
}

int truncateFile(sqlite3_file* file, sqlite3_int64 size) {
    if (current->fails(Kind::Truncate)) return SQLITE_IOERR_TRUNCATE;
    note(file, {Event::Truncate, {}, size, {}});
    return own(file).real->xTruncate(file, size);
}

/// The machine does not stop in a test, so the real disk need not be waited for.
int syncFile(sqlite3_file* file, int) {
    if (current->fails(Kind::Sync)) return SQLITE_IOERR_FSYNC;
    note(file, {Event::Sync, {}, 0, {}});
    return SQLITE_OK;
}

int mapMemory(sqlite3_file* file, int region, int size, int extend, void volatile** memory) {
    if (current->fails(Kind::SharedMemory)) return SQLITE_IOERR_SHMSIZE;
    return own(file).real->xShmMap(file, region, size, extend, memory);
}

int openFile(sqlite3_vfs* vfs, const char* name, sqlite3_file* file, int flags, int* outFlags) {
    file->pMethods = nullptr;
    int exists = 1;
    if (name) vfs->xAccess(vfs, name, SQLITE_ACCESS_EXISTS, &exists);
    if (current->fails(exists ? Kind::Open : Kind::Create)) return SQLITE_CANTOPEN;
    const int code = current->real()->xOpen(current->real(), name, file, flags, outFlags);
    if (code != SQLITE_OK) return code;
    OpenFile& open = *new (&own(file)) OpenFile{file->pMethods, *file->pMethods, name ? name : ""};
    open.ours.iVersion = 2;  // without memory maps of the file, which nothing could make fail
    open.ours.xClose = closeFile;
    open.ours.xRead = readFile;
    open.ours.xWrite = writeFile;
    open.ours.xTruncate = truncateFile;
    open.ours.xSync = syncFile;
    open.ours.xSectorSize = [](sqlite3_file*) { return 512; };
    open.ours.xShmMap = mapMemory;
    file->pMethods = &open.ours;
    if (!exists) current->note({Event::Open, {}, 0, {}}, name);
    return code;
}

int deleteFile(sqlite3_vfs*, const char* name, int syncFolder) {
    if (current->fails(Kind::Delete)) return SQLITE_IOERR_DELETE;
    const int code = current->real()->xDelete(current->real(), name, syncFolder);
    if (code == SQLITE_OK) {
        current->note({Event::Delete, {}, 0, {}}, name);
        if (syncFolder) current->note({Event::SyncFolder, {}, 0, {}}, name);
    }
    return code;
}

}  // namespace

FaultyFileSystem::FaultyFileSystem()
    : real_(sqlite3_vfs_find(nullptr)), vfs_(std::make_unique<sqlite3_vfs>(*real_)) {
    static_assert(alignof(OpenFile) <= 8);
    vfs_->pNext = nullptr;
    vfs_->szOsFile = real_->szOsFile + static_cast<int>(sizeof(OpenFile));
    vfs_->zName = "faulty";
    vfs_->xOpen = openFile;
    vfs_->xDelete = deleteFile;
    vfs_->xGetLastError = [](sqlite3_vfs*, int, char*) { return errno; };
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
    const bool needsSpace = kind == Kind::Create || kind == Kind::Grow || kind == Kind::SharedMemory;
    const bool failing = fault_ == Fault::OneFailure ? number == failing_
                         : fault_ == Fault::FullDisk ? needsSpace
                                                     : true;
    if (failing) errno = fault_ == Fault::FullDisk ? ENOSPC : EIO;
    return failing;
}

bool FaultyFileSystem::isFull() const {
    std::lock_guard lock(mutex_);
    return armed_ && fault_ == Fault::FullDisk;
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
