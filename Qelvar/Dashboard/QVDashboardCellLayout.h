#pragma once

#include <QRectF>
#include <functional>

/// What the layout of a card depends on. All lengths in points.
struct QVDashboardCellContent {
    double width = 0;        // of the cell
    double screenScale = 1;  // pixels a point
    double textScale = 1;    // already in all widths and heights of text
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
///
/// Title and value share a line, and so do average and last update. Where the person wants larger texts and a
/// line cannot hold both, the second one stands on a line of its own, and the chart gives way.
struct QVDashboardCellLayout {
    /// What every card is high when texts have that scale.
    static double preferredCellHeight(double textScale);
    /// What the time axis of the chart is high then.
    static double axisGutterHeight(double textScale);

    double fontFactor = 1, valueFactor = 1;  // of the fonts of the title, and of the value
    QRectF background;
    QRectF categoryIcon;  // empty: none
    QRectF title, value;
    QRectF average, averageIcon, lastUpdated;
    QRectF chart;
    double firstBaseline = 0, valueBaseline = 0;
    double secondBaseline = 0, lastUpdatedBaseline = 0;

    static QVDashboardCellLayout make(const QVDashboardCellContent& content);
};
