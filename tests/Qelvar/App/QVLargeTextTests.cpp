#include <QDir>

#include "Platform/SystemEvents.h"
#include "Platform/TextScale.h"
#include "WindowTest.h"

namespace {

using test::date;

/// The window of a person who wants texts twice as large.
class LargeTextTest : public test::WindowTest {
 protected:
    ~LargeTextTest() override {
        environment_->setLocale("en_US");
        platform::loadTranslations();
        platform::TextScale::shared().set(1);
    }

    void save(VSTypeCode code, const char* unit, double value) {
        const auto sample = std::make_shared<const VSQuantitySample>(
            VSObjectType::dataTypeWithCode(code), VSQuantity(VSUnit::fromString(unit), value),
            date("2020-03-31T10:00"), date("2020-03-31T10:05"));
        ASSERT_TRUE(store_->saveObjectsAndWait({sample}).ok());
    }
    /// All while the window is open.
    void change(const char* locale, QSize size, double textScale) {
        environment_->setLocale(locale);
        platform::SystemEvents::shared().postLocaleChange();
        platform::TextScale::shared().set(textScale);
        window_->resize(size);
        waitForFrames();
    }
    void waitForFrames() {
        int frames = 0;
        const auto connection =
            QObject::connect(window_.get(), &QQuickWindow::afterAnimating, window_.get(), [&] {
                ++frames;
                window_->update();
            });
        window_->update();
        EXPECT_TRUE(test::waitUntil(
            [&] { return frames >= 3 && !window_->rootObject()->property("busy").toBool(); }));
        QObject::disconnect(connection);
    }
    static void collectTexts(QQuickItem* item, QRectF seen, QList<std::pair<QQuickItem*, QRectF>>& texts) {
        if (!item->isVisible() || item->opacity() == 0) return;
        const QRectF rect = item->mapRectToScene(QRectF(0, 0, item->width(), item->height()));
        if (item->clip()) seen = seen.intersected(rect);
        if (item->inherits("QQuickText") && !item->property("text").toString().isEmpty()) {
            // Where its lines are, which may be less than its item.
            const double height = item->property("contentHeight").toDouble();
            const QRectF lines(rect.x(), rect.center().y() - height / 2, rect.width(), height);
            const bool isTop = rect.height() <= height || item->property("verticalAlignment") == Qt::AlignTop;
            texts.append({item, isTop ? QRectF(rect.topLeft(), QSizeF(rect.width(), height)) : lines});
            if (!seen.intersects(texts.back().second)) texts.removeLast();
        }
        for (QQuickItem* child : item->childItems()) collectTexts(child, seen, texts);
    }
    /// What the item scrolls with; bars lie above it.
    static QQuickItem* scroller(QQuickItem* item) {
        while (item && !item->inherits("QQuickFlickable")) item = item->parentItem();
        return item;
    }
    /// No text of the root is cut or lies on another one or beside the window.
    void expectTextsFit(QQuickItem* root, const QString& name) {
        SCOPED_TRACE(name.toStdString());
        QList<std::pair<QQuickItem*, QRectF>> texts;
        const QRectF window(QPointF(), QSizeF(window_->size()));
        collectTexts(root, window, texts);
        EXPECT_FALSE(texts.empty());
        for (qsizetype i = 0; i < texts.size(); ++i) {
            const auto& [item, rect] = texts[i];
            const auto words = item->property("text").toString().toStdString();
            EXPECT_FALSE(item->property("truncated").toBool()) << words;
            EXPECT_LE(item->property("paintedWidth").toDouble(), rect.width() + 1) << words;
            EXPECT_TRUE(rect.left() >= 0 && rect.right() <= window.right() + 1) << words;
            for (qsizetype j = 0; j < i; ++j)
                EXPECT_FALSE(scroller(item) == scroller(texts[j].first) &&
                             rect.adjusted(1, 1, -1, -1).intersects(texts[j].second.adjusted(1, 1, -1, -1)))
                    << words << " lies on " << texts[j].first->property("text").toString().toStdString();
        }
        keepPicture(name);
    }
    void expectCardsFit() {
        for (const auto* card : QVCardsInScene(window_->rootObject())) {
            SCOPED_TRACE(card->titleText().toStdString());
            const QVDashboardCellLayout layout = card->cellLayout();
            EXPECT_EQ(card->height(), layout.background.bottom());
            const QRectF parts[] = {layout.title, layout.value, layout.average, layout.lastUpdated,
                                    layout.chart};
            // The lines stand closer than the font's own line spacing.
            const auto letters = [](const QRectF& line) {
                return line.adjusted(0, line.height() / 4, 0, -line.height() / 4);
            };
            for (const QRectF& part : parts) {
                EXPECT_TRUE(part.isEmpty() || layout.background.contains(part));
                for (const QRectF& other : parts)
                    EXPECT_TRUE(&part == &other || !letters(part).intersects(letters(other)));
            }
            EXPECT_GT(layout.title.width(), 60);
            EXPECT_EQ(layout.value.width() > 40, !card->valueText().isEmpty());
            EXPECT_EQ(layout.average.width() > 40, !card->secondaryText().isEmpty());
            EXPECT_EQ(layout.lastUpdated.width() > 40, !card->lastUpdatedText().isEmpty());
            EXPECT_GE(layout.chart.height(), 110) << "the plot is not squeezed away";
        }
    }
    /// For a person to look at, when a folder for pictures is named.
    void keepPicture(const QString& name) {
        const QString folder = qEnvironmentVariable("QELVAR_TEST_PICTURES");
        if (folder.isEmpty()) return;
        QDir().mkpath(folder);
        EXPECT_TRUE(window_->grabWindow().save(folder + '/' + name + ".png"));
    }
};

TEST_F(LargeTextTest, NothingIsCutOrCoveredInAnyLanguageAtAnyWidth) {
    save(VSCode::StepCount, "count", 123'456);
    save(VSCode::HeartRate, "count/min", 72);
    save(VSCode::DistanceWalkingRunning, "km", 12.34);
    open({group(VSGroupID::WalkingRunningDistance), group(VSGroupID::Steps), group(VSGroupID::HeartRate)});
    if (HasFatalFailure()) return;
    const auto cards = [this] { return QVCardsInScene(window_->rootObject()); };
    EXPECT_EQ(cards().front()->height(), 187);
    for (const char* locale : {"en_US", "de_DE", "ar_EG", "hi_IN"}) {
        for (const QSize size : {QSize(320, 568), QSize(375, 667), QSize(768, 1024)}) {
            change(locale, size, 2);
            const QString name = QString("large-%1-%2").arg(locale).arg(size.width());
            EXPECT_TRUE(waitForCards(1));
            expectCardsFit();
            for (int tab = 3; tab >= 0; --tab) {
                app_->tabBarController()->setSelectedIndex(tab);
                waitForFrames();
                expectTextsFit(window_->contentItem(), name + QString("-tab-%1").arg(tab));
            }
            app_->importController()->importUrls(
                {QUrl::fromLocalFile(QELVAR_TEST_DATA "/import/refused-records/input.xml")});
            EXPECT_TRUE(test::waitUntil([this] { return !app_->importController()->isRunning(); }));
            waitForFrames();
            auto* sheet = window_->findChild<QObject*>("importSheet");
            ASSERT_TRUE(sheet);
            expectTextsFit(qvariant_cast<QQuickItem*>(sheet->property("contentItem")), name + "-import");
            app_->importController()->dismiss();
            EXPECT_TRUE(test::waitUntil([sheet] { return !sheet->property("visible").toBool(); }));
        }
    }
    app_->controllerManager()->dashboardDataUnitGroupsController().setDataUnitGroupsForDashboard({});
    for (const char* locale : {"en_US", "de_DE", "ar_EG"}) {
        change(locale, {320, 568}, 2);
        expectTextsFit(window_->contentItem(), QString("large-%1-empty").arg(locale));
    }
    app_->controllerManager()->dashboardDataUnitGroupsController().setDataUnitGroupsForDashboard(
        {group(VSGroupID::Steps)});
    change("en_US", {375, 667}, 1);
    EXPECT_TRUE(waitForCards(1));
    EXPECT_EQ(cards().front()->height(), 187) << "back";
}

}  // namespace
