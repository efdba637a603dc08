#pragma once

#include <QPainter>
#include <functional>
#include <vector>

#include "Qelvar/Charts/QVChartSeries.h"

// Drawing that several series share. Any thread.

// The outline of a path is slow to fill when many of its parts lie side by side. So what belongs together but
// may overlap is drawn piece by piece, opaque, on a layer of its own, and the layer is laid over the image
// once.

/// A transparent image of that size in points, at `scale` pixels a point.
QImage QVTransparentImage(QSizeF size, double scale);

/// Runs `draw` on a transparent layer of the image's size in points, and lays the layer over the image.
void QVPaintLayer(QPainter& painter, QSizeF imageSize, double opacity,
                  const std::function<void(QPainter&)>& draw);

/// The outline of a horizontal or vertical stroke from a to b, which lies on whole pixels of the painter:
/// what is one pixel wide along it is as bright at every place.
QRectF QVSegmentOutline(const QPainter& painter, QPointF a, QPointF b, double width, QVLineCapStyle cap);

/// Fills that outline. One of no length with a round cap is a dot.
void QVFillSegment(QPainter& painter, QPointF a, QPointF b, double width, QVLineCapStyle cap,
                   const QColor& color);

/// Draws a hairline along the inside of rounded outlines, or of what they are together where they overlap.
void QVDrawEdges(QPainter& painter, QSizeF imageSize, const std::vector<QRectF>& outlines,
                 const QColor& color);
/// Draws it along the left and right side of each outline.
void QVDrawSideEdges(QPainter& painter, const std::vector<QRectF>& outlines, const QColor& color);

/// Clears circles, so that nothing drawn before shows inside them.
void QVEraseCircles(QPainter& painter, const std::vector<QPointF>& centers, double radius);

/// The colour without its transparency: for a layer that is laid over the image with that.
QColor QVOpaque(QColor color);

/// Draws one line of text in the painter's font and pen with its top left there. Its baseline is that of the
/// font, whatever other fonts its characters come from, so that labels side by side stand on one line.
void QVDrawText(QPainter& painter, QPointF topLeft, const QString& text);

/// Draws the image centred on the point.
void QVDrawCentered(QPainter& painter, const QImage& image, QPointF center);
