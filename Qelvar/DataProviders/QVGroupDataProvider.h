#pragma once

#include <map>
#include <memory>
#include <optional>
#include <set>
#include <vector>

#include "Platform/StyledText.h"
#include "Qelvar/Charts/QVChartRendererDataSource.h"
#include "Qelvar/Charts/QVChartSeries.h"
#include "Qelvar/DataProviders/QVDataProvider.h"
#include "VessaUI/VSDataUnitGroup.h"

class QVGroupDataProvider;

/// Told on the main thread.
class QVGroupDataProviderDelegate {
 public:
    virtual ~QVGroupDataProviderDelegate() = default;
    virtual void groupDataProviderDidUpdateHistoricalData(QVGroupDataProvider& provider) = 0;
    virtual void groupDataProviderDidUpdateSecondaryData(QVGroupDataProvider& provider) = 0;
    virtual void groupDataProviderDidUpdateCurrentValueData(QVGroupDataProvider& provider) = 0;
};

/// What a chart card talks to: the providers of all data units of a display type, as one. It is the chart
/// renderer's data source, and makes the series that draw the display type in the visible time scope. Main
/// thread only.
///
/// It starts inactive, in time scope hour, without a span.
class QVGroupDataProvider final : public QVChartRendererDataSource, public QVDataProviderDelegate {
 public:
    static std::shared_ptr<QVGroupDataProvider> create(const VSDataUnitGroup* dataUnitGroup,
                                                       std::shared_ptr<VSUnitController> unitController,
                                                       const std::shared_ptr<VSHealthStore>& healthStore);
    QVGroupDataProvider(const QVGroupDataProvider&) = delete;
    QVGroupDataProvider& operator=(const QVGroupDataProvider&) = delete;

    std::shared_ptr<QVGroupDataProviderDelegate> delegate() const { return delegate_.lock(); }
    void setDelegate(std::weak_ptr<QVGroupDataProviderDelegate> delegate) { delegate_ = std::move(delegate); }

    /// Whether every data unit's provider has loaded it.
    bool hasLoadedHistoricalData() const;
    bool hasLoadedCurrentValueData() const;
    bool hasLoadedSecondaryValueData() const;
    /// Whether something that a data unit shows has not been loaded.
    bool isWaiting() const;
    /// Whether every data unit has a current value that may be shown.
    bool holdsCurrentValueData() const;

    platform::StyledText secondaryValueText() const;
    std::optional<double> averageValueForDataUnit(const VSDataUnit* dataUnit) const;
    std::optional<double> currentValueForDataUnit(const VSDataUnit* dataUnit) const;
    /// The latest of the data units' dates.
    std::optional<VSDate> lastUpdatedDate() const { return lastUpdatedDate_; }
    const VSDataUnitGroup* dataUnitGroup() const { return dataUnitGroup_; }
    std::optional<VSDate> startDate() const { return startDate_; }
    std::optional<VSDate> endDate() const { return endDate_; }
    QVTimeScope timeScope() const { return timeScope_; }
    bool isActive() const { return isActive_; }
    /// The provider of one of the display type's units.
    const std::shared_ptr<QVDataProvider>& providerForDataUnit(const VSDataUnit* dataUnit) const {
        return dataProviders_.at(dataUnit);
    }

    /// Sets span and scope, makes the series anew and, when active, asks for the data. The delegate hears of
    /// points again when every data unit has answered.
    void setStartDate(std::optional<VSDate> startDate, std::optional<VSDate> endDate, QVTimeScope timeScope);
    /// Starts the queries; a second call does nothing.
    void activate();
    void deactivate();
    void invalidateCachedData();
    /// For a span that stays the same when the day turns: asks again for what concerned the day before.
    void dayDidChange();
    /// The user's language changed: makes the series anew, for some carry labels.
    void localeDidChange();

    /// Of the data unit at the index. Null where the display type draws nothing in this time scope.
    const std::shared_ptr<const QVChartSeries>& chartSeriesForIndex(size_t index) const {
        return chartSeries_.at(index);
    }

    // QVChartRendererDataSource
    bool dataForChartRendererIsFinishedLoading(const QVChartRenderer& renderer) override;
    size_t numberOfSeriesInChartRenderer(const QVChartRenderer& renderer) override;
    std::shared_ptr<const QVChartSeries> seriesAtIndex(const QVChartRenderer& renderer,
                                                       size_t index) override;
    size_t numberOfDataPointsForSeriesAtIndex(const QVChartRenderer& renderer, size_t seriesIndex) override;
    std::shared_ptr<QVChartPoint> dataPointAtIndex(const QVChartRenderer& renderer, size_t pointIndex,
                                                   size_t seriesIndex) override;
    VSDataUnitGroupChartingRules::Bounds adjustChartBounds(double min, double max) override;
    const VSDataUnit* dataUnit() override { return dataUnitGroup_->anyDataUnit(); }
    VSUnitController* unitController() override { return unitController_.get(); }

    // QVDataProviderDelegate
    void dataProviderDidUpdateHistoricalData(QVDataProvider& provider) override;
    void dataProviderDidConfirmHistoricalData(QVDataProvider& provider) override;
    void dataProviderDidUpdateCurrentValueData(QVDataProvider& provider) override;
    void dataProviderDidUpdateSecondaryData(QVDataProvider& provider) override;

 private:
    QVGroupDataProvider(const VSDataUnitGroup* dataUnitGroup,
                        std::shared_ptr<VSUnitController> unitController,
                        const std::shared_ptr<VSHealthStore>& healthStore);
    template <typename Predicate>
    bool allProviders(Predicate predicate) const;
    const QVDataProvider& providerAtIndex(size_t index) const;
    platform::StyledText bloodPressureSecondaryText() const;
    platform::StyledText minMaxSecondaryTextForDataUnit(const VSDataUnit* dataUnit) const;
    void tellHistoricalData();

    const VSDataUnitGroup* const dataUnitGroup_;
    const std::shared_ptr<VSUnitController> unitController_;
    std::map<const VSDataUnit*, std::shared_ptr<QVDataProvider>> dataProviders_;
    std::optional<VSDate> lastUpdatedDate_;
    bool isActive_ = false;
    std::set<const VSDataUnit*> pendingHistoricalRequests_;
    std::vector<std::shared_ptr<const QVChartSeries>> chartSeries_;  // in the order of the data units
    std::optional<VSDate> startDate_, endDate_;
    QVTimeScope timeScope_{};
    std::weak_ptr<QVGroupDataProviderDelegate> delegate_;
};
