#pragma once

#include <memory>
#include <optional>
#include <string>

#include "Vessa/Base/VSDate.h"

/// Clock, time zone and locale of the user: the only place that asks the system for them. Everything else
/// asks VSEnvironment::current(), anew at every computation. Any thread.
class VSEnvironment {
 public:
    virtual ~VSEnvironment() = default;

    virtual VSDate now() const = 0;
    /// An Olson identifier ("Europe/Copenhagen"), or "GMT+hh:mm" for a zone given as an offset.
    virtual std::string timeZoneIdentifier() const = 0;
    /// An ICU locale identifier ("en_US", "ar_EG").
    virtual std::string localeIdentifier() const = 0;
    /// Whether the user's locale shows hours on a 24-hour clock.
    virtual bool uses24HourClock() const;

    /// The environment in force. Never null; the system's until another is installed.
    static std::shared_ptr<const VSEnvironment> current();
    /// Installs another one (the start-up with `--now`, tests) and returns the one before.
    static std::shared_ptr<const VSEnvironment> install(std::shared_ptr<const VSEnvironment> environment);
};

/// The system's clock, the zone of TZ or /etc/localtime, the locale of LC_ALL, LC_TIME, LANG or what the host
/// has since said instead; all read anew at each call, so that a change of the system's zone or locale is
/// seen. With `startAt` the clock starts there and runs on from the moment of construction.
class VSSystemEnvironment final : public VSEnvironment {
 public:
    explicit VSSystemEnvironment(std::optional<VSDate> startAt = std::nullopt);
    VSDate now() const override;
    std::string timeZoneIdentifier() const override;
    std::string localeIdentifier() const override;

    /// What the host says while the process runs, for every system environment: the locale by its POSIX name
    /// (none: the process's variables stand), and the clock that the user prefers to the locale's (none: the
    /// locale's).
    static void setHostPreferences(std::optional<std::string> locale, std::optional<bool> uses24HourClock);

 private:
    VSDuration offset_{};
};

/// Fixed values, for tests. The setters may be called between computations; thread-safe.
class VSFixedEnvironment final : public VSEnvironment {
 public:
    VSFixedEnvironment(VSDate now, std::string timeZone, std::string locale);
    ~VSFixedEnvironment() override;
    VSDate now() const override;
    std::string timeZoneIdentifier() const override;
    std::string localeIdentifier() const override;
    void setNow(VSDate now);
    void setTimeZone(std::string identifier);
    void setLocale(std::string identifier);

 private:
    struct State;
    std::unique_ptr<State> state_;
};
