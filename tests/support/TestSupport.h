#pragma once

#include <condition_variable>
#include <filesystem>
#include <iosfwd>
#include <memory>
#include <mutex>
#include <optional>
#include <string>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSEnvironment.h"

/// How GoogleTest shows a date that is not the expected one.
void PrintTo(const VSDate& date, std::ostream* stream);

namespace test {

/// Installs a fixed clock, zone and locale for the life of the object.
class FixedEnvironment {
 public:
    /// `now` in ISO 8601, in the zone given.
    explicit FixedEnvironment(const std::string& now = "2020-03-31T20:00",
                              const std::string& zone = "Europe/Copenhagen",
                              const std::string& locale = "en_US");
    ~FixedEnvironment();
    VSFixedEnvironment& operator*() { return *environment_; }
    VSFixedEnvironment* operator->() { return environment_.get(); }

 private:
    std::shared_ptr<VSFixedEnvironment> environment_;
    std::shared_ptr<const VSEnvironment> previous_;
};

/// A date in ISO 8601, in the zone of the current environment unless it names its offset. Fails loudly.
VSDate date(const std::string& iso);

/// An empty folder that is removed at the end.
class TemporaryFolder {
 public:
    TemporaryFolder();
    ~TemporaryFolder();
    TemporaryFolder(const TemporaryFolder&) = delete;
    TemporaryFolder& operator=(const TemporaryFolder&) = delete;
    const std::filesystem::path& path() const { return path_; }

 private:
    std::filesystem::path path_;
};

/// A value that another thread delivers once: wait for the event, never sleep.
template <typename T>
class Promise {
 public:
    void set(T value) {
        std::lock_guard lock(mutex_);
        value_ = std::move(value);
        condition_.notify_all();
    }
    /// Waits at most a minute; none when nothing came.
    std::optional<T> wait() {
        std::unique_lock lock(mutex_);
        condition_.wait_for(lock, std::chrono::minutes(1), [this] { return value_.has_value(); });
        return std::move(value_);
    }

 private:
    std::mutex mutex_;
    std::condition_variable condition_;
    std::optional<T> value_;
};

}  // namespace test
