#include "Vessa/VSWorkFolder.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/random.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>
#include <optional>

#include "Vessa/VSDatabase.h"

namespace {

constexpr std::string_view kPrefix = ".qelvar-export-";
constexpr size_t kNameLength = kPrefix.size() + 16;
constexpr int kFolderFlags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
constexpr int kAttempts = 16;

/// What tells our folders from those that somebody else may have put there.
struct Owner {
    uid_t user;
    mode_t mode;
    friend bool operator==(const Owner&, const Owner&) = default;
};

Owner ownerOf(const struct stat& status) {
    return {status.st_uid, status.st_mode & 0777};
}

std::optional<struct stat> statusOf(int descriptor) {
    struct stat status {};
    if (fstat(descriptor, &status) != 0) return std::nullopt;
    return status;
}

/// False when the name has gone, or is another folder's, since it was opened.
bool isStillNamed(int folder, int parent, const std::string& name) {
    const auto open = statusOf(folder);
    struct stat named {};
    return open && fstatat(parent, name.c_str(), &named, AT_SYMLINK_NOFOLLOW) == 0 &&
           open->st_ino == named.st_ino && open->st_dev == named.st_dev;
}

template <typename Block>
void forEachEntry(int folder, Block block) {
    const int copy = openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    DIR* const opened = copy < 0 ? nullptr : fdopendir(copy);
    if (!opened) {
        if (copy >= 0) close(copy);
        return;
    }
    const std::unique_ptr<DIR, int (*)(DIR*)> entries(opened, closedir);
    while (const dirent* entry = readdir(entries.get())) {
        const std::string name = entry->d_name;
        if (name != "." && name != "..") block(name);
    }
}

void removeEntry(int folder, const std::string& name) {
    // Of a link this removes the link, of one of several names the name.
    if (unlinkat(folder, name.c_str(), 0) == 0 || (errno != EISDIR && errno != EPERM)) return;
    const VSFileDescriptor inner(openat(folder, name.c_str(), kFolderFlags));
    const auto outside = statusOf(folder), inside = statusOf(inner.get());
    if (!outside || !inside || outside->st_dev != inside->st_dev || outside->st_uid != inside->st_uid) return;
    forEachEntry(inner.get(), [&inner](const std::string& below) { removeEntry(inner.get(), below); });
    unlinkat(folder, name.c_str(), AT_REMOVEDIR);
}

void removeContent(int folder) {
    forEachEntry(folder, [folder](const std::string& name) { removeEntry(folder, name); });
}

enum class Lock { Ours, Others, NotKnown };

Lock lock(int folder) {
    if (flock(folder, LOCK_EX | LOCK_NB) == 0) return Lock::Ours;
    // Some file systems over a network know no such locks.
    return errno == EWOULDBLOCK ? Lock::Others : Lock::NotKnown;
}

/// Removes the folders of such a name that have this owner and that nobody holds any more.
void removeLeftovers(int parent, const Owner& owner) {
    forEachEntry(parent, [&](const std::string& name) {
        if (!name.starts_with(kPrefix) || name.size() != kNameLength) return;
        const VSFileDescriptor folder(openat(parent, name.c_str(), kFolderFlags));
        const auto status = statusOf(folder.get());
        if (!status || ownerOf(*status) != owner || lock(folder.get()) != Lock::Ours) return;
        if (!isStillNamed(folder.get(), parent, name)) return;
        removeContent(folder.get());
        unlinkat(parent, name.c_str(), AT_REMOVEDIR);
    });
}

std::string nameWith(uint64_t number) {
    char digits[17];
    std::snprintf(digits, sizeof digits, "%016llx", static_cast<unsigned long long>(number));
    return std::string(kPrefix) + digits;
}

/// The same for each work on the target, so that the second finds the first there.
std::string nameFor(const std::string& target) {
    uint64_t hash = 14'695'981'039'346'656'037U;
    for (const char c : target) hash = (hash ^ static_cast<unsigned char>(c)) * 1'099'511'628'211U;
    return nameWith(hash);
}

std::string unforeseeableName() {
    uint64_t number = 0;
    while (getrandom(&number, sizeof number, 0) != sizeof number) {
    }
    return nameWith(number);
}

bool isInUse(int parent, const std::string& name) {
    const VSFileDescriptor folder(openat(parent, name.c_str(), kFolderFlags));
    const auto status = statusOf(folder.get());
    return status && ownerOf(*status) == Owner{geteuid(), 0700} && lock(folder.get()) == Lock::Others;
}

VSError inUse(const std::filesystem::path& place) {
    return {VSErrorCode::NotAccessible, "another export is under way in " + place.string(), true};
}

/// Whether the folder that was made is the one that was opened. Some file systems give all files one owner,
/// so a new file tells whose ours are.
bool isOurs(int folder) {
    bool isEmpty = true;
    forEachEntry(folder, [&isEmpty](const std::string&) { isEmpty = false; });
    const auto status = statusOf(folder);
    if (!isEmpty || !status) return false;
    if (status->st_uid == geteuid()) return true;
    const VSFileDescriptor file(openat(folder, "owner", O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    const auto owned = statusOf(file.get());
    if (owned) unlinkat(folder, "owner", 0);
    return owned && owned->st_uid == status->st_uid;
}

}  // namespace

VSResult<VSWorkFolder> VSWorkFolder::makeFor(const std::string& target, int parent,
                                             const std::filesystem::path& place) {
    const Owner owner{geteuid(), 0700};
    removeLeftovers(parent, owner);
    std::string name = nameFor(target);
    for (int attempt = 0; attempt < kAttempts; ++attempt, name = unforeseeableName()) {
        if (mkdirat(parent, name.c_str(), 0700) != 0) {
            if (errno != EEXIST) return VSErrorFromSystem(errno, place.string());
            if (attempt == 0 && isInUse(parent, name)) return inUse(place);
            continue;  // somebody else's, whatever it is
        }
        VSFileDescriptor folder(openat(parent, name.c_str(), kFolderFlags));
        if (!folder.isOpen() && errno != ENOENT && errno != ENOTDIR && errno != ELOOP)
            return VSErrorFromSystem(errno, place.string());
        // Until it was locked another process may have taken it for one that was left.
        if (!folder.isOpen() || lock(folder.get()) == Lock::Others ||
            !isStillNamed(folder.get(), parent, name))
            continue;
        if (!isOurs(folder.get())) continue;
        if (const auto status = statusOf(folder.get()); status && ownerOf(*status) != owner)
            removeLeftovers(parent, ownerOf(*status));
        VSFileDescriptor home(fcntl(parent, F_DUPFD_CLOEXEC, 3));
        if (!home.isOpen()) return VSErrorFromSystem(errno, place.string());
        const auto path = place.parent_path() / name;
        return VSWorkFolder(std::move(folder), std::move(home), std::move(name), path);
    }
    return VSError{VSErrorCode::Refused,
                   place.string() + ": somebody else makes files of this program's names in the folder"};
}

VSResult<VSWorkFolder> VSWorkFolder::open(const std::string& name, int parent,
                                          const std::filesystem::path& place) {
    if (mkdirat(parent, name.c_str(), 0700) != 0 && errno != EEXIST)
        return VSErrorFromSystem(errno, place.string());
    VSFileDescriptor folder(openat(parent, name.c_str(), kFolderFlags));
    if (!folder.isOpen() && errno != ENOTDIR && errno != ELOOP) return VSErrorFromSystem(errno, place.string());
    const auto status = statusOf(folder.get()), outside = statusOf(parent);
    const bool isOurs = status && outside &&
                        (status->st_uid == geteuid() || status->st_uid == outside->st_uid) &&
                        status->st_dev == outside->st_dev;
    if (!isOurs)
        return VSError{VSErrorCode::Refused,
                       place.string() + " is not used: it is a link, no folder or somebody else's"};
    fchmod(folder.get(), 0700);  // where the file system has no rights, it has none to lose
    const Lock held = lock(folder.get());
    if (held == Lock::Others || !isStillNamed(folder.get(), parent, name))
        return VSError{VSErrorCode::NotAccessible, place.string() + " is in use by another program", true};
    return VSWorkFolder(std::move(folder), {}, name, place);
}

VSWorkFolder::~VSWorkFolder() {
    if (!folder_.isOpen() || !parent_.isOpen()) return;
    removeAll();
    if (isStillNamed(folder_.get(), parent_.get(), name_))
        unlinkat(parent_.get(), name_.c_str(), AT_REMOVEDIR);
}

VSResult<VSFileDescriptor> VSWorkFolder::makeFolder(const std::string& name) const {
    const bool isMade = mkdirat(folder_.get(), name.c_str(), 0700) == 0;
    VSFileDescriptor folder(isMade ? openat(folder_.get(), name.c_str(), kFolderFlags) : -1);
    if (!folder.isOpen()) return VSErrorFromSystem(errno, (path_ / name).string());
    return folder;
}

void VSWorkFolder::remove(const std::string& name) const {
    removeEntry(folder_.get(), name);
}

void VSWorkFolder::removeAll() const {
    removeContent(folder_.get());
}
