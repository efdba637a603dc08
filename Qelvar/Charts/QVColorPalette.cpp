#include "Qelvar/Charts/QVColorPalette.h"

#include <QImage>

namespace {

QColor withAlpha(QColor color, double alpha) {
    color.setAlphaF(static_cast<float>(alpha));
    return color;
}

}  // namespace

QVColorPalette QVColorPalette::paletteWithBaseColor(const QColor& baseColor, const QColor& tintColor,
                                                    const QColor& secondaryColor,
                                                    const std::optional<QColor>& textColor) {
    return QVColorPalette(baseColor, tintColor, secondaryColor, textColor);
}

QVColorPalette::QVColorPalette(const QColor& baseColor, const QColor& tintColor, const QColor& secondaryColor,
                               const std::optional<QColor>& textColor)
    : baseColor_(baseColor), tintColor_(tintColor), secondaryColor_(secondaryColor), textColor_(textColor) {}

bool QVColorPalette::baseColorIsVeryLight() const {
    constexpr double kVeryLight = 0.9;
    return 0.299 * baseColor_.redF() + 0.587 * baseColor_.greenF() + 0.114 * baseColor_.blueF() > kVeryLight;
}

QColor QVColorPalette::blend(const QColor& bottom, const QColor& top, QPainter::CompositionMode mode,
                             double alpha) {
    QImage pixel(1, 1, QImage::Format_ARGB32_Premultiplied);
    pixel.fill(withAlpha(bottom, 1));
    QPainter painter(&pixel);
    painter.setCompositionMode(mode);
    painter.fillRect(0, 0, 1, 1, withAlpha(top, alpha));
    painter.end();
    return pixel.pixelColor(0, 0);
}

QColor QVColorPalette::fill(const QColor& bottom, const QColor& top, double opacity) {
    return opacity < 1 ? blend(bottom, top, QPainter::CompositionMode_SourceOver, opacity) : top;
}

QColor QVColorPalette::overlay(const QColor& bottom, const QColor& top, double opacity) {
    return blend(bottom, fill(bottom, top, opacity), QPainter::CompositionMode_Overlay, 1);
}

QColor QVColorPalette::compute(Recipe recipe, double fillOpacity, double alpha) const {
    using enum Recipe;
    const auto blendFilled = [&](const QColor& top, QPainter::CompositionMode mode) {
        return blend(baseColor_, fill(baseColor_, top, fillOpacity), mode, 1);
    };
    const auto laidOverBase = [&](const QColor& color) {
        return blend(baseColor_, color, QPainter::CompositionMode_SourceOver, alpha);
    };
    switch (recipe) {
        case LinearDodge:
            return withAlpha(blendFilled(tintColor_, QPainter::CompositionMode_ColorDodge), alpha);
        case TintOverlay:
            return withAlpha(overlay(baseColor_, tintColor_, fillOpacity), alpha);
        case SoftLight:
            return withAlpha(blendFilled(tintColor_, QPainter::CompositionMode_SoftLight), alpha);
        case SecondaryOverlay:
            return laidOverBase(overlay(baseColor_, secondaryColor_, fillOpacity));
        case SecondaryBurn:
            return laidOverBase(blendFilled(secondaryColor_, QPainter::CompositionMode_ColorBurn));
    }
    return {};
}

QColor QVColorPalette::derived(Recipe recipe, double fillOpacity, double alpha) const {
    const Key key{recipe, fillOpacity, alpha};
    const auto found = derived_.find(key);
    if (found != derived_.end()) return found->second;
    return derived_.emplace(key, compute(recipe, fillOpacity, alpha)).first->second;
}

QColor QVColorPalette::tintWithAlpha(double alpha) const {
    return withAlpha(tintColor_, alpha);
}

QColor QVColorPalette::tintLinearDodge(double fillOpacity, double alpha) const {
    return derived(Recipe::LinearDodge, fillOpacity, alpha);
}

QColor QVColorPalette::tintOverlay(double fillOpacity, double alpha) const {
    return derived(Recipe::TintOverlay, fillOpacity, alpha);
}

QColor QVColorPalette::tintSoftLight(double fillOpacity, double alpha) const {
    return derived(Recipe::SoftLight, fillOpacity, alpha);
}

QColor QVColorPalette::secondaryColorOverlay(double fillOpacity, double alpha) const {
    return derived(Recipe::SecondaryOverlay, fillOpacity, alpha);
}

QColor QVColorPalette::secondaryColorBurn(double fillOpacity, double alpha) const {
    return derived(Recipe::SecondaryBurn, fillOpacity, alpha);
}

QColor QVColorPalette::tintTextColorWithAlpha(double alpha) const {
    return withAlpha(textColor_.value_or(tintColor_), alpha);
}

QColor QVColorPalette::currentStateChartTargetRangeColor() const {
    return overlay(currentStateChartGutterColor(), tintColor_, 0.8);
}

QColor QVColorPalette::bloodPressureBackgroundFillColor() const {
    return withAlpha(tintOverlay20(), 0.05);
}

QColor QVColorPalette::lastUpdatedColor() const {
    return baseColorIsVeryLight() ? QColor::fromRgbF(0.6f, 0.6f, 0.6f) : tintOverlay50();
}

QColor QVColorPalette::doneButtonTintColor() const {
    return baseColorIsVeryLight() ? textColor_.value_or(tintColor_) : QColor(Qt::white);
}

QVGradientObject QVColorPalette::lineChartDefaultGradient() const {
    const QColor color = tintOverlay50();
    return {{color, withAlpha(color, 0), withAlpha(color, 0)}, {0, 0.75, 1}};
}
