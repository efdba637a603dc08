#pragma once

#include <QColor>
#include <QFont>
#include <QPainter>
#include <optional>
#include <vector>

#include "Qelvar/Charts/QVAxisLabel.h"
#include "Vessa/Base/VSDate.h"

/// The kind of value that an axis runs over.
enum class QVAxisDataType { Date, Number };

/// Says which labels the time axis of a chart carries. Main thread only.
class QVAxisDescriptor {
 public:
    /// How one of the two kinds of labels looks. An invalid colour draws nothing.
    struct LabelStyle {
        QFont font;
        QColor color;
        std::optional<QPainter::CompositionMode> filter;
        friend bool operator==(const LabelStyle&, const LabelStyle&) = default;
    };

    virtual ~QVAxisDescriptor() = default;

    /// The labels in the order of time; none (not an empty list) when the range is missing or upside down.
    /// The reference holds until the next call of anything that is not const.
    virtual const std::optional<std::vector<QVAxisLabel>>& axisLabels() = 0;
    virtual QVAxisDataType expectedDataType() const = 0;

    virtual std::optional<VSDate> minValue() const = 0;
    virtual void setMinValue(std::optional<VSDate> minValue) = 0;
    virtual std::optional<VSDate> maxValue() const = 0;
    virtual void setMaxValue(std::optional<VSDate> maxValue) = 0;
    virtual unsigned labelAlignment() const = 0;
    virtual void setLabelAlignment(unsigned labelAlignment) = 0;

    virtual const QFont& highlightedLabelFont() const = 0;
    virtual void setHighlightedLabelFont(const QFont& font) = 0;
    virtual const QFont& unhighlightedLabelFont() const = 0;
    virtual void setUnhighlightedLabelFont(const QFont& font) = 0;
    virtual const QColor& highlightedLabelColor() const = 0;
    virtual void setHighlightedLabelColor(const QColor& color) = 0;
    virtual const QColor& unhighlightedLabelColor() const = 0;
    virtual void setUnhighlightedLabelColor(const QColor& color) = 0;
    virtual std::optional<QPainter::CompositionMode> highlightedLabelFilter() const = 0;
    virtual void setHighlightedLabelFilter(std::optional<QPainter::CompositionMode> filter) = 0;
    virtual std::optional<QPainter::CompositionMode> unhighlightedLabelFilter() const = 0;
    virtual void setUnhighlightedLabelFilter(std::optional<QPainter::CompositionMode> filter) = 0;

    /// The number of labels, and the position and text of one of them. REQUIRES: index < numLabels().
    virtual size_t numLabels() = 0;
    virtual VSDate positionForLabelAtIndex(size_t index) = 0;
    virtual QString textForLabelAtIndex(size_t index) = 0;
    /// Forgets labels made earlier (the locale changed).
    virtual void invalidateCache() {}
};
