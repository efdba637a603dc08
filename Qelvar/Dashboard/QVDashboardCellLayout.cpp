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
constexpr double kHeight = 187, kAxisGutter = 33;
constexpr int kSmallestFontPercent = 60, kFontStepPercent = 5;
/// Larger texts shrink no further before the value gets a line of its own.
constexpr double kSharedLineFactor = 0.85;
/// What larger texts add to a card, for each further 100 %: to the header, to the axis, and half of what
/// lines of their own take.
constexpr double kHeaderGrowth = kChartTop, kAxisGrowth = 14, kOwnLineGrowth = 40;

/// The largest factor of the fonts with which the text fits; the smallest one when none does.
double fittingFontFactor(const std::function<double(double)>& textWidth, double room,
                         int smallestPercent = kSmallestFontPercent) {
    for (int percent = 100; percent > smallestPercent; percent -= kFontStepPercent) {
        const double factor = percent / 100.0;
        if (textWidth(factor) <= room) return factor;
    }
    return smallestPercent / 100.0;
}

QRectF flooredToPixels(const QRectF& frame, double scale) {
    // Sums of decimal fractions end a hair below the pixel that they mean.
    const auto floored = [scale](double value) { return std::floor(value * scale + 1e-6) / scale; };
    return {floored(frame.x()), floored(frame.y()), floored(frame.width()), floored(frame.height())};
}

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
        layOutFirstLine();
        layOutSecondLine();
        bottom = kChartTop * scale_ + ownLines_;
    }

    QRectF icon, title, value, average, averageIcon, updated;
    double titleFactor = 1, valueFactor = 1;
    double titleBaseline = 0, valueBaseline = 0, averageBaseline = 0, updatedBaseline = 0;
    double bottom = 0;

 private:
    void layOutFirstLine() {
        const double iconGap = content_.hasCategoryIcon ? kIconGap : 0;
        const double room = width_ - 2 * kMargin - icon.right() - kTextGap - iconGap;
        const auto bothWidths = [this](double factor) {
            return content_.titleWidth(factor) + content_.valueWidth(factor);
        };
        titleFactor = valueFactor = fittingFontFactor(bothWidths, room);
        titleBaseline = valueBaseline = kFirstBaseline * scale_;
        const double lineHeight = content_.firstLineAscent + content_.firstLineDescent;
        if (scale_ > 1 && titleFactor < kSharedLineFactor) {
            const double wholeLine = std::max(0.0, right_ - left_);
            // No further than to the size that texts have for others.
            const int smallest = std::min(kSmallestFontPercent, static_cast<int>(std::ceil(100 / scale_)));
            titleFactor = fittingFontFactor(content_.titleWidth, wholeLine, smallest);
            valueFactor = fittingFontFactor(content_.valueWidth, wholeLine, smallest);
            ownLines_ += lineHeight;
            valueBaseline += lineHeight;
            value = QRectF(left_, 0, std::min(wholeLine, content_.valueWidth(valueFactor)), 0);
            title = QRectF(left_, 0, wholeLine, 0);
        } else {
            const double naturalTitle = content_.titleWidth(titleFactor);
            const double naturalValue = content_.valueWidth(valueFactor);
            const double tooClose = std::max(0.0, left_ + naturalTitle + kTextGap - (right_ - naturalValue));
            const double valueWidth = std::max(0.0, naturalValue - tooClose);
            value = QRectF(right_ - valueWidth, 0, valueWidth, 0);
            title = QRectF(left_, 0, std::max(0.0, value.left() - kTextGap - left_), 0);
        }
        title.setTop(titleBaseline - content_.firstLineAscent * titleFactor);
        title.setHeight(lineHeight * titleFactor);
        value.setTop(valueBaseline - content_.firstLineAscent * valueFactor);
        value.setHeight(lineHeight * valueFactor);
    }

    void layOutSecondLine() {
        const double wholeLine = std::max(0.0, right_ - left_);
        const double iconWidth = kAverageIconWidth * scale_;
        averageBaseline = updatedBaseline = kSecondBaseline * scale_ + 1 / content_.screenScale + ownLines_;
        const double lineHeight = content_.secondLineAscent + content_.secondLineDescent;
        const double updatedWidth = std::min(content_.lastUpdatedWidth, wholeLine);
        double updatedLeft = right_ - updatedWidth;
        double averageWidth = content_.averageWidth;
        const double overlap = std::max(0.0, left_ + averageWidth + kTextGap - updatedLeft);
        if (scale_ > 1 && overlap > 0 && averageWidth > 0 && updatedWidth > 0) {
            ownLines_ += lineHeight;
            updatedBaseline += lineHeight;
            updatedLeft = left_;
            const double iconRoom = content_.hasAverageIcon ? kAverageIconGap + iconWidth : 0;
            averageWidth = std::min(averageWidth, std::max(0.0, wholeLine - iconRoom));
        } else if (updatedWidth > 0) {
            averageWidth = std::max(0.0, averageWidth - overlap);
        }
        const double top = averageBaseline - content_.secondLineAscent;
        average = QRectF(left_, top, averageWidth, lineHeight);
        updated = QRectF(updatedLeft, updatedBaseline - content_.secondLineAscent, updatedWidth, lineHeight);
        if (content_.hasAverageIcon)
            averageIcon = QRectF(average.right() + kAverageIconGap, top, iconWidth, lineHeight);
    }

    const QVDashboardCellContent& content_;
    const double width_, right_, scale_;
    double left_ = 0;
    double ownLines_ = 0;  // the height of the lines that texts have of their own
};

}  // namespace

double QVDashboardCellLayout::preferredCellHeight(double textScale) {
    return kHeight + std::round((textScale - 1) * (kHeaderGrowth + kAxisGrowth + kOwnLineGrowth));
}

double QVDashboardCellLayout::axisGutterHeight(double textScale) {
    return kAxisGutter + std::round((textScale - 1) * kAxisGrowth);
}

QVDashboardCellLayout QVDashboardCellLayout::make(const QVDashboardCellContent& content) {
    const Header header(content);
    const double width = std::max(0.0, content.width - 2 * kInset);
    QVDashboardCellLayout layout;
    layout.fontFactor = header.titleFactor;
    layout.valueFactor = header.valueFactor;
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
    layout.firstBaseline = top + header.titleBaseline;
    layout.valueBaseline = top + header.valueBaseline;
    layout.secondBaseline = top + header.averageBaseline;
    layout.lastUpdatedBaseline = top + header.updatedBaseline;
    return layout;
}
