#include "Qelvar/Dashboard/QVDashboardCellLayout.h"

#include <gtest/gtest.h>

namespace {

/// A card of a phone's width, with texts of the given widths at full size.
QVDashboardCellContent content(double titleWidth, double valueWidth) {
    QVDashboardCellContent content;
    content.width = 375;
    content.screenScale = 2;
    content.titleWidth = [titleWidth](double factor) { return titleWidth * factor; };
    content.valueWidth = [valueWidth](double factor) { return valueWidth * factor; };
    content.averageWidth = 100;
    content.lastUpdatedWidth = 80;
    content.firstLineAscent = 18;
    content.firstLineDescent = 5;
    content.secondLineAscent = 10;
    content.secondLineDescent = 3;
    return content;
}

TEST(DashboardCellLayout, PartsStandWhereTheyBelong) {
    const auto layout = QVDashboardCellLayout::make(content(60, 90));
    EXPECT_EQ(layout.background, QRectF(4, 4, 367, 183));
    EXPECT_EQ(layout.fontFactor, 1);
    EXPECT_EQ(layout.firstBaseline, 4 + 22);
    EXPECT_EQ(layout.secondBaseline, 4 + 36.5) << "a pixel more than 36";
    EXPECT_EQ(layout.value, QRectF(4 + 367 - 11 - 90, 4 + 4, 90, 23));
    EXPECT_EQ(layout.title, QRectF(4 + 12, 4 + 4, 367 - 11 - 90 - 8 - 12, 23))
        << "up to 8 points before the value";
    EXPECT_EQ(layout.average.topLeft(), QPointF(16, 4 + 26.5));
    EXPECT_EQ(layout.average.width(), 100);
    EXPECT_EQ(layout.lastUpdated.right(), 4 + 367 - 11);
    EXPECT_EQ(layout.chart, QRectF(4, 48, 367, 139));
    EXPECT_TRUE(layout.categoryIcon.isEmpty());
    EXPECT_TRUE(layout.averageIcon.isEmpty());
}

TEST(DashboardCellLayout, AnIconMovesTheTextsAndTheUnitIconFollowsTheAverage) {
    auto withIcons = content(60, 90);
    withIcons.hasCategoryIcon = withIcons.hasAverageIcon = true;
    const auto layout = QVDashboardCellLayout::make(withIcons);
    EXPECT_EQ(layout.categoryIcon, QRectF(4 + 12, 4 + 8, 25, 28));
    EXPECT_EQ(layout.title.left(), 4 + 41);
    EXPECT_EQ(layout.average.left(), 4 + 41);
    EXPECT_EQ(layout.averageIcon.left(), layout.average.right() + 1.5);
    EXPECT_EQ(layout.averageIcon.size(), QSizeF(7.5, layout.average.height()));
}

TEST(DashboardCellLayout, RightToLeftMirrorsEveryFrame) {
    auto mirrored = content(60, 90);
    mirrored.hasCategoryIcon = mirrored.hasAverageIcon = true;
    const auto leftToRight = QVDashboardCellLayout::make(mirrored);
    mirrored.rightToLeft = true;
    const auto layout = QVDashboardCellLayout::make(mirrored);
    const auto isMirrored = [](const QRectF& a, const QRectF& b) {
        return a.size() == b.size() && a.top() == b.top() && qAbs(a.left() + b.right() - 375) < 1e-9;
    };
    EXPECT_TRUE(isMirrored(layout.title, leftToRight.title));
    EXPECT_TRUE(isMirrored(layout.value, leftToRight.value));
    EXPECT_TRUE(isMirrored(layout.categoryIcon, leftToRight.categoryIcon));
    EXPECT_TRUE(isMirrored(layout.average, leftToRight.average));
    EXPECT_TRUE(isMirrored(layout.averageIcon, leftToRight.averageIcon));
    EXPECT_TRUE(isMirrored(layout.lastUpdated, leftToRight.lastUpdated));
    EXPECT_EQ(layout.chart, leftToRight.chart);
    EXPECT_EQ(layout.value.left(), 4 + 11);
}

TEST(DashboardCellLayout, FontsShrinkInStepsOfFivePercentUntilBothTextsFit) {
    const double room = 367 - 24 - 8;  // without an icon
    EXPECT_EQ(QVDashboardCellLayout::make(content(room - 100, 100)).fontFactor, 1);
    EXPECT_EQ(QVDashboardCellLayout::make(content(room - 99, 100)).fontFactor, 0.95);
    EXPECT_EQ(QVDashboardCellLayout::make(content(room / 0.72 - 100, 100)).fontFactor, 0.70);
    EXPECT_EQ(QVDashboardCellLayout::make(content(3000, 100)).fontFactor, 0.6) << "no further";
    auto withIcon = content(room - 37 - 4 - 100, 100);
    withIcon.hasCategoryIcon = true;
    EXPECT_EQ(QVDashboardCellLayout::make(withIcon).fontFactor, 1);
    withIcon.titleWidth = [=](double factor) { return (room - 37 - 4 - 99) * factor; };
    EXPECT_EQ(QVDashboardCellLayout::make(withIcon).fontFactor, 0.95);
}

TEST(DashboardCellLayout, TextsThatStillDoNotFitNeverOverlap) {
    for (const double title : {300.0, 500.0, 600.0, 5000.0})
        for (const double value : {100.0, 200.0, 400.0, 5000.0})
            for (const double width : {320.0, 375.0, 20.0}) {
                auto tight = content(title, value);
                tight.width = width;
                const auto layout = QVDashboardCellLayout::make(tight);
                EXPECT_GE(layout.title.width(), 0);
                EXPECT_GE(layout.value.width(), 0);
                if (layout.title.width() > 0 && width > 100) {
                    EXPECT_LE(layout.title.right() + 8, layout.value.left() + 1e-9);
                }
            }
    // 400 and 200 at 60 % are 240 and 120: the value gives way by what is missing.
    const auto layout = QVDashboardCellLayout::make(content(400, 200));
    EXPECT_EQ(layout.fontFactor, 0.6);
    EXPECT_EQ(layout.title.width(), 240);
    EXPECT_EQ(layout.value.left(), 4 + 12 + 240 + 8);
}

TEST(DashboardCellLayout, TheAverageGivesWayToTheLastUpdate) {
    auto wide = content(60, 90);
    wide.averageWidth = 300;
    auto layout = QVDashboardCellLayout::make(wide);
    EXPECT_EQ(layout.average.right() + 8, layout.lastUpdated.left());
    EXPECT_EQ(layout.lastUpdated.width(), 80);
    wide.lastUpdatedWidth = 340;
    EXPECT_EQ(QVDashboardCellLayout::make(wide).average.width(), 0);
    wide.lastUpdatedWidth = 0;
    EXPECT_EQ(QVDashboardCellLayout::make(wide).average.width(), 300);
}

TEST(DashboardCellLayout, FramesLieOnThePixelGrid) {
    auto odd = content(60.3, 90.7);
    odd.screenScale = 3;
    odd.firstLineAscent = 17.67;
    odd.width = 360.2;
    for (const bool rightToLeft : {false, true}) {
        odd.rightToLeft = rightToLeft;
        const auto layout = QVDashboardCellLayout::make(odd);
        for (const QRectF& frame : {layout.title, layout.value, layout.average, layout.lastUpdated})
            for (const double value : {frame.x(), frame.y(), frame.width(), frame.height()})
                EXPECT_NEAR(value * 3, qRound(value * 3), 1e-6) << rightToLeft;
    }
}

}  // namespace
