#include "Qelvar/Charts/QVStackedValueSeries.h"

#include <QFontMetricsF>
#include <algorithm>

#include "Qelvar/Charts/QVChartDrawing.h"

namespace {

/// From the right end of a label to the right edge of the image.
constexpr double kLabelMargin = 12;

}  // namespace

double QVStackedValueSeries::yForRow(size_t row) const {
    return static_cast<double>(row + 1) * imageSize().height() /
           static_cast<double>(enumeratedValueOrder_.size() + 1);
}

const std::vector<double>& QVStackedValueSeries::pointsOfRow(size_t row) const {
    static const std::vector<double> kNone;
    const auto found = chartPointsByValue_.find(enumeratedValueOrder_[row]);
    return found == chartPointsByValue_.end() ? kNone : found->second;
}

void QVStackedValueSeries::discardPreparation() {
    QVChartSeries::discardPreparation();
    chartPointsByValue_.clear();
}

double QVStackedValueSeries::labelRoom() const {
    const QFontMetricsF metrics(labelFont_);
    double widest = 0;
    for (const auto& [value, label] : valueLabels_)
        widest = std::max(widest, metrics.horizontalAdvance(label));
    return widest > 0 ? widest + kLabelMargin : 0;
}

void QVStackedValueSeries::renderChart(QPainter& painter) const {
    QFont font = labelFont_;
    const double rowHeight = yForRow(1) - yForRow(0);
    if (const double height = QFontMetricsF(font).height(); height > rowHeight && font.pixelSize() > 0)
        font.setPixelSize(std::max(1, static_cast<int>(font.pixelSize() * rowHeight / height)));
    const QFontMetricsF metrics(font);
    painter.save();
    painter.setFont(font);
    painter.setPen(labelColor_);
    for (size_t row = 0; row < enumeratedValueOrder_.size(); ++row) {
        const auto label = valueLabels_.find(enumeratedValueOrder_[row]);
        if (label == valueLabels_.end() || label->second.isEmpty()) continue;
        const QSizeF size(metrics.horizontalAdvance(label->second), metrics.height());
        const QPointF corner(imageSize().width() - size.width() - kLabelMargin,
                             yForRow(row) - size.height() / 2);
        QVDrawText(painter, corner, label->second);
    }
    painter.restore();
}
