#include "Platform/UserDefaults.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <iterator>
#include <system_error>

#include "Vessa/Base/VSLog.h"

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

bool writeNewFile(const fs::path& path, std::string_view text) {
    const File file(path, O_WRONLY | O_CREAT | O_TRUNC, 0600);
    return file.ok() && file.writeAll(text) && file.sync();
}

bool replace(const fs::path& path, std::string_view text) {
    std::error_code ignored;
    if (fs::create_directories(path.parent_path(), ignored))
        fs::permissions(path.parent_path(), fs::perms::owner_all, ignored);
    const fs::path beside = fs::path(path).concat(".new");
    if (!writeNewFile(beside, text) || rename(beside.c_str(), path.c_str()) != 0) {
        const int error = errno;
        fs::remove(beside, ignored);
        errno = error;
        return false;
    }
    // Without this the new name may be lost with the power; the settings themselves are whole either way.
    const File folder(path.parent_path(), O_RDONLY | O_DIRECTORY);
    if (folder.ok()) folder.sync();
    return true;
}

// Under the first free name beside it.
void keepAside(const fs::path& path) {
    fs::path aside;
    std::error_code error;
    for (int number = 1;; ++number) {
        aside = fs::path(path).concat(".unreadable-" + std::to_string(number));
        if (!fs::exists(aside, error)) break;
    }
    fs::rename(path, aside, error);
    if (error)
        VSLog(VSLogLevel::Error,
              "The settings in " + path.string() + " cannot be read, nor kept aside: " + error.message());
    else
        VSLog(VSLogLevel::Error, "The settings in " + path.string() + " cannot be read. They are kept as " +
                                     aside.string() + ".");
}

VSValue::Dictionary read(const fs::path& path) {
    std::error_code error;
    if (!fs::exists(path, error)) return {};
    std::ifstream file(path, std::ios::binary);
    const std::string text((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    if (file) {
        const auto value = VSValue::fromSerialized(text);
        if (value && value->dictionary()) return *value->dictionary();
    }
    keepAside(path);
    return {};
}

std::unique_ptr<UserDefaults>& standardDefaults() {
    static std::unique_ptr<UserDefaults> defaults = std::make_unique<UserDefaults>(fs::path());
    return defaults;
}

}  // namespace

UserDefaults::UserDefaults(fs::path file) : file_(std::move(file)) {
    if (!file_.empty()) {
        file_ = fs::absolute(file_);
        values_ = read(file_);
    }
}

std::optional<VSValue> UserDefaults::value(const std::string& key) const {
    const auto found = values_.find(key);
    if (found == values_.end()) return std::nullopt;
    return found->second;
}

bool UserDefaults::boolean(const std::string& key) const {
    const auto found = value(key);
    return found && found->boolean().value_or(false);
}

void UserDefaults::setValue(const std::string& key, VSValue value) {
    const auto found = values_.find(key);
    if (found != values_.end() && found->second == value) return;
    values_.insert_or_assign(key, std::move(value));
    save();
}

void UserDefaults::removeValue(const std::string& key) {
    if (values_.erase(key) > 0) save();
}

void UserDefaults::save() const {
    if (file_.empty()) return;
    if (!replace(file_, VSValue(values_).serialized()))
        VSLog(VSLogLevel::Error,
              "The settings cannot be written to " + file_.string() + ": " + std::strerror(errno));
}

UserDefaults& UserDefaults::standard() {
    return *standardDefaults();
}

void UserDefaults::setStandard(std::unique_ptr<UserDefaults> defaults) {
    standardDefaults() = std::move(defaults);
}

}  // namespace platform
