#include <fstream>

#include "Platform/SystemEvents.h"
#include "Platform/TextScale.h"
#include "WindowTest.h"
#include "WindowTexts.h"

namespace {

namespace fs = std::filesystem;
using State = QVExportController::State;

using test::date;

/// The window of a person who wants texts twice as large.
class LargeTextTest : public test::WindowTest {
 protected:
    LargeTextTest() {
        // A home of its own, with names of every length, and all that a desktop may offer for an archive.
        fs::create_directories(home_ / "Health");
        fs::create_directories(home_ / "Records of the clinic in which I was last autumn");
        std::ofstream(home_ / "records.xml") << "<HealthData/>";
        for (const char* name : {"xdg-open", "xdg-email"}) {
            std::ofstream(home_ / name) << "#!/bin/sh\n";
            fs::permissions(home_ / name, fs::perms::owner_all);
        }
        qputenv("HOME", home_.c_str());
        qputenv("PATH", home_.c_str());
        qputenv("DBUS_SESSION_BUS_ADDRESS", "unix:path=/nowhere");  // no dialogs of this machine's desktop
    }
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
    void expectFits(const QString& name, const char* object = nullptr) {
        waitForFrames();
        auto* popup = object ? window_->findChild<QObject*>(object) : nullptr;
        ASSERT_EQ(popup != nullptr, object != nullptr);
        test::expectTextsFit(
            *window_,
            popup ? qvariant_cast<QQuickItem*>(popup->property("contentItem")) : window_->contentItem(),
            name);
    }
    /// And lets it go.
    void expectImportFits(const QString& name) {
        app_->importController()->importUrls(
            {QUrl::fromLocalFile(QELVAR_TEST_DATA "/import/refused-records/input.xml")});
        EXPECT_TRUE(test::waitUntil([this] { return !app_->importController()->isRunning(); }));
        expectFits(name + "-import", "importSheet");
        app_->importController()->dismiss();
        expectGoes("importSheet");
        emit app_->importRequested();
        expectFits(name + "-file", "importFileDialog");
        EXPECT_TRUE(shownText(platform::localized("CANCEL"))) << "in the language of now";
        press(Qt::Key_Escape);
        expectGoes("importFileDialog");
    }
    void expectExportFits(const QString& name) {
        QVExportController& controller = *app_->exportController();
        const auto reaches = [&](State state) {
            return test::waitUntil([&] { return controller.state() == state; });
        };
        controller.verifyExport();
        expectFits(name + "-export", "exportSheet");
        controller.pressButton(0);
        ASSERT_TRUE(reaches(State::Sharing));
        EXPECT_EQ(controller.buttonTitles().size(), 4);
        expectFits(name + "-share", "exportSheet");
        controller.pressButton(0);
        ASSERT_TRUE(test::waitUntil([this] { return window_->findChild<QObject*>("exportSaveDialog"); }));
        expectFits(name + "-save", "exportSaveDialog");
        EXPECT_TRUE(shownText(platform::localized("CANCEL"))) << "in the language of now";
        press(Qt::Key_Escape);
        expectGoes("exportSaveDialog");
        controller.saveIn(QUrl::fromLocalFile("/nowhere"), "a.zip");
        ASSERT_TRUE(reaches(State::Sharing));
        expectFits(name + "-not-saved", "exportSheet");
        controller.leave();
        expectGoes("exportSheet");
    }
    QQuickItem* shownText(const QString& text) {
        QList<std::pair<QQuickItem*, QRectF>> texts;
        test::collectTexts(window_->contentItem(), QRectF(QPointF(), QSizeF(window_->size())), texts);
        for (const auto& [item, rect] : texts)
            if (item->property("text").toString() == text) return item;
        return nullptr;
    }
    void expectGoes(const char* object) {
        auto* popup = window_->findChild<QObject*>(object);
        EXPECT_TRUE(test::waitUntil([popup] { return !popup->property("visible").toBool(); }));
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

    const fs::path home_ = folder_.path() / "home";
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
                expectFits(name + QString("-tab-%1").arg(tab));
            }
            if (size.width() > 375) continue;  // sheets are no wider than a phone
            expectImportFits(name);
            expectExportFits(name);
        }
    }
    app_->controllerManager()->dashboardDataUnitGroupsController().setDataUnitGroupsForDashboard({});
    for (const char* locale : {"en_US", "de_DE", "ar_EG"}) {
        change(locale, {320, 568}, 1);
        waitForFrames();
        change(locale, {320, 568}, 2);  // without a resize: the desktop tells it late
        expectFits(QString("large-%1-empty").arg(locale));
        const auto* help = shownText(app_->dashboard()->emptyStateHelp());
        ASSERT_TRUE(help);
        EXPECT_EQ(help->width(), 300);
    }
    app_->controllerManager()->dashboardDataUnitGroupsController().setDataUnitGroupsForDashboard(
        {group(VSGroupID::Steps)});
    change("en_US", {375, 667}, 1);
    EXPECT_TRUE(waitForCards(1));
    EXPECT_EQ(cards().front()->height(), 187) << "back";
}

}  // namespace
