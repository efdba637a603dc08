#include "Platform/ReplaceFile.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <string>
#include <system_error>

namespace platform {

namespace {

namespace fs = std::filesystem;

// A descriptor that is closed at the end.
class File {
 public:
    File(const fs::path& path, int flags, mode_t mode = 0)
        : descriptor_(open(path.c_str(), flags | O_CLOEXEC, mode)) {}
    ~File() {
        if (descriptor_ >= 0) close(descriptor_);
    }
    File(const File&) = delete;
    File& operator=(const File&) = delete;
    bool ok() const { return descriptor_ >= 0; }
    bool sync() const { return fsync(descriptor_) == 0; }
    bool writeAll(std::string_view text) const {
        while (!text.empty()) {
            const ssize_t count = write(descriptor_, text.data(), text.size());
            if (count < 0 && errno == EINTR) continue;
            if (count <= 0) return false;
            text.remove_prefix(static_cast<size_t>(count));
        }
        return true;
    }

 private:
    int descriptor_;
};

bool writeNewFile(const fs::path& path, std::string_view text, bool durable) {
    unlink(path.c_str());  // what a killed process of the same number had, or a link that leads elsewhere
    const File file(path, O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW, 0600);
    return file.ok() && file.writeAll(text) && (!durable || file.sync());
}

}  // namespace

bool replaceFile(const fs::path& path, std::string_view text, bool durable) {
    std::error_code ignored;
    if (fs::create_directories(path.parent_path(), ignored))
        fs::permissions(path.parent_path(), fs::perms::owner_all, ignored);
    // Another process may be replacing it too; whole files follow each other.
    const fs::path beside = fs::path(path).concat(".new-" + std::to_string(getpid()));
    if (!writeNewFile(beside, text, durable) || rename(beside.c_str(), path.c_str()) != 0) {
        const int error = errno;
        fs::remove(beside, ignored);
        errno = error;
        return false;
    }
    if (!durable) return true;
    // Without this the new name may be lost with the power; the file itself is whole either way.
    const File folder(path.parent_path(), O_RDONLY | O_DIRECTORY);
    if (folder.ok()) folder.sync();
    return true;
}

}  // namespace platform
