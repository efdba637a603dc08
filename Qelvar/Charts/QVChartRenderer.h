#pragma once

#include <QImage>
#include <QSizeF>
#include <atomic>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Platform/Queue.h"
#include "Qelvar/Charts/QVChartRendererDataSource.h"
#include "Qelvar/Charts/QVEdgeInsets.h"
#include "Qelvar/Models/Data/QVChartDataGroup.h"
#include "Vessa/Base/VSDate.h"

/// What a renderer's last drawing had to draw.
enum class QVChartDataState { NotRendered = 1, RenderedWithData = 2, RenderedWithoutData = 3 };

/// Draws the chart of one data source into images, away from the client's thread. All state belongs to the
/// client queue (for cards: the main queue); a drawing works on copies taken there, so that it never sees
/// later changes.
class QVChartRenderer final : public QVChartDataGroupDataSource,
                              public std::enable_shared_from_this<QVChartRenderer> {
 public:
    /// `clientQueue` is serial and outlives the renderer. The data source is held weakly.
    static std::shared_ptr<QVChartRenderer> create(platform::Queue& clientQueue,
                                                   std::weak_ptr<QVChartRendererDataSource> dataSource);
    /// Waits for drawings under way; their results and completions are dropped.
    ~QVChartRenderer() override;
    QVChartRenderer(const QVChartRenderer&) = delete;
    QVChartRenderer& operator=(const QVChartRenderer&) = delete;

    /// Called on the client queue with the chart, fill and secondary fill images (each may be null) and
    /// whether the data was complete.
    using Completion = std::function<void(const QImage& chart, const QImage& fill,
                                          const QImage& secondaryFill, bool finishedLoading)>;
    /// Reloads the data and draws it at `size` points and `viewScale` pixels a point. The plot lies inside
    /// chartInsets() plus `renderInsets`. Without separate fills all layers are in the chart image. Returns
    /// at once; may be called on any thread. A drawing that a later one has overtaken is not shown: its
    /// completion is called with the images of the later one.
    void renderChart(QSizeF size, const QVEdgeInsets& renderInsets, double viewScale,
                     bool shouldRenderFillSeparately, Completion completion);

    const std::shared_ptr<QVChartDataGroup>& dataGroup() const { return dataGroup_; }
    std::optional<VSDate> minXValue() const { return minXValue_; }
    void setMinXValue(std::optional<VSDate> date) { minXValue_ = date; }
    std::optional<VSDate> maxXValue() const { return maxXValue_; }
    void setMaxXValue(std::optional<VSDate> date) { maxXValue_ = date; }
    /// The margins of the plot: those that were set, with as much more at the right as the labels there need.
    QVEdgeInsets chartInsets() const;
    void setChartInsets(const QVEdgeInsets& insets) { chartInsets_ = insets; }
    /// Says how much of the image, from its right edge, labels of the vertical range need; asked on the
    /// client queue when the range is known and before anything is drawn in it. None: they need nothing.
    using LabelRoom = std::function<double(const QVChartRenderer&)>;
    void setLabelRoom(LabelRoom labelRoom) { askLabelRoom_ = std::move(labelRoom); }
    /// The adjusted vertical range; none without data.
    std::optional<double> minYValue() const { return minYValue_; }
    std::optional<double> maxYValue() const { return maxYValue_; }
    std::optional<double> maxYValueInData() const { return maxYValueInData_; }
    /// The mean of the points' representative values, or none.
    std::optional<double> averageYValue() const;
    int decimalPrecision() const { return decimalPrecision_; }
    QVChartDataState dataState() const { return dataState_; }
    const QImage& chartImage() const { return chartImage_; }
    const QImage& chartFillImage() const { return chartFillImage_; }
    const QImage& chartSecondaryFillImage() const { return chartSecondaryFillImage_; }
    /// Whether the data was complete at the last drawing.
    bool finishedLoadingData() const { return finishedLoadingData_; }
    /// Forgets the images of a range that is no longer shown, and that its data was complete.
    void dropCachedImages();

    const VSDataUnit* dataUnit() const;
    VSUnitController* unitController() const;

    // QVChartDataGroupDataSource: one set for each series.
    size_t numberOfDataSetsInGroup(const QVChartDataGroup& dataGroup) override;
    size_t numberOfPointsInSetAtIndex(const QVChartDataGroup& dataGroup, size_t setIndex) override;
    QVChartPointPtr pointForSetAtIndex(const QVChartDataGroup& dataGroup, size_t setIndex,
                                       size_t pointIndex) override;

 private:
    struct Operation;
    struct Images;
    explicit QVChartRenderer(platform::Queue& clientQueue,
                             std::weak_ptr<QVChartRendererDataSource> dataSource);
    void reload();
    void adjustVerticalRange(QVChartRendererDataSource& source);
    void measureLabels(QVChartRendererDataSource& source);
    void capture(Operation& operation) const;
    void start(std::shared_ptr<Operation> operation);
    void finish(const Operation& operation, const std::optional<Images>& images);

    platform::Queue& clientQueue_;
    const std::weak_ptr<QVChartRendererDataSource> dataSource_;
    const std::shared_ptr<QVChartDataGroup> dataGroup_;
    std::optional<VSDate> minXValue_, maxXValue_;
    QVEdgeInsets chartInsets_;
    LabelRoom askLabelRoom_;
    double labelRoom_ = 0;
    std::optional<double> minYValue_, maxYValue_, maxYValueInData_;
    int decimalPrecision_ = 0;
    QVChartDataState dataState_ = QVChartDataState::NotRendered;
    QImage chartImage_, chartFillImage_, chartSecondaryFillImage_;
    bool finishedLoadingData_ = false;

    /// The number of the newest drawing asked for; read by drawings to see whether they are overtaken.
    std::shared_ptr<std::atomic<uint64_t>> newestOperation_ = std::make_shared<std::atomic<uint64_t>>(0);
    uint64_t newestFinished_ = 0;
    /// Drawings up to this one show a range that is no longer wanted.
    uint64_t newestDropped_ = 0;
    std::vector<Completion> overtaken_;

    /// Last, so that drawings under way end before the rest goes.
    std::shared_ptr<platform::Queue> renderQueue_;
};
