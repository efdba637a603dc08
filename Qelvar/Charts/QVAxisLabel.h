#pragma once

#include <QColor>
#include <QFont>
#include <QPainter>
#include <QString>
#include <optional>

#include "Vessa/Base/VSDate.h"

/// One label of a time axis.
struct QVAxisLabel {
    QString text;
    VSDate location;
    QColor labelColor;
    QFont labelFont;
    /// How the label's colour meets what lies beneath it; none: it covers it.
    std::optional<QPainter::CompositionMode> compositingFilter;

    /// "Text: ..., Location: ..., Color: ..." for logs; the location in ISO 8601 in the user's zone.
    QString description() const;
    friend bool operator==(const QVAxisLabel&, const QVAxisLabel&) = default;
};
