#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Qelvar/Models/Data/QVChartDataSet.h"

class QVChartDataGroup;

/// Where a group gets the points of its sets. Asked on the queue that reloads the group.
class QVChartDataGroupDataSource {
 public:
    virtual ~QVChartDataGroupDataSource() = default;
    virtual size_t numberOfDataSetsInGroup(const QVChartDataGroup& dataGroup) = 0;
    virtual size_t numberOfPointsInSetAtIndex(const QVChartDataGroup& dataGroup, size_t setIndex) = 0;
    virtual QVChartPointPtr pointForSetAtIndex(const QVChartDataGroup& dataGroup, size_t setIndex,
                                               size_t pointIndex) = 0;
    virtual QVChartPointAnnotationPtr annotationForPointInSetAtIndex(const QVChartDataGroup&, size_t,
                                                                     size_t) {
        return nullptr;
    }
    virtual std::vector<QVChartPointPtr> dataPointsForSetAtIndex(const QVChartDataGroup&, size_t) {
        return {};
    }
};

/// An ordered list of data sets with the range of their numbers. Always held by a shared pointer, since it is
/// its sets' data source. No locks: one queue reloads and reads it; others draw a copy().
class QVChartDataGroup final : public QVChartDataSetDataSource,
                               public std::enable_shared_from_this<QVChartDataGroup> {
    struct Private {};

 public:
    static std::shared_ptr<QVChartDataGroup> create() {
        return std::make_shared<QVChartDataGroup>(Private());
    }
    explicit QVChartDataGroup(Private) {}
    QVChartDataGroup(const QVChartDataGroup&) = delete;
    QVChartDataGroup& operator=(const QVChartDataGroup&) = delete;
    /// A group of copies of the sets (sharing their points), without data source and cached range.
    std::shared_ptr<QVChartDataGroup> copy() const;

    std::shared_ptr<QVChartDataGroupDataSource> dataSource() const { return dataSource_.lock(); }
    void setDataSource(std::weak_ptr<QVChartDataGroupDataSource> dataSource) {
        dataSource_ = std::move(dataSource);
    }

    size_t numberOfDataSets() const { return dataSets_.size(); }
    /// Null past the end.
    std::shared_ptr<QVChartDataSet> dataSetAtIndex(size_t index) const;
    const std::vector<std::shared_ptr<QVChartDataSet>>& dataSets() const { return dataSets_; }
    void setDataSets(std::vector<std::shared_ptr<QVChartDataSet>> dataSets) {
        dataSets_ = std::move(dataSets);
    }

    /// As of the last reloadData; none when no set has a number.
    std::optional<double> minYValue() const { return minYValue_; }
    std::optional<double> maxYValue() const { return maxYValue_; }
    /// The mean of all points' averages, as they are now; none when no point has one.
    std::optional<double> averageYValue() const;
    std::optional<VSDate> minXValue() const;
    std::optional<VSDate> maxXValue() const;
    /// Whether no set holds a point.
    bool isEmpty() const;

    /// Keeps the sets that it has as objects, and reloads them; makes and drops sets to the data source's
    /// count.
    void reloadData();
    /// The cached range stays as it is. An index past the end is logged.
    void reloadDataInSetAtIndex(size_t setIndex);
    void reloadDataPointInSetAtIndex(size_t setIndex, size_t pointIndex);

    // Groups are filled by their data source only: these write a line to the log.
    void addDataPoint(VSDate xValue, double yValue, size_t setIndex);
    void removeDataPointFromSetAtIndex(size_t setIndex, size_t pointIndex);

    // QVChartDataSetDataSource
    size_t numberOfDataPointsForDataSet(const QVChartDataSet& dataSet) override;
    QVChartPointPtr chartPointForIndex(const QVChartDataSet& dataSet, size_t index) override;
    std::vector<QVChartPointPtr> dataPointsForSet(const QVChartDataSet& dataSet) override;
    QVChartPointAnnotationPtr annotationForPointAtIndex(const QVChartDataSet& dataSet, size_t index) override;

    /// For logs.
    std::string description() const;

 private:
    std::vector<std::shared_ptr<QVChartDataSet>> dataSets_;
    std::optional<double> minYValue_, maxYValue_;
    std::weak_ptr<QVChartDataGroupDataSource> dataSource_;
};
