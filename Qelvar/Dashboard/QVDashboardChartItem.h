#pragma once

#include <QFont>
#include <QString>
#include <memory>
#include <optional>

#include "Platform/StyledText.h"
#include "Qelvar/Charts/QVChartRenderer.h"
#include "Qelvar/DataProviders/QVGroupDataProvider.h"
#include "Qelvar/Models/Data/QVDateCache.h"
#include "VessaUI/VSDataCategory.h"

class QVDashboardChartItem;

/// Told on the main thread.
class QVDashboardChartItemDelegate {
 public:
    virtual ~QVDashboardChartItemDelegate() = default;
    virtual void chartItemDidUpdateHistoricalData(QVDashboardChartItem& item) = 0;
    virtual void chartItemDidUpdateCurrentValueData(QVDashboardChartItem& item) = 0;
    virtual void chartItemDidUpdateSecondaryValueData(QVDashboardChartItem& item) = 0;
};

/// The model of one chart card: one display type over one time scope. It owns the providers that load its
/// data and the renderer that draws it. Main thread only; held by shared pointers.
class QVDashboardChartItem final : public QVGroupDataProviderDelegate {
 public:
    /// Inactive, in time scope hour, without a span.
    static std::shared_ptr<QVDashboardChartItem> create(const VSDataUnitGroup* dataUnitGroup,
                                                        const VSDataCategory* dataCategory,
                                                        std::shared_ptr<VSUnitController> unitController,
                                                        const std::shared_ptr<VSHealthStore>& healthStore);
    QVDashboardChartItem() = delete;
    QVDashboardChartItem(const QVDashboardChartItem&) = delete;
    QVDashboardChartItem& operator=(const QVDashboardChartItem&) = delete;

    const VSDataUnitGroup* dataUnitGroup() const { return dataUnitGroup_; }
    /// The category whose colours the card takes.
    const VSDataCategory* dataCategory() const { return dataCategory_; }
    const std::shared_ptr<QVGroupDataProvider>& dataProvider() const { return dataProvider_; }
    const std::shared_ptr<QVChartRenderer>& chartRenderer() const { return chartRenderer_; }
    const std::shared_ptr<VSUnitController>& unitController() const { return unitController_; }

    std::shared_ptr<QVDashboardChartItemDelegate> delegate() const { return delegate_.lock(); }
    void setDelegate(std::weak_ptr<QVDashboardChartItemDelegate> delegate) {
        delegate_ = std::move(delegate);
    }
    QVTimeScope timeScope() const { return timeScope_; }
    std::optional<VSDate> startDate() const { return startDate_; }
    std::optional<VSDate> endDate() const { return endDate_; }
    /// Set when the user's locale changed, cleared by the card when it has made its texts anew.
    bool localeDidChange() const { return localeDidChange_; }
    void setLocaleDidChange(bool changed);

    bool isActive() const { return active_; }
    /// Starts the data provider; a second call does nothing.
    void activate();
    /// Clears the flag only: the data provider keeps running.
    void deactivate();
    /// Loads everything anew, after the order of the sources changed.
    void invalidateChart();
    /// Takes the span of the time scope from the cache. When scope and span are the present ones, only what
    /// concerned another day is asked for again.
    void updateDateRange(QVDateCache& dateCache, QVTimeScope timeScope);

    /// The current value with its unit; empty before it was loaded.
    platform::StyledText mostRecentValue(const QFont& valueFont, const QFont& unitFont) const;
    /// The unit's name for the current value; empty for display types of several units.
    QString mostRecentValueUnitString() const;
    /// The name of the display type's unit icon, in the same cases; else empty.
    QString mostRecentValueUnitIcon() const;
    std::optional<VSDate> lastUpdated() const;
    platform::StyledText secondaryValue() const;
    bool shouldHideAverageLineForTimeScope(QVTimeScope timeScope) const;
    bool shouldHideMinMaxOnBackgroundForTimeScope(QVTimeScope timeScope) const;

    static QVEdgeInsets chartInsetsForTimeScope(QVTimeScope timeScope);

    /// Two items are equal when their display types are.
    friend bool operator==(const QVDashboardChartItem& a, const QVDashboardChartItem& b) {
        return a.dataUnitGroup_ == b.dataUnitGroup_;
    }

    void groupDataProviderDidUpdateHistoricalData(QVGroupDataProvider& provider) override;
    void groupDataProviderDidUpdateSecondaryData(QVGroupDataProvider& provider) override;
    void groupDataProviderDidUpdateCurrentValueData(QVGroupDataProvider& provider) override;

 private:
    QVDashboardChartItem(const VSDataUnitGroup* dataUnitGroup, const VSDataCategory* dataCategory,
                         std::shared_ptr<VSUnitController> unitController,
                         const std::shared_ptr<VSHealthStore>& healthStore);
    /// The current value, when there is exactly one data unit.
    std::optional<double> singleCurrentValue() const;

    const VSDataUnitGroup* const dataUnitGroup_;
    const VSDataCategory* const dataCategory_;
    const std::shared_ptr<VSUnitController> unitController_;
    bool active_ = false;
    const std::shared_ptr<QVGroupDataProvider> dataProvider_;
    const std::shared_ptr<QVChartRenderer> chartRenderer_;
    std::weak_ptr<QVDashboardChartItemDelegate> delegate_;
    QVTimeScope timeScope_{};
    std::optional<VSDate> startDate_, endDate_;
    bool localeDidChange_ = false;
};

template <>
struct std::hash<QVDashboardChartItem> {
    size_t operator()(const QVDashboardChartItem& item) const noexcept {
        return std::hash<const void*>()(item.dataUnitGroup());
    }
};
