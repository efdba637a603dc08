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

    VSDate startOfDay(bool noon) { return span(QVTimeScope::Day, noon).start; }
    VSDate endOfDay(bool noon) { return span(QVTimeScope::Day, noon).end; }
    VSDate startOfWeek(bool noon) { return span(QVTimeScope::Week, noon).start; }
    VSDate endOfWeek(bool noon) { return span(QVTimeScope::Week, noon).end; }
    VSDate startOfMonth(bool noon) { return span(QVTimeScope::Month, noon).start; }
    VSDate endOfMonth(bool noon) { return span(QVTimeScope::Month, noon).end; }
    VSDate startOfYear(bool noon) { return span(QVTimeScope::Year, noon).start; }
    VSDate endOfYear(bool noon) { return span(QVTimeScope::Year, noon).end; }

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
    const QVDateSpan& span(QVTimeScope timeScope, bool noon);
    void significantTimeDidChange();

    std::array<std::array<std::optional<QVDateSpan>, 2>, QVTimeScopeCount> spans_{};
    platform::ObserverSet<QVDateCacheObserver> observers_;
    QMetaObject::Connection significantTimeChange_;
};

/// The cached dates by time scope; none for hour and for what is no time scope.
std::optional<VSDate> QVDateCacheStartDate(QVDateCache& dateCache, QVTimeScope timeScope, bool noon);
std::optional<VSDate> QVDateCacheEndDate(QVDateCache& dateCache, QVTimeScope timeScope, bool noon);
