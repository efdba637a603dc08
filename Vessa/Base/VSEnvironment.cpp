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

bool askWhether24HourClock(const std::string& locale) {
    UErrorCode status = U_ZERO_ERROR;
    const std::unique_ptr<icu::DateTimePatternGenerator> generator(
        icu::DateTimePatternGenerator::createInstance(icu::Locale(locale.c_str()), status));
    if (U_FAILURE(status) || !generator) return false;
    const icu::UnicodeString pattern = generator->getBestPattern(icu::UnicodeString("j"), status);
    return U_SUCCESS(status) && (pattern.indexOf(u'H') >= 0 || pattern.indexOf(u'k') >= 0);
}

VSDate systemNow() {
    return VSDate(std::chrono::floor<VSDuration>(std::chrono::system_clock::now()));
}

}  // namespace

bool VSEnvironment::uses24HourClock() const {
    // A pattern generator takes milliseconds to make, and every label of a time axis asks.
    static std::mutex mutex;
    static std::map<std::string, bool> answers;
    const std::string locale = localeIdentifier();
    std::lock_guard lock(mutex);
    const auto known = answers.find(locale);
    if (known != answers.end()) return known->second;
    return answers.emplace(locale, askWhether24HourClock(locale)).first->second;
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
    for (const char* variable : {"LC_ALL", "LC_TIME", "LANG"}) {
        const char* value = std::getenv(variable);
        if (value && *value) return VSLocaleFromPOSIX(value);
    }
    return VSLocaleFromPOSIX(nullptr);
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
