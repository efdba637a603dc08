#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"

#include <QFontMetricsF>
#include <QQuickWindow>
#include <QSGImageNode>
#include <chrono>
#include <cmath>

#include "Platform/Appearance.h"
#include "Platform/Icons.h"
#include "Platform/Localization.h"
#include "Platform/TextScale.h"
#include "Qelvar/Charts/QVHourAxisDescriptor.h"
#include "Qelvar/Charts/QVMonthAxisDescriptor.h"
#include "Qelvar/Charts/QVYearAxisDescriptor.h"
#include "Qelvar/Dashboard/QVDashboardViewController.h"
#include "Qelvar/Formatters/QVDataUnitGroupLabels.h"
#include "Qelvar/Formatters/QVDateFormatters.h"
#include "Vessa/Base/VSEnvironment.h"

namespace {

constexpr double kTitleFontSize = 19, kValueFontSize = 19, kUnitFontSize = 15;
constexpr double kSecondLineFontSize = 11, kChartLabelFontSize = 10, kNoDataFontSize = 27;
constexpr double kDividerInset = 12;
constexpr QVAnimationTime kCrossFade = std::chrono::milliseconds(500);

const QColor kWhite = Qt::white;
const QColor kHalfWhite = QColor::fromRgbF(1, 1, 1, 0.5);

/// How what is not quite white is laid on the card's colour.
struct Blending {
    QColor softText;
    QPainter::CompositionMode softTexts, fill, secondaryFill, lines;
};

/// Light is added and colours are blended; with high contrast everything is plain, and texts are white.
Blending blending() {
    using Painter = QPainter;
    if (platform::highContrast())
        return {kWhite, Painter::CompositionMode_SourceOver, Painter::CompositionMode_SourceOver,
                Painter::CompositionMode_SourceOver, Painter::CompositionMode_SourceOver};
    return {kHalfWhite, Painter::CompositionMode_Plus, Painter::CompositionMode_Overlay,
            Painter::CompositionMode_SoftLight, Painter::CompositionMode_Overlay};
}

/// The axis of a time scope; null: it has none.
std::shared_ptr<QVCachedAxisDescriptor> axisDescriptor(QVTimeScope timeScope) {
    std::shared_ptr<QVCachedAxisDescriptor> axis;
    if (timeScope == QVTimeScope::Day) {
        axis = std::make_shared<QVHourAxisDescriptor>();
        axis->setAlwaysHighlight(true);
    } else if (timeScope == QVTimeScope::Week || timeScope == QVTimeScope::Month) {
        auto days = std::make_shared<QVMonthAxisDescriptor>();
        days->setDayOffset(timeScope == QVTimeScope::Week ? 1 : 7);
        days->setMonthMarkerUnit(VSCalendarUnit::Month);
        axis = days;
    } else if (timeScope == QVTimeScope::Year) {
        axis = std::make_shared<QVYearAxisDescriptor>();
    } else {
        return nullptr;
    }
    axis->setHighlightedLabelColor(kWhite);
    axis->setHighlightedLabelFont(platform::boldSystemFont(kChartLabelFontSize));
    axis->setUnhighlightedLabelColor(blending().softText);
    axis->setUnhighlightedLabelFont(platform::systemFont(kChartLabelFontSize));
    axis->setUnhighlightedLabelFilter(blending().softTexts);
    return axis;
}

QVDashboardCellContent::Text measured(const platform::StyledText& text, const QFont& font) {
    const platform::StyledText::Ink ink = text.ink(font);
    return {text.size(font).width(), ink.above, ink.below};
}

/// Draws one line in a frame, at its leading or trailing edge of the reading direction.
void drawLine(QPainter& painter, const platform::StyledText& text, const QRectF& frame, double baseline,
              const QFont& font, const QColor& color, bool atRightEdge, double factor = 1) {
    if (text.isEmpty() || frame.width() <= 0) return;
    const double width = std::min(frame.width(), text.size(font, factor).width());
    const double left = atRightEdge ? frame.right() - width : frame.left();
    text.draw(painter, {left, baseline}, font, color, frame.width(), factor);
}

}  // namespace

struct QVDashboardTableViewCell::Observer final : QVDashboardChartItemDelegate, QVDateCacheObserver {
    explicit Observer(QVDashboardTableViewCell& owner) : cell(owner) {}

    bool isCurrent(const QVDashboardChartItem& item) const { return cell.chartItem_.get() == &item; }
    void chartItemDidUpdateHistoricalData(QVDashboardChartItem& item) override {
        if (isCurrent(item)) cell.chart_.reloadData(true);
    }
    void chartItemDidUpdateCurrentValueData(QVDashboardChartItem& item) override {
        if (isCurrent(item)) cell.refreshTexts();
    }
    void chartItemDidUpdateSecondaryValueData(QVDashboardChartItem& item) override {
        if (isCurrent(item)) cell.refreshTexts();
    }
    void dateCacheDidUpdate(QVDateCache&) override {
        if (cell.chartItem_ && cell.timeScope_) cell.rebuildTimeBasedContent();
    }

    QVDashboardTableViewCell& cell;
};

QVDashboardTableViewCell::QVDashboardTableViewCell(QQuickItem* parent)
    : QQuickItem(parent),
      chartBackground_(std::make_shared<QVDottedAverageBackgroundView>()),
      observer_(std::make_shared<Observer>(*this)) {
    setFlag(ItemHasContents);

    chart_.setAnimationStyle(QVChart::AnimationStyle::CrossFade);
    chart_.setAnimationDuration(kCrossFade);
    chart_.setDividerInset(kDividerInset);
    chartBackground_->setBoundFormatter([this](double value, const VSNumberFormatter& numberFormatter) {
        if (!chartItem_) return QString();
        return qv_dashboardChartBoundStringFromValue(chartItem_->dataUnitGroup(), chartItem_->timeScope(),
                                                     value, numberFormatter, *chartItem_->unitController());
    });
    chart_.setChartBackgroundView(chartBackground_);
    chart_.onNeedsRepaint = [this] { contentLooksDifferent(); };
    takeTextScale();
    takeContrast();
    connect(&platform::TextScale::shared(), &platform::TextScale::factorChanged, this,
            &QVDashboardTableViewCell::takeTextScale);
    connect(&platform::Appearance::shared(), &platform::Appearance::contrastChanged, this,
            &QVDashboardTableViewCell::takeContrast);
}

double QVDashboardTableViewCell::preferredCellHeight() {
    return QVDashboardCellLayout::preferredCellHeight(platform::textScale());
}

/// Takes the fonts and measures that are not asked for anew with each layout.
void QVDashboardTableViewCell::takeTextScale() {
    setImplicitHeight(preferredCellHeight());
    chartBackground_->setLabelFont(platform::systemFont(kChartLabelFontSize));
    chartBackground_->setNoDataLabelFont(platform::systemFont(kNoDataFontSize));
    chart_.setXAxisGutterHeight(QVDashboardCellLayout::axisGutterHeight(platform::textScale()));
    stillPartLooksDifferent();
}

void QVDashboardTableViewCell::takeContrast() {
    const Blending now = blending();
    chart_.setChartFillCompositingFilter(now.fill);
    chart_.setChartSecondaryFillCompositingFilter(now.secondaryFill);
    chart_.setDividerCompositingFilter(now.lines);
    chartBackground_->setAverageLineCompositingFilter(now.lines);
    chartBackground_->setLabelColor(now.softText);
    chartBackground_->setLabelCompositingFilter(now.softTexts);
    chartBackground_->setNoDataLabelColor(now.softText);
    chartBackground_->setNoDataLabelCompositingFilter(now.softTexts);
    stillPartLooksDifferent();
}

QVDashboardTableViewCell::~QVDashboardTableViewCell() {
    chart_.onNeedsRepaint = nullptr;
    if (const auto dateCache = dateCache_.lock()) dateCache->removeObserver(observer_.get());
}

void QVDashboardTableViewCell::setScreen(QVDashboardViewController* screen) {
    if (screen == screen_) return;
    if (screen_) screen_->disconnect(this);
    screen_ = screen;
    if (screen_) {
        connect(screen_, &QVDashboardViewController::tableReloaded, this, &QVDashboardTableViewCell::prepare);
        connect(screen_, &QObject::destroyed, this, [this] { screen_ = nullptr; });
    }
    emit screenChanged();
    prepare();
}

void QVDashboardTableViewCell::setRow(int row) {
    if (row == row_) return;
    row_ = row;
    emit rowChanged();
    prepare();
}

void QVDashboardTableViewCell::componentComplete() {
    QQuickItem::componentComplete();
    complete_ = true;
    prepare();
}

void QVDashboardTableViewCell::prepare() {
    if (complete_ && screen_ && row_ >= 0) screen_->prepareCell(*this, row_);
}

void QVDashboardTableViewCell::setDateCache(const std::shared_ptr<QVDateCache>& dateCache) {
    const auto previous = dateCache_.lock();
    if (dateCache == previous) return;
    if (previous) previous->removeObserver(observer_.get());
    dateCache_ = dateCache;
    if (dateCache) dateCache->addObserver(observer_);
}

void QVDashboardTableViewCell::setChartItem(std::shared_ptr<QVDashboardChartItem> item) {
    if (item != chartItem_) {
        chartItem_ = std::move(item);
        still_.reset();
        if (!chartItem_) return;
        chartItem_->setDelegate(observer_);
        chart_.setChartRenderer(chartItem_->chartRenderer());
        if (timeScope_) rebuildTimeBasedContent();
        chart_.reloadData(false);
    }
    // Another card, on its way out, may have cleared the item's mark.
    const bool isOutdated = textsLocale_ != VSEnvironment::current()->localeIdentifier() ||
                            textsScale_ != platform::textScale() ||
                            textsContrast_ != platform::highContrast();
    if (chartItem_ && (chartItem_->localeDidChange() || (timeScope_ && isOutdated))) {
        chartItem_->setLocaleDidChange(false);
        if (timeScope_) rebuildTimeBasedContent();
    }
}

void QVDashboardTableViewCell::setTimeScope(QVTimeScope timeScope) {
    if (timeScope_ == timeScope) return;
    timeScope_ = timeScope;
    if (chartItem_) rebuildTimeBasedContent();
}

void QVDashboardTableViewCell::rebuildTimeBasedContent() {
    const auto axis = axisDescriptor(*timeScope_);
    chart_.setXAxisDescriptor(axis);
    if (const auto dateCache = dateCache_.lock()) chartItem_->updateDateRange(*dateCache, *timeScope_);
    chartBackground_->setHideAverageLine(chartItem_->shouldHideAverageLineForTimeScope(*timeScope_));
    chartBackground_->setHideMinMaxLabels(chartItem_->shouldHideMinMaxOnBackgroundForTimeScope(*timeScope_));
    if (axis) {
        axis->setMinValue(chartItem_->startDate());
        axis->setMaxValue(chartItem_->endDate());
    }
    chart_.refreshView();
    chart_.reloadData(true);
    refreshTexts();
}

void QVDashboardTableViewCell::refreshTexts() {
    const VSDataUnitGroup& group = *chartItem_->dataUnitGroup();
    textsLocale_ = VSEnvironment::current()->localeIdentifier();
    textsScale_ = platform::textScale();
    textsContrast_ = platform::highContrast();
    title_ = group.displayName();
    categoryIconName_ = group.isNikeFuel() ? group.groupIcon() : QString();
    average_ = chartItem_->secondaryValue();
    averageIconName_ = group.unitIcon();
    value_ = chartItem_->mostRecentValue(platform::systemFont(kValueFontSize),
                                         platform::systemFont(kUnitFontSize));
    const auto updated = chartItem_->lastUpdated();
    lastUpdated_ = updated ? QVLastUpdatedString(*updated) : QString();
    emit contentChanged();
    stillPartLooksDifferent();
}

QString QVDashboardTableViewCell::accessibleValue() const {
    QStringList parts;
    for (const QString& part : {value_.spokenText(), average_.spokenText(), lastUpdated_})
        if (!part.isEmpty()) parts.append(part);
    return parts.join(QStringLiteral(", "));
}

void QVDashboardTableViewCell::describeChart() {
    QString description;
    if (chartItem_ && timeScope_ && showsItsData()) {
        const QString span = QVTimeScopeDisplayName(*timeScope_);
        const QString &minimum = chartBackground_->minimumText(), &maximum = chartBackground_->maximumText();
        if (minimum.isEmpty() && maximum.isEmpty())
            description = platform::localized("CHART_DESCRIPTION_EMPTY", {span});
        else if (chartBackground_->labelsAreVisible())
            description = platform::localized("CHART_DESCRIPTION_BOUNDS", {span, minimum, maximum});
        else
            description = platform::localized("CHART_DESCRIPTION", {span});
    }
    if (description == chartDescription_) return;
    chartDescription_ = description;
    emit chartDescriptionChanged();
}

double QVDashboardTableViewCell::screenScale() const {
    return window() ? window()->effectiveDevicePixelRatio() : 1.0;
}

QVDashboardCellContent QVDashboardTableViewCell::layoutContent() const {
    const QFont titleFont = platform::systemFont(kTitleFontSize),
                secondFont = platform::systemFont(kSecondLineFontSize);
    const QFontMetricsF secondMetrics(secondFont);
    QVDashboardCellContent content;
    content.width = width();
    content.screenScale = screenScale();
    content.textScale = platform::textScale();
    content.rightToLeft = platform::isRightToLeft();
    content.hasCategoryIcon = !categoryIconName_.isEmpty();
    content.hasAverageIcon = !averageIconName_.isEmpty();
    content.title = measured(platform::StyledText(title_), titleFont);
    content.value = measured(value_, titleFont);
    content.average = measured(average_, secondFont);
    content.lastUpdated = measured(platform::StyledText(lastUpdated_), secondFont);
    content.secondLineAscent = secondMetrics.ascent();
    content.secondLineDescent = secondMetrics.descent();
    return content;
}

QVDashboardCellLayout QVDashboardTableViewCell::cellLayout() const {
    return QVDashboardCellLayout::make(layoutContent());
}

void QVDashboardTableViewCell::paintTexts(QPainter& painter, const QVDashboardCellLayout& layout) const {
    const bool rightToLeft = platform::isRightToLeft();
    const double scale = painter.device()->devicePixelRatioF();
    const QFont titleFont = platform::systemFont(kTitleFontSize),
                secondFont = platform::systemFont(kSecondLineFontSize);
    if (!layout.categoryIcon.isEmpty())
        painter.drawImage(layout.categoryIcon,
                          platform::icon(categoryIconName_, layout.categoryIcon.size(), scale));
    drawLine(painter, platform::StyledText(title_), layout.title, layout.titleBaseline, titleFont, kWhite,
             rightToLeft, layout.titleFactor);
    drawLine(painter, value_, layout.value, layout.valueBaseline, titleFont, kWhite, !rightToLeft,
             layout.valueFactor);

    const Blending now = blending();
    painter.setCompositionMode(now.softTexts);
    drawLine(painter, average_, layout.average, layout.averageBaseline, secondFont, now.softText, rightToLeft,
             layout.averageFactor);
    if (!layout.averageIcon.isEmpty()) {
        const QImage icon =
            platform::icon(averageIconName_, layout.averageIcon.size(), scale, kWhite, rightToLeft);
        painter.setOpacity(now.softText.alphaF());
        painter.drawImage(layout.averageIcon, icon);
        painter.setOpacity(1);
    }
    drawLine(painter, platform::StyledText(lastUpdated_), layout.lastUpdated, layout.lastUpdatedBaseline,
             secondFont, now.softText, !rightToLeft, layout.lastUpdatedFactor);
    painter.setCompositionMode(QPainter::CompositionMode_SourceOver);
}

QImage QVDashboardTableViewCell::render(double scale) {
    return renderOn(Qt::white, scale);
}

QImage QVDashboardTableViewCell::renderCard() {
    return renderOn(Qt::transparent, screenScale());
}

/// What does not move: the colours and the texts. No text stands where the chart draws.
QVDashboardTableViewCell::StillPart QVDashboardTableViewCell::paintStillPart(const QColor& ground,
                                                                             double scale) const {
    const QSize pixels(qCeil(width() * scale), qCeil(height() * scale));
    // Without transparency the scene takes the image as it is.
    const bool isOpaque = ground.alpha() == 255;
    StillPart still{QImage(pixels, isOpaque ? QImage::Format_RGB32 : QImage::Format_ARGB32_Premultiplied),
                    cellLayout()};
    still.image.setDevicePixelRatio(scale);
    still.image.fill(ground);
    if (!chartItem_ || pixels.isEmpty()) return still;
    const QRectF& background = still.layout.background;
    QPainter painter(&still.image);
    painter.setRenderHints(QPainter::Antialiasing | QPainter::TextAntialiasing |
                           QPainter::SmoothPixmapTransform);
    painter.drawImage(background.topLeft(),
                      chartItem_->dataCategory()->roundedGradient(background.size(), scale));
    paintTexts(painter, still.layout);
    return still;
}

QImage QVDashboardTableViewCell::renderOn(const QColor& ground, double scale) {
    // While the chart moves every frame shows the same still part.
    const bool isKept = ground == Qt::white && scale == screenScale();
    StillPart still = isKept && still_ ? *still_ : paintStillPart(ground, scale);
    if (isKept) still_ = still;
    if (!chartItem_ || still.image.isNull()) return still.image;
    chart_.setSize(still.layout.chart.size(), scale);
    QPainter painter(&still.image);
    painter.setClipRect(still.layout.background);
    chart_.paint(painter, still.layout.chart.topLeft());
    painter.end();
    describeChart();
    return still.image;
}

bool QVDashboardTableViewCell::showsItsData() const {
    if (!chartItem_ || !timeScope_) return false;
    return !chartItem_->dataProvider()->isWaiting() && chartItem_->chartRenderer()->finishedLoadingData();
}

void QVDashboardTableViewCell::geometryChange(const QRectF& newGeometry, const QRectF& oldGeometry) {
    QQuickItem::geometryChange(newGeometry, oldGeometry);
    if (newGeometry.size() != oldGeometry.size()) stillPartLooksDifferent();
}

void QVDashboardTableViewCell::itemChange(ItemChange change, const ItemChangeData& data) {
    QQuickItem::itemChange(change, data);
    if (change == ItemSceneChange) {
        disconnect(frames_);
        disconnect(sceneLoss_);
        if (data.window) {
            frames_ = connect(data.window, &QQuickWindow::afterAnimating, this,
                              &QVDashboardTableViewCell::animateFrames);
            // With a lost graphics device the texture is lost, too.
            sceneLoss_ = connect(data.window, &QQuickWindow::sceneGraphInvalidated, this,
                                 &QVDashboardTableViewCell::contentLooksDifferent);
        }
    }
    if (change == ItemDevicePixelRatioHasChanged || change == ItemSceneChange) stillPartLooksDifferent();
}

void QVDashboardTableViewCell::stillPartLooksDifferent() {
    still_.reset();
    contentLooksDifferent();
}

void QVDashboardTableViewCell::contentLooksDifferent() {
    // What a layout under way changes is painted right after it.
    if (painting_) return;
    painted_ = Painted::Outdated;
    if (window()) polish();
}

void QVDashboardTableViewCell::animateFrames() {
    // Told before each frame of the window; while something moves each frame asks for the next one.
    if (!chart_.isAnimating()) return;
    const auto now = std::chrono::steady_clock::now().time_since_epoch();
    chart_.advance(std::chrono::duration_cast<QVAnimationTime>(now));
    polish();
}

void QVDashboardTableViewCell::updatePolish() {
    painting_ = true;
    image_ = render(screenScale());
    painting_ = false;
    painted_ = isSettled() ? Painted::Settled : showsItsData() ? Painted::WithData : Painted::Outdated;
    update();
}

QSGNode* QVDashboardTableViewCell::updatePaintNode(QSGNode* node, UpdatePaintNodeData*) {
    auto* picture = static_cast<QSGImageNode*>(node);
    if (image_.isNull() && !picture) return nullptr;
    if (!picture) {
        picture = window()->createImageNode();
        picture->setOwnsTexture(true);
    }
    if (!image_.isNull()) {
        picture->setTexture(window()->createTextureFromImage(image_, QQuickWindow::TextureIsOpaque));
        picture->setSourceRect(QRectF({}, QSizeF(picture->texture()->textureSize())));
        image_ = {};
    }
    picture->setRect(QRectF(0, 0, width(), height()));
    return picture;
}
