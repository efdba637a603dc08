#include "Platform/SystemEvents.h"

#include <sys/timerfd.h>
#include <time.h>
#include <unicode/timezone.h>
#include <unistd.h>

#include <QCoreApplication>
#include <QDBusConnection>
#include <QFileSystemWatcher>
#include <QSocketNotifier>
#include <QTimer>
#include <QVariantMap>
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <tuple>

#include "Platform/Localization.h"
#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSEnvironment.h"
#include "Vessa/Base/VSLog.h"

namespace platform {

namespace {

// What a significant change is a change of.
struct LocalDay {
    std::string zone;
    int year = 0, month = 0, day = 0;
    friend bool operator==(const LocalDay&, const LocalDay&) = default;

    static LocalDay current() {
        const VSDate now = VSEnvironment::current()->now();
        const VSCalendar calendar = VSCalendar::current();
        return {calendar.timeZoneIdentifier(), calendar.component(VSCalendarUnit::Year, now),
                calendar.component(VSCalendarUnit::Month, now), calendar.component(VSCalendarUnit::Day, now)};
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

}  // namespace

struct SystemEvents::Private {
    explicit Private(SystemEvents& owner) : events(owner) {}
    ~Private() {
        notifier.reset();  // before what it watches
        if (timer >= 0) close(timer);
    }

    void start() {
        today = LocalDay::current();
        if (timer < 0) {
            startTimer();
            startWatchingZoneFile();
            // The bus may take a moment to answer; the first screen need not wait for it.
            QTimer::singleShot(0, &events, [this] { startListeningToBus(); });
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

    void startWatchingZoneFile() {
        // The link itself is replaced when the zone is changed, which only its folder notices.
        watcher = std::make_unique<QFileSystemWatcher>();
        watcher->addPaths({QStringLiteral("/etc/localtime"), QStringLiteral("/etc")});
        QObject::connect(watcher.get(), &QFileSystemWatcher::fileChanged, &events,
                         [this](const QString& path) {
                             if (!watcher->files().contains(path)) watcher->addPath(path);
                             check();
                         });
        QObject::connect(watcher.get(), &QFileSystemWatcher::directoryChanged, &events, [this] { check(); });
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
    }

    SystemEvents& events;
    LocalDay today;
    int timer = -1;
    std::unique_ptr<QSocketNotifier> notifier;
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

void SystemEvents::start() {
    private_->start();
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

void SystemEvents::postLocaleChange() {
    loadTranslations();
    emit localeDidChange();
}

}  // namespace platform
