#pragma once

#include "Qelvar/Charts/QVAxisDescriptor.h"

/// A time axis that makes its labels when they are first asked for and keeps them until its range changes.
/// The style is set before the first use: changing it does not make the labels anew. Both fonts start as the
/// system font of 10 points.
class QVCachedAxisDescriptor : public QVAxisDescriptor {
 public:
    QVCachedAxisDescriptor();

    const std::optional<std::vector<QVAxisLabel>>& axisLabels() override;
    QVAxisDataType expectedDataType() const override { return QVAxisDataType::Date; }
    std::optional<VSDate> minValue() const override { return minValue_; }
    void setMinValue(std::optional<VSDate> minValue) override;
    std::optional<VSDate> maxValue() const override { return maxValue_; }
    void setMaxValue(std::optional<VSDate> maxValue) override;
    unsigned labelAlignment() const override { return labelAlignment_; }
    void setLabelAlignment(unsigned labelAlignment) override { labelAlignment_ = labelAlignment; }

    const QFont& highlightedLabelFont() const override { return highlighted_.font; }
    void setHighlightedLabelFont(const QFont& font) override { highlighted_.font = font; }
    const QFont& unhighlightedLabelFont() const override { return unhighlighted_.font; }
    void setUnhighlightedLabelFont(const QFont& font) override { unhighlighted_.font = font; }
    const QColor& highlightedLabelColor() const override { return highlighted_.color; }
    void setHighlightedLabelColor(const QColor& color) override { highlighted_.color = color; }
    const QColor& unhighlightedLabelColor() const override { return unhighlighted_.color; }
    void setUnhighlightedLabelColor(const QColor& color) override { unhighlighted_.color = color; }
    std::optional<QPainter::CompositionMode> highlightedLabelFilter() const override {
        return highlighted_.filter;
    }
    void setHighlightedLabelFilter(std::optional<QPainter::CompositionMode> filter) override {
        highlighted_.filter = filter;
    }
    std::optional<QPainter::CompositionMode> unhighlightedLabelFilter() const override {
        return unhighlighted_.filter;
    }
    void setUnhighlightedLabelFilter(std::optional<QPainter::CompositionMode> filter) override {
        unhighlighted_.filter = filter;
    }

    /// Whether labels that have no rank of their own are highlighted (the hour axis). False at first.
    bool alwaysHighlight() const { return alwaysHighlight_; }
    void setAlwaysHighlight(bool alwaysHighlight) { alwaysHighlight_ = alwaysHighlight; }

    size_t numLabels() override;
    VSDate positionForLabelAtIndex(size_t index) override;
    QString textForLabelAtIndex(size_t index) override;
    void invalidateCache() override { cachedAxisLabels_.reset(); }

 protected:
    /// The labels of the range. Called only with a valid range. The base class has none.
    virtual std::optional<std::vector<QVAxisLabel>> generateAxisLabels() const { return std::nullopt; }
    QVAxisLabel label(const QString& text, VSDate location, bool highlighted) const;
    static void restyle(QVAxisLabel& label, const LabelStyle& style);
    const LabelStyle& highlightedStyle() const { return highlighted_; }

 private:
    bool assertPropertiesValid() const;

    std::optional<VSDate> minValue_;
    std::optional<VSDate> maxValue_;
    unsigned labelAlignment_ = 0;
    LabelStyle highlighted_;
    LabelStyle unhighlighted_;
    bool alwaysHighlight_ = false;
    std::optional<std::vector<QVAxisLabel>> cachedAxisLabels_;
};
