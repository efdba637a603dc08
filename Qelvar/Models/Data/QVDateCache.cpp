#include "Qelvar/Models/Data/QVDateCache.h"

#include "Platform/SystemEvents.h"
#include "Vessa/Base/VSEnvironment.h"

QVDateCache::QVDateCache()
    : significantTimeChange_(QObject::connect(&platform::SystemEvents::shared(),
                                              &platform::SystemEvents::significantTimeChange,
                                              [this] { significantTimeDidChange(); })) {}

QVDateCache::~QVDateCache() {
    QObject::disconnect(significantTimeChange_);
}

const QVDateSpan& QVDateCache::span(QVTimeScope timeScope, bool noon) {
    auto& cached = spans_.at(static_cast<size_t>(timeScope)).at(noon ? 1 : 0);
    if (!cached) cached = QVTimeScopeSpan(timeScope, VSEnvironment::current()->now(), noon);
    return *cached;
}

void QVDateCache::significantTimeDidChange() {
    spans_ = {};
    observers_.tell([this](QVDateCacheObserver& observer) { observer.dateCacheDidUpdate(*this); });
}

std::optional<VSDate> QVDateCacheStartDate(QVDateCache& dateCache, QVTimeScope timeScope, bool noon) {
    switch (timeScope) {
        case QVTimeScope::Day:
            return dateCache.startOfDay(noon);
        case QVTimeScope::Week:
            return dateCache.startOfWeek(noon);
        case QVTimeScope::Month:
            return dateCache.startOfMonth(noon);
        case QVTimeScope::Year:
            return dateCache.startOfYear(noon);
        default:
            return std::nullopt;
    }
}

std::optional<VSDate> QVDateCacheEndDate(QVDateCache& dateCache, QVTimeScope timeScope, bool noon) {
    switch (timeScope) {
        case QVTimeScope::Day:
            return dateCache.endOfDay(noon);
        case QVTimeScope::Week:
            return dateCache.endOfWeek(noon);
        case QVTimeScope::Month:
            return dateCache.endOfMonth(noon);
        case QVTimeScope::Year:
            return dateCache.endOfYear(noon);
        default:
            return std::nullopt;
    }
}
