#include "Qelvar/Dashboard/QVDashboardCellLayout.h"

#include <algorithm>
#include <cmath>
#include <functional>

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
constexpr double kHeight = 187, kAxisGutter = 33, kAxisGrowth = 14;
constexpr int kSmallestFontPercent = 60, kFontStepPercent = 5;
/// Larger texts that share a line shrink no further before the second gets a line of its own.
constexpr double kSharedLineFactor = 0.85;
/// From one line to the next where texts have lines of their own.
constexpr double kTitleLine = 24, kAverageLine = 14;
/// Between what is drawn on one line and on the next. Where letters reach far beneath and above their lines
/// these stand farther apart, but only for more than a trifle: a tail seldom meets an accent.
constexpr double kLineGap = 1, kTrifle = 2;
/// What a header is high at most when each text has a line of its own, with the tallest scripts.
constexpr double kTallestHeader = 91;

using Text = QVDashboardCellContent::Text;

/// The largest factor of the fonts with which texts of that width fit; the smallest when none does.
double fittingFactor(const std::function<double(double)>& width, double room, int smallestPercent) {
    for (int percent = 100; percent > smallestPercent; percent -= kFontStepPercent)
        if (width(percent / 100.0) <= room) return percent / 100.0;
    return smallestPercent / 100.0;
}

QRectF flooredToPixels(const QRectF& frame, double scale) {
    // Sums of decimal fractions end a hair below the pixel that they mean.
    const auto floored = [scale](double value) { return std::floor(value * scale + 1e-6) / scale; };
    return {floored(frame.x()), floored(frame.y()), floored(frame.width()), floored(frame.height())};
}

/// Two texts of a line, or of two lines when `apart`.
struct Pair {
    double leadingFactor = 1, trailingFactor = 1;
    bool apart = false;
};

/// Everything in points of the background, from its left, as if in a left-to-right language.
struct Header {
    explicit Header(const QVDashboardCellContent& content)
        : content_(content),
          width_(std::max(0.0, content.width - 2 * kInset)),
          right_(width_ - kTrailingMargin),
          scale_(content.textScale) {
        if (content.hasCategoryIcon)
            icon = QRectF(kMargin, kIconTop * scale_, kIconWidth * scale_, kIconHeight * scale_);
        left_ = content.hasCategoryIcon ? icon.right() + kIconGap : kMargin;
        line_ = std::max(0.0, right_ - left_);
        layOutFirstLine();
        layOutSecondLine();
        bottom = kChartTop * scale_ + moved_;
    }

    QRectF icon, title, value, average, averageIcon, updated;
    double titleFactor = 1, valueFactor = 1, averageFactor = 1, updatedFactor = 1;
    double titleBaseline = 0, valueBaseline = 0, averageBaseline = 0, updatedBaseline = 0;
    double bottom = 0;

 private:
    /// How two texts fit, the leading one with `extra` points beside it.
    Pair fit(const Text& leading, double extra, const Text& trailing, double room) const {
        const auto leadingWidth = [&](double factor) { return widthOf(leading, factor) + extra * factor; };
        const auto trailingWidth = [&](double factor) { return widthOf(trailing, factor); };
        const auto bothWidths = [&](double factor) { return leadingWidth(factor) + trailingWidth(factor); };
        const double factor = fittingFactor(bothWidths, room, kSmallestFontPercent);
        if (scale_ <= 1 || factor >= kSharedLineFactor || leading.width <= 0 || trailing.width <= 0)
            return {factor, factor, false};
        // No further than to the size that texts have for others.
        const int smallest = std::min(kSmallestFontPercent, static_cast<int>(std::ceil(100 / scale_)));
        return {fittingFactor(leadingWidth, line_, smallest), fittingFactor(trailingWidth, line_, smallest),
                true};
    }

    /// What the text takes of a line: whole pixels, so that nothing is cut.
    double widthOf(const Text& text, double factor) const {
        const double pixels = content_.screenScale;
        return std::ceil(text.width * factor * pixels - 1e-6) / pixels;
    }

    /// From a line with that beneath its baseline to the next with that above its own.
    double lineDistance(double least, double below, double above) const {
        const double needed = below + above + kLineGap * scale_;
        return needed > least + kTrifle * scale_ ? needed : least;
    }

    static void setHeight(QRectF& frame, const Text& text, double factor, double baseline) {
        frame.setTop(baseline - text.above * factor);
        frame.setHeight((text.above + text.below) * factor);
    }

    void layOutFirstLine() {
        const Text &titleText = content_.title, &valueText = content_.value;
        const double iconGap = content_.hasCategoryIcon ? kIconGap : 0;
        const double room = width_ - 2 * kMargin - icon.right() - kTextGap - iconGap;
        const Pair pair = fit(titleText, 0, valueText, room);
        titleFactor = pair.leadingFactor;
        valueFactor = pair.trailingFactor;
        titleBaseline = valueBaseline = kFirstBaseline * scale_;
        const double naturalValue = widthOf(valueText, valueFactor);
        if (pair.apart) {
            moved_ = lineDistance(kTitleLine * scale_ * std::max(titleFactor, valueFactor),
                                  titleText.below * titleFactor, valueText.above * valueFactor);
            valueBaseline += moved_;
            title = QRectF(left_, 0, line_, 0);
            value = QRectF(left_, 0, std::min(line_, naturalValue), 0);
        } else {
            const double tooClose =
                std::max(0.0, left_ + widthOf(titleText, titleFactor) + kTextGap - (right_ - naturalValue));
            const double valueWidth = std::max(0.0, naturalValue - tooClose);
            value = QRectF(right_ - valueWidth, 0, valueWidth, 0);
            title = QRectF(left_, 0, std::max(0.0, value.left() - kTextGap - left_), 0);
        }
        setHeight(title, titleText, titleFactor, titleBaseline);
        setHeight(value, valueText, valueFactor, valueBaseline);
    }

    void layOutSecondLine() {
        const Text &averageText = content_.average, &updatedText = content_.lastUpdated;
        const double iconWidth = content_.hasAverageIcon ? (kAverageIconGap + kAverageIconWidth) * scale_ : 0;
        const double gap = averageText.width > 0 && updatedText.width > 0 ? kTextGap : 0;
        const Pair pair = fit(averageText, iconWidth, updatedText, line_ - gap);
        averageFactor = pair.leadingFactor;
        updatedFactor = pair.trailingFactor;
        moveBeneathFirstLine(averageText.above * averageFactor,
                             pair.apart ? 0 : updatedText.above * updatedFactor);
        averageBaseline = updatedBaseline = kSecondBaseline * scale_ + 1 / content_.screenScale + moved_;
        const double updatedWidth = std::min(widthOf(updatedText, updatedFactor), line_);
        double averageWidth = widthOf(averageText, averageFactor);
        const double iconRoom = iconWidth * averageFactor;
        if (pair.apart) {
            const double distance =
                lineDistance(kAverageLine * scale_ * std::max(averageFactor, updatedFactor),
                             averageText.below * averageFactor, updatedText.above * updatedFactor);
            moved_ += distance;
            updatedBaseline += distance;
            averageWidth = std::min(averageWidth, std::max(0.0, line_ - iconRoom));
        } else {
            averageWidth = std::clamp(line_ - gap - iconRoom - updatedWidth, 0.0, averageWidth);
        }
        average = QRectF(left_, 0, averageWidth, 0);
        updated = QRectF(pair.apart ? left_ : right_ - updatedWidth, 0, updatedWidth, 0);
        setHeight(average, averageText, averageFactor, averageBaseline);
        setHeight(updated, updatedText, updatedFactor, updatedBaseline);
        if (content_.hasAverageIcon)
            averageIcon = QRectF(average.right() + kAverageIconGap * scale_ * averageFactor,
                                 averageBaseline - content_.secondLineAscent * averageFactor,
                                 kAverageIconWidth * scale_ * averageFactor,
                                 (content_.secondLineAscent + content_.secondLineDescent) * averageFactor);
    }

    /// The second line stands lower where the first would run into it.
    void moveBeneathFirstLine(double averageAbove, double updatedAbove) {
        const double between = (kSecondBaseline - kFirstBaseline) * scale_;
        // Texts at the same side are above each other, and a long one is above everything.
        const double below = valueBaseline > titleBaseline ? content_.value.below * valueFactor
                                                           : std::max(content_.title.below * titleFactor,
                                                                      content_.value.below * valueFactor);
        moved_ += lineDistance(between, below, std::max(averageAbove, updatedAbove)) - between;
    }

    const QVDashboardCellContent& content_;
    const double width_, right_, scale_;
    double left_ = 0, line_ = 0;
    double moved_ = 0;  // how far what follows is moved down by lines that texts have of their own
};

}  // namespace

double QVDashboardCellLayout::preferredCellHeight(double textScale) {
    if (textScale <= 1) return kHeight;
    return std::round(kInset + kTallestHeader * textScale + kSmallestPlotHeight +
                      axisGutterHeight(textScale));
}

double QVDashboardCellLayout::axisGutterHeight(double textScale) {
    return kAxisGutter + std::round((textScale - 1) * kAxisGrowth);
}

QVDashboardCellLayout QVDashboardCellLayout::make(const QVDashboardCellContent& content) {
    const Header header(content);
    const double width = std::max(0.0, content.width - 2 * kInset);
    QVDashboardCellLayout layout;
    layout.titleFactor = header.titleFactor;
    layout.valueFactor = header.valueFactor;
    layout.averageFactor = header.averageFactor;
    layout.lastUpdatedFactor = header.updatedFactor;
    layout.background = QRectF(kInset, kInset, width, preferredCellHeight(content.textScale) - kInset);
    const auto placed = [&](QRectF frame) {
        if (content.rightToLeft) frame.moveLeft(width - frame.right());
        return flooredToPixels(frame.translated(layout.background.topLeft()), content.screenScale);
    };
    if (content.hasCategoryIcon) layout.categoryIcon = placed(header.icon);
    layout.title = placed(header.title);
    layout.value = placed(header.value);
    layout.average = placed(header.average);
    if (content.hasAverageIcon) layout.averageIcon = placed(header.averageIcon);
    layout.lastUpdated = placed(header.updated);
    layout.chart = placed(QRectF(0, header.bottom, width, layout.background.height() - header.bottom));
    const double top = layout.background.top();
    layout.titleBaseline = top + header.titleBaseline;
    layout.valueBaseline = top + header.valueBaseline;
    layout.averageBaseline = top + header.averageBaseline;
    layout.lastUpdatedBaseline = top + header.updatedBaseline;
    return layout;
}
