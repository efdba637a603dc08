#include <QFontMetricsF>
#include <cmath>

#include "ChartTestSupport.h"
#include "Platform/Localization.h"
#include "Platform/StyledText.h"
#include "Qelvar/Charts/QVDottedAverageBackgroundView.h"
#include "TestSupport.h"
#include "VessaUI/VSNumberFormatter.h"
#include "VessaUI/VSUnitController.h"

using namespace test;

namespace {

constexpr QVAnimationTime ms(int milliseconds) {
    return QVAnimationTime(milliseconds * 1000);
}

class BackgroundView : public testing::Test {
 protected:
    FixedEnvironment environment;
    QVDottedAverageBackgroundView view;

    void SetUp() override {
        platform::loadTranslations();
        view.layout({200, 100}, 2);
    }
    void setValues(std::optional<double> min, std::optional<double> max, std::optional<double> average,
                   std::optional<double> maxData = std::nullopt, int precision = 0) {
        view.setValues(min, max, average, maxData, precision, nullptr, nullptr);
        view.commitChanges(ms(0), ms(0));
    }
    QImage paint() const {
        QImage image(400, 200, QImage::Format_ARGB32_Premultiplied);
        image.setDevicePixelRatio(2);
        image.fill(Qt::transparent);
        QPainter painter(&image);
        view.paint(painter);
        return image;
    }
};

}  // namespace

TEST_F(BackgroundView, ShowsTheAverageOnlyInsideTheBounds) {
    const auto visible = [&](std::optional<double> min, std::optional<double> max,
                             std::optional<double> average) {
        setValues(min, max, average);
        return view.averageLineIsVisible();
    };
    EXPECT_TRUE(visible(0, 10, 5));
    EXPECT_TRUE(visible(0, 10, 0));
    EXPECT_TRUE(visible(0, 10, 10));
    EXPECT_FALSE(visible(0, 10, -0.1));
    EXPECT_FALSE(visible(0, 10, 10.1));
    EXPECT_FALSE(visible(0, 10, std::nullopt));
    EXPECT_FALSE(visible(0, 10, std::nan("")));
    EXPECT_FALSE(visible(std::nullopt, std::nullopt, 5));
    EXPECT_TRUE(visible(std::nullopt, 10, 5));
    EXPECT_FALSE(visible(std::nullopt, 10, 15));
    view.setHideAverageLine(true);
    EXPECT_FALSE(visible(0, 10, 5));
}

TEST_F(BackgroundView, LabelsNameTheBounds) {
    setValues(40, 160, 80, 158, 1);
    EXPECT_EQ(view.minimumText(), "40");
    EXPECT_EQ(view.maximumText(), "160");
    EXPECT_TRUE(view.labelsAreVisible());
    setValues(0.25, 1, 0.5, 1.75, 1);
    EXPECT_EQ(view.minimumText(), "0.2") << "in the fraction digits of the bounds";
    EXPECT_EQ(view.maximumText(), "1.8") << "data above the bound is named";
    setValues(std::nullopt, std::nullopt, std::nullopt);
    EXPECT_FALSE(view.labelsAreVisible());
    view.setHideMinMaxLabels(true);
    setValues(40, 160, 80);
    EXPECT_FALSE(view.labelsAreVisible());
    EXPECT_TRUE(view.averageLineIsVisible());
}

TEST_F(BackgroundView, AsksTheFormatterForTheBounds) {
    view.setBoundFormatter(
        [](double value, const VSNumberFormatter&) { return QStringLiteral("<%1>").arg(value); });
    setValues(1, 2, {}, 3);
    EXPECT_EQ(view.minimumText(), "<1>");
    EXPECT_EQ(view.maximumText(), "<3>");
}

TEST_F(BackgroundView, TheUpperBoundSaysMoreThanAboveTheDisplayRange) {
    const TemporaryFolder folder;
    const auto store = VSHealthStore::open(folder.path() / "store");
    ASSERT_TRUE(store.ok());
    VSUnitController units(store.value());
    const VSDataUnit* unit = nullptr;
    for (const auto* group : VSDataUnitGroupController::shared().allDataUnitGroups()) {
        const auto range =
            group->isCharacteristic() ? std::nullopt : units.displayRangeForDataUnit(group->anyDataUnit());
        if (range && range->maximum) unit = group->anyDataUnit();
    }
    ASSERT_TRUE(unit);
    const double limit = *units.displayRangeForDataUnit(unit)->maximum;
    const auto texts = [&](double max, std::optional<double> maxData) {
        view.setValues(0, max, {}, maxData, 0, unit, &units);
        return view.maximumText();
    };
    const QString atLimit = texts(limit, {});
    EXPECT_EQ(texts(limit, limit * 3), platform::localized("GREATER_THAN_%@", {atLimit}));
    EXPECT_EQ(texts(limit * 2, {}), platform::localized("GREATER_THAN_%@", {atLimit}));
    EXPECT_EQ(texts(limit, limit / 2), atLimit);
}

TEST_F(BackgroundView, LabelsStandAtTheRightOnThePixelGrid) {
    setValues(40, 16000, 80);
    const QFontMetricsF metrics(platform::systemFont(10));
    const QRectF maximum = view.maximumLabelFrame(), minimum = view.minimumLabelFrame();
    EXPECT_NEAR(maximum.right(), 200.5, 0.5) << "a pixel beyond the edge, then down to the grid";
    EXPECT_EQ(maximum.top(), 2);
    EXPECT_GE(maximum.width(), metrics.horizontalAdvance("16,000"));
    EXPECT_NEAR(minimum.right(), 200.5, 0.5);
    EXPECT_LE(minimum.bottom(), 98);
    EXPECT_GT(minimum.bottom(), 97);
    for (const double edge : {maximum.left(), maximum.top(), minimum.left(), minimum.top()})
        EXPECT_EQ(edge * 2, std::floor(edge * 2));
    EXPECT_GE(maximum.height(), metrics.ascent() + metrics.descent());
}

TEST_F(BackgroundView, TheLineStandsAtTheAverageAndMakesRoomForLabels) {
    view.setChartInsets({10, 0, 20, 0});
    setValues(0, 100, 50.2);
    // The plot is 70 high from 10: (100 - 50.2) % of it is 34.86.
    EXPECT_EQ(view.averageLineFrame(), QRectF(0, 45, 200, 0.5));
    view.setChartInsets({});
    setValues(0, 100, 95);
    EXPECT_EQ(view.averageLineFrame().top(), 5);
    EXPECT_EQ(view.averageLineFrame().right(), view.maximumLabelFrame().left() - 2);
    setValues(0, 100, 4);
    EXPECT_EQ(view.averageLineFrame().right(), view.minimumLabelFrame().left() - 2);
    view.setHideMinMaxLabels(true);
    setValues(0, 100, 4);
    EXPECT_EQ(view.averageLineFrame().right(), 200) << "a label that does not show needs no room";
    setValues(7, 7, 7);
    EXPECT_EQ(view.averageLineFrame().top(), 50);
}

TEST_F(BackgroundView, TheLineIsTwoPointsOfColourAndOneClear) {
    view.setAverageLineColor(Qt::red);
    setValues(0, 100, 50);
    const QImage image = paint();
    for (int x = 0; x < 60; ++x) {
        EXPECT_EQ(qAlpha(image.pixel(x, 100)) != 0, x % 6 < 4) << x;
        EXPECT_EQ(qAlpha(image.pixel(x, 99)), 0);
        EXPECT_EQ(qAlpha(image.pixel(x, 101)), 0) << "one pixel high";
    }
}

TEST_F(BackgroundView, ChangesFadeAndMoveWithTime) {
    view.setAverageLineColor(Qt::white);
    setValues({}, {}, {});
    view.setValues(0, 100, 50, {}, 0, nullptr, nullptr);
    view.commitChanges(ms(1000), ms(250));
    EXPECT_TRUE(view.advance(ms(1000)));
    EXPECT_EQ(alphaAt(paint(), 0.5, 50), 0);
    EXPECT_TRUE(view.advance(ms(1125)));
    const int half = alphaAt(paint(), 0.5, 50);
    EXPECT_NEAR(half, 255 * 0.75, 3) << "eases out";
    view.commitChanges(ms(1130), ms(0));
    EXPECT_EQ(alphaAt(paint(), 0.5, 50), half) << "what is on its way there goes on";
    EXPECT_FALSE(view.advance(ms(1250)));
    EXPECT_EQ(alphaAt(paint(), 0.5, 50), 255);

    view.setValues(0, 100, 90, {}, 0, nullptr, nullptr);
    view.commitChanges(ms(2000), ms(250));
    view.advance(ms(2125));
    EXPECT_EQ(alphaAt(paint(), 0.5, 50), 0);
    EXPECT_EQ(alphaAt(paint(), 0.5, 10), 0) << "on its way from 50 to 10";
    view.advance(ms(2250));
    EXPECT_EQ(alphaAt(paint(), 0.5, 10), 255);
}

TEST_F(BackgroundView, SaysThatThereIsNoData) {
    view.setNoDataLabelFont(platform::systemFont(27));
    view.layout({200, 100}, 2);
    EXPECT_NEAR(view.noDataLabelFrame().center().x(), 100, 0.5);
    EXPECT_NEAR(view.noDataLabelFrame().center().y(), 50, 0.5);
    const auto ink = [&] {
        const QImage image = paint();
        int sum = 0;
        for (int y = 60; y < 140; ++y)
            for (int x = 0; x < 400; ++x) sum += qAlpha(image.pixel(x, y)) > 100;
        return sum;
    };
    EXPECT_EQ(ink(), 0);
    view.setShowNoDataLabel(true);
    view.commitChanges(ms(0), ms(0));
    EXPECT_GT(ink(), 300);
}
