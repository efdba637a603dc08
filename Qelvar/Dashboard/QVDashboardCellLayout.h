#pragma once

#include <QRectF>

/// What the layout of a card depends on. All lengths in points.
struct QVDashboardCellContent {
    /// A text at factor 1 of its font; all of it is in proportion to the factor.
    struct Text {
        double width = 0;             // 0: there is none
        double above = 0, below = 0;  // how far it reaches from its baseline
    };
    double width = 0;        // of the cell
    double screenScale = 1;  // pixels a point
    double textScale = 1;    // already in the measures of the texts
    bool rightToLeft = false;
    bool hasCategoryIcon = false;
    bool hasAverageIcon = false;
    Text title, value, average, lastUpdated;
    /// Of the font of the second line: the unit's icon is as high.
    double secondLineAscent = 0, secondLineDescent = 0;
};

/// Where the parts of a dashboard card stand, in points of the cell, every frame on the pixel grid.
///
/// Title and value share a line, and so do average and last update; the fonts of a line shrink together until
/// both fit. Where the person wants larger texts and they would shrink by much, the second one stands on a
/// line of its own, and cards are higher.
struct QVDashboardCellLayout {
    /// What every card is high when texts have that scale: with texts larger than normal and four lines of
    /// them the plot between the dividers is at least kSmallestPlotHeight high.
    static double preferredCellHeight(double textScale);
    /// What the time axis of the chart is high then.
    static double axisGutterHeight(double textScale);
    static constexpr double kSmallestPlotHeight = 80;

    double titleFactor = 1, valueFactor = 1;  // of the fonts
    double averageFactor = 1, lastUpdatedFactor = 1;
    QRectF background;
    QRectF categoryIcon;  // empty: none
    /// As high as what is drawn.
    QRectF title, value;
    QRectF average, averageIcon, lastUpdated;
    QRectF chart;
    double titleBaseline = 0, valueBaseline = 0;
    double averageBaseline = 0, lastUpdatedBaseline = 0;

    static QVDashboardCellLayout make(const QVDashboardCellContent& content);
};
