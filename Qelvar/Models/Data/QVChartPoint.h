#pragma once

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

#include "Vessa/Base/VSDate.h"

/// What a data source has to say about a point. Opaque to everything here.
class QVChartPointAnnotation {
 public:
    virtual ~QVChartPointAnnotation() = default;
};
using QVChartPointAnnotationPtr = std::shared_ptr<const QVChartPointAnnotation>;

/// The named values of one point.
using QVChartYValues = std::map<std::string, double, std::less<>>;
/// A point's payload: nothing, one number, or named numbers.
using QVChartYValue = std::variant<std::monostate, double, QVChartYValues>;

/// One date with one or several numbers, in the user's unit as shown. Shared, and immutable once handed to a
/// data set; only a reload of the set puts the annotation on it.
class QVChartPoint {
 public:
    virtual ~QVChartPoint() = default;

    /// The number of a key; a point with one number gives it for any key.
    virtual std::optional<double> yValueForKey(std::string_view key) const = 0;
    virtual std::vector<double> allYValues() const = 0;
    virtual std::optional<double> maxYValue() const = 0;
    virtual std::optional<double> minYValue() const = 0;
    /// The number that stands for the point in totals and averages.
    virtual std::optional<double> averageYValue() const = 0;
    /// One of its numbers; 0 when it has none.
    virtual double yValueFloatRepresentation() const = 0;
    virtual QVChartYValue yValue() const = 0;

    VSDate xValue() const { return xValue_; }
    void setXValue(VSDate date) { xValue_ = date; }
    const QVChartPointAnnotationPtr& annotation() const { return annotation_; }
    void setAnnotation(QVChartPointAnnotationPtr annotation) { annotation_ = std::move(annotation); }

    /// Same kind, date and numbers; annotations do not count.
    virtual bool isEqual(const QVChartPoint& other) const = 0;
    virtual size_t hash() const = 0;
    /// For logs.
    virtual std::string description() const = 0;
    friend bool operator==(const QVChartPoint& a, const QVChartPoint& b) { return a.isEqual(b); }

 protected:
    explicit QVChartPoint(VSDate xValue) : xValue_(xValue) {}

 private:
    VSDate xValue_;
    QVChartPointAnnotationPtr annotation_;
};
using QVChartPointPtr = std::shared_ptr<QVChartPoint>;

/// A point with one number, or none.
class QVChartPointNumeric final : public QVChartPoint {
 public:
    QVChartPointNumeric(VSDate xValue, std::optional<double> yValue)
        : QVChartPoint(xValue), yValue_(yValue) {}
    static std::shared_ptr<QVChartPointNumeric> chartPoint(VSDate xValue, std::optional<double> yValue) {
        return std::make_shared<QVChartPointNumeric>(xValue, yValue);
    }

    void setYValue(std::optional<double> yValue) { yValue_ = yValue; }
    std::optional<double> yValueForKey(std::string_view) const override { return yValue_; }
    std::vector<double> allYValues() const override;
    std::optional<double> maxYValue() const override { return yValue_; }
    std::optional<double> minYValue() const override { return yValue_; }
    std::optional<double> averageYValue() const override { return yValue_; }
    double yValueFloatRepresentation() const override { return yValue_.value_or(0); }
    QVChartYValue yValue() const override;
    bool isEqual(const QVChartPoint& other) const override;
    size_t hash() const override;
    std::string description() const override;

 private:
    std::optional<double> yValue_;
};

/// A point with named numbers ("min" and "max").
class QVChartPointDictionary final : public QVChartPoint {
 public:
    /// What averageYValue is; any other number than 0 and 1 means the maximum.
    enum class AverageStyle : int64_t { Mean = 0, Minimum = 1, Maximum = 2 };

    QVChartPointDictionary(VSDate xValue, QVChartYValues yValue)
        : QVChartPoint(xValue), yValue_(std::move(yValue)) {}
    static std::shared_ptr<QVChartPointDictionary> chartPoint(VSDate xValue, QVChartYValues yValue) {
        return std::make_shared<QVChartPointDictionary>(xValue, std::move(yValue));
    }

    AverageStyle averageStyle() const { return averageStyle_; }
    void setAverageStyle(AverageStyle style) { averageStyle_ = style; }
    void setYValue(QVChartYValues yValue) { yValue_ = std::move(yValue); }
    std::optional<double> yValueForKey(std::string_view key) const override;
    std::vector<double> allYValues() const override;
    std::optional<double> maxYValue() const override;
    std::optional<double> minYValue() const override;
    std::optional<double> averageYValue() const override;
    double yValueFloatRepresentation() const override {
        return yValue_.empty() ? 0 : yValue_.begin()->second;
    }
    QVChartYValue yValue() const override { return yValue_; }
    bool isEqual(const QVChartPoint& other) const override;
    size_t hash() const override;
    std::string description() const override;

 private:
    QVChartYValues yValue_;
    AverageStyle averageStyle_ = AverageStyle::Mean;
};
