#include "Qelvar/App/QVAppDelegate.h"

#include <gtest/gtest.h>

#include <QAbstractItemModelTester>
#include <QSignalSpy>

#include "Platform/Localization.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/App/QVPlaceholderViewController.h"
#include "Qelvar/Controllers/QVUserActivityManager.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "QtTestSupport.h"
#include "TestSupport.h"

namespace {

class AppDelegateTest : public testing::Test {
 protected:
    AppDelegateTest() {
        platform::loadTranslations();
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
    }
    ~AppDelegateTest() override { QVUserDefaults::sharedDefaults().setHealthStore(nullptr); }

    std::unique_ptr<QVAppDelegate> launch(bool medicalIDIsSupported = true) {
        auto app = std::make_unique<QVAppDelegate>(store_, medicalIDIsSupported);
        app->willFinishLaunching();
        app->didFinishLaunching();
        return app;
    }

    test::FixedEnvironment environment_{"2020-03-31T20:00"};
    test::TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
};

TEST_F(AppDelegateTest, FourTabsInTheirOrder) {
    const auto app = launch();
    QVTabBarController& tabs = *app->tabBarController();
    QAbstractItemModelTester tester(&tabs, QAbstractItemModelTester::FailureReportingMode::Fatal);
    ASSERT_EQ(tabs.count(), 4);
    const char* const titles[] = {"Dashboard", "Health Data", "Sources", "Medical ID"};
    const char* const images[] = {"dashboard", "healthdata", "sources", "medical_ID"};
    const char* const stacks[] = {"Dashboard Navigation Controller", "Health Data Navigation Controller",
                                  "Sources Navigation Controller", "Medical ID Navigation Controller"};
    for (int index = 0; index < 4; ++index) {
        EXPECT_EQ(tabs.data(tabs.index(index), QVTabBarController::TitleRole), titles[index]);
        EXPECT_EQ(tabs.data(tabs.index(index), QVTabBarController::ImageRole), images[index]);
        EXPECT_EQ(tabs.data(tabs.index(index), QVTabBarController::SelectedImageRole),
                  QString(images[index]) + "_selected");
        EXPECT_EQ(tabs.stack(index)->restorationIdentifier(), stacks[index]);
        EXPECT_EQ(tabs.stack(index)->rootScreen()->title(), titles[index]);
    }
    EXPECT_EQ(tabs.selectedIndex(), 0);
    EXPECT_TRUE(app->dashboard()->isVisible());
}

TEST_F(AppDelegateTest, TappingTheMedicalIDAgainIsRefusedAndOthersReturnToTheirRoot) {
    const auto app = launch();
    QVTabBarController& tabs = *app->tabBarController();
    const auto push = [&tabs] {
        tabs.selectedStack()->push(
            std::make_unique<QVPlaceholderViewController>([] { return QString("deep"); }, "", "DONE"));
    };
    push();
    tabs.tap(0);
    EXPECT_EQ(tabs.selectedStack()->count(), 1);
    tabs.tap(3);
    EXPECT_EQ(tabs.selectedIndex(), 3);
    EXPECT_FALSE(app->dashboard()->isVisible());
    push();
    tabs.tap(3);
    EXPECT_EQ(tabs.selectedStack()->count(), 2) << "refused";
    tabs.tap(9);
    EXPECT_EQ(tabs.selectedIndex(), 3);
    tabs.tap(0);
    EXPECT_TRUE(app->dashboard()->isVisible());
}

TEST_F(AppDelegateTest, ActivitiesLeadToTheirTabsRoot) {
    const auto app = launch();
    QVTabBarController& tabs = *app->tabBarController();
    tabs.stack(2)->push(
        std::make_unique<QVPlaceholderViewController>([] { return QString("deep"); }, "", "DONE"));
    EXPECT_TRUE(
        app->continueUserActivity(*QVUserActivityManager::activity("", {}, QVUserActivityTab::Sources)));
    EXPECT_EQ(tabs.selectedIndex(), 2);
    EXPECT_EQ(tabs.selectedStack()->count(), 1);
    EXPECT_TRUE(app->openLink("qelvar://HealthDataTab?DataCategory=3"));
    EXPECT_EQ(tabs.selectedIndex(), 1);
    EXPECT_TRUE(app->openLink("qelvar://NoSuchTab"));
    EXPECT_EQ(tabs.selectedIndex(), 1) << "unchanged";
    EXPECT_FALSE(app->openLink("https://example.org/"));
    platform::UserActivity other;
    other.activityType = "org.example.tab";
    EXPECT_FALSE(app->continueUserActivity(other));
    EXPECT_EQ(tabs.selectedIndex(), 1);
}

TEST_F(AppDelegateTest, WithoutMedicalIDThereIsNoSuchTab) {
    const auto app = launch(false);
    EXPECT_EQ(app->tabBarController()->count(), 3);
    EXPECT_TRUE(app->openLink("qelvar://MedicalIDTab"));
    EXPECT_EQ(app->tabBarController()->selectedIndex(), 0);
}

TEST_F(AppDelegateTest, TheTabShownIsTheCurrentActivity) {
    const auto app = launch();
    const auto tab = [] { return platform::UserActivity::current()->userInfo.value("MainTab").toString(); };
    EXPECT_EQ(tab(), "DashboardTab");
    app->tabBarController()->tap(3);
    EXPECT_EQ(tab(), "MedicalIDTab");
    EXPECT_EQ(platform::UserActivity::current()->title, "Medical ID");
}

TEST_F(AppDelegateTest, TheHealthDataTabOffersToImport) {
    const auto app = launch();
    auto* screen =
        qobject_cast<QVPlaceholderViewController*>(app->tabBarController()->stack(1)->rootScreen());
    ASSERT_TRUE(screen);
    QSignalSpy requested(app.get(), &QVAppDelegate::importRequested);
    ASSERT_EQ(screen->actionTitles().size(), 1);
    EXPECT_TRUE(screen->actionTitles()[0].startsWith("Import"));
    screen->runAction(0);
    screen->runAction(1);
    EXPECT_EQ(requested.size(), 1);
    EXPECT_FALSE(screen->message().isEmpty());
}

TEST_F(AppDelegateTest, DemoRecordsAreBuiltOnlyInTheDemonstration) {
    auto app = launch();
    app->didBecomeActive();
    EXPECT_FALSE(app->isResettingDemoData());
    app.reset();
    platform::UserDefaults::standard().setValue("UseDemoData", true);
    app = launch();
    app->didBecomeActive();
    app->didBecomeActive();
    EXPECT_TRUE(app->isResettingDemoData());
    ASSERT_TRUE(test::waitUntil([&app] { return !app->isResettingDemoData(); }));
    const auto types = store_->typeSummaries();
    ASSERT_TRUE(types.ok());
    EXPECT_GT(types->size(), 60u);
    EXPECT_FALSE(
        app->controllerManager()->dashboardDataUnitGroupsController().dataUnitGroupsForDashboard().empty());
    app->didBecomeActive();
    EXPECT_FALSE(app->isResettingDemoData()) << "once a day";
}

TEST(UserActivities, NameWhatIsNeededToOpenThem) {
    const auto plain = QVUserActivityManager::activity("Sources", {"a"}, QVUserActivityTab::Sources);
    EXPECT_EQ(plain->activityType, "org.qelvar.Qelvar.tab");
    EXPECT_TRUE(plain->eligibleForSearch);
    EXPECT_FALSE(plain->eligibleForHandoff || plain->eligibleForPublicIndexing);
    EXPECT_EQ(plain->requiredUserInfoKeys, QStringList{"MainTab"});
    const auto full = QVUserActivityManager::activity("x", {}, QVUserActivityTab::HealthData, true, 4, 59);
    EXPECT_EQ(full->requiredUserInfoKeys, (QStringList{"MainTab", "DataCategory", "DataUnit", "Calendar"}));
    EXPECT_EQ(full->userInfo.value("DataUnit").toInt(), 59);

    const auto link = QVUserActivityManager::activityFromLink(
        "qelvar://HealthDataTab/?DataCategory=4&DataUnit=59&Calendar=1");
    ASSERT_TRUE(link);
    EXPECT_EQ(link->userInfo, full->userInfo);
    EXPECT_EQ(QVUserActivityManager::activityFromLink("QELVAR://DashboardTab")->userInfo.value("MainTab"),
              "DashboardTab");
    EXPECT_FALSE(QVUserActivityManager::activityFromLink("DashboardTab"));
    EXPECT_EQ(QVUserActivityManager::activityFromLink("qelvar://SourcesTab?DataCategory=x")
                  ->requiredUserInfoKeys.size(),
              1);
}

}  // namespace
