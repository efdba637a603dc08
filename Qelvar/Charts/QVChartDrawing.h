#pragma once

#include <QPainter>
#include <QPainterPath>
#include <functional>

#include "Qelvar/Charts/QVChartSeries.h"

// Drawing that several series share. Any thread.

/// Adds the outline of a horizontal or vertical stroke from a to b. Outlines that overlap are filled once
/// when the path's fill rule is winding. A stroke of no length with a round cap is a dot.
void QVAddSegment(QPainterPath& path, QPointF a, QPointF b, double width, QVLineCapStyle cap);

/// A transparent image of that size in points, at `scale` pixels a point.
QImage QVTransparentImage(QSizeF size, double scale);

/// Runs `draw` so that nothing of what it draws shows inside the path `holes`; what was there before stays.
/// `imageSize`: of the image being painted, in points.
void QVPaintWithHoles(QPainter& painter, QSizeF imageSize, const QPainterPath& holes,
                      const std::function<void(QPainter&)>& draw);

/// Draws one line of text in the painter's font and pen with its top left there. Its baseline is that of the
/// font, whatever other fonts its characters come from, so that labels side by side stand on one line.
void QVDrawText(QPainter& painter, QPointF topLeft, const QString& text);

/// Draws the image centred on the point.
void QVDrawCentered(QPainter& painter, const QImage& image, QPointF center);
