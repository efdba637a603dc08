#pragma once

#include <gtest/gtest.h>

#include <QDir>
#include <QQuickItem>
#include <QQuickWindow>

namespace test {

/// For a person to look at, when a folder for pictures is named.
inline void keepPicture(QQuickWindow& window, const QString& name) {
    const QString folder = qEnvironmentVariable("QELVAR_TEST_PICTURES");
    if (folder.isEmpty()) return;
    QDir().mkpath(folder);
    EXPECT_TRUE(window.grabWindow().save(folder + '/' + name + ".png"));
}

/// The texts in sight, and where their lines are, which may be less than their items.
inline void collectTexts(QQuickItem* item, QRectF seen, QList<std::pair<QQuickItem*, QRectF>>& texts) {
    if (!item->isVisible() || item->opacity() == 0) return;
    const QRectF rect = item->mapRectToScene(QRectF(0, 0, item->width(), item->height()));
    if (item->clip()) seen = seen.intersected(rect);
    if (item->inherits("QQuickText") && !item->property("text").toString().isEmpty()) {
        const double height = item->property("contentHeight").toDouble();
        const QRectF lines(rect.x(), rect.center().y() - height / 2, rect.width(), height);
        const bool isTop = rect.height() <= height || item->property("verticalAlignment") == Qt::AlignTop;
        texts.append({item, isTop ? QRectF(rect.topLeft(), QSizeF(rect.width(), height)) : lines});
        if (!seen.intersects(texts.back().second)) texts.removeLast();
    }
    for (QQuickItem* child : item->childItems()) collectTexts(child, seen, texts);
}

/// No text of the root is cut or lies on another one or beside the window. Names of files and folders, which
/// may be of any length, lose their middle.
inline void expectTextsFit(QQuickWindow& window, QQuickItem* root, const QString& name) {
    SCOPED_TRACE(name.toStdString());
    // What an item scrolls with; bars lie above it.
    const auto scroller = [](QQuickItem* item) {
        while (item && !item->inherits("QQuickFlickable")) item = item->parentItem();
        return item;
    };
    const auto words = [](QQuickItem* item) { return item->property("text").toString().toStdString(); };
    QList<std::pair<QQuickItem*, QRectF>> texts;
    const QRectF frame(QPointF(), QSizeF(window.size()));
    collectTexts(root, frame, texts);
    EXPECT_FALSE(texts.empty());
    for (qsizetype i = 0; i < texts.size(); ++i) {
        const auto& [item, rect] = texts[i];
        const bool mayBeCut = item->property("elide").toInt() == Qt::ElideMiddle;
        EXPECT_TRUE(mayBeCut || !item->property("truncated").toBool()) << words(item);
        EXPECT_LE(item->property("paintedWidth").toDouble(), rect.width() + 1) << words(item);
        EXPECT_TRUE(rect.left() >= 0 && rect.right() <= frame.right() + 1) << words(item);
        for (qsizetype j = 0; j < i; ++j)
            EXPECT_FALSE(scroller(item) == scroller(texts[j].first) &&
                         rect.adjusted(1, 1, -1, -1).intersects(texts[j].second.adjusted(1, 1, -1, -1)))
                << words(item) << " lies on " << words(texts[j].first);
    }
    keepPicture(window, name);
}

}  // namespace test
