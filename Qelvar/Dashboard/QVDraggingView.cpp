#include "Qelvar/Dashboard/QVDraggingView.h"

#include <QQuickWindow>
#include <QSGImageNode>

QVDraggingView::QVDraggingView(QQuickItem* parent) : QQuickItem(parent) {
    setFlag(ItemHasContents);
    setVisible(false);
}

void QVDraggingView::setScreen(QVReorderableTableViewController* screen) {
    if (screen == screen_) return;
    if (screen_) screen_->disconnect(this);
    screen_ = screen;
    if (screen_) {
        connect(screen_, &QVReorderableTableViewController::draggingViewChanged, this,
                &QVDraggingView::follow);
        connect(screen_, &QObject::destroyed, this, [this] {
            screen_ = nullptr;
            setVisible(false);
        });
        follow();
    }
    emit screenChanged();
}

void QVDraggingView::follow() {
    const auto view = screen_->draggingView();
    const QImage image = view ? view->image : QImage();
    if (image.cacheKey() != image_.cacheKey()) {
        image_ = image;
        imageIsNew_ = true;
        update();
    }
    setVisible(view.has_value());
    if (!view) return;
    setPosition(view->frame.topLeft());
    setSize(view->frame.size());
    setScale(view->scale);
    setOpacity(view->opacity);
}

void QVDraggingView::itemChange(ItemChange change, const ItemChangeData& data) {
    QQuickItem::itemChange(change, data);
    if (change != ItemSceneChange) return;
    disconnect(sceneLoss_);
    imageIsNew_ = true;
    // With a lost graphics device the texture is lost, too.
    if (data.window)
        sceneLoss_ =
            connect(data.window, &QQuickWindow::sceneGraphInvalidated, this, [this] { imageIsNew_ = true; });
}

QSGNode* QVDraggingView::updatePaintNode(QSGNode* node, UpdatePaintNodeData*) {
    auto* picture = static_cast<QSGImageNode*>(node);
    if (image_.isNull()) {
        delete picture;
        return nullptr;
    }
    if (!picture) {
        picture = window()->createImageNode();
        picture->setOwnsTexture(true);
        picture->setFiltering(QSGTexture::Linear);
        imageIsNew_ = true;
    }
    if (imageIsNew_) {
        picture->setTexture(window()->createTextureFromImage(image_, QQuickWindow::TextureHasAlphaChannel));
        picture->setSourceRect(QRectF({}, QSizeF(picture->texture()->textureSize())));
        imageIsNew_ = false;
    }
    picture->setRect(boundingRect());
    return picture;
}
