#include "Vessa/VSStoreGuard.h"

#include <fcntl.h>
#include <strings.h>
#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <set>
#include <vector>

#include "Vessa/VSDatabase.h"
#include "Vessa/VSStoreSchema.h"

namespace {

namespace fs = std::filesystem;

using Identity = std::pair<dev_t, ino_t>;

Identity identityOf(const struct stat& status) {
    return {status.st_dev, status.st_ino};
}

std::optional<struct stat> statusOf(int descriptor) {
    struct stat status {};
    if (fstat(descriptor, &status) != 0) return std::nullopt;
    return status;
}

std::optional<struct stat> statusOf(const fs::path& path) {
    struct stat status {};
    if (stat(path.c_str(), &status) != 0) return std::nullopt;
    return status;
}

/// Where an open folder is; what it was named where the system does not tell.
std::string placeOf(int folder, const fs::path& otherwise) {
    std::error_code error;
    const fs::path place = fs::read_symlink("/proc/self/fd/" + std::to_string(folder), error);
    return error ? otherwise.string() : place.string();
}

constexpr const char* sideFiles[] = {"-wal", "-shm", "-journal", "-copy"};

/// The names by which a folder is known as a store's.
const std::vector<std::string>& storeNames() {
    static const std::vector<std::string> names = [] {
        std::vector<std::string> all{VSStoreSchema::fileName, VSStoreSchema::noticeFileName};
        for (const char* suffix : sideFiles) all.push_back(std::string(VSStoreSchema::fileName) + suffix);
        for (int version = 1; version < VSStoreSchema::currentVersion; ++version)
            all.push_back("vessa.version-" + std::to_string(version) + ".sqlite");
        return all;
    }();
    return names;
}

/// Also where only a dangling link is left of the file.
bool holdsStore(int folder) {
    struct stat status {};
    for (const std::string& name : storeNames())
        if (fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0) return true;
    return false;
}

/// The folder of a store and all that is in it, and its files elsewhere when they are links.
struct Territory {
    std::set<Identity> folders, files;

    explicit Territory(const fs::path& store) {
        if (store.empty()) return;
        note(store);
        std::error_code error;
        fs::recursive_directory_iterator entry(store, fs::directory_options::skip_permission_denied, error);
        for (; !error && entry != fs::recursive_directory_iterator(); entry.increment(error)) {
            note(entry->path());
            // A store has few folders in folders; whoever made "/" one is not to wait for all of a disk.
            if (entry.depth() >= 3) entry.disable_recursion_pending();
            if (folders.size() + files.size() > 10'000) break;
        }
        const fs::path database = fs::canonical(store / VSStoreSchema::fileName, error);
        if (error) return;
        note(database);
        for (const char* suffix : sideFiles) note(fs::path(database).concat(suffix));
    }

 private:
    void note(const fs::path& path) {
        const auto status = statusOf(path);
        if (status) (S_ISDIR(status->st_mode) ? folders : files).insert(identityOf(*status));
    }
};

/// What the beginning of a file says that it is.
const char* kindOfStoreFile(int file) {
    std::array<uint8_t, 100> head{};
    const ssize_t size = pread(file, head.data(), head.size(), 0);
    const auto number = [&head](size_t at) {
        return uint32_t{head[at]} << 24 | uint32_t{head[at + 1]} << 16 | uint32_t{head[at + 2]} << 8 |
               head[at + 3];
    };
    constexpr uint32_t walMagic = 0x377f0682, walFormat = 3'007'000;
    if (size >= 32 && (number(0) & ~1U) == walMagic && number(4) == walFormat) return "the log of a database";
    const bool isDatabase =
        size == static_cast<ssize_t>(head.size()) && std::memcmp(head.data(), "SQLite format 3", 16) == 0;
    return isDatabase && number(68) == static_cast<uint32_t>(VSStoreSchema::applicationID)
               ? "the database of a store"
               : nullptr;
}

VSError refused(const fs::path& place, const std::string& what) {
    return {VSErrorCode::Refused, place.string() + " " + what};
}

/// The descriptor by which this process has the file open, standard input and output, which others opened,
/// apart; -1: none.
int descriptorOf(const Identity& wanted) {
    std::error_code error;
    for (fs::directory_iterator entry("/proc/self/fd", error), end; !error && entry != end;
         entry.increment(error)) {
        const int descriptor = std::atoi(entry->path().filename().c_str());
        if (descriptor <= STDERR_FILENO) continue;
        const auto status = statusOf(entry->path());
        if (status && identityOf(*status) == wanted) return descriptor;
    }
    return -1;
}

bool isOpenHere(const Identity& wanted) {
    return descriptorOf(wanted) >= 0;
}

bool isStoreName(const std::string& name) {
    for (const std::string& known : storeNames())
        if (strcasecmp(known.c_str(), name.c_str()) == 0) return true;
    return false;
}

/// Whether the name is that of a log, or the like, of a store's database beside it.
bool isSideFile(int folder, const std::string& name) {
    for (const std::string suffix : sideFiles) {
        if (!name.ends_with(suffix)) continue;
        const std::string database = name.substr(0, name.size() - suffix.size());
        struct stat status {};
        if (fstatat(folder, database.c_str(), &status, 0) != 0 || !S_ISREG(status.st_mode)) continue;
        if (isOpenHere(identityOf(status))) return true;
        const VSFileDescriptor file(openat(folder, database.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
        if (file.isOpen() && kindOfStoreFile(file.get())) return true;
    }
    return false;
}

}  // namespace

VSStatus VSStoreGuard::checkFolder(int folder, const fs::path& place) const {
    const Territory ours(store_);
    VSFileDescriptor here(openat(folder, ".", O_PATH | O_DIRECTORY | O_CLOEXEC));
    if (!here.isOpen()) return VSErrorFromSystem(errno, place.string());
    bool isPart = false;
    for (VSFileDescriptor above;;) {
        const auto status = statusOf(here.get());
        if (!status) return VSErrorFromSystem(errno, place.string());
        if (holdsStore(here.get()))
            return refused(place, "is not written: " + placeOf(here.get(), place) +
                                      " is the folder of a store, which holds nothing but the store");
        above = VSFileDescriptor(openat(here.get(), "..", O_PATH | O_DIRECTORY | O_CLOEXEC));
        const auto next = above.isOpen() ? statusOf(above.get()) : std::nullopt;
        isPart = isPart || ours.folders.contains(identityOf(*status));
        if (!next || identityOf(*next) == identityOf(*status)) break;
        here = std::move(above);
    }
    if (isPart) return refused(place, "is not written: it is in the store in " + store_.string());
    return {};
}

VSStatus VSStoreGuard::checkNewStore(const fs::path& folder) {
    const auto path = VSResolvedPath(folder);
    if (!path) return path.error();
    fs::path there = *path;
    VSFileDescriptor here(open(there.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
    if (here.isOpen() && holdsStore(here.get())) return {};
    while (!here.isOpen() && there.has_relative_path()) {
        there = there.parent_path();
        here = VSFileDescriptor(open(there.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC));
    }
    return here.isOpen() ? VSStoreGuard().checkFolder(here.get(), folder) : VSStatus();
}

VSStatus VSStoreGuard::checkFile(int folder, const std::string& name, const fs::path& place) const {
    if (isStoreName(name)) return refused(place, "is not written: the name is that of a store's file");
    struct stat status {};
    if (fstatat(folder, name.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) {
        if (errno != ENOENT) return VSErrorFromSystem(errno, place.string());
        if (isSideFile(folder, name))
            return refused(place, "is not written: the name is that of a store's log");
        return {};
    }
    if (S_ISLNK(status.st_mode)) return refused(place, "is not written: it is a link");
    if (!S_ISREG(status.st_mode)) return {};
    if (Territory(store_).files.contains(identityOf(status)))
        return refused(place, "is not written: it is a file of the store in " + store_.string());
    if (isSideFile(folder, name)) return refused(place, "is not written: it is a store's log");
    if (isOpenHere(identityOf(status)))
        return refused(place, "is not written: this program has it open itself");
    const VSFileDescriptor file(
        openat(folder, name.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC));
    if (!file.isOpen()) return VSErrorFromSystem(errno, place.string() + " cannot be looked into");
    if (const char* kind = kindOfStoreFile(file.get()))
        return refused(place, std::string("is not written: it is ") + kind);
    return {};
}

VSStatus VSStoreGuard::checkOpenFile(int file, const fs::path& place) const {
    const auto status = statusOf(file);
    if (!status || !S_ISREG(status->st_mode)) return {};
    if (Territory(store_).files.contains(identityOf(*status)))
        return refused(place, "leads into a file of the store in " + store_.string());
    const VSFileDescriptor readable(
        open(("/proc/self/fd/" + std::to_string(file)).c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
    const char* kind = readable.isOpen() ? kindOfStoreFile(readable.get()) : nullptr;
    return kind ? VSStatus(refused(place, std::string("leads into ") + kind)) : VSStatus();
}

VSResult<VSFileDescriptor> VSStoreGuard::makeFolder(const fs::path& given, unsigned mode, bool* isNew) const {
    constexpr int flags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
    if (isNew) *isNew = false;
    auto folder = VSResolvedPath(given);
    if (!folder) return folder.error();
    std::vector<std::string> missing;
    fs::path there = folder->has_filename() ? *folder : folder->parent_path();
    VSFileDescriptor here(open(there.c_str(), flags));
    while (!here.isOpen() && errno == ENOENT && there.has_relative_path()) {
        missing.push_back(there.filename().string());
        there = there.parent_path();
        here = VSFileDescriptor(open(there.c_str(), flags));
    }
    if (!here.isOpen()) return VSErrorFromSystem(errno, there.string());
    if (VSStatus status = checkFolder(here.get(), given); !status) return status.error();
    for (; !missing.empty(); missing.pop_back()) {
        const char* name = missing.back().c_str();
        const bool isMade = mkdirat(here.get(), name, mode) == 0;
        if (!isMade && errno != EEXIST) return VSErrorFromSystem(errno, given.string());
        VSFileDescriptor next(openat(here.get(), name, flags));
        if (!next.isOpen()) return VSErrorFromSystem(errno, given.string());
        // Else somebody else made it this moment, and may have put anything there.
        if (VSStatus status = isMade ? VSStatus() : checkFolder(next.get(), given); !status)
            return status.error();
        if (isNew) *isNew = isMade;
        here = std::move(next);
    }
    return here;
}

VSResult<fs::path> VSResolvedPath(const fs::path& given) {
    std::error_code error;
    const fs::path absolute = fs::absolute(given, error);
    if (error) return VSErrorFromSystem(error.value(), given.string());
    const fs::path resolved = fs::weakly_canonical(absolute, error);
    if (error) return VSErrorFromSystem(error.value(), given.string());
    return resolved;
}

bool VSIsOpenStoreFile(const fs::path& file) {
    const auto status = statusOf(file);
    const int descriptor = status && S_ISREG(status->st_mode) ? descriptorOf(identityOf(*status)) : -1;
    if (descriptor < 0) return false;
    // The log's index says nothing of itself but its name.
    return kindOfStoreFile(descriptor) || placeOf(descriptor, {}).ends_with("-shm");
}
