#pragma once

#include <QImage>
#include <QQuickItem>
#include <memory>
#include <optional>
#include <string>

#include "Platform/StyledText.h"
#include "Qelvar/Charts/QVChart.h"
#include "Qelvar/Charts/QVDottedAverageBackgroundView.h"
#include "Qelvar/Dashboard/QVDashboardCellLayout.h"
#include "Qelvar/Dashboard/QVDashboardChartItem.h"
#include "Qelvar/Models/Data/QVDateCache.h"

class QVDashboardViewController;
Q_MOC_INCLUDE("Qelvar/Dashboard/QVDashboardViewController.h")

/// A dashboard card: one chart item over one time scope, painted as a whole on an opaque image, so that its
/// blend modes are the same on every machine. It is an item of the scene and also serves without a window.
/// Main thread only.
class QVDashboardTableViewCell : public QQuickItem {
    Q_OBJECT
    /// The screen whose row it shows; it asks the screen to be prepared as soon as it has both.
    Q_PROPERTY(QVDashboardViewController* screen READ screen WRITE setScreen NOTIFY screenChanged)
    Q_PROPERTY(int row READ row WRITE setRow NOTIFY rowChanged)
    /// What a screen reader says of it.
    Q_PROPERTY(QString accessibleName READ accessibleName NOTIFY contentChanged)
    Q_PROPERTY(QString accessibleValue READ accessibleValue NOTIFY contentChanged)
    /// What the chart shows, in words.
    Q_PROPERTY(QString chartDescription READ chartDescription NOTIFY chartDescriptionChanged)
 public:
    explicit QVDashboardTableViewCell(QQuickItem* parent = nullptr);
    ~QVDashboardTableViewCell() override;

    /// What every card is high, with texts as large as the person wants them.
    static double preferredCellHeight();

    QVDashboardViewController* screen() const { return screen_; }
    void setScreen(QVDashboardViewController* screen);
    int row() const { return row_; }
    void setRow(int row);

    /// Observes the cache from now on, in place of the one before. Held weakly: a card that is destroyed late
    /// may outlive it.
    void setDateCache(const std::shared_ptr<QVDateCache>& dateCache);
    const std::shared_ptr<QVDashboardChartItem>& chartItem() const { return chartItem_; }
    void setChartItem(std::shared_ptr<QVDashboardChartItem> item);
    /// None until the first one was set.
    std::optional<QVTimeScope> timeScope() const { return timeScope_; }
    void setTimeScope(QVTimeScope timeScope);
    /// Nothing is seen of it: its row is the placeholder of what is dragged.
    bool isContentHidden() const { return opacity() == 0; }
    void setContentHidden(bool hidden) { setOpacity(hidden ? 0 : 1); }
    QVChart& chartView() { return chart_; }
    const QVDottedAverageBackgroundView& chartBackground() const { return *chartBackground_; }

    QString titleText() const { return title_; }
    QString valueText() const { return value_.plainText(); }
    QString secondaryText() const { return average_.plainText(); }
    QString lastUpdatedText() const { return lastUpdated_; }
    QString accessibleName() const { return title_; }
    QString accessibleValue() const;
    QString chartDescription() const { return chartDescription_; }

    /// Where everything stands at the present width.
    QVDashboardCellLayout cellLayout() const;
    /// The card as it looks now, `scale` pixels a point, on white.
    QImage render(double scale);
    /// The card alone, without the ground beneath and beside it, at the screen's scale.
    QImage renderCard();
    /// Whether the item has loaded all that the card shows and the chart is drawn from it.
    bool showsItsData() const;
    /// The same, and nothing is moving any more.
    bool isSettled() const { return showsItsData() && chart_.imagesFit() && !chart_.isAnimating(); }
    /// The same of what was painted into the scene last.
    bool wasPaintedWithData() const { return painted_ >= Painted::WithData; }
    bool wasPaintedSettled() const { return painted_ == Painted::Settled; }

 signals:
    void screenChanged();
    void rowChanged();
    void contentChanged();
    void chartDescriptionChanged();

 protected:
    void componentComplete() override;
    void geometryChange(const QRectF& newGeometry, const QRectF& oldGeometry) override;
    void itemChange(ItemChange change, const ItemChangeData& data) override;
    void updatePolish() override;
    QSGNode* updatePaintNode(QSGNode* node, UpdatePaintNodeData* data) override;

 private:
    /// Told by the chart item and the date cache, which hold it weakly; it dies with the cell.
    struct Observer;

    void prepare();
    void takeTextScale();
    void takeContrast();
    void rebuildTimeBasedContent();
    void refreshTexts();
    void describeChart();
    void contentLooksDifferent();
    void stillPartLooksDifferent();
    void animateFrames();
    double screenScale() const;
    QVDashboardCellContent layoutContent() const;
    struct StillPart {
        QImage image;
        QVDashboardCellLayout layout;
    };
    StillPart paintStillPart(const QColor& ground, double scale) const;
    QImage renderOn(const QColor& ground, double scale);
    void paintTexts(QPainter& painter, const QVDashboardCellLayout& layout) const;

    QVDashboardViewController* screen_ = nullptr;
    int row_ = -1;
    bool complete_ = false;
    bool painting_ = false;

    QString categoryIconName_, averageIconName_;
    platform::StyledText value_;
    platform::StyledText average_;
    QString title_, lastUpdated_, chartDescription_;
    std::string textsLocale_;  // of which they are
    double textsScale_ = 0;
    bool textsContrast_ = false;

    std::shared_ptr<QVDottedAverageBackgroundView> chartBackground_;
    std::weak_ptr<QVDateCache> dateCache_;
    std::shared_ptr<QVDashboardChartItem> chartItem_;
    std::optional<QVTimeScope> timeScope_;
    QVChart chart_;

    std::shared_ptr<Observer> observer_;
    QMetaObject::Connection frames_, sceneLoss_;
    std::optional<StillPart> still_;  // at the screen's scale
    QImage image_;
    enum class Painted { Outdated, WithData, Settled };
    Painted painted_ = Painted::Outdated;
};
