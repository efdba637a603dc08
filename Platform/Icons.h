#pragma once

#include <QColor>
#include <QImage>
#include <QSizeF>
#include <QString>

namespace platform {

/// The icon of a name (the file Resources/icons/<name>.svg, built in), fitted into a size in points, as an
/// image of size * scale pixels with that device pixel ratio. A valid tint replaces all its colours, keeping
/// alpha. `mirrored` flips it left to right. Null when there is no icon of that name. Kept in a cache. Any
/// thread.
QImage icon(const QString& name, QSizeF size, double scale, const QColor& tint = {}, bool mirrored = false);

}  // namespace platform
