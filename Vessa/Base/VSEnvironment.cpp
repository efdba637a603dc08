#include "Vessa/Base/VSEnvironment.h"

#include <unicode/dtptngen.h>
#include <unicode/locid.h>

#include <cstdlib>
#include <map>
#include <mutex>

#include "Vessa/Base/VSSystemSettings.h"

namespace {

struct CurrentEnvironment {
    std::mutex mutex;
    std::shared_ptr<const VSEnvironment> environment =
        std::make_shared<VSSystemEnvironment>();  // guarded by mutex
};

CurrentEnvironment& currentEnvironment() {
    static auto* instance =
        new CurrentEnvironment;  // never destroyed: threads may ask while the process ends
    return *instance;
}

/// What the host says while the process runs.
struct HostPreferences {
    std::mutex mutex;
    // guarded by mutex
    std::optional<std::string> locale;
    std::optional<bool> uses24HourClock;
};

HostPreferences& hostPreferences() {
    static auto* instance = new HostPreferences;  // never destroyed: as above
    return *instance;
}

std::string localeOfVariables() {
    for (const char* variable : {"LC_ALL", "LC_TIME", "LANG"}) {
        const char* value = std::getenv(variable);
        if (value && *value) return VSLocaleFromPOSIX(value);
    }
    return VSLocaleFromPOSIX(nullptr);
}

bool askWhether24HourClock(const std::string& locale) {
    UErrorCode status = U_ZERO_ERROR;
    const std::unique_ptr<icu::DateTimePatternGenerator> generator(
        icu::DateTimePatternGenerator::createInstance(icu::Locale(locale.c_str()), status));
    if (U_FAILURE(status) || !generator) return false;
    const icu::UnicodeString pattern = generator->getBestPattern(icu::UnicodeString("j"), status);
    return U_SUCCESS(status) && (pattern.indexOf(u'H') >= 0 || pattern.indexOf(u'k') >= 0);
}

// A pattern generator takes milliseconds to make, and every label of a time axis asks.
bool localeUses24HourClock(const std::string& locale) {
    static std::mutex mutex;
    static std::map<std::string, bool> answers;
    std::lock_guard lock(mutex);
    const auto known = answers.find(locale);
    if (known != answers.end()) return known->second;
    return answers.emplace(locale, askWhether24HourClock(locale)).first->second;
}

VSDate systemNow() {
    return VSDate(std::chrono::floor<VSDuration>(std::chrono::system_clock::now()));
}

}  // namespace

bool VSEnvironment::uses24HourClock() const {
    return localeUses24HourClock(localeIdentifier());
}

std::shared_ptr<const VSEnvironment> VSEnvironment::current() {
    auto& current = currentEnvironment();
    std::lock_guard lock(current.mutex);
    return current.environment;
}

std::shared_ptr<const VSEnvironment> VSEnvironment::install(
    std::shared_ptr<const VSEnvironment> environment) {
    if (!environment) environment = std::make_shared<VSSystemEnvironment>();
    auto& current = currentEnvironment();
    std::lock_guard lock(current.mutex);
    current.environment.swap(environment);
    return environment;
}

VSSystemEnvironment::VSSystemEnvironment(std::optional<VSDate> startAt) {
    if (startAt) offset_ = *startAt - systemNow();
}

VSDate VSSystemEnvironment::now() const {
    return systemNow() + offset_;
}

std::string VSSystemEnvironment::timeZoneIdentifier() const {
    return VSTimeZoneFromSystem(std::getenv("TZ"), "/etc");
}

std::string VSSystemEnvironment::localeIdentifier() const {
    auto& host = hostPreferences();
    std::lock_guard lock(host.mutex);
    const std::string locale = host.locale ? VSLocaleFromPOSIX(host.locale->c_str()) : localeOfVariables();
    if (!host.uses24HourClock || *host.uses24HourClock == localeUses24HourClock(locale)) return locale;
    return locale + (*host.uses24HourClock ? "@hours=h23" : "@hours=h12");
}

void VSSystemEnvironment::setHostPreferences(std::optional<std::string> locale,
                                             std::optional<bool> uses24HourClock) {
    auto& host = hostPreferences();
    std::lock_guard lock(host.mutex);
    host.locale = std::move(locale);
    host.uses24HourClock = uses24HourClock;
}

struct VSFixedEnvironment::State {
    mutable std::mutex mutex;
    // guarded by mutex
    VSDate now;
    std::string timeZone, locale;
};

VSFixedEnvironment::VSFixedEnvironment(VSDate now, std::string timeZone, std::string locale)
    : state_(std::make_unique<State>()) {
    state_->now = now;
    state_->timeZone = std::move(timeZone);
    state_->locale = std::move(locale);
}

VSFixedEnvironment::~VSFixedEnvironment() = default;

VSDate VSFixedEnvironment::now() const {
    std::lock_guard lock(state_->mutex);
    return state_->now;
}

std::string VSFixedEnvironment::timeZoneIdentifier() const {
    std::lock_guard lock(state_->mutex);
    return state_->timeZone;
}

std::string VSFixedEnvironment::localeIdentifier() const {
    std::lock_guard lock(state_->mutex);
    return state_->locale;
}

void VSFixedEnvironment::setNow(VSDate now) {
    std::lock_guard lock(state_->mutex);
    state_->now = now;
}

void VSFixedEnvironment::setTimeZone(std::string identifier) {
    std::lock_guard lock(state_->mutex);
    state_->timeZone = std::move(identifier);
}

void VSFixedEnvironment::setLocale(std::string identifier) {
    std::lock_guard lock(state_->mutex);
    state_->locale = std::move(identifier);
}
