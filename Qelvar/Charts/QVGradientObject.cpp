#include "Qelvar/Charts/QVGradientObject.h"

QVGradientObject QVGradientObject::gradientWithTopColor(const QColor& topColor, const QColor& bottomColor) {
    return {{topColor, bottomColor}, {0, 1}};
}

QLinearGradient QVGradientObject::verticalGradient(double top, double bottom) const {
    QLinearGradient gradient(0, top, 0, bottom);
    for (size_t i = 0; i < locations.size(); ++i) gradient.setColorAt(locations[i], colors[i]);
    return gradient;
}
