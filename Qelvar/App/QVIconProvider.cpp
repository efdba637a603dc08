#include "Qelvar/App/QVIconProvider.h"

#include "Platform/Icons.h"

QImage QVIconProvider::requestImage(const QString& id, QSize* size, const QSize& requestedSize) {
    const qsizetype slash = id.indexOf(QLatin1Char('/'));
    const QString name = slash < 0 ? id : id.left(slash);
    const QColor tint = slash < 0 ? QColor() : QColor(id.mid(slash + 1));
    const QSize fitted = requestedSize.isValid() ? requestedSize : QSize(32, 32);
    const QImage image = platform::icon(name, fitted, 1, tint);
    *size = image.size();
    return image;
}
