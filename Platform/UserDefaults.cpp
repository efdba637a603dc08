#include "Platform/UserDefaults.h"

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
    if (!replaceFile(file_, VSValue(values_).serialized(), true))
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
