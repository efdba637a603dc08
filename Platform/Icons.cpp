#include "Platform/Icons.h"

#include <QCache>
#include <QFile>
#include <QMutex>
#include <QPainter>
#include <QSvgRenderer>
#include <cmath>
#include <mutex>
#include <tuple>

static void initializeIconResources() {
    Q_INIT_RESOURCE(qelvar_icons);
}

namespace platform {

namespace {

struct IconKey {
    QString name;
    QSize pixels;
    int thousandthsOfScale;
    QRgb tint;
    bool tinted, mirrored;
    friend bool operator==(const IconKey&, const IconKey&) = default;
    friend size_t qHash(const IconKey& key, size_t seed = 0) {
        return qHashMulti(seed, key.name, key.pixels.width(), key.pixels.height(), key.thousandthsOfScale,
                          key.tint, key.tinted, key.mirrored);
    }
};

QImage rendered(const QString& path, const IconKey& key, double scale) {
    QSvgRenderer renderer(path);
    if (!renderer.isValid()) return {};
    renderer.setAspectRatioMode(Qt::KeepAspectRatio);
    QImage image(key.pixels, QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    painter.setRenderHint(QPainter::Antialiasing);
    renderer.render(&painter, QRectF(QPointF(), key.pixels));
    if (key.tinted) {
        painter.setCompositionMode(QPainter::CompositionMode_SourceIn);
        painter.fillRect(image.rect(), QColor::fromRgba(key.tint));
    }
    painter.end();
    if (key.mirrored) image = image.mirrored(true, false);
    image.setDevicePixelRatio(scale);
    return image;
}

}  // namespace

QImage icon(const QString& name, QSizeF size, double scale, const QColor& tint, bool mirrored) {
    static std::once_flag once;
    std::call_once(once, initializeIconResources);
    static QMutex mutex;
    static QCache<IconKey, QImage> cache(16 * 1024);  // kilobytes; guarded by mutex

    const QSize pixels(static_cast<int>(std::lround(size.width() * scale)),
                       static_cast<int>(std::lround(size.height() * scale)));
    if (name.isEmpty() || pixels.isEmpty()) return {};
    const IconKey key{name,
                      pixels,
                      static_cast<int>(std::lround(scale * 1000)),
                      tint.isValid() ? tint.rgba() : 0,
                      tint.isValid(),
                      mirrored};
    {
        QMutexLocker lock(&mutex);
        if (const QImage* found = cache.object(key)) return *found;
    }
    const QString path = QStringLiteral(":/icons/%1.svg").arg(name);
    if (!QFile::exists(path)) return {};
    QImage image = rendered(path, key, scale);
    QMutexLocker lock(&mutex);
    cache.insert(key, new QImage(image), std::max<qsizetype>(1, image.sizeInBytes() / 1024));
    return image;
}

}  // namespace platform
