#pragma once

#include <QColor>
#include <QQuickItem>

namespace platform {

/// Shows a built-in icon, fitted into the item, in its own colours or in one. Main thread only.
class IconItem : public QQuickItem {
    Q_OBJECT
    Q_PROPERTY(QString name READ name WRITE setName NOTIFY nameChanged)
    Q_PROPERTY(QColor tint READ tint WRITE setTint NOTIFY tintChanged)
 public:
    explicit IconItem(QQuickItem* parent = nullptr);
    QString name() const { return name_; }
    void setName(const QString& name);
    /// Transparent: the icon's own colours.
    QColor tint() const { return tint_; }
    void setTint(const QColor& tint);

 signals:
    void nameChanged();
    void tintChanged();

 protected:
    QSGNode* updatePaintNode(QSGNode* node, UpdatePaintNodeData* data) override;
    void geometryChange(const QRectF& newGeometry, const QRectF& oldGeometry) override;
    void itemChange(ItemChange change, const ItemChangeData& data) override;

 private:
    QString name_;
    QColor tint_ = Qt::transparent;
};

}  // namespace platform
