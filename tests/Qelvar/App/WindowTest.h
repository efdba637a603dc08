#pragma once

#include <gtest/gtest.h>

#include <QAccessible>
#include <QQuickItem>
#include <QTest>
#include <algorithm>
#include <functional>
#include <mutex>

#include "Platform/Localization.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/App/QVScreenshots.h"
#include "Qelvar/App/QVWindow.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "QtTestSupport.h"
#include "TestSupport.h"

namespace test {

/// What Qt complained about.
inline QStringList& complaints() {
    static QStringList lines;
    return lines;
}

/// The whole window, on a store of its own.
class WindowTest : public testing::Test {
 protected:
    WindowTest() {
        static std::once_flag once;
        std::call_once(once, [] { QQuickWindow::setGraphicsApi(QSGRendererInterface::Software); });
        complaints().clear();
        previousHandler_ =
            qInstallMessageHandler([](QtMsgType type, const QMessageLogContext&, const QString& line) {
                // A font that another stands in for, letter by letter, is the machine's affair.
                if (type != QtDebugMsg && type != QtInfoMsg && !line.contains("XDG_RUNTIME_DIR") &&
                    !line.contains("OpenType support missing"))
                    complaints() << line;
            });
        openStore();
    }
    ~WindowTest() override {
        window_.reset();
        app_.reset();
        QVUserDefaults::sharedDefaults().setHealthStore(nullptr);
        environment_->setLocale("en_US");
        platform::loadTranslations();
        qInstallMessageHandler(previousHandler_);
        EXPECT_TRUE(complaints().isEmpty()) << complaints().join('\n').toStdString();
    }

    void open(const QVDashboardViewController::Groups& groups) {
        platform::loadTranslations();
        app_ = std::make_unique<QVAppDelegate>(store_, stateFile_);
        app_->willFinishLaunching();
        auto& dashboard = app_->controllerManager()->dashboardDataUnitGroupsController();
        ASSERT_TRUE(waitUntil([&dashboard] { return dashboard.hasLoadedDashboard(); }));
        dashboard.setDataUnitGroupsForDashboard(groups);
        show(QSize());
        // No more than the window has room for are made.
        ASSERT_TRUE(waitForCards(std::min<qsizetype>(static_cast<qsizetype>(groups.size()), 3)));
    }
    /// The application again, with everything read from the disk: `beforeShown` is called between its launch
    /// and its window.
    void relaunch(
        const std::function<void()>& beforeShown = [] {}, QSize size = {}) {
        quit();
        platform::loadTranslations();
        openStore();
        app_ = std::make_unique<QVAppDelegate>(store_, stateFile_);
        app_->willFinishLaunching();
        beforeShown();
        show(size);
    }
    void quit() {
        if (app_) app_->willTerminate();
        window_.reset();
        app_.reset();
        QVUserDefaults::sharedDefaults().setHealthStore(nullptr);
        store_.reset();
    }
    void openStore() {
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
    }
    void show(QSize size) {
        window_ = std::make_unique<QVWindow>(*app_, size);
        ASSERT_TRUE(window_->isUsable());
        app_->didFinishLaunching();
        window_->show();
        ASSERT_TRUE(waitUntil([this] { return window_->isActive(); }));
    }
    bool waitForCards(qsizetype atLeast) {
        return waitUntil([this, atLeast] {
            const auto cards = QVCardsInScene(window_->rootObject());
            return cards.size() >= atLeast && std::all_of(cards.begin(), cards.end(), [](const auto* card) {
                       return card->wasPaintedSettled();
                   });
        });
    }
    /// Two frames, the first of which may bring new cards, and every card with all that it shows.
    bool settle() {
        int frames = 0;
        const auto connection =
            QObject::connect(window_.get(), &QQuickWindow::afterAnimating, window_.get(), [&] {
                ++frames;
                window_->update();
            });
        window_->update();
        const bool drawn =
            waitUntil([&] { return frames >= 3 && !window_->rootObject()->property("busy").toBool(); });
        QObject::disconnect(connection);
        return drawn && waitForCards(0);
    }
    void press(Qt::Key key, Qt::KeyboardModifiers modifiers = {}) {
        QTest::keyClick(window_.get(), key, modifiers);
    }
    /// What a screen reader says of the item that has the keyboard.
    QString focused() const {
        QAccessibleInterface* interface = QAccessible::queryAccessibleInterface(window_->activeFocusItem());
        return interface ? interface->text(QAccessible::Name) : QString();
    }
    static const VSDataUnitGroup* group(int id) {
        return VSDataUnitGroupController::shared().dataUnitGroupWithID(id);
    }

    FixedEnvironment environment_{"2020-03-31T20:00"};
    TemporaryFolder folder_;
    const std::filesystem::path stateFile_ = folder_.path() / "state.json";
    std::shared_ptr<VSHealthStore> store_;
    std::unique_ptr<QVAppDelegate> app_;
    std::unique_ptr<QVWindow> window_;
    QtMessageHandler previousHandler_ = nullptr;
};

}  // namespace test
