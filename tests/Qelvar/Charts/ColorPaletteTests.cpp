#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>

#include "Qelvar/Charts/QVColorPalette.h"

namespace {

// The separable blend modes written out, for one channel of backdrop b and source s.
double overlay(double b, double s) {
    return b <= 0.5 ? 2 * b * s : 1 - 2 * (1 - b) * (1 - s);
}
double colorDodge(double b, double s) {
    return b == 0 ? 0 : s >= 1 ? 1 : std::min(1.0, b / (1 - s));
}
double colorBurn(double b, double s) {
    return b == 1 ? 1 : s <= 0 ? 0 : 1 - std::min(1.0, (1 - b) / s);
}
double softLight(double b, double s) {
    if (s <= 0.5) return b - (1 - 2 * s) * b * (1 - b);
    const double d = b <= 0.25 ? ((16 * b - 12) * b + 4) * b : std::sqrt(b);
    return b + (2 * s - 1) * (d - b);
}
double normal(double, double s) {
    return s;
}

using Channel = std::function<double(double, double)>;

QColor apply(const QColor& bottom, const QColor& top, const Channel& mode, double alpha) {
    const auto one = [&](float b, float s) {
        return static_cast<float>(b + alpha * (std::clamp(mode(b, s), 0.0, 1.0) - b));
    };
    return QColor::fromRgbF(one(bottom.redF(), top.redF()), one(bottom.greenF(), top.greenF()),
                            one(bottom.blueF(), top.blueF()));
}

QColor withAlpha(QColor color, double alpha) {
    color.setAlphaF(static_cast<float>(alpha));
    return color;
}

testing::AssertionResult near(const QColor& actual, const QColor& expected, double steps = 2.5) {
    const double off = 255 * std::max({std::abs(actual.redF() - expected.redF()),
                                       std::abs(actual.greenF() - expected.greenF()),
                                       std::abs(actual.blueF() - expected.blueF()),
                                       std::abs(actual.alphaF() - expected.alphaF())});
    if (off <= steps) return testing::AssertionSuccess();
    return testing::AssertionFailure() << actual.name(QColor::HexArgb).toStdString() << " is " << off
                                       << " steps off " << expected.name(QColor::HexArgb).toStdString();
}

const std::vector<QColor> kColors = {QColor(0, 0, 0),      QColor(255, 255, 255), QColor(200, 40, 90),
                                     QColor(20, 120, 230), QColor(128, 127, 60),  QColor(250, 240, 235),
                                     QColor(60, 61, 64)};

QVColorPalette palette() {
    return QVColorPalette::paletteWithBaseColor(QColor(200, 60, 90), QColor(240, 220, 120),
                                                QColor(30, 90, 160), QColor(10, 20, 30));
}

}  // namespace

TEST(ColorPalette, BlendsAreThoseOfTheFormulas) {
    const std::vector<std::pair<QPainter::CompositionMode, Channel>> modes = {
        {QPainter::CompositionMode_SourceOver, normal},
        {QPainter::CompositionMode_Overlay, overlay},
        {QPainter::CompositionMode_ColorDodge, colorDodge},
        {QPainter::CompositionMode_ColorBurn, colorBurn},
        {QPainter::CompositionMode_SoftLight, softLight}};
    for (const auto& [mode, formula] : modes)
        for (const QColor& bottom : kColors)
            for (const QColor& top : kColors)
                for (const double alpha : {1.0, 0.3})
                    EXPECT_TRUE(near(QVColorPalette::blend(bottom, top, mode, alpha),
                                     apply(bottom, top, formula, alpha)))
                        << "mode " << mode << " bottom " << bottom.name().toStdString() << " top "
                        << top.name().toStdString() << " alpha " << alpha;
    const QColor translucent(255, 0, 0, 10);
    EXPECT_EQ(QVColorPalette::blend(translucent, translucent, QPainter::CompositionMode_SourceOver, 1),
              QColor(255, 0, 0))
        << "the colours' own alpha plays no part";
}

TEST(ColorPalette, DerivedColoursFollowTheirRules) {
    const QVColorPalette colors = palette();
    const QColor base = colors.baseColor(), tint = colors.tintColor(), secondary = colors.secondaryColor();
    EXPECT_TRUE(near(colors.tint20(), withAlpha(tint, 0.2)));
    EXPECT_TRUE(near(colors.tintLinearDodge4(), withAlpha(apply(base, tint, colorDodge, 1), 0.04)));
    EXPECT_TRUE(near(colors.dividerAccentColor(), withAlpha(apply(base, tint, colorDodge, 1), 0.1)));
    EXPECT_TRUE(near(colors.headerUnitsColor(), withAlpha(apply(base, tint, overlay, 1), 0.5)));
    EXPECT_TRUE(near(colors.chartHighlightedLabelColor(), withAlpha(apply(base, tint, overlay, 1), 0.8)));
    EXPECT_TRUE(near(colors.tintOverlay100(), apply(base, tint, overlay, 1)));
    EXPECT_TRUE(near(colors.tintSoftLight10(), apply(base, apply(base, tint, normal, 0.1), softLight, 1)));
    EXPECT_TRUE(near(colors.secondaryColorBurn5(),
                     apply(base, apply(base, secondary, normal, 0.05), colorBurn, 1), 4));
    EXPECT_TRUE(near(colors.dividerPrimaryColor(),
                     apply(base, apply(base, secondary, normal, 0.2), colorBurn, 1), 4));
    const auto secondaryOverlay = [&](double alpha) {
        return apply(base, apply(base, secondary, overlay, 1), normal, alpha);
    };
    EXPECT_TRUE(near(colors.timePeriodSelectedPillColor(), secondaryOverlay(0.2)));
    EXPECT_TRUE(near(colors.radioSelectorPillColor(), secondaryOverlay(0.3)));
    EXPECT_TRUE(near(colors.pieChartDefaultColor(), secondaryOverlay(0.4)));
    EXPECT_TRUE(near(colors.secondaryOverlay70(), secondaryOverlay(0.7)));
    const QColor gutter = secondaryOverlay(0.3);
    EXPECT_TRUE(near(colors.currentStateChartTargetRangeColor(),
                     apply(gutter, apply(gutter, tint, normal, 0.8), overlay, 1), 4));
    EXPECT_TRUE(
        near(colors.bloodPressureBackgroundFillColor(), withAlpha(apply(base, tint, overlay, 1), 0.05)));
    const QVGradientObject gradient = colors.lineChartDefaultGradient();
    EXPECT_EQ(gradient.locations, (std::vector<double>{0, 0.75, 1}));
    EXPECT_EQ(gradient.colors[0], colors.tintOverlay50());
    EXPECT_EQ(gradient.colors[1].alpha(), 0);
    EXPECT_EQ(gradient.colors[2].alpha(), 0);
}

TEST(ColorPalette, LightBasesAndMissingTextColoursHaveTheirOwn) {
    const QColor tint(200, 10, 10), text(1, 2, 3);
    const auto with = [&](const QColor& base, std::optional<QColor> textColor) {
        return QVColorPalette::paletteWithBaseColor(base, tint, Qt::blue, textColor);
    };
    EXPECT_TRUE(with(QColor(235, 235, 235), text).baseColorIsVeryLight());
    EXPECT_FALSE(with(QColor(229, 229, 229), text).baseColorIsVeryLight());
    EXPECT_EQ(with(Qt::white, text).doneButtonTintColor(), text);
    EXPECT_EQ(with(Qt::black, text).doneButtonTintColor(), QColor(Qt::white));
    EXPECT_EQ(with(Qt::white, text).lastUpdatedColor(), QColor::fromRgbF(0.6f, 0.6f, 0.6f));
    EXPECT_EQ(with(Qt::black, text).lastUpdatedColor(), with(Qt::black, text).tintOverlay50());
    EXPECT_EQ(with(Qt::black, text).headerTitleColor(), text);
    EXPECT_EQ(with(Qt::black, std::nullopt).headerTitleColor(), tint);
    EXPECT_EQ(with(Qt::black, std::nullopt).tintTextColorWithAlpha(0.5), withAlpha(tint, 0.5));
}
