#include "Qelvar/Charts/QVChartBackgroundView.h"

void QVChartBackgroundView::setValues(std::optional<double> minValue, std::optional<double> maxValue,
                                      std::optional<double> averageValue, std::optional<double> maxDataValue,
                                      int decimalPrecision, const VSDataUnit* dataUnit,
                                      VSUnitController* unitController) {
    minValue_ = minValue;
    maxValue_ = maxValue;
    averageValue_ = averageValue;
    maxDataValue_ = maxDataValue;
    decimalPrecision_ = decimalPrecision;
    dataUnit_ = dataUnit;
    unitController_ = unitController;
}

double QVChartBackgroundView::labelWidth(const Range&) const {
    return 0;
}

void QVChartBackgroundView::layout(QSizeF size, double scale) {
    size_ = size;
    scale_ = scale;
}

void QVChartBackgroundView::commitChanges(QVAnimationTime, QVAnimationTime) {}
bool QVChartBackgroundView::advance(QVAnimationTime) {
    return false;
}
void QVChartBackgroundView::paint(QPainter&) const {}
