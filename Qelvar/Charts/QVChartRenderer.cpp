#include "Qelvar/Charts/QVChartRenderer.h"

#include <QUuid>
#include <algorithm>
#include <cmath>
#include <utility>

#include "Qelvar/Charts/QVChartDrawing.h"

namespace {

/// Between what is drawn last and a label, in points: a marker at the very edge has room in it.
constexpr double kAirBeforeLabels = 6;

}  // namespace

struct QVChartRenderer::Images {
    QImage chart, fill, secondaryFill;
};

/// One drawing: what was asked for, and copies of everything that it needs.
struct QVChartRenderer::Operation {
    uint64_t number = 0;
    QSizeF size;
    QVEdgeInsets renderInsets;
    double viewScale = 1;
    bool separateFills = true;
    Completion completion;

    // Captured after the reload.
    std::shared_ptr<const QVChartDataGroup> dataGroup;
    std::vector<std::unique_ptr<QVChartSeries>> series;
    QVEdgeInsets insets;
    std::optional<VSDate> minXValue, maxXValue;
    std::optional<double> minYValue, maxYValue;
    bool finishedLoading = false;
    bool hasAverage = false;

    Images draw();

 private:
    enum class Layer { Fill, SecondaryFill, Chart };
    QImage drawLayers(std::initializer_list<Layer> layers) const;
};

QVChartRenderer::Images QVChartRenderer::Operation::draw() {
    if (!(size.width() > 0 && size.height() > 0) || dataGroup->isEmpty()) return {};
    for (size_t i = 0; i < series.size(); ++i) {
        if (series[i] && i < dataGroup->numberOfDataSets())
            series[i]->prepareForRendering(size, minXValue, maxXValue, minYValue, maxYValue, insets,
                                           dataGroup->dataSetAtIndex(i));
        else
            series[i] = nullptr;
    }
    if (!separateFills) return {drawLayers({Layer::Fill, Layer::SecondaryFill, Layer::Chart}), {}, {}};
    const auto any = [this](bool (QVChartSeries::*draws)() const) {
        return std::any_of(series.begin(), series.end(),
                           [draws](const auto& one) { return one && (one.get()->*draws)(); });
    };
    return {drawLayers({Layer::Chart}), any(&QVChartSeries::drawsFill) ? drawLayers({Layer::Fill}) : QImage(),
            any(&QVChartSeries::drawsSecondaryFill) ? drawLayers({Layer::SecondaryFill}) : QImage()};
}

QImage QVChartRenderer::Operation::drawLayers(std::initializer_list<Layer> layers) const {
    QImage image = QVTransparentImage(size, viewScale);
    QPainter painter(&image);
    painter.setRenderHints(QPainter::Antialiasing | QPainter::TextAntialiasing |
                           QPainter::SmoothPixmapTransform);
    for (const Layer layer : layers) {
        for (const auto& one : series) {
            if (!one) continue;
            if (layer == Layer::Fill) one->renderFill(painter);
            if (layer == Layer::SecondaryFill) one->renderSecondaryFill(painter);
            if (layer == Layer::Chart) one->renderChart(painter);
        }
    }
    return image;
}

std::shared_ptr<QVChartRenderer> QVChartRenderer::create(
    platform::Queue& clientQueue, std::weak_ptr<QVChartRendererDataSource> dataSource) {
    std::shared_ptr<QVChartRenderer> renderer(new QVChartRenderer(clientQueue, std::move(dataSource)));
    renderer->dataGroup_->setDataSource(renderer->weak_from_this());
    return renderer;
}

QVChartRenderer::QVChartRenderer(platform::Queue& clientQueue,
                                 std::weak_ptr<QVChartRendererDataSource> dataSource)
    : clientQueue_(clientQueue),
      dataSource_(std::move(dataSource)),
      dataGroup_(QVChartDataGroup::create()),
      renderQueue_(platform::makeConcurrentQueue(
          "qelvar.QVChartRenderer." + QUuid::createUuid().toString(QUuid::WithoutBraces).toStdString())) {}

QVChartRenderer::~QVChartRenderer() = default;

void QVChartRenderer::renderChart(QSizeF size, const QVEdgeInsets& renderInsets, double viewScale,
                                  bool shouldRenderFillSeparately, Completion completion) {
    auto operation = std::make_shared<Operation>();
    operation->number = ++*newestOperation_;
    operation->size = size;
    operation->renderInsets = renderInsets;
    operation->viewScale = viewScale;
    operation->separateFills = shouldRenderFillSeparately;
    operation->completion = std::move(completion);
    clientQueue_.async([weak = weak_from_this(), operation] {
        const auto self = weak.lock();
        if (!self) return;
        self->reload();
        self->capture(*operation);
        self->start(operation);
    });
}

void QVChartRenderer::reload() {
    dataGroup_->reloadData();
    minYValue_ = maxYValue_ = maxYValueInData_ = std::nullopt;
    decimalPrecision_ = 0;
    if (const auto source = dataSource_.lock()) {
        adjustVerticalRange(*source);
        measureLabels(*source);
    }
}

void QVChartRenderer::measureLabels(QVChartRendererDataSource& source) {
    labelRoom_ = askLabelRoom_ ? askLabelRoom_(*this) : 0;
    const size_t count = source.numberOfSeriesInChartRenderer(*this);
    for (size_t i = 0; i < count; ++i)
        if (const auto series = source.seriesAtIndex(*this, i))
            labelRoom_ = std::max(labelRoom_, series->labelRoom());
    if (labelRoom_ > 0) labelRoom_ += kAirBeforeLabels;
}

QVEdgeInsets QVChartRenderer::chartInsets() const {
    QVEdgeInsets insets = chartInsets_;
    insets.right = std::max(insets.right, labelRoom_);
    return insets;
}

void QVChartRenderer::adjustVerticalRange(QVChartRendererDataSource& source) {
    const auto number = [](std::optional<double> value) {
        return value && !std::isnan(*value) ? value : std::nullopt;
    };
    const std::optional<double> min = dataGroup_->minYValue();
    const std::optional<double> max = dataGroup_->maxYValue();
    if (!min || !max) return;
    const VSDataUnitGroupChartingRules::Bounds bounds = source.adjustChartBounds(*min, *max);
    minYValue_ = number(bounds.minimum);
    maxYValue_ = number(bounds.maximum);
    maxYValueInData_ = number(max);
    decimalPrecision_ = bounds.decimalPrecision;
}

void QVChartRenderer::capture(Operation& operation) const {
    operation.dataGroup = dataGroup_->copy();
    operation.hasAverage = operation.dataGroup->averageYValue().has_value();
    operation.insets = chartInsets() + operation.renderInsets;
    operation.minXValue = minXValue_;
    operation.maxXValue = maxXValue_;
    operation.minYValue = minYValue_;
    operation.maxYValue = maxYValue_;
    const auto source = dataSource_.lock();
    if (!source) return;
    operation.finishedLoading = source->dataForChartRendererIsFinishedLoading(*this);
    const size_t count = source->numberOfSeriesInChartRenderer(*this);
    for (size_t i = 0; i < count; ++i) {
        const auto series = source->seriesAtIndex(*this, i);
        operation.series.push_back(series ? series->copy() : nullptr);
    }
}

/// The drawing holds the renderer weakly, so that the renderer can wait for it when it goes.
void QVChartRenderer::start(std::shared_ptr<Operation> operation) {
    renderQueue_->async(
        [weak = weak_from_this(), &clientQueue = clientQueue_, newest = newestOperation_, operation] {
            std::optional<Images> images;
            if (newest->load() == operation->number) images = operation->draw();
            clientQueue.async([weak, operation, images = std::move(images)] {
                if (const auto self = weak.lock()) self->finish(*operation, images);
            });
        });
}

void QVChartRenderer::finish(const Operation& operation, const std::optional<Images>& images) {
    const bool current = operation.number > newestFinished_ && operation.number > newestDropped_;
    if (images && current) {
        chartImage_ = images->chart;
        chartFillImage_ = images->fill;
        chartSecondaryFillImage_ = images->secondaryFill;
        finishedLoadingData_ = operation.finishedLoading;
        dataState_ =
            operation.hasAverage ? QVChartDataState::RenderedWithData : QVChartDataState::RenderedWithoutData;
    } else if (newestFinished_ < operation.number && operation.number < newestOperation_->load()) {
        // A later drawing is on its way: this one is done when that is.
        overtaken_.push_back(operation.completion);
        return;
    }
    newestFinished_ = std::max(newestFinished_, operation.number);
    std::vector<Completion> completions;
    if (operation.number == newestOperation_->load()) completions = std::exchange(overtaken_, {});
    completions.push_back(operation.completion);
    const Images shown{chartImage_, chartFillImage_, chartSecondaryFillImage_};
    const bool finishedLoading = finishedLoadingData_;
    for (const Completion& completion : completions)
        if (completion) completion(shown.chart, shown.fill, shown.secondaryFill, finishedLoading);
}

std::optional<double> QVChartRenderer::averageYValue() const {
    return dataGroup_->averageYValue();
}

void QVChartRenderer::dropCachedImages() {
    chartImage_ = chartFillImage_ = chartSecondaryFillImage_ = {};
    finishedLoadingData_ = false;
    newestDropped_ = newestOperation_->load();
}

const VSDataUnit* QVChartRenderer::dataUnit() const {
    const auto source = dataSource_.lock();
    return source ? source->dataUnit() : nullptr;
}

VSUnitController* QVChartRenderer::unitController() const {
    const auto source = dataSource_.lock();
    return source ? source->unitController() : nullptr;
}

size_t QVChartRenderer::numberOfDataSetsInGroup(const QVChartDataGroup&) {
    const auto source = dataSource_.lock();
    return source ? source->numberOfSeriesInChartRenderer(*this) : 0;
}

size_t QVChartRenderer::numberOfPointsInSetAtIndex(const QVChartDataGroup&, size_t setIndex) {
    const auto source = dataSource_.lock();
    return source ? source->numberOfDataPointsForSeriesAtIndex(*this, setIndex) : 0;
}

QVChartPointPtr QVChartRenderer::pointForSetAtIndex(const QVChartDataGroup&, size_t setIndex,
                                                    size_t pointIndex) {
    const auto source = dataSource_.lock();
    return source ? source->dataPointAtIndex(*this, pointIndex, setIndex) : nullptr;
}
