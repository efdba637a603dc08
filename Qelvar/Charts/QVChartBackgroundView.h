#pragma once

#include <QPainter>
#include <QSizeF>
#include <optional>

#include "Qelvar/Charts/QVAnimation.h"
#include "Qelvar/Charts/QVEdgeInsets.h"

class VSDataUnit;
class VSUnitController;

/// What lies beneath a chart and is told its range. The base class shows nothing. Main thread only.
class QVChartBackgroundView {
 public:
    virtual ~QVChartBackgroundView() = default;

    /// All in the user's unit. The unit controller outlives the view.
    virtual void setValues(std::optional<double> minValue, std::optional<double> maxValue,
                           std::optional<double> averageValue, std::optional<double> maxDataValue,
                           int decimalPrecision, const VSDataUnit* dataUnit,
                           VSUnitController* unitController);
    std::optional<double> minValue() const { return minValue_; }
    std::optional<double> maxValue() const { return maxValue_; }
    std::optional<double> averageValue() const { return averageValue_; }
    std::optional<double> maxDataValue() const { return maxDataValue_; }
    int decimalPrecision() const { return decimalPrecision_; }
    const VSDataUnit* dataUnit() const { return dataUnit_; }
    VSUnitController* unitController() const { return unitController_; }

    const QVEdgeInsets& chartInsets() const { return chartInsets_; }
    virtual void setChartInsets(const QVEdgeInsets& insets) { chartInsets_ = insets; }
    bool hideAverageLine() const { return hideAverageLine_; }
    virtual void setHideAverageLine(bool hide) { hideAverageLine_ = hide; }
    bool hideMinMaxLabels() const { return hideMinMaxLabels_; }
    virtual void setHideMinMaxLabels(bool hide) { hideMinMaxLabels_ = hide; }
    bool showNoDataLabel() const { return showNoDataLabel_; }
    virtual void setShowNoDataLabel(bool show) { showNoDataLabel_ = show; }

    /// How wide the labels of a range would be, in points from the right edge of the view; 0: there are none.
    /// The range is not taken over.
    struct Range {
        std::optional<double> minimum, maximum, maximumInData;
        int decimalPrecision = 0;
        const VSDataUnit* dataUnit = nullptr;
        VSUnitController* unitController = nullptr;
    };
    virtual double labelWidth(const Range& range) const;
    Range range() const {
        return {minValue_, maxValue_, maxDataValue_, decimalPrecision_, dataUnit_, unitController_};
    }

    /// Lays out in a rectangle of that size, at `scale` pixels a point.
    virtual void layout(QSizeF size, double scale);
    /// What has changed since the last call moves there in that time (0: at once).
    virtual void commitChanges(QVAnimationTime now, QVAnimationTime duration);
    /// Moves animations on; returns whether one is still running.
    virtual bool advance(QVAnimationTime now);
    /// Paints with the origin at the view's top left.
    virtual void paint(QPainter& painter) const;

 protected:
    QSizeF size() const { return size_; }
    double scale() const { return scale_; }

 private:
    std::optional<double> minValue_, maxValue_, averageValue_, maxDataValue_;
    int decimalPrecision_ = 0;
    const VSDataUnit* dataUnit_ = nullptr;
    VSUnitController* unitController_ = nullptr;
    QVEdgeInsets chartInsets_;
    bool hideAverageLine_ = false, hideMinMaxLabels_ = false, showNoDataLabel_ = false;
    QSizeF size_;
    double scale_ = 1;
};
