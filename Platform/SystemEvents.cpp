#include "Platform/SystemEvents.h"

#include <sys/timerfd.h>
#include <time.h>
#include <unicode/timezone.h>
#include <unistd.h>

#include <QCoreApplication>
#include <QDBusConnection>
#include <QFile>
#include <QFileSystemWatcher>
#include <QSocketNotifier>
#include <QTimer>
#include <QVariantMap>
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <tuple>

#include "Platform/DesktopSettings.h"
#include "Platform/Localization.h"
#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/Base/VSLog.h"
#include "Vessa/Base/VSSystemSettings.h"

namespace platform {

namespace {

// What a significant change is a change of.
struct LocalDay {
    std::string zone;
    VSDate start;
    friend bool operator==(const LocalDay&, const LocalDay&) = default;

    static LocalDay current() {
        const VSCalendar calendar = VSCalendar::current();
        return {calendar.timeZoneIdentifier(), calendar.startOfDay(VSEnvironment::current()->now())};
    }
};

std::chrono::microseconds untilMidnight() {
    const VSDate now = VSEnvironment::current()->now();
    const VSCalendar calendar = VSCalendar::current();
    return calendar.addDays(calendar.startOfDay(now), 1) - now;
}

// What the C library and ICU remember of the zone.
void forgetZone() {
    tzset();
    icu::TimeZone::adoptDefault(icu::TimeZone::detectHostTimeZone());
}

constexpr std::chrono::milliseconds kFileIsWritten{200};

const QString kSettingsGroup = QStringLiteral("org.gnome.desktop.interface");
const QString kClockKey = QStringLiteral("clock-format");

// Whether each variable is set in both or in neither, and to the same locale however it is written.
bool meanTheSame(const VSLocaleVariables& a, const VSLocaleVariables& b) {
    const auto same = [](const std::string& one, const std::string& other) {
        return one.empty() == other.empty() &&
               VSLocaleFromPOSIX(one.c_str()) == VSLocaleFromPOSIX(other.c_str());
    };
    return same(a.all, b.all) && same(a.time, b.time) && same(a.language, b.language);
}

std::optional<bool> uses24HourClock(const QVariant& packed) {
    const QVariant setting = unpackedSetting(packed);
    if (setting == QStringLiteral("24h")) return true;
    if (setting == QStringLiteral("12h")) return false;
    return std::nullopt;
}

}  // namespace

// The user's locale as the host has it. The process's variables come from the host's settings when both were
// the same at the start: then they follow when the settings change. Else somebody gave the process a locale
// of its own, which stays.
class HostLocale {
 public:
    HostLocale(SystemEvents& events, std::filesystem::path etc)
        : events_(events), etc_(std::move(etc)), inFiles_(VSLocaleVariablesOfHost(etc_)) {
        followsHost_ = meanTheSame(inFiles_, VSLocaleVariablesOfProcess());
        said_ = inFiles_;
        // Some write the file in place, and it is not read half.
        reader_.setSingleShot(true);
        reader_.setInterval(kFileIsWritten);
        QObject::connect(&reader_, &QTimer::timeout, &events_, [this] { readFiles(); });
    }
    void filesDidChange() { reader_.start(); }
    void hostSays(const VSLocaleVariables& variables) {
        if (!followsHost_ || variables == said_) return;
        said_ = variables;
        locale_ = variables.strongest();
        apply();
    }
    void clockPreferred(std::optional<bool> uses24HourClock) {
        if (clock_ == uses24HourClock) return;
        clock_ = uses24HourClock;
        apply();
    }

 private:
    void readFiles() {
        const VSLocaleVariables variables = VSLocaleVariablesOfHost(etc_);
        if (variables == inFiles_) return;
        inFiles_ = variables;
        hostSays(variables);
    }
    void apply() {
        const std::string before = VSEnvironment::current()->localeIdentifier();
        VSSystemEnvironment::setHostPreferences(locale_, clock_);
        if (VSEnvironment::current()->localeIdentifier() != before) events_.postLocaleChange();
    }

    SystemEvents& events_;
    const std::filesystem::path etc_;
    bool followsHost_ = false;
    VSLocaleVariables inFiles_, said_;  // last
    std::optional<std::string> locale_;
    std::optional<bool> clock_;
    QTimer reader_;
};

struct SystemEvents::Private {
    explicit Private(SystemEvents& owner) : events(owner) {}
    ~Private() {
        notifier.reset();  // before what it watches
        if (timer >= 0) close(timer);
    }

    void start(const std::filesystem::path& etc) {
        today = LocalDay::current();
        if (etc != folder) {
            folder = etc;
            locale = std::make_unique<HostLocale>(events, etc);
            startWatchingFiles();
        }
        if (timer < 0) {
            startTimer();
            // The bus may take a moment to answer; the first screen need not wait for it.
            QTimer::singleShot(0, &events, [this] {
                startListeningToBus();
                startListeningToSettings();
            });
        }
        arm();
    }

    // One event for each change, by however many ways it is heard of.
    void check() {
        const LocalDay now = LocalDay::current();
        if (now.zone != today.zone) forgetZone();
        if (now == today)
            arm();
        else
            post();
    }

    void post() {
        today = LocalDay::current();
        arm();
        emit events.significantTimeChange();
    }

    // One kernel timer does for midnight (also one that passes while the machine sleeps) and for a set clock,
    // which cancels it.
    void startTimer() {
        timer = timerfd_create(CLOCK_REALTIME, TFD_NONBLOCK | TFD_CLOEXEC);
        if (timer < 0) {
            VSLog(VSLogLevel::Error, std::string("No timer for midnight: ") + std::strerror(errno));
            return;
        }
        notifier = std::make_unique<QSocketNotifier>(timer, QSocketNotifier::Read);
        QObject::connect(notifier.get(), &QSocketNotifier::activated, &events, [this] { timerDidFire(); });
    }

    void arm() {
        if (timer < 0) return;
        // Not at once even when midnight is now: a clock that stands (a fixed one) must not keep us spinning.
        constexpr std::chrono::microseconds shortest = std::chrono::milliseconds(20);
        const auto delay = std::max(untilMidnight(), shortest);
        timespec now{};
        clock_gettime(CLOCK_REALTIME, &now);
        const auto nanoseconds = now.tv_nsec + (delay % std::chrono::seconds(1)).count() * 1000;
        itimerspec spec{};
        spec.it_value.tv_sec = now.tv_sec + std::chrono::duration_cast<std::chrono::seconds>(delay).count() +
                               nanoseconds / 1'000'000'000;
        spec.it_value.tv_nsec = nanoseconds % 1'000'000'000;
        if (timerfd_settime(timer, TFD_TIMER_ABSTIME | TFD_TIMER_CANCEL_ON_SET, &spec, nullptr) != 0 &&
            errno != ECANCELED)
            VSLog(VSLogLevel::Error,
                  std::string("The timer for midnight cannot be set: ") + std::strerror(errno));
    }

    void timerDidFire() {
        uint64_t expirations = 0;
        const ssize_t count = read(timer, &expirations, sizeof expirations);
        if (count < 0 && errno == ECANCELED)
            post();
        else
            check();
    }

    // A link or a file that is replaced is noticed by its folder only, one written in place by itself only.
    void startWatchingFiles() {
        watcher = std::make_unique<QFileSystemWatcher>();
        watchFiles();
        const auto filesDidChange = [this] {
            watchFiles();
            check();
            locale->filesDidChange();
        };
        QObject::connect(watcher.get(), &QFileSystemWatcher::fileChanged, &events, filesDidChange);
        QObject::connect(watcher.get(), &QFileSystemWatcher::directoryChanged, &events, filesDidChange);
    }

    void watchFiles() {
        const QStringList watched = watcher->files() + watcher->directories();
        for (const char* name : {"", "localtime", "timezone", "locale.conf", "default", "default/locale"}) {
            const std::filesystem::path path = *name ? folder / name : folder;
            const QString text = QString::fromStdString(path.string());
            if (!watched.contains(text) && QFile::exists(text)) watcher->addPath(text);
        }
    }

    // A machine without a system bus or without these services never sends anything, which is no error.
    void startListeningToBus() {
        auto bus = QDBusConnection::systemBus();
        if (!bus.isConnected()) return;
        bus.connect(QStringLiteral("org.freedesktop.timedate1"), QStringLiteral("/org/freedesktop/timedate1"),
                    QStringLiteral("org.freedesktop.DBus.Properties"), QStringLiteral("PropertiesChanged"),
                    &events, SLOT(busTimeDateChanged(QString, QVariantMap, QStringList)));
        bus.connect(QStringLiteral("org.freedesktop.login1"), QStringLiteral("/org/freedesktop/login1"),
                    QStringLiteral("org.freedesktop.login1.Manager"), QStringLiteral("PrepareForSleep"),
                    &events, SLOT(busPrepareForSleep(bool)));
        bus.connect(QStringLiteral("org.freedesktop.locale1"), QStringLiteral("/org/freedesktop/locale1"),
                    QStringLiteral("org.freedesktop.DBus.Properties"), QStringLiteral("PropertiesChanged"),
                    &events, SLOT(busLocaleChanged(QString, QVariantMap, QStringList)));
    }

    // The desktop's settings; the clock is the one that a locale does not tell.
    void startListeningToSettings() {
        listenToDesktopSetting(&events, "busSettingChanged", kSettingsGroup, kClockKey);
    }

    SystemEvents& events;
    LocalDay today;
    int timer = -1;
    std::unique_ptr<QSocketNotifier> notifier;
    std::filesystem::path folder;  // of the host's settings
    std::unique_ptr<HostLocale> locale;
    std::unique_ptr<QFileSystemWatcher> watcher;
};

SystemEvents::SystemEvents() : private_(std::make_unique<Private>(*this)) {}
SystemEvents::~SystemEvents() = default;

SystemEvents& SystemEvents::shared() {
    static SystemEvents* const events = [] {
        // Its notifiers must go while the application still stands.
        qAddPostRoutine([] { shared().private_ = std::make_unique<Private>(shared()); });
        return new SystemEvents;
    }();
    return *events;
}

void SystemEvents::start(const std::filesystem::path& etc) {
    private_->start(etc);
}

void SystemEvents::postSignificantTimeChange() {
    private_->post();
}

void SystemEvents::busTimeDateChanged(const QString&, const QVariantMap&, const QStringList&) {
    private_->check();
}

void SystemEvents::busPrepareForSleep(bool goingToSleep) {
    if (!goingToSleep) private_->check();
}

void SystemEvents::busLocaleChanged(const QString&, const QVariantMap& changed, const QStringList&) {
    if (!private_->locale) return;
    const auto settings = changed.constFind(QStringLiteral("Locale"));
    if (settings == changed.constEnd()) return private_->locale->filesDidChange();
    VSLocaleVariables variables;
    for (const QString& setting : settings->toStringList()) variables.assign(setting.toStdString());
    private_->locale->hostSays(variables);
}

void SystemEvents::busSettingChanged(const QString& group, const QString& key, const QDBusVariant& value) {
    if (private_->locale && group == kSettingsGroup && key == kClockKey)
        private_->locale->clockPreferred(uses24HourClock(value.variant()));
}

void SystemEvents::postLocaleChange() {
    loadTranslations();
    emit localeDidChange();
}

}  // namespace platform
