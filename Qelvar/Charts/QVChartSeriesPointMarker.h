#pragma once

#include <QColor>
#include <QImage>

/// How a point of a chart is marked. The numbers are those that display types give.
enum class QVPointStyle { Disc = 0, Ring = 1, UpwardChevron = 2, DownwardChevron = 3, None = 4 };

class QVChartSeriesPointMarker {
 public:
    /// The marker as a transparent image of 2 x radius by 2 x radius points, at `scale` pixels a point (which
    /// is its device pixel ratio); null for style None. Any thread.
    static QImage chartPointWithColor(const QColor& color, double radius, double lineWidth,
                                      QVPointStyle style, double scale = 2.0);
    /// The same for a text: as large beside it as the person wants texts, and sharp on every screen. Main
    /// thread only.
    static QImage chartPointForText(const QColor& color, double radius, double lineWidth, QVPointStyle style);
};
