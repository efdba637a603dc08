#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Qelvar/Models/Data/QVChartPoint.h"

class QVChartDataSet;

/// Where a data set gets its points. Asked on the queue that reloads the set.
class QVChartDataSetDataSource {
 public:
    virtual ~QVChartDataSetDataSource() = default;
    virtual size_t numberOfDataPointsForDataSet(const QVChartDataSet& dataSet) = 0;
    /// A null answer leaves the point out.
    virtual QVChartPointPtr chartPointForIndex(const QVChartDataSet& dataSet, size_t index) = 0;
    virtual std::vector<QVChartPointPtr> dataPointsForSet(const QVChartDataSet&) { return {}; }
    virtual QVChartPointAnnotationPtr annotationForPointAtIndex(const QVChartDataSet&, size_t) {
        return nullptr;
    }
};

/// An ordered list of points, in the data source's order. No locks: one queue reloads and reads it; others
/// draw copies.
class QVChartDataSet {
 public:
    QVChartDataSet() = default;
    /// With the same points and without data source and tag.
    QVChartDataSet(const QVChartDataSet& other) : data_(other.data_) {}
    QVChartDataSet& operator=(const QVChartDataSet&) = delete;

    std::shared_ptr<QVChartDataSetDataSource> dataSource() const { return dataSource_.lock(); }
    void setDataSource(std::weak_ptr<QVChartDataSetDataSource> dataSource) {
        dataSource_ = std::move(dataSource);
    }
    /// The index of the set in its group.
    size_t tag() const { return tag_; }
    void setTag(size_t tag) { tag_ = tag; }

    // REQUIRES of all that take an index: index < numDataPoints().
    size_t numDataPoints() const { return data_->size(); }
    const QVChartPointPtr& pointAtIndex(size_t index) const { return data_->at(index); }
    /// Stays valid until the next reload; keep a copy of the set to hold it longer.
    const std::vector<QVChartPointPtr>& allDataPoints() const { return *data_; }
    VSDate xValueForPointAtIndex(size_t index) const { return pointAtIndex(index)->xValue(); }
    QVChartYValue yValueForPointAtIndex(size_t index) const { return pointAtIndex(index)->yValue(); }
    std::optional<double> yValueForPointAtIndex(size_t index, std::string_view key) const {
        return pointAtIndex(index)->yValueForKey(key);
    }
    QVChartPointAnnotationPtr annotationForPointAtIndex(size_t index) const {
        return pointAtIndex(index)->annotation();
    }

    /// Over all numbers of all points; none without any.
    std::optional<double> minYValue() const;
    std::optional<double> maxYValue() const;
    /// The total by the number of points: not a number for a set without points; none when there is no total.
    std::optional<double> averageYValue() const;
    /// The sum of the points' averages; none when it is not finite.
    std::optional<double> totalYValue() const;
    std::optional<VSDate> minXValue() const;
    std::optional<VSDate> maxXValue() const;

    void reloadData();
    /// Fetches one point again. An index past the end does nothing.
    void reloadDataPointAtIndex(size_t index);

    // Sets are filled by their data source only: these write a line to the log.
    void addDataPoint(VSDate xValue, double yValue, QVChartPointAnnotationPtr annotation);
    void removeDataPointAtIndex(size_t index);
    void normalizeData();
    void normalizeData(std::optional<double> minYValue, std::optional<double> maxYValue,
                       std::optional<VSDate> minXValue, std::optional<VSDate> maxXValue);

    /// For logs.
    std::string description() const;

 private:
    std::shared_ptr<const std::vector<QVChartPointPtr>> data_ =
        std::make_shared<const std::vector<QVChartPointPtr>>();
    std::weak_ptr<QVChartDataSetDataSource> dataSource_;
    size_t tag_ = 0;
};
