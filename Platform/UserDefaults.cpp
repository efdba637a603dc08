#include "Platform/UserDefaults.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <fstream>
#include <iterator>
#include <system_error>

#include "Platform/ReplaceFile.h"
#include "Vessa/Base/VSLog.h"

namespace platform {

namespace {

namespace fs = std::filesystem;

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

/// While it lives, no other process changes the file: its folder is locked, which leaves nothing behind.
/// Where there is no folder yet, or it cannot be locked, it holds up nobody.
class Turn {
 public:
    explicit Turn(const fs::path& file)
        : folder_(open(file.parent_path().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC)) {
        while (folder_ >= 0 && flock(folder_, LOCK_EX) != 0 && errno == EINTR) {
        }
    }
    ~Turn() {
        if (folder_ >= 0) close(folder_);
    }
    Turn(const Turn&) = delete;
    Turn& operator=(const Turn&) = delete;

 private:
    const int folder_;
};

std::unique_ptr<UserDefaults>& standardDefaults() {
    static std::unique_ptr<UserDefaults> defaults = std::make_unique<UserDefaults>(fs::path());
    return defaults;
}

}  // namespace

UserDefaults::UserDefaults(fs::path file) : file_(std::move(file)) {
    if (file_.empty()) return;
    file_ = fs::absolute(file_);
    refresh();
}

UserDefaults::Identity UserDefaults::identityOfFile() const {
    struct stat status {};
    if (file_.empty() || stat(file_.c_str(), &status) != 0) return {};
    return {status.st_dev, status.st_ino, static_cast<uint64_t>(status.st_size), status.st_mtim.tv_sec,
            status.st_mtim.tv_nsec};
}

void UserDefaults::refresh() const {
    const Identity now = identityOfFile();
    if (now == identity_) return;
    values_ = read(file_);
    identity_ = now;
}

std::optional<VSValue> UserDefaults::value(const std::string& key) const {
    refresh();
    const auto found = values_.find(key);
    if (found == values_.end()) return std::nullopt;
    return found->second;
}

bool UserDefaults::boolean(const std::string& key) const {
    const auto found = value(key);
    return found && found->boolean().value_or(false);
}

/// In this process's turn; `change` returns whether there is anything to write.
void UserDefaults::change(const std::function<bool()>& change) {
    const Turn turn(file_);
    refresh();
    if (change()) save();
}

void UserDefaults::updateValue(const std::string& key, const Answer& answer) {
    change([&] {
        const auto found = values_.find(key);
        const auto current = found == values_.end() ? std::nullopt : std::optional(found->second);
        VSValue value = answer(current);
        if (current == value) return false;
        values_.insert_or_assign(key, std::move(value));
        return true;
    });
}

void UserDefaults::setValue(const std::string& key, VSValue value) {
    updateValue(key, [&](const auto&) { return std::move(value); });
}

void UserDefaults::removeValue(const std::string& key) {
    change([&] { return values_.erase(key) > 0; });
}

void UserDefaults::save() const {
    if (file_.empty()) return;
    if (!replaceFile(file_, VSValue(values_).serialized(), true))
        VSLog(VSLogLevel::Error,
              "The settings cannot be written to " + file_.string() + ": " + std::strerror(errno));
    identity_ = identityOfFile();
}

UserDefaults& UserDefaults::standard() {
    return *standardDefaults();
}

void UserDefaults::setStandard(std::unique_ptr<UserDefaults> defaults) {
    standardDefaults() = std::move(defaults);
}

}  // namespace platform
