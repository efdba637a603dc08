#include "Qelvar/Charts/QVDottedAverageBackgroundView.h"

#include <QFontMetricsF>
#include <algorithm>
#include <cmath>

#include "Platform/Localization.h"
#include "Platform/StyledText.h"
#include "Platform/TextScale.h"
#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

namespace {

constexpr double kDotLength = 2;
constexpr double kDotPeriod = 3;
/// Between the line and the dividers above and below.
constexpr double kDividerGap = 2;
/// Of the width, for the labels.
constexpr double kLargestLabelShare = 0.25;

/// What is on its way to the same target goes on undisturbed.
void move(QVAnimatedNumber& number, double target, QVAnimationTime now, QVAnimationTime duration) {
    if (number.target() != target) number.animateTo(target, now, duration, QVAnimationCurve::EaseOut);
}

double textHeight(const QFont& font) {
    const QFontMetricsF metrics(font);
    return metrics.ascent() + metrics.descent();
}

struct LabelPaint {
    QFont font;
    QColor color;
    QPainter::CompositionMode mode;
    double opacity;
};

/// The text at the right end of the frame.
void paintText(QPainter& painter, const QRectF& frame, const QString& text, const LabelPaint& paint) {
    if (paint.opacity <= 0 || text.isEmpty()) return;
    const QFontMetricsF metrics(paint.font);
    painter.save();
    painter.setOpacity(painter.opacity() * paint.opacity);
    painter.setCompositionMode(paint.mode);
    painter.setFont(paint.font);
    painter.setPen(paint.color);
    QVDrawText(painter,
               {frame.right() - metrics.horizontalAdvance(text), frame.center().y() - metrics.height() / 2},
               text);
    painter.restore();
}

}  // namespace

QVDottedAverageBackgroundView::QVDottedAverageBackgroundView() : noDataLabelFont_(platform::systemFont(0)) {
    setLabelFont(platform::systemFont(10));
}

void QVDottedAverageBackgroundView::setLabelFont(const QFont& font) {
    labelFont_ = shownLabelFont_ = font;
}

void QVDottedAverageBackgroundView::setValues(std::optional<double> minValue, std::optional<double> maxValue,
                                              std::optional<double> averageValue,
                                              std::optional<double> maxDataValue, int decimalPrecision,
                                              const VSDataUnit* dataUnit, VSUnitController* unitController) {
    QVChartBackgroundView::setValues(minValue, maxValue, averageValue, maxDataValue, decimalPrecision,
                                     dataUnit, unitController);
    updateVisibility();
    updateTexts();
    layoutLabels();
    layoutAverageLine();
}

void QVDottedAverageBackgroundView::setHideAverageLine(bool hide) {
    QVChartBackgroundView::setHideAverageLine(hide);
    updateVisibility();
}

void QVDottedAverageBackgroundView::setHideMinMaxLabels(bool hide) {
    QVChartBackgroundView::setHideMinMaxLabels(hide);
    updateVisibility();
}

void QVDottedAverageBackgroundView::updateVisibility() {
    const bool boundsKnown = minValue() || maxValue();
    labelsVisible_ = boundsKnown && !hideMinMaxLabels();
    const std::optional<double> average = averageValue();
    averageVisible_ = boundsKnown && !hideAverageLine() && average && !std::isnan(*average) &&
                      (!minValue() || *average >= *minValue()) && (!maxValue() || *average <= *maxValue());
}

QString QVDottedAverageBackgroundView::boundText(double value, bool clampToDisplayRange,
                                                 const Range& range) const {
    const auto digits = QVNumberFormatterWithFractionDigits(range.decimalPrecision);
    if (boundFormatter_) return boundFormatter_(value, *digits);
    if (!range.dataUnit || !range.unitController) return digits->stringFromNumber(value);
    const auto own = qv_numberFormatterForUnit(range.dataUnit->dataType(),
                                               range.unitController->unitForDataUnit(range.dataUnit));
    const VSNumberFormatter* formatter = own ? own.get() : digits.get();
    return QVStringFromNumberInDisplayRange(value, range.dataUnit, *range.unitController, clampToDisplayRange,
                                            formatter);
}

QVDottedAverageBackgroundView::Texts QVDottedAverageBackgroundView::texts(const Range& range) const {
    const std::optional<double> maximum =
        std::max(range.maximum, range.maximumInData);  // none is less than any
    return {range.minimum ? boundText(*range.minimum, false, range) : QString(),
            maximum ? boundText(*maximum, true, range) : QString()};
}

void QVDottedAverageBackgroundView::updateTexts() {
    auto [minimum, maximum] = texts(range());
    minimumText_ = std::move(minimum);
    maximumText_ = std::move(maximum);
}

/// Larger texts shrink, though not below the normal size, before they take most of the plot's width.
QFont QVDottedAverageBackgroundView::fittingLabelFont(const Texts& texts) const {
    QFont font = labelFont_;
    const auto widest = [&] {
        const QFontMetricsF metrics(font);
        return std::max(metrics.horizontalAdvance(texts.minimum), metrics.horizontalAdvance(texts.maximum));
    };
    const int smallest = static_cast<int>(std::ceil(labelFont_.pixelSize() / platform::textScale()));
    while (font.pixelSize() > smallest && widest() > kLargestLabelShare * size().width())
        font.setPixelSize(font.pixelSize() - 1);
    return font;
}

double QVDottedAverageBackgroundView::labelWidth(const Range& range) const {
    if (hideMinMaxLabels() || (!range.minimum && !range.maximum)) return 0;
    const Texts shown = texts(range);
    const QFontMetricsF metrics(fittingLabelFont(shown));
    return std::max(metrics.horizontalAdvance(shown.minimum), metrics.horizontalAdvance(shown.maximum));
}

void QVDottedAverageBackgroundView::layout(QSizeF size, double scale) {
    QVChartBackgroundView::layout(size, scale);
    noDataText_ = platform::localized("CHART_NO_DATA");
    layoutLabels();
    layoutAverageLine();
}

void QVDottedAverageBackgroundView::layoutLabels() {
    const double pixel = 1 / scale();
    const auto downToPixel = [this](double value) { return std::floor(value * scale()) / scale(); };
    const auto upToPixel = [this](double value) { return std::ceil(value * scale()) / scale(); };
    shownLabelFont_ = fittingLabelFont({minimumText_, maximumText_});
    const QFontMetricsF metrics(shownLabelFont_);
    const double height = upToPixel(std::max(metrics.height(), textHeight(shownLabelFont_)));
    const auto frame = [&](const QString& text, double y) {
        const double width = upToPixel(metrics.horizontalAdvance(text));
        return QRectF(downToPixel(size().width() - width + pixel), downToPixel(y), width, height);
    };
    maximumFrame_ = frame(maximumText_, labelPadding_);
    minimumFrame_ = frame(minimumText_, size().height() - height - labelPadding_);

    shownNoDataFont_ = noDataLabelFont_;
    const double noDataWidth = QFontMetricsF(noDataLabelFont_).horizontalAdvance(noDataText_);
    if (noDataWidth > size().width() && noDataLabelFont_.pixelSize() > 0)
        shownNoDataFont_.setPixelSize(
            std::max(1, static_cast<int>(noDataLabelFont_.pixelSize() * size().width() / noDataWidth)));
    const QFontMetricsF noDataMetrics(shownNoDataFont_);
    noDataFrame_ = QRectF(0, 0, upToPixel(noDataMetrics.horizontalAdvance(noDataText_)),
                          upToPixel(noDataMetrics.height()));
    noDataFrame_.moveTo(downToPixel((size().width() - noDataFrame_.width()) / 2),
                        downToPixel((size().height() - noDataFrame_.height()) / 2));
}

void QVDottedAverageBackgroundView::layoutAverageLine() {
    const double pixel = 1 / scale();
    double position = 0.5;
    if (averageVisible_ && minValue() && maxValue() && *minValue() != *maxValue())
        position = (*maxValue() - *averageValue()) / (*maxValue() - *minValue());
    if (!std::isfinite(position)) position = 0.5;
    const double height = size().height() - chartInsets().top - chartInsets().bottom;
    const double wanted = std::round((chartInsets().top + position * height) * scale()) / scale();
    // An average at a bound is told beside the divider that stands there, not on it.
    const double lowest = std::max(kDividerGap, size().height() - kDividerGap - pixel);
    const double y = std::clamp(wanted, kDividerGap, lowest);

    averageFrame_ = QRectF(0, y, size().width(), pixel);
    if (!labelsVisible_) return;
    for (const QRectF& label : {minimumFrame_, maximumFrame_})
        if (!label.isEmpty() && averageFrame_.intersects(label))
            averageFrame_.setWidth(std::max(0.0, label.left() - labelPadding_));
}

void QVDottedAverageBackgroundView::commitChanges(QVAnimationTime now, QVAnimationTime duration) {
    // A line that was not to be seen appears at its place.
    const QVAnimationTime moving = averageOpacity_.value() > 0 ? duration : QVAnimationTime::zero();
    layoutAverageLine();
    move(averageY_, averageFrame_.top(), now, moving);
    move(averageWidth_, averageFrame_.width(), now, moving);
    move(labelOpacity_, labelsVisible_ ? 1 : 0, now, duration);
    move(averageOpacity_, averageVisible_ ? 1 : 0, now, duration);
    move(noDataOpacity_, showNoDataLabel() ? 1 : 0, now, duration);
}

bool QVDottedAverageBackgroundView::advance(QVAnimationTime now) {
    bool running = false;
    for (QVAnimatedNumber* number :
         {&labelOpacity_, &averageOpacity_, &noDataOpacity_, &averageY_, &averageWidth_})
        running |= number->advance(now);
    return running;
}

void QVDottedAverageBackgroundView::paint(QPainter& painter) const {
    if (averageOpacity_.value() > 0) {
        painter.save();
        painter.setOpacity(painter.opacity() * averageOpacity_.value());
        painter.setCompositionMode(averageLineFilter_);
        for (double x = 0; x < averageWidth_.value(); x += kDotPeriod)
            painter.fillRect(
                QRectF(x, averageY_.value(), std::min(kDotLength, averageWidth_.value() - x), 1 / scale()),
                averageLineColor_);
        painter.restore();
    }
    const LabelPaint labels{shownLabelFont_, labelColor_, labelFilter_, labelOpacity_.value()};
    paintText(painter, maximumFrame_, maximumText_, labels);
    paintText(painter, minimumFrame_, minimumText_, labels);
    paintText(painter, noDataFrame_, noDataText_,
              {shownNoDataFont_, noDataLabelColor_, noDataLabelFilter_, noDataOpacity_.value()});
}
