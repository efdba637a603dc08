#include "Qelvar/App/QVAppDelegate.h"

#include <gtest/gtest.h>

#include <QAbstractItemModelTester>
#include <QSignalSpy>

#include "Platform/Localization.h"
#include "Platform/SystemEvents.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/Controllers/QVPlaceholderViewController.h"
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
        auto app = std::make_unique<QVAppDelegate>(store_, "", medicalIDIsSupported);
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

TEST_F(AppDelegateTest, LinksLeadAsFarAsThereIsSomething) {
    const auto app = launch();
    QVTabBarController& tabs = *app->tabBarController();
    const auto place = [&tabs] {
        QStringList titles;
        for (int i = 0; i < tabs.selectedStack()->count(); ++i)
            titles << tabs.selectedStack()->screenAt(i)->title();
        return titles.join(" > ");
    };
    const struct {
        const char *link, *place, *activity;
    } cases[] = {
        {"qelvar://SourcesTab", "Sources", "Sources"},
        {"qelvar://healthdatatab/", "Health Data", "Health Data"},
        {"qelvar://HealthDataTab?DataCategory=2", "Health Data > Fitness", "Fitness"},
        {"QELVAR://HealthDataTab?DataCategory=2&DataUnit=59#x", "Health Data > Fitness > Steps", "Steps"},
        {"qelvar://HealthDataTab?DataCategory=2&DataUnit=6", "Health Data > Fitness", "Fitness"},
        {"qelvar://HealthDataTab?DataCategory=99&DataUnit=59", "Health Data", "Health Data"},
        {"qelvar://HealthDataTab?DataUnit=59&DataCategory=x", "Health Data", "Health Data"},
        {"qelvar://HealthDataTab?Calendar=1&DataCategory=2", "Health Data", "Health Data Calendar"},
        {"qelvar://NoSuchTab?DataCategory=2", "Health Data > Fitness", "Fitness"},
        {"qelvar://HealthDataTab?Calendar=1", "Health Data", "Health Data Calendar"},
        {"qelvar://DASHBOARDTAB?DataCategory=2", "Dashboard", "Dashboard"},
        {"qelvar://", "Dashboard", "Dashboard"},
    };
    for (const auto& expected : cases) {
        SCOPED_TRACE(expected.link);
        // From a deep screen, mostly of another tab.
        tabs.selectedStack()->push(
            std::make_unique<QVPlaceholderViewController>([] { return QString("deep"); }, "", "DONE"));
        EXPECT_TRUE(app->openLink(expected.link));
        EXPECT_EQ(place(), expected.place);
        EXPECT_EQ(platform::UserActivity::current()->title, expected.activity);
    }
    platform::UserActivity other;
    other.activityType = "org.example.tab";
    EXPECT_FALSE(app->continueUserActivity(other));
    for (const char* link : {"https://example.org/", "qelvar", "SourcesTab", ""})
        EXPECT_FALSE(app->openLink(link)) << link;
    EXPECT_EQ(place(), "Dashboard");

    // What is shown can be opened again.
    EXPECT_TRUE(app->openLink("qelvar://HealthDataTab?DataCategory=2&DataUnit=59"));
    const auto steps = platform::UserActivity::current();
    EXPECT_TRUE(steps->keywords.contains("walk")) << steps->keywords.join(", ").toStdString();
    app->tabBarController()->tap(0);
    EXPECT_TRUE(app->continueUserActivity(*steps));
    EXPECT_EQ(place(), "Health Data > Fitness > Steps");
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
    environment_->setLocale("de_DE");
    platform::SystemEvents::shared().postLocaleChange();
    EXPECT_EQ(platform::UserActivity::current()->title, "Notfallpass");
    app->tabBarController()->tap(0);
    EXPECT_EQ(platform::UserActivity::current()->title, "Übersicht");
    environment_->setLocale("en_US");
    platform::loadTranslations();
}

TEST_F(AppDelegateTest, TheHealthDataTabOffersToImportAndItsCategories) {
    const auto app = launch();
    QSignalSpy requested(app.get(), &QVAppDelegate::importRequested);
    platform::NavigationStack& stack = *app->tabBarController()->stack(1);
    const auto run = [&stack](const QString& title) {
        auto* screen = qobject_cast<QVPlaceholderViewController*>(stack.topScreen());
        screen->runAction(static_cast<int>(screen->actionTitles().indexOf(title)));
    };
    run("Import Records…");
    run("no such row");
    EXPECT_EQ(requested.size(), 1);
    run("Calendar");
    run("List");
    run("Vitals");
    run("Heart Rate");
    EXPECT_EQ(stack.count(), 3);
    EXPECT_EQ(stack.topScreen()->title(), "Heart Rate");
    auto& dashboard = app->controllerManager()->dashboardDataUnitGroupsController();
    ASSERT_TRUE(test::waitUntil([&] { return dashboard.hasReadDashboard(); }));
    const auto before = dashboard.dataUnitGroupsForDashboard();
    run("Show on Dashboard");
    auto* detail = qobject_cast<QVPlaceholderViewController*>(stack.topScreen());
    EXPECT_EQ(detail->actionStates(), QVariantList{true});
    EXPECT_EQ(dashboard.dataUnitGroupsForDashboard().size(), before.size() + 1);
    run("Show on Dashboard");
    EXPECT_EQ(detail->actionStates(), QVariantList{false});
    EXPECT_EQ(dashboard.dataUnitGroupsForDashboard(), before);
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
