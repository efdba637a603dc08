#pragma once

#include <QColor>
#include <QFont>
#include <QString>
#include <map>
#include <optional>

#include "Qelvar/Charts/QVChartSeries.h"

/// Base of the series that show enumerated values in rows, one row a value, with a label at the right end.
class QVStackedValueSeries : public QVChartSeries {
 public:
    const QColor& labelColor() const { return labelColor_; }
    void setLabelColor(const QColor& color) { labelColor_ = color; }
    const QFont& labelFont() const { return labelFont_; }
    void setLabelFont(const QFont& font) { labelFont_ = font; }
    /// The labels by value; a row without one has no label.
    const std::map<int, QString>& valueLabels() const { return valueLabels_; }
    void setValueLabels(const std::map<int, QString>& labels) { valueLabels_ = labels; }
    /// The values that have a row, from the top.
    const std::vector<int>& enumeratedValueOrder() const { return enumeratedValueOrder_; }
    void setEnumeratedValueOrder(const std::vector<int>& order) { enumeratedValueOrder_ = order; }

    /// The x of the points of each value, in the order of the data set. Prepared by the subclass.
    const std::map<int, std::vector<double>>& chartPointsByValue() const { return chartPointsByValue_; }
    /// The y of a row. REQUIRES: row < enumeratedValueOrder().size().
    double yForRow(size_t row) const;

    void renderChart(QPainter& painter) const override;
    double labelRoom() const override;

 protected:
    void discardPreparation() override;
    const std::vector<double>& pointsOfRow(size_t row) const;

    std::map<int, std::vector<double>> chartPointsByValue_;

 private:
    QColor labelColor_;
    QFont labelFont_;
    std::map<int, QString> valueLabels_;
    std::vector<int> enumeratedValueOrder_;
};
