#pragma once

#include <QQuickImageProvider>

/// Gives the built-in icons to the scene: "image://icon/dashboard", "image://icon/dashboard/#007aff" in one
/// colour. The image's source size, in points times the window's scale, must be set.
class QVIconProvider : public QQuickImageProvider {
 public:
    QVIconProvider() : QQuickImageProvider(QQuickImageProvider::Image) {}
    QImage requestImage(const QString& id, QSize* size, const QSize& requestedSize) override;
};
