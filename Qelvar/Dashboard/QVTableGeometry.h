#pragma once

#include <QRectF>
#include <optional>

/// What a table of rows of one height looks like at the moment. All in points; heights count from the top of
/// the content, which begins with a header.
struct QVTableGeometry {
    double width = 0, visibleHeight = 0;
    /// How far the visible part begins below the content's top.
    double contentOffset = 0;
    /// Room above and below the content that can be scrolled into sight.
    double topInset = 0, bottomInset = 0;
    double headerHeight = 0, rowHeight = 0;
    int rowCount = 0;

    double contentHeight() const { return headerHeight + rowCount * rowHeight; }
    /// The row that the height falls into; none above the first and below the last.
    std::optional<int> rowAt(double y) const;
    QRectF rectOfRow(int row) const;

    /// How fast the table scrolls by itself while something is dragged at that height, in points a frame;
    /// towards the content's end when positive.
    double autoScrollSpeed(double y) const;
    /// The offset after scrolling by so many points, held within the content.
    double offsetScrolledBy(double points) const;
    /// The nearest offset at which the table can come to rest.
    double restingOffset(double offset) const;
};
