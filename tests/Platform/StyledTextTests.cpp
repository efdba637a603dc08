#include "Platform/StyledText.h"

#include <gtest/gtest.h>

#include <QFontInfo>
#include <QFontMetricsF>
#include <cmath>
#include <thread>

#include "Platform/Queue.h"
#include "TestSupport.h"

namespace {

using platform::StyledText;

constexpr QSize canvas(300, 40);
constexpr double baseline = 28;

QImage drawn(const StyledText& text, double x = 0, double maxWidth = 1000, double scale = 1) {
    QImage image(canvas, QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    text.draw(painter, QPointF(x, baseline), platform::systemFont(19), Qt::black, maxWidth, scale);
    painter.end();
    return image;
}

// Columns from the first to the last with ink of a kind; empty when there is none.
template <typename Predicate>
QRect inkWhere(const QImage& image, Predicate&& predicate) {
    QRect result;
    for (int y = 0; y < image.height(); ++y)
        for (int x = 0; x < image.width(); ++x)
            if (predicate(image.pixelColor(x, y))) result |= QRect(x, y, 1, 1);
    return result;
}
QRect ink(const QImage& image) {
    return inkWhere(image, [](const QColor& color) { return color.alpha() > 60; });
}
QRect redInk(const QImage& image) {
    return inkWhere(image, [](const QColor& color) {
        return color.alpha() > 60 && color.red() > 200 && color.blue() < 60;
    });
}
QRect blueInk(const QImage& image) {
    return inkWhere(image, [](const QColor& color) {
        return color.alpha() > 60 && color.blue() > 200 && color.red() < 60;
    });
}

QImage redSquare(int side, double ratio = 1) {
    QImage image(static_cast<int>(side * ratio), static_cast<int>(side * ratio),
                 QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::red);
    image.setDevicePixelRatio(ratio);
    return image;
}

TEST(StyledText, FontsAreInPointsOfTheLayout) {
    EXPECT_EQ(platform::systemFont(19).pixelSize(), 19);
    EXPECT_GT(platform::systemFont(0).pixelSize(), 0);
    EXPECT_TRUE(platform::boldSystemFont(10).bold());
    EXPECT_FALSE(platform::systemFont(10).bold());
}

TEST(StyledText, PlainTextLeavesImagesAndSpacesOut) {
    const auto text = StyledText("72") + StyledText::spacer(2) + StyledText("bpm") + StyledText::spacer(0) +
                      StyledText::withImage(redSquare(8), 3);
    EXPECT_EQ(text.plainText(), "72bpm");
    EXPECT_EQ(text.spokenText(), "72 bpm");
    EXPECT_EQ(text.runs().size(), 4u);
    EXPECT_TRUE(StyledText("").isEmpty());
    EXPECT_TRUE(StyledText::withImage({}, 1).isEmpty());
}

TEST(StyledText, AddingItselfDoublesIt) {
    StyledText text("ab");
    text += text;
    EXPECT_EQ(text.plainText(), "abab");
}

TEST(StyledText, WidthIsTheSumOfItsParts) {
    test::FixedEnvironment environment;
    const QFont font = platform::systemFont(19), small = platform::systemFont(15);
    const double number = StyledText("120").size(font).width(),
                 unit = StyledText("mmHg", small).size(font).width();
    EXPECT_NEAR(number, QFontMetricsF(font).horizontalAdvance("120"), 0.5);
    const auto text = StyledText("120") + StyledText::spacer(2) + StyledText("mmHg", small) +
                      StyledText::spacer(1) + StyledText::withImage(redSquare(8, 2), 0);
    EXPECT_NEAR(text.size(font).width(), number + 2 + unit + 1 + 8, 1e-6);
    EXPECT_NEAR(text.size(font, 0.6).width(), 0.6 * (number + 2 + unit + 1 + 8), 1e-6);
    // Blanks at the end of a run count: something may follow.
    EXPECT_GT(StyledText("7 ").size(font).width(), StyledText("7").size(font).width() + 1);
}

TEST(StyledText, HeightHoldsTheTallestPart) {
    test::FixedEnvironment environment;
    const QFont font = platform::systemFont(10);
    const QFontMetricsF metrics(font);
    EXPECT_DOUBLE_EQ(StyledText("x").ascent(font), metrics.ascent());
    EXPECT_DOUBLE_EQ(StyledText().size(font).height(), metrics.ascent() + metrics.descent());
    EXPECT_DOUBLE_EQ((StyledText("x") + StyledText::withImage(redSquare(20), 5)).ascent(font), 25);
    EXPECT_DOUBLE_EQ((StyledText("x") + StyledText::withImage(redSquare(20), -8)).size(font).height(),
                     12 > metrics.ascent() ? 20 : metrics.ascent() + 8);
}

TEST(StyledText, ImageStandsOnTheBaselineMovedUp) {
    test::FixedEnvironment environment;
    EXPECT_EQ(redInk(drawn(StyledText::withImage(redSquare(8), 0), 10)), QRect(10, 20, 8, 8));
    EXPECT_EQ(redInk(drawn(StyledText::withImage(redSquare(8, 2), 5), 10)), QRect(10, 15, 8, 8));
}

TEST(StyledText, RunsFollowTheReadingOrderOfTheLanguage) {
    const auto text = StyledText("72", std::nullopt, Qt::red) + StyledText::spacer(20) +
                      StyledText("kg", std::nullopt, Qt::blue);
    {
        test::FixedEnvironment english;
        const QImage image = drawn(text, 5);
        EXPECT_GE(blueInk(image).left() - redInk(image).right(), 20);
    }
    test::FixedEnvironment arabic("2020-03-31T20:00", "Africa/Cairo", "ar_EG");
    const QImage image = drawn(text, 5);
    EXPECT_GE(redInk(image).left() - blueInk(image).right(), 20);
    // It still begins at its left end and is as wide.
    EXPECT_NEAR(ink(image).left(), 5, 3);
    EXPECT_NEAR(ink(image).right(), 5 + text.size(platform::systemFont(19)).width(), 3);
}

TEST(StyledText, ArabicRunsBesideEachOtherReadFromTheRight) {
    test::FixedEnvironment arabic("2020-03-31T20:00", "Africa/Cairo", "ar_EG");
    const auto text = StyledText(QString::fromUtf8("٧٢"), std::nullopt, Qt::red) +
                      StyledText(QString::fromUtf8(" خطوة"), std::nullopt, Qt::blue);
    const QImage image = drawn(text, 5);
    EXPECT_GT(redInk(image).left(), blueInk(image).right());
}

TEST(StyledText, TooWideTextEndsWithAnEllipsisInsideTheWidth) {
    const auto text = StyledText("Walking + Running Distance", std::nullopt, Qt::red) +
                      StyledText::spacer(2) + StyledText("km", std::nullopt, Qt::blue);
    for (const auto* locale : {"en_US", "ar_EG"}) {
        test::FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", locale);
        const double width = text.size(platform::systemFont(19)).width();
        const QImage whole = drawn(text, 2, width);
        EXPECT_FALSE(blueInk(whole).isEmpty()) << locale;
        for (const double maxWidth : {width - 1, 120.0, 40.0}) {
            for (const double scale : {1.0, 0.6}) {
                const QImage image = drawn(text, 2, maxWidth * scale, scale);
                const QRect where = ink(image);
                EXPECT_FALSE(where.isEmpty()) << locale << maxWidth;
                EXPECT_LE(where.right(), 2 + maxWidth * scale + 1) << locale << maxWidth;
                EXPECT_GE(where.width(), std::min(maxWidth * scale * 0.6, width)) << locale << maxWidth;
            }
        }
    }
}

TEST(StyledText, ScaledTextIsAsWideAsItsMeasure) {
    test::FixedEnvironment environment;
    const StyledText text("1,234,567");
    for (const double scale : {1.0, 0.85, 0.6})
        EXPECT_NEAR(ink(drawn(text, 0, 1000, scale)).right() + 1,
                    text.size(platform::systemFont(19), scale).width(), 2)
            << scale;
}

TEST(StyledText, JoinedWithAFormatKeepsStylesAndLeavesEmptyPartsOut) {
    test::FixedEnvironment environment;
    const auto text = platform::joinWithFormat("FEET_INCH_FORMAT %@ %@",
                                               {StyledText("5", platform::systemFont(19)), StyledText()});
    EXPECT_EQ(text.plainText(), "5 ft  in");
    ASSERT_EQ(text.runs().size(), 3u);
    EXPECT_EQ(text.runs()[0].font, platform::systemFont(19));
    EXPECT_EQ(text.runs()[1].font, std::nullopt);
    const auto prefixed = platform::prefixedWithImage(StyledText("5"), redSquare(4), 1, 3);
    ASSERT_EQ(prefixed.runs().size(), 3u);
    EXPECT_EQ(prefixed.runs()[0].baselineOffset, 1);
    EXPECT_EQ(prefixed.runs()[1].spacing, 3);
}

TEST(StyledText, DrawsTheSameOnWorkerThreads) {
    test::FixedEnvironment environment;
    const auto text = StyledText(QString::fromUtf8("72 نبضة")) + StyledText::spacer(2) +
                      StyledText("bpm", platform::boldSystemFont(12));
    const QImage expected = drawn(text);
    std::vector<QImage> images(8);
    {
        auto queue = platform::makeConcurrentQueue("draw");
        for (auto& image : images) queue->async([&] { image = drawn(text); });
    }
    for (const auto& image : images) EXPECT_EQ(image, expected);
}

}  // namespace
