#pragma once

#include <filesystem>
#include <memory>
#include <optional>
#include <string>

#include "Vessa/Base/VSValue.h"

namespace platform {

/// The platform's local per-user defaults: small settings that stay on this machine. One file, replaced as a
/// whole at each change (written beside it, synced, renamed), so that a killed process leaves the old or the
/// new one. Main thread only. A file that cannot be read is kept aside under another name and reported.
class UserDefaults {
 public:
    /// An empty path keeps the settings in memory only.
    explicit UserDefaults(std::filesystem::path file);
    std::optional<VSValue> value(const std::string& key) const;
    bool boolean(const std::string& key) const;  // false when absent
    void setValue(const std::string& key, VSValue value);
    void removeValue(const std::string& key);

    /// The defaults of this process; set once at start-up, before any use. In memory only until then.
    static UserDefaults& standard();
    static void setStandard(std::unique_ptr<UserDefaults> defaults);

 private:
    void save() const;
    std::filesystem::path file_;
    VSValue::Dictionary values_;
};

}  // namespace platform
