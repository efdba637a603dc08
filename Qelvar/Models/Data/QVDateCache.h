#pragma once

#include <QMetaObject>
#include <array>
#include <memory>
#include <optional>

#include "Platform/ObserverSet.h"
#include "Qelvar/Models/Data/QVTimeScope.h"

class QVDateCache;

class QVDateCacheObserver {
 public:
    virtual ~QVDateCacheObserver() = default;
    /// All dates have been dropped: those asked for from now on are computed from the new now.
    virtual void dateCacheDidUpdate(QVDateCache& dateCache) = 0;
};

/// The spans of today's charts, computed at their first use and kept until the day, the clock or the zone
/// changes (platform::SystemEvents tells). One for the application. Main thread only.
class QVDateCache {
 public:
    QVDateCache();
    ~QVDateCache();
    QVDateCache(const QVDateCache&) = delete;
    QVDateCache& operator=(const QVDateCache&) = delete;

    VSDate startOfDay(bool noon) { return start(QVTimeScope::Day, noon); }
    VSDate endOfDay(bool noon) { return end(QVTimeScope::Day, noon); }
    VSDate startOfWeek(bool noon) { return start(QVTimeScope::Week, noon); }
    VSDate endOfWeek(bool noon) { return end(QVTimeScope::Week, noon); }
    VSDate startOfMonth(bool noon) { return start(QVTimeScope::Month, noon); }
    VSDate endOfMonth(bool noon) { return end(QVTimeScope::Month, noon); }
    VSDate startOfYear(bool noon) { return start(QVTimeScope::Year, noon); }
    VSDate endOfYear(bool noon) { return end(QVTimeScope::Year, noon); }

    VSDate startOfDayMidnight() { return startOfDay(false); }
    VSDate endOfDayMidnight() { return endOfDay(false); }
    VSDate startOfDayNoon() { return startOfDay(true); }
    VSDate endOfDayNoon() { return endOfDay(true); }
    VSDate startOfWeekMidnight() { return startOfWeek(false); }
    VSDate endOfWeekMidnight() { return endOfWeek(false); }
    VSDate startOfWeekNoon() { return startOfWeek(true); }
    VSDate endOfWeekNoon() { return endOfWeek(true); }
    VSDate startOfMonthMidnight() { return startOfMonth(false); }
    VSDate endOfMonthMidnight() { return endOfMonth(false); }
    VSDate startOfMonthNoon() { return startOfMonth(true); }
    VSDate endOfMonthNoon() { return endOfMonth(true); }
    VSDate startOfYearMidnight() { return startOfYear(false); }
    VSDate endOfYearMidnight() { return endOfYear(false); }
    VSDate startOfYearNoon() { return startOfYear(true); }
    VSDate endOfYearNoon() { return endOfYear(true); }

    void addObserver(const std::shared_ptr<QVDateCacheObserver>& observer) { observers_.add(observer); }
    void removeObserver(const QVDateCacheObserver* observer) { observers_.remove(observer); }

 private:
    struct Dates {
        std::optional<VSDate> start, end;
    };
    Dates& dates(QVTimeScope timeScope, bool noon);
    VSDate start(QVTimeScope timeScope, bool noon);
    VSDate end(QVTimeScope timeScope, bool noon);
    void significantTimeDidChange();

    std::array<std::array<Dates, 2>, QVTimeScopeCount> dates_{};
    platform::ObserverSet<QVDateCacheObserver> observers_;
    QMetaObject::Connection significantTimeChange_;
};

/// The cached dates by time scope; none for hour and for what is no time scope.
std::optional<VSDate> QVDateCacheStartDate(QVDateCache& dateCache, QVTimeScope timeScope, bool noon);
std::optional<VSDate> QVDateCacheEndDate(QVDateCache& dateCache, QVTimeScope timeScope, bool noon);
