#include "Qelvar/Charts/QVCachedAxisDescriptor.h"

#include "Platform/StyledText.h"

QVCachedAxisDescriptor::QVCachedAxisDescriptor() {
    highlighted_.font = platform::systemFont(10);
    unhighlighted_.font = platform::systemFont(10);
}

void QVCachedAxisDescriptor::setMinValue(std::optional<VSDate> minValue) {
    if (minValue_ != minValue) invalidateCache();
    minValue_ = minValue;
}

void QVCachedAxisDescriptor::setMaxValue(std::optional<VSDate> maxValue) {
    if (maxValue_ != maxValue) invalidateCache();
    maxValue_ = maxValue;
}

const std::optional<std::vector<QVAxisLabel>>& QVCachedAxisDescriptor::axisLabels() {
    if (!cachedAxisLabels_ && assertPropertiesValid()) cachedAxisLabels_ = generateAxisLabels();
    return cachedAxisLabels_;
}

bool QVCachedAxisDescriptor::assertPropertiesValid() const {
    return minValue_ && maxValue_ && *minValue_ <= *maxValue_;
}

size_t QVCachedAxisDescriptor::numLabels() {
    const auto& labels = axisLabels();
    return labels ? labels->size() : 0;
}

VSDate QVCachedAxisDescriptor::positionForLabelAtIndex(size_t index) {
    return axisLabels().value().at(index).location;
}

QString QVCachedAxisDescriptor::textForLabelAtIndex(size_t index) {
    return axisLabels().value().at(index).text;
}

QVAxisLabel QVCachedAxisDescriptor::label(const QString& text, VSDate location, bool highlighted) const {
    QVAxisLabel label;
    label.text = text;
    label.location = location;
    restyle(label, highlighted ? highlighted_ : unhighlighted_);
    return label;
}

void QVCachedAxisDescriptor::restyle(QVAxisLabel& label, const LabelStyle& style) {
    label.labelFont = style.font;
    label.labelColor = style.color;
    label.compositingFilter = style.filter;
}
