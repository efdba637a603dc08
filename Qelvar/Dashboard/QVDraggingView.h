#pragma once

#include <QQuickItem>

#include "Qelvar/Dashboard/QVReorderableTableViewController.h"

/// The row's picture that follows the pointer, above the table: its parent has the size and place of the
/// table's visible part. Main thread only.
class QVDraggingView : public QQuickItem {
    Q_OBJECT
    Q_PROPERTY(QVReorderableTableViewController* screen READ screen WRITE setScreen NOTIFY screenChanged)
 public:
    explicit QVDraggingView(QQuickItem* parent = nullptr);

    QVReorderableTableViewController* screen() const { return screen_; }
    void setScreen(QVReorderableTableViewController* screen);

 signals:
    void screenChanged();

 protected:
    QSGNode* updatePaintNode(QSGNode* node, UpdatePaintNodeData* data) override;
    void itemChange(ItemChange change, const ItemChangeData& data) override;

 private:
    void follow();

    QVReorderableTableViewController* screen_ = nullptr;
    QImage image_;
    bool imageIsNew_ = false;
    QMetaObject::Connection sceneLoss_;
};
