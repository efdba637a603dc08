#pragma once

#include <QColor>
#include <QLinearGradient>
#include <QPainter>
#include <map>
#include <optional>

#include "Qelvar/Charts/QVGradientObject.h"

/// A family of interface colours made from four by blending. A derived colour is computed when it is first
/// asked for. One thread.
class QVColorPalette {
 public:
    /// The text colour may be none.
    static QVColorPalette paletteWithBaseColor(const QColor& baseColor, const QColor& tintColor,
                                               const QColor& secondaryColor,
                                               const std::optional<QColor>& textColor);
    QVColorPalette() = delete;

    const QColor& baseColor() const { return baseColor_; }
    const QColor& tintColor() const { return tintColor_; }
    const QColor& secondaryColor() const { return secondaryColor_; }
    const std::optional<QColor>& textColor() const { return textColor_; }
    /// Whether the base colour's grey level is above 0.9.
    bool baseColorIsVeryLight() const;

    // The blends, for any fill opacity and alpha from 0 to 1.
    QColor tintWithAlpha(double alpha) const;
    QColor tintLinearDodge(double fillOpacity, double alpha) const;
    QColor tintOverlay(double fillOpacity, double alpha) const;
    QColor tintSoftLight(double fillOpacity, double alpha) const;
    QColor secondaryColorOverlay(double fillOpacity, double alpha) const;
    QColor secondaryColorBurn(double fillOpacity, double alpha) const;
    QColor tintTextColorWithAlpha(double alpha) const;

    // The derived colours.
    QColor tint50() const { return tintWithAlpha(0.5); }
    QColor tint20() const { return tintWithAlpha(0.2); }
    QColor tintLinearDodge4() const { return tintLinearDodge(1, 0.04); }
    QColor tintLinearDodge10() const { return tintLinearDodge(1, 0.1); }
    QColor tintOverlay20() const { return tintOverlay(1, 0.2); }
    QColor tintOverlay50() const { return tintOverlay(1, 0.5); }
    QColor tintOverlay80() const { return tintOverlay(1, 0.8); }
    QColor tintOverlay100() const { return tintOverlay(1, 1.0); }
    QColor tintSoftLight10() const { return tintSoftLight(0.1, 1); }
    QColor secondaryColorBurn5() const { return secondaryColorBurn(0.05, 1); }
    QColor secondaryColorBurn20() const { return secondaryColorBurn(0.2, 1); }
    QColor secondaryOverlay20() const { return secondaryColorOverlay(1, 0.2); }
    QColor secondaryOverlay30() const { return secondaryColorOverlay(1, 0.3); }
    QColor secondaryOverlay40() const { return secondaryColorOverlay(1, 0.4); }
    QColor secondaryOverlay70() const { return secondaryColorOverlay(1, 0.7); }

    // The colours by their role.
    QColor glyphColor() const { return tintColor_; }
    QColor headerValueColor() const { return tintColor_; }
    QColor highlightedStatsColor() const { return tintColor_; }
    QColor currentStateChartPointColor() const { return tintColor_; }
    QColor timePeriodSelectedTextColor() const { return tintColor_; }
    QColor bloodPressureChartDefaultArrowColor() const { return tintColor_; }
    QColor radioSelectorHighlightedTitleColor() const { return tintColor_; }
    QColor headerTitleColor() const { return textColor_.value_or(tintColor_); }
    QColor shareButtonTintColor() const { return textColor_.value_or(tintColor_); }
    QColor infoButtonTintColor() const { return textColor_.value_or(tintColor_); }
    QColor headerUnitsColor() const { return tintOverlay50(); }
    QColor currentStateChartLabelColor() const { return tintOverlay50(); }
    QColor chartUnhighlightedLabelColor() const { return tintOverlay50(); }
    QColor bloodPressureChartDefaultTopColor() const { return tintOverlay50(); }
    QColor chartHighlightedLabelColor() const { return tintOverlay80(); }
    QColor unhighlightedStatsColor() const { return tint50(); }
    QColor timePeriodUnselectedTextColor() const { return tint50(); }
    QColor lineChartDefaultColor() const { return tint50(); }
    QColor radioSelectorUnhighlightedTitleColor() const { return tint50(); }
    QColor currentStateChartGutterColor() const { return secondaryOverlay30(); }
    QColor radioSelectorPillColor() const { return secondaryOverlay30(); }
    QColor currentStateChartTargetRangeColor() const;
    QColor timePeriodSelectedPillColor() const { return secondaryOverlay20(); }
    QColor pieChartDefaultColor() const { return secondaryOverlay40(); }
    QColor dividerPrimaryColor() const { return secondaryColorBurn20(); }
    QColor bloodPressureBackgroundTextColor() const { return secondaryColorBurn20(); }
    QColor dividerAccentColor() const { return tintLinearDodge10(); }
    QColor bloodPressureBackgroundFillColor() const;
    QColor lastUpdatedColor() const;
    QColor doneButtonTintColor() const;
    QVGradientObject lineChartDefaultGradient() const;

    /// Paints `top`, its alpha replaced, over an opaque `bottom` and reads the colour back (8 bits a
    /// channel).
    static QColor blend(const QColor& bottom, const QColor& top, QPainter::CompositionMode mode,
                        double alpha);
    static QColor fill(const QColor& bottom, const QColor& top, double opacity);
    static QColor overlay(const QColor& bottom, const QColor& top, double opacity);

 private:
    QVColorPalette(const QColor& baseColor, const QColor& tintColor, const QColor& secondaryColor,
                   const std::optional<QColor>& textColor);

    enum class Recipe { LinearDodge, TintOverlay, SoftLight, SecondaryOverlay, SecondaryBurn };
    QColor derived(Recipe recipe, double fillOpacity, double alpha) const;
    QColor compute(Recipe recipe, double fillOpacity, double alpha) const;

    QColor baseColor_, tintColor_, secondaryColor_;
    std::optional<QColor> textColor_;
    struct Key {
        Recipe recipe;
        double fillOpacity, alpha;
        friend auto operator<=>(const Key&, const Key&) = default;
    };
    mutable std::map<Key, QColor> derived_;
};
