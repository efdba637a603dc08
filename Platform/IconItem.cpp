#include "Platform/IconItem.h"

#include <QQuickWindow>
#include <QSGImageNode>

#include "Platform/Icons.h"

namespace platform {

IconItem::IconItem(QQuickItem* parent) : QQuickItem(parent) {
    setFlag(ItemHasContents);
}

void IconItem::setName(const QString& name) {
    if (name == name_) return;
    name_ = name;
    emit nameChanged();
    update();
}

void IconItem::setTint(const QColor& tint) {
    if (tint == tint_) return;
    tint_ = tint;
    emit tintChanged();
    update();
}

void IconItem::geometryChange(const QRectF& newGeometry, const QRectF& oldGeometry) {
    QQuickItem::geometryChange(newGeometry, oldGeometry);
    update();
}

void IconItem::itemChange(ItemChange change, const ItemChangeData& data) {
    QQuickItem::itemChange(change, data);
    if (change == ItemDevicePixelRatioHasChanged) update();
}

QSGNode* IconItem::updatePaintNode(QSGNode* node, UpdatePaintNodeData*) {
    const QImage image = name_.isEmpty() ? QImage()
                                         : icon(name_, size(), window()->effectiveDevicePixelRatio(),
                                                tint_.alpha() == 0 ? QColor() : tint_);
    if (image.isNull()) {
        delete node;
        return nullptr;
    }
    auto* picture = static_cast<QSGImageNode*>(node);
    if (!picture) {
        picture = window()->createImageNode();
        picture->setOwnsTexture(true);
    }
    picture->setTexture(window()->createTextureFromImage(image));
    picture->setSourceRect(QRectF({}, QSizeF(picture->texture()->textureSize())));
    // In the middle: the icon keeps its proportions.
    const QSizeF points = image.deviceIndependentSize();
    picture->setRect(QRectF({(width() - points.width()) / 2, (height() - points.height()) / 2}, points));
    return picture;
}

}  // namespace platform
