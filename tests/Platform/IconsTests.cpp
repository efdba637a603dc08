#include "Platform/Icons.h"

#include <gtest/gtest.h>

#include <QDirIterator>

#include "Platform/Queue.h"

namespace {

TEST(Icons, UnknownNamesAndEmptySizesGiveNone) {
    EXPECT_TRUE(platform::icon("no such icon", {10, 10}, 1).isNull());
    EXPECT_TRUE(platform::icon("", {10, 10}, 1).isNull());
    EXPECT_TRUE(platform::icon("dashboard", {0, 10}, 1).isNull());
}

TEST(Icons, EveryIconDrawsSomethingInItsSizeAndTint) {
    int count = 0;
    for (QDirIterator files(QELVAR_SOURCE_DIR "/Resources/icons", {"*.svg"}, QDir::Files); files.hasNext();
         ++count) {
        files.next();
        const QString name = files.fileInfo().completeBaseName();
        const QImage plain = platform::icon(name, {12, 10}, 2);
        ASSERT_EQ(plain.size(), QSize(24, 20)) << name.toStdString();
        EXPECT_EQ(plain.devicePixelRatio(), 2);
        const QImage tinted = platform::icon(name, {12, 10}, 2, Qt::blue);
        int visible = 0;
        for (int y = 0; y < tinted.height(); ++y)
            for (int x = 0; x < tinted.width(); ++x) {
                const QColor color = tinted.pixelColor(x, y);
                EXPECT_EQ(color.alpha(), plain.pixelColor(x, y).alpha());
                if (color.alpha() < 128) continue;
                ++visible;
                EXPECT_LT(color.red(), 10);
                EXPECT_GT(color.blue(), 245);
            }
        EXPECT_GT(visible, 0) << name.toStdString();
        EXPECT_EQ(platform::icon(name, {12, 10}, 2, {}, true), [&] {
            QImage mirrored = plain.mirrored(true, false);
            mirrored.setDevicePixelRatio(2);
            return mirrored;
        }()) << name.toStdString();
    }
    EXPECT_GT(count, 0);
}

}  // namespace
