#pragma once

/// Margins inside a rectangle, in points.
struct QVEdgeInsets {
    double top = 0;
    double left = 0;
    double bottom = 0;
    double right = 0;

    friend QVEdgeInsets operator+(const QVEdgeInsets& a, const QVEdgeInsets& b) {
        return {a.top + b.top, a.left + b.left, a.bottom + b.bottom, a.right + b.right};
    }
    friend bool operator==(const QVEdgeInsets&, const QVEdgeInsets&) = default;
};
