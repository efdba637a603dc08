#include "Qelvar/Charts/QVStackedDotSeries.h"

#include <string>

#include "Qelvar/Charts/QVChartDrawing.h"
#include "Qelvar/Models/Data/QVChartDataSet.h"

void QVStackedDotSeries::prepareForRendering(QSizeF size, std::optional<VSDate> minXValue,
                                             std::optional<VSDate> maxXValue, std::optional<double> minYValue,
                                             std::optional<double> maxYValue, const QVEdgeInsets& insets,
                                             std::shared_ptr<const QVChartDataSet> dataSet) {
    QVChartSeries::prepareForRendering(size, minXValue, maxXValue, minYValue, maxYValue, insets,
                                       std::move(dataSet));
    chartPointsByValue_.clear();
    for (const auto& chartPoint : this->dataSet()->allDataPoints())
        for (const int value : enumeratedValueOrder())
            if (chartPoint->yValueForKey(std::to_string(value)).value_or(0) != 0)
                chartPointsByValue_[value].push_back(xForChartPoint(*chartPoint));
}

void QVStackedDotSeries::renderChart(QPainter& painter) const {
    QVStackedValueSeries::renderChart(painter);
    const QImage marker = QVChartSeriesPointMarker::chartPointWithColor(
        pointColor_, pointRadius_, pointLineWidth_, pointStyle_, painter.device()->devicePixelRatio());
    for (size_t row = 0; row < enumeratedValueOrder().size(); ++row)
        for (const double x : pointsOfRow(row)) QVDrawCentered(painter, marker, {x, yForRow(row)});
}
