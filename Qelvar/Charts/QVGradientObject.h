#pragma once

#include <QColor>
#include <QLinearGradient>
#include <vector>

/// Colours at places from 0 to 1, drawn as a linear gradient.
struct QVGradientObject {
    std::vector<QColor> colors;
    std::vector<double> locations;

    static QVGradientObject gradientWithTopColor(const QColor& topColor, const QColor& bottomColor);
    /// Whether it can be drawn: it has a location, and a colour for each.
    bool isValid() const { return !locations.empty() && locations.size() == colors.size(); }
    /// The gradient from y = top (location 0) to y = bottom (location 1). REQUIRES: isValid().
    QLinearGradient verticalGradient(double top, double bottom) const;
    friend bool operator==(const QVGradientObject&, const QVGradientObject&) = default;
};
