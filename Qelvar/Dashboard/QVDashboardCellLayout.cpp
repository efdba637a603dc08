#include "Qelvar/Dashboard/QVDashboardCellLayout.h"

#include <algorithm>
#include <cmath>

namespace {

constexpr double kInset = 4;    // of the background, but at the bottom
constexpr double kMargin = 12;  // of the first text, and of the icon
constexpr double kIconTop = 8;
constexpr double kIconWidth = 25, kIconHeight = 28;
constexpr double kIconGap = 4;
constexpr double kTrailingMargin = 11;
constexpr double kTextGap = 8;  // at least so much between two texts of a line
constexpr double kFirstBaseline = 22;
constexpr double kSecondBaseline = 36;
constexpr double kAverageIconGap = 1.5, kAverageIconWidth = 7.5;
constexpr double kChartTop = 44;
constexpr int kSmallestFontPercent = 60, kFontStepPercent = 5;

/// The largest factor of the fonts with which both texts fit; the smallest one when none does.
double fittingFontFactor(const QVDashboardCellContent& content, double backgroundWidth, double iconRight,
                         double iconGap) {
    const double room = backgroundWidth - 2 * kMargin - iconRight - kTextGap - iconGap;
    for (int percent = 100; percent > kSmallestFontPercent; percent -= kFontStepPercent) {
        const double factor = percent / 100.0;
        if (content.titleWidth(factor) + content.valueWidth(factor) <= room) return factor;
    }
    return kSmallestFontPercent / 100.0;
}

QRectF flooredToPixels(const QRectF& frame, double scale) {
    // Sums of decimal fractions end a hair below the pixel that they mean.
    const auto floored = [scale](double value) { return std::floor(value * scale + 1e-6) / scale; };
    return {floored(frame.x()), floored(frame.y()), floored(frame.width()), floored(frame.height())};
}

}  // namespace

QVDashboardCellLayout QVDashboardCellLayout::make(const QVDashboardCellContent& content) {
    QVDashboardCellLayout layout;
    const double pixel = 1 / content.screenScale;
    const double width = std::max(0.0, content.width - 2 * kInset);
    // Everything below is in points of the background, from its left; the end moves and mirrors it.
    const QRectF icon =
        content.hasCategoryIcon ? QRectF(kMargin, kIconTop, kIconWidth, kIconHeight) : QRectF();
    const double iconGap = content.hasCategoryIcon ? kIconGap : 0;
    const double textLeft = content.hasCategoryIcon ? icon.right() + iconGap : kMargin;

    layout.fontFactor = fittingFontFactor(content, width, icon.right(), iconGap);
    const double naturalTitle = content.titleWidth(layout.fontFactor);
    const double naturalValue = content.valueWidth(layout.fontFactor);
    const double lineTop = kFirstBaseline - content.firstLineAscent * layout.fontFactor;
    const double lineHeight = (content.firstLineAscent + content.firstLineDescent) * layout.fontFactor;
    const double valueRight = width - kTrailingMargin;
    const double tooClose = std::max(0.0, textLeft + naturalTitle + kTextGap - (valueRight - naturalValue));
    const double valueWidth = std::max(0.0, naturalValue - tooClose);
    QRectF value(valueRight - valueWidth, lineTop, valueWidth, lineHeight);
    QRectF title(textLeft, lineTop, std::max(0.0, value.left() - kTextGap - textLeft), lineHeight);

    const double secondBaseline = kSecondBaseline + pixel;
    const double secondTop = secondBaseline - content.secondLineAscent;
    const double secondHeight = content.secondLineAscent + content.secondLineDescent;
    const double updatedWidth = std::min(content.lastUpdatedWidth, std::max(0.0, valueRight - textLeft));
    const QRectF updated(valueRight - updatedWidth, secondTop, updatedWidth, secondHeight);
    const double overlap = std::max(0.0, textLeft + content.averageWidth + kTextGap - updated.left());
    const double averageWidth = std::max(0.0, content.averageWidth - (updatedWidth > 0 ? overlap : 0));
    const QRectF average(textLeft, secondTop, averageWidth, secondHeight);
    const QRectF averageIcon = content.hasAverageIcon ? QRectF(average.right() + kAverageIconGap, secondTop,
                                                               kAverageIconWidth, secondHeight)
                                                      : QRectF();

    layout.background = QRectF(kInset, kInset, width, preferredCellHeight - kInset);
    const auto placed = [&](QRectF frame) {
        if (content.rightToLeft) frame.moveLeft(width - frame.right());
        return flooredToPixels(frame.translated(layout.background.topLeft()), content.screenScale);
    };
    if (content.hasCategoryIcon) layout.categoryIcon = placed(icon);
    layout.title = placed(title);
    layout.value = placed(value);
    layout.average = placed(average);
    if (content.hasAverageIcon) layout.averageIcon = placed(averageIcon);
    layout.lastUpdated = placed(updated);
    layout.chart = placed(QRectF(0, kChartTop, width, layout.background.height() - kChartTop));
    layout.firstBaseline = layout.background.top() + kFirstBaseline;
    layout.secondBaseline = layout.background.top() + secondBaseline;
    return layout;
}
