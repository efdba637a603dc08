#pragma once

#include <QRectF>
#include <functional>

/// What the layout of a card depends on. All lengths in points.
struct QVDashboardCellContent {
    double width = 0;        // of the cell
    double screenScale = 1;  // pixels a point
    bool rightToLeft = false;
    bool hasCategoryIcon = false;
    bool hasAverageIcon = false;
    /// The natural widths of title and current value with all fonts of the first line scaled by the factor.
    std::function<double(double factor)> titleWidth, valueWidth;
    double averageWidth = 0, lastUpdatedWidth = 0;
    /// The heights of the lines above and beneath the baseline, at factor 1.
    double firstLineAscent = 0, firstLineDescent = 0;
    double secondLineAscent = 0, secondLineDescent = 0;
};

/// Where the parts of a dashboard card stand, in points of the cell, every frame on the pixel grid.
struct QVDashboardCellLayout {
    /// What every card is high.
    static constexpr double preferredCellHeight = 187;

    double fontFactor = 1;  // of the first line's fonts
    QRectF background;
    QRectF categoryIcon;  // empty: none
    QRectF title, value;
    QRectF average, averageIcon, lastUpdated;
    QRectF chart;
    double firstBaseline = 0, secondBaseline = 0;

    static QVDashboardCellLayout make(const QVDashboardCellContent& content);
};
