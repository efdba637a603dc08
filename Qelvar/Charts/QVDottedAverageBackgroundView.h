#pragma once

#include <QColor>
#include <QFont>
#include <QPainter>
#include <QRectF>
#include <QString>
#include <functional>

#include "Qelvar/Charts/QVChartBackgroundView.h"

class VSNumberFormatter;

/// Shows the range's bounds as labels at the right, the average as a dotted line, and "no data" when there is
/// none.
class QVDottedAverageBackgroundView : public QVChartBackgroundView {
 public:
    QVDottedAverageBackgroundView();

    /// Between the labels and the edges, and between the line and a label.
    double labelPadding() const { return labelPadding_; }
    void setLabelPadding(double padding) { labelPadding_ = padding; }
    const QFont& labelFont() const { return labelFont_; }
    void setLabelFont(const QFont& font);
    void setLabelColor(const QColor& color) { labelColor_ = color; }
    void setAverageLineColor(const QColor& color) { averageLineColor_ = color; }
    void setNoDataLabelFont(const QFont& font) { noDataLabelFont_ = font; }
    void setNoDataLabelColor(const QColor& color) { noDataLabelColor_ = color; }
    void setAverageLineCompositingFilter(QPainter::CompositionMode mode) { averageLineFilter_ = mode; }
    void setLabelCompositingFilter(QPainter::CompositionMode mode) { labelFilter_ = mode; }
    void setNoDataLabelCompositingFilter(QPainter::CompositionMode mode) { noDataLabelFilter_ = mode; }

    /// Another text for a bound (the card asks the display type), given the number and a formatter with the
    /// fraction digits of the bounds. Without one: the number, the upper bound as "more than" above the
    /// display range.
    using BoundFormatter = std::function<QString(double value, const VSNumberFormatter& numberFormatter)>;
    void setBoundFormatter(BoundFormatter formatter) { boundFormatter_ = std::move(formatter); }

    void setValues(std::optional<double> minValue, std::optional<double> maxValue,
                   std::optional<double> averageValue, std::optional<double> maxDataValue,
                   int decimalPrecision, const VSDataUnit* dataUnit,
                   VSUnitController* unitController) override;
    void setHideAverageLine(bool hide) override;
    void setHideMinMaxLabels(bool hide) override;
    double labelWidth(const Range& range) const override;
    void layout(QSizeF size, double scale) override;
    void commitChanges(QVAnimationTime now, QVAnimationTime duration) override;
    bool advance(QVAnimationTime now) override;
    void paint(QPainter& painter) const override;

    /// What is shown once all animations have ended, for whoever describes the chart in words.
    const QString& minimumText() const { return minimumText_; }
    const QString& maximumText() const { return maximumText_; }
    bool labelsAreVisible() const { return labelsVisible_; }
    bool averageLineIsVisible() const { return averageVisible_; }
    QRectF minimumLabelFrame() const { return minimumFrame_; }
    QRectF maximumLabelFrame() const { return maximumFrame_; }
    /// One pixel high. At its place also when it is not visible.
    QRectF averageLineFrame() const { return averageFrame_; }
    QRectF noDataLabelFrame() const { return noDataFrame_; }

 private:
    void updateVisibility();
    void updateTexts();
    void layoutLabels();
    void layoutAverageLine();
    struct Texts {
        QString minimum, maximum;
    };
    Texts texts(const Range& range) const;
    QString boundText(double value, bool clampToDisplayRange, const Range& range) const;
    QFont fittingLabelFont(const Texts& texts) const;

    double labelPadding_ = 2.0;
    QFont labelFont_, shownLabelFont_;
    QColor labelColor_ = Qt::white;
    QColor averageLineColor_ = Qt::white;
    QFont noDataLabelFont_, shownNoDataFont_;
    QColor noDataLabelColor_ = Qt::white;
    QPainter::CompositionMode averageLineFilter_ = QPainter::CompositionMode_SourceOver;
    QPainter::CompositionMode labelFilter_ = QPainter::CompositionMode_SourceOver;
    QPainter::CompositionMode noDataLabelFilter_ = QPainter::CompositionMode_SourceOver;
    BoundFormatter boundFormatter_;

    QString minimumText_, maximumText_, noDataText_;
    bool labelsVisible_ = false, averageVisible_ = false;
    QRectF minimumFrame_, maximumFrame_, averageFrame_, noDataFrame_;

    QVAnimatedNumber labelOpacity_, averageOpacity_, noDataOpacity_;
    QVAnimatedNumber averageY_, averageWidth_;
};
