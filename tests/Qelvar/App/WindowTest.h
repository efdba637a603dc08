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
                if (type != QtDebugMsg && type != QtInfoMsg && !line.contains("XDG_RUNTIME_DIR"))
                    complaints() << line;
            });
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
    }
    ~WindowTest() override {
        window_.reset();
        app_.reset();
        QVUserDefaults::sharedDefaults().setHealthStore(nullptr);
        qInstallMessageHandler(previousHandler_);
        EXPECT_TRUE(complaints().isEmpty()) << complaints().join('\n').toStdString();
    }

    void open(const QVDashboardViewController::Groups& groups) {
        platform::loadTranslations();
        app_ = std::make_unique<QVAppDelegate>(store_);
        app_->willFinishLaunching();
        auto& dashboard = app_->controllerManager()->dashboardDataUnitGroupsController();
        ASSERT_TRUE(waitUntil([&dashboard] { return dashboard.hasLoadedDashboard(); }));
        dashboard.setDataUnitGroupsForDashboard(groups);
        show(QSize());
        ASSERT_TRUE(waitForCards(static_cast<qsizetype>(groups.size())));
    }
    /// The application again, on the same store: `beforeShown` is called between its launch and its window.
    void relaunch(const std::function<void()>& beforeShown, QSize size = {}) {
        window_.reset();
        app_ = std::make_unique<QVAppDelegate>(store_);
        app_->willFinishLaunching();
        beforeShown();
        show(size);
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
    std::shared_ptr<VSHealthStore> store_;
    std::unique_ptr<QVAppDelegate> app_;
    std::unique_ptr<QVWindow> window_;
    QtMessageHandler previousHandler_ = nullptr;
};

}  // namespace test
