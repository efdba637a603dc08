// Contrast as it is on pictures of cards, by WCAG 2.1 (https://www.w3.org/TR/WCAG21/#dfn-contrast-ratio):
// (L1 + 0.05) / (L2 + 0.05) of the relative luminances of the lighter and the darker colour. What is drawn is
// held against the card's colours at its place. Of a text or a hairline the brightest pixel counts, since
// others are only partly covered.

#include <cmath>
#include <set>

#include "CardTestSupport.h"

namespace {

double luminance(QRgb color) {
    const auto linear = [](int channel) {
        const double value = channel / 255.0;
        return value <= 0.03928 ? value / 12.92 : std::pow((value + 0.055) / 1.055, 2.4);
    };
    return 0.2126 * linear(qRed(color)) + 0.7152 * linear(qGreen(color)) + 0.0722 * linear(qBlue(color));
}

double contrast(QRgb a, QRgb b) {
    const auto [dark, light] = std::minmax({luminance(a), luminance(b)});
    return (light + 0.05) / (dark + 0.05);
}

constexpr double kWidth = 320, kScale = 2;

/// A card's picture beside its colours alone; both in pixels of the cell.
class Measured {
 public:
    Measured(QVDashboardTableViewCell& cell, const VSDataCategory& category)
        : layout_(cell.cellLayout()), picture_(cell.render(kScale)) {
        ground_ = QImage(picture_.size(), QImage::Format_RGB32);
        ground_.setDevicePixelRatio(kScale);
        ground_.fill(Qt::white);
        QPainter painter(&ground_);
        painter.drawImage(layout_.background.topLeft(),
                          category.roundedGradient(layout_.background.size(), kScale));
        painter.end();
        const QVChartRenderer& renderer = *cell.chartItem()->chartRenderer();
        fill_ = inCell(renderer.chartFillImage(), cell.chartView());
        chart_ = inCell(renderer.chartImage(), cell.chartView());
        for (int y = 0; y < fill_.height(); ++y)
            for (int x = 0; x < fill_.width(); ++x)
                fullAlpha_ = std::max(fullAlpha_, qAlpha(fill_.pixel(x, y)));
    }

    double at(int x, int y) const { return contrast(picture_.pixel(x, y), ground_.pixel(x, y)); }
    double best(const QRect& pixels) const {
        double best = 1;
        for (int y = pixels.top(); y <= pixels.bottom(); ++y)
            for (int x = pixels.left(); x <= pixels.right(); ++x)
                if (picture_.valid(x, y)) best = std::max(best, at(x, y));
        return best;
    }
    double best(const QRectF& points) const {
        return best(QRectF(points.topLeft() * kScale, points.size() * kScale).toRect());
    }
    /// The least contrast of what is filled, edges and what lies on it included.
    double leastOfFill() const {
        return least([this](int x, int y) { return qAlpha(fill_.pixel(x, y)) >= fullAlpha_; },
                     [this](int x, int y) { return at(x, y); });
    }
    /// The least contrast of the sides of what is filled, each taken with the pixels beside it.
    double leastOfSides() const {
        const auto isSide = [this](int x, int y) {
            const bool filled = qAlpha(fill_.pixel(x, y)) >= fullAlpha_;
            const auto isClear = [this](int besideX, int besideY) { return qAlpha(fill_.pixel(besideX, besideY)) == 0; };
            return filled && (isClear(x - 1, y) || isClear(x + 1, y) || isClear(x, y - 1) || isClear(x, y + 1));
        };
        return least(isSide, [this](int x, int y) { return best(QRect(x - 1, y - 1, 3, 3)); });
    }
    /// The least contrast of what is drawn plainly: lines, markers, edges.
    double leastOfLines() const {
        return least([this](int x, int y) { return qAlpha(chart_.pixel(x, y)) > 180; },
                     [this](int x, int y) { return at(x, y); });
    }

 private:
    QImage inCell(const QImage& layer, const QVChart& chart) const {
        QImage image(picture_.size(), QImage::Format_ARGB32_Premultiplied);
        image.setDevicePixelRatio(kScale);
        image.fill(Qt::transparent);
        QPainter painter(&image);
        painter.drawImage(layout_.chart.topLeft() + chart.chartRectangle().topLeft(), layer);
        return image;
    }
    template <typename Where, typename What>
    double least(Where where, What what) const {
        double least = 100;
        int found = 0;
        for (int y = 1; y + 1 < fill_.height(); ++y)
            for (int x = 1; x + 1 < fill_.width(); ++x)
                if (where(x, y)) ++found, least = std::min(least, what(x, y));
        return found > 0 ? least : 0;
    }

    QVDashboardCellLayout layout_;
    QImage picture_, ground_, fill_, chart_;
    int fullAlpha_ = 1;
};

class CardContrast : public test::CardTest {
 protected:
    struct Kind {
        int group;
        QVTimeScope timeScope;
        bool fades;  // its fill does
    };
    static constexpr Kind kKinds[] = {{VSGroupID::Steps, QVTimeScope::Week, false},
                                      {VSGroupID::HeartRate, QVTimeScope::Month, false},
                                      {VSGroupID::SleepAnalysis, QVTimeScope::Day, false},
                                      {4, QVTimeScope::Month, true}};

    void expectReadable(const Kind& kind, const VSDataCategory& category, bool high) {
        SCOPED_TRACE(category.categoryID() * 100 + kind.group);
        SCOPED_TRACE(high ? "high contrast" : "normal");
        const auto cell = card(group(kind.group), kind.timeScope, kWidth, kScale, &category);
        const Measured measured(*cell, category);
        const QVDashboardCellLayout layout = cell->cellLayout();
        const double text = high ? 7.0 : 4.5;
        for (const QRectF& frame : {layout.title, layout.value, layout.average, layout.lastUpdated})
            EXPECT_TRUE(frame.isEmpty() || measured.best(frame) >= text) << frame.x() << ' ' << frame.y();
        const QPointF chart = layout.chart.topLeft();
        for (const auto& label : cell->chartView().xAxisLabels())
            EXPECT_GE(measured.best(label.frame().translated(chart)), text) << label.text.toStdString();
        const QVDottedAverageBackgroundView& background = cell->chartBackground();
        const QPointF plot = chart + cell->chartView().backgroundFrame().topLeft();
        if (background.labelsAreVisible()) {
            EXPECT_GE(measured.best(background.minimumLabelFrame().translated(plot)), text);
            EXPECT_GE(measured.best(background.maximumLabelFrame().translated(plot)), text);
        }
        EXPECT_GE(measured.best(cell->chartView().bottomDividerFrame().translated(chart)), 3.0);
        if (background.averageLineIsVisible()) {
            EXPECT_GE(measured.best(background.averageLineFrame().translated(plot)), 3.0);
        }
        EXPECT_GE(measured.leastOfLines(), 3.0);
        if (!kind.fades) {
            EXPECT_GE(measured.leastOfSides(), 3.0);
        }
        if (high || !kind.fades) {
            EXPECT_GE(measured.leastOfFill(), high ? 3.0 : 1.8);
        }
    }
};

TEST_F(CardContrast, OfTextsLinesAndFillsInTheColoursOfEveryCategory) {
    for (int day = 1; day <= 30; ++day)
        add(VSCode::BodyMass, 70 + 4 * std::sin(day), "kg",
            test::date("2020-03-31") - std::chrono::hours(24 * day));
    ASSERT_TRUE(store_->saveObjectsAndWait({samples_.end() - 30, samples_.end()}).ok());
    for (const bool high : {false, true}) {
        setLook({"en_US", 1, high});
        for (const VSDataCategory& category : VSDataCategoryController::shared().allDataCategories())
            for (const Kind& kind : kKinds) expectReadable(kind, category, high);
    }
}

}  // namespace
