#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "Vessa/Base/VSValue.h"

namespace platform {

/// The platform's local per-user defaults: small settings that stay on this machine. One file, replaced as a
/// whole at each change (written beside it, synced, renamed), so that a killed process leaves the old or the
/// new one. Processes that share it take turns: each changes what the file holds then, and what others
/// changed is read at the next question. Main thread only. A file that cannot be read is kept aside under
/// another name and reported.
class UserDefaults {
 public:
    /// An empty path keeps the settings in memory only.
    explicit UserDefaults(std::filesystem::path file);
    UserDefaults(const UserDefaults&) = delete;
    UserDefaults& operator=(const UserDefaults&) = delete;
    std::optional<VSValue> value(const std::string& key) const;
    bool boolean(const std::string& key) const;  // false when absent
    void setValue(const std::string& key, VSValue value);
    /// Sets what `answer` makes of the value, so that nothing is lost that another process set meanwhile.
    using Answer = std::function<VSValue(const std::optional<VSValue>& current)>;
    void updateValue(const std::string& key, const Answer& answer);
    void removeValue(const std::string& key);

    /// The defaults of this process; set once at start-up, before any use. In memory only until then.
    static UserDefaults& standard();
    static void setStandard(std::unique_ptr<UserDefaults> defaults);

 private:
    /// What tells one state of the file from the next: all are 0 where there is none.
    struct Identity {
        uint64_t device = 0, inode = 0, size = 0;
        int64_t seconds = 0, nanoseconds = 0;
        friend bool operator==(const Identity&, const Identity&) = default;
    };
    Identity identityOfFile() const;
    /// Reads the file if it is another one than that which was read.
    void refresh() const;
    void change(const std::function<bool()>& change);
    void save() const;
    std::filesystem::path file_;
    mutable VSValue::Dictionary values_;
    mutable Identity identity_;  // of the file that was read or written last
};

}  // namespace platform
