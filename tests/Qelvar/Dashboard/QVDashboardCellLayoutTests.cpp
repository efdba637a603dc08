#include "Qelvar/Dashboard/QVDashboardCellLayout.h"

#include <gtest/gtest.h>

#include <rapidcheck/gtest.h>

#include "CardTestSupport.h"

namespace {

using Text = QVDashboardCellContent::Text;

/// A card of a phone's width, with texts of the given widths at full size.
QVDashboardCellContent content(double titleWidth, double valueWidth) {
    QVDashboardCellContent content;
    content.width = 375;
    content.screenScale = 2;
    content.title = {titleWidth, 14, 4};
    content.value = {valueWidth, 14, 4};
    content.average = {100, 8, 2};
    content.lastUpdated = {80, 8, 2};
    content.secondLineAscent = 10;
    content.secondLineDescent = 3;
    return content;
}

TEST(DashboardCellLayout, PartsStandWhereTheyBelong) {
    auto parts = content(60, 90);
    auto layout = QVDashboardCellLayout::make(parts);
    EXPECT_EQ(layout.background, QRectF(4, 4, 367, 183));
    EXPECT_EQ(layout.titleFactor, 1);
    EXPECT_EQ(layout.titleBaseline, 4 + 22);
    EXPECT_EQ(layout.averageBaseline, 4 + 36.5) << "a pixel more than 36";
    EXPECT_EQ(layout.value, QRectF(4 + 367 - 11 - 90, 4 + 8, 90, 18));
    EXPECT_EQ(layout.title, QRectF(4 + 12, 4 + 8, 367 - 11 - 90 - 8 - 12, 18))
        << "up to 8 points before the value";
    EXPECT_EQ(layout.average, QRectF(16, 4 + 28.5, 100, 10));
    EXPECT_EQ(layout.lastUpdated.right(), 4 + 367 - 11);
    EXPECT_EQ(layout.chart, QRectF(4, 48, 367, 139));
    EXPECT_TRUE(layout.categoryIcon.isEmpty());
    EXPECT_TRUE(layout.averageIcon.isEmpty());

    parts.hasCategoryIcon = parts.hasAverageIcon = true;
    layout = QVDashboardCellLayout::make(parts);
    EXPECT_EQ(layout.categoryIcon, QRectF(4 + 12, 4 + 8, 25, 28));
    EXPECT_EQ(layout.title.left(), 4 + 41);
    EXPECT_EQ(layout.average.left(), 4 + 41);
    EXPECT_EQ(layout.averageIcon, QRectF(layout.average.right() + 1.5, 4 + 26.5, 7.5, 13));
}

TEST(DashboardCellLayout, FontsOfALineShrinkInStepsOfFivePercentUntilBothTextsFit) {
    const double room = 367 - 24 - 8;  // without an icon
    EXPECT_EQ(QVDashboardCellLayout::make(content(room - 100, 100)).titleFactor, 1);
    EXPECT_EQ(QVDashboardCellLayout::make(content(room - 99, 100)).titleFactor, 0.95);
    EXPECT_EQ(QVDashboardCellLayout::make(content(room / 0.72 - 100, 100)).valueFactor, 0.70);
    // 400 and 200 at 60 %, and no further, are 240 and 120: the value gives way by what is missing.
    const auto layout = QVDashboardCellLayout::make(content(400, 200));
    EXPECT_EQ(layout.titleFactor, 0.6);
    EXPECT_EQ(layout.title.width(), 240);
    EXPECT_EQ(layout.value.left(), 4 + 12 + 240 + 8);

    auto second = content(60, 90);
    second.average.width = 367 - 11 - 12 - 8 - 79;
    EXPECT_EQ(QVDashboardCellLayout::make(second).lastUpdatedFactor, 0.95);
    second.average.width = 1000;
    EXPECT_EQ(QVDashboardCellLayout::make(second).averageFactor, 0.6);
}

/// Anything that cards are asked to hold.
QVDashboardCellContent anyContent() {
    QVDashboardCellContent content;
    content.width = *rc::gen::elementOf(std::vector<double>{320, 360.2, 375, 412, 768});
    content.screenScale = *rc::gen::element(1.0, 1.5, 2.0, 3.0);
    content.textScale = *rc::gen::inRange(100, 201) / 100.0;
    content.rightToLeft = *rc::gen::arbitrary<bool>();
    content.hasCategoryIcon = *rc::gen::arbitrary<bool>();
    content.hasAverageIcon = *rc::gen::arbitrary<bool>();
    // How far letters reach from the baseline, in parts of the font's size: from Latin to Arabic.
    const double above = *rc::gen::inRange(70, 96) / 100.0, below = *rc::gen::inRange(0, 46) / 100.0;
    const auto text = [&](double size, int longest) {
        const double points = size * content.textScale;
        return Text{*rc::gen::inRange(0, longest) * points / 2, above * points, below * points};
    };
    content.title = text(19, 60);
    content.value = text(19, 40);
    content.average = text(11, 70);
    content.lastUpdated = text(11, 50);
    content.secondLineAscent = 1.07 * 11 * content.textScale;
    content.secondLineDescent = 0.29 * 11 * content.textScale;
    return content;
}

/// The text is whole, or its font as small as it may become.
void expectWhole(const QRectF& frame, const Text& text, double factor) {
    RC_ASSERT(frame.width() >= text.width * factor - 1e-6 || factor <= 0.6);
}

RC_GTEST_PROP(DashboardCellLayout, HoldsWhateverItIsGiven, ()) {
    const QVDashboardCellContent given = anyContent();
    const auto layout = QVDashboardCellLayout::make(given);
    expectWhole(layout.title, given.title, layout.titleFactor);
    expectWhole(layout.value, given.value, layout.valueFactor);
    expectWhole(layout.average, given.average, layout.averageFactor);
    expectWhole(layout.lastUpdated, given.lastUpdated, layout.lastUpdatedFactor);

    const std::vector<QRectF> frames{layout.categoryIcon, layout.title,       layout.value,
                                     layout.average,      layout.averageIcon, layout.lastUpdated};
    for (size_t i = 0; i < frames.size(); ++i) {
        if (frames[i].isEmpty()) continue;
        RC_ASSERT(layout.background.contains(frames[i]));
        RC_ASSERT(frames[i].bottom() <= layout.chart.top() + 1 / given.screenScale);
        for (const double value : {frames[i].x(), frames[i].y(), frames[i].width(), frames[i].height()})
            RC_ASSERT(std::abs(value * given.screenScale - std::round(value * given.screenScale)) < 1e-6);
        // A tail may come near an accent of the next line; the unit's icon is as high as its font, empty at
        // the top.
        for (size_t j = 0; j < i; ++j) {
            const QRectF common = frames[i] & frames[j];
            const bool isIcon = frames[i] == layout.averageIcon || frames[j] == layout.averageIcon;
            RC_ASSERT(common.height() <= (isIcon ? 6 : 2) * given.textScale + 2 / given.screenScale);
        }
    }
    const double plot = layout.chart.height() - QVDashboardCellLayout::axisGutterHeight(given.textScale) -
                        1 / given.screenScale;
    RC_ASSERT(plot >= QVDashboardCellLayout::kSmallestPlotHeight);

    auto other = given;
    other.rightToLeft = !given.rightToLeft;
    const auto mirrored = QVDashboardCellLayout::make(other);
    const double pixel = 3 / given.screenScale + 1e-9;
    RC_ASSERT(mirrored.chart == layout.chart);
    for (const auto& [a, b] : {std::pair(mirrored.title, layout.title),
                               {mirrored.value, layout.value},
                               {mirrored.average, layout.average},
                               {mirrored.lastUpdated, layout.lastUpdated}})
        RC_ASSERT(a.size() == b.size() && a.top() == b.top() &&
                  std::abs(a.left() + b.right() - given.width) < pixel);
}

using CardPlots = test::CardTest;

/// The first and the last column of each run of columns that are filled in a row of pixels.
std::vector<std::pair<int, int>> runs(const QImage& image, int y) {
    std::vector<std::pair<int, int>> found;
    for (int x = 0; x < image.width(); ++x) {
        if (qAlpha(image.pixel(x, y)) < 64) continue;
        if (found.empty() || found.back().second != x - 1) found.emplace_back(x, x);
        found.back().second = x;
    }
    return found;
}

TEST_F(CardPlots, NeighboursStayApartAndNothingReachesTheLabels) {
    constexpr double kScale = 2;
    for (const char* locale : {"en_US", "de_DE", "ar_EG", "hi_IN"})
        for (const double textScale : {1.0, 2.0})
            for (const double width : {320.0, 768.0}) {
                setLook({locale, textScale});
                for (const int id : {VSGroupID::Steps, VSGroupID::HeartRate, VSGroupID::SleepAnalysis}) {
                    SCOPED_TRACE(testing::Message()
                                 << locale << ' ' << textScale << ' ' << width << ' ' << id);
                    const bool rows = id == VSGroupID::SleepAnalysis;
                    const auto cell =
                        card(group(id), rows ? QVTimeScope::Day : QVTimeScope::Month, width, kScale);
                    const QImage fill = cell->chartItem()->chartRenderer()->chartFillImage();
                    const QRectF background = cell->chartView().backgroundFrame();
                    const double labels =
                        rows ? cell->chartView().size().width() -
                                   cell->chartItem()->chartRenderer()->chartInsets().right
                             : background.left() +
                                   std::min(cell->chartBackground().minimumLabelFrame().left(),
                                            cell->chartBackground().maximumLabelFrame().left());
                    EXPECT_GE(background.height(), QVDashboardCellLayout::kSmallestPlotHeight);
                    for (int y = 0; y < fill.height(); y += 5) {
                        const auto bars = runs(fill, y);
                        for (size_t i = 1; i < bars.size(); ++i)
                            EXPECT_LE(bars[i - 1].second + 1 - bars[i - 1].first,
                                      0.8 * (bars[i].first - bars[i - 1].first) + 1)
                                << y;
                        if (!bars.empty()) {
                            EXPECT_LE(bars.back().second / kScale + 2, labels) << y;
                        }
                    }
                }
            }
}

}  // namespace
