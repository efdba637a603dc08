#include <gtest/gtest.h>

#include <QAbstractItemModelTester>
#include <QSignalSpy>

#include "Platform/Localization.h"
#include "Platform/NavigationStack.h"
#include "Platform/SystemEvents.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/Dashboard/QVDashboardTable.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"
#include "Qelvar/Dashboard/QVDashboardViewController.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "QtTestSupport.h"
#include "TestSupport.h"

namespace {

using test::date;
using Groups = QVDashboardViewController::Groups;

const VSDataUnitGroup* group(int id) {
    return VSDataUnitGroupController::shared().dataUnitGroupWithID(id);
}
const VSDataUnitGroup* steps() {
    return group(VSGroupID::Steps);
}
const VSDataUnitGroup* heartRate() {
    return group(VSGroupID::HeartRate);
}
const VSDataUnitGroup* distance() {
    return group(VSGroupID::WalkingRunningDistance);
}

class DashboardTest : public testing::Test {
 protected:
    DashboardTest() {
        platform::loadTranslations();
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
        manager_ = std::make_shared<QVControllerManager>(store_);
        EXPECT_TRUE(test::waitUntil([this] { return dashboard().hasLoadedDashboard(); }));
        setDashboard({steps(), heartRate()});
    }
    ~DashboardTest() override { QVUserDefaults::sharedDefaults().setHealthStore(nullptr); }

    QVDashboardDataUnitGroupsController& dashboard() { return manager_->dashboardDataUnitGroupsController(); }
    void setDashboard(const Groups& groups) { dashboard().setDataUnitGroupsForDashboard(groups); }

    /// The screen in its stack, shown.
    QVDashboardViewController* show() {
        auto screen = std::make_unique<QVDashboardViewController>(manager_);
        auto* raw = screen.get();
        stack_ = std::make_unique<platform::NavigationStack>("stack", std::move(screen));
        stack_->setVisible(true);
        return raw;
    }

    /// A card for a row of the screen, without a window.
    std::unique_ptr<QVDashboardTableViewCell> card(QVDashboardViewController& screen, int row,
                                                   double width = 375) {
        auto cell = std::make_unique<QVDashboardTableViewCell>();
        cell->setSize({width, QVDashboardTableViewCell::preferredCellHeight()});
        screen.prepareCell(*cell, row);
        return cell;
    }

    void save(VSTypeCode code, double value, const char* unit, const std::string& start) {
        const auto* type = VSObjectType::dataTypeWithCode(code);
        const auto sample = std::make_shared<const VSQuantitySample>(
            type, VSQuantity(VSUnit::fromString(unit), value), date(start), date(start));
        const auto saved = store_->saveObjectsAndWait({sample});
        ASSERT_TRUE(saved.ok()) << saved.error().message;
    }

    /// Draws the card until its data is there and its chart stands still.
    bool settle(QVDashboardTableViewCell& cell) {
        cell.chartView().setAnimationClock([this] { return animationTime_; });
        return test::waitUntil([&] {
            cell.render(1);
            animationTime_ += std::chrono::seconds(1);
            cell.chartView().advance(animationTime_);
            return cell.isSettled();
        });
    }

    test::FixedEnvironment environment_{"2020-03-31T20:00"};
    QVAnimationTime animationTime_{1};
    test::TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
    std::shared_ptr<QVControllerManager> manager_;
    std::unique_ptr<platform::NavigationStack> stack_;
};

TEST(DashboardTable, ANewListIsReachedByTheFewestChanges) {
    QVDashboardTable table;
    QAbstractItemModelTester tester(&table, QAbstractItemModelTester::FailureReportingMode::Fatal);
    QSignalSpy reset(&table, &QAbstractItemModel::modelReset),
        removed(&table, &QAbstractItemModel::rowsRemoved);
    QSignalSpy inserted(&table, &QAbstractItemModel::rowsInserted),
        moved(&table, &QAbstractItemModel::rowsMoved);
    table.setGroups({steps(), heartRate(), distance()});
    EXPECT_EQ(inserted.size(), 3);
    table.setGroups({steps(), heartRate(), distance()});
    EXPECT_EQ(inserted.size(), 3);
    table.setGroups({distance(), steps(), heartRate()});
    EXPECT_EQ(moved.size(), 1);
    table.setGroups({distance(), heartRate()});
    EXPECT_EQ(removed.size(), 1);
    table.setGroups({heartRate(), group(VSGroupID::FlightsClimbed), distance(), heartRate()});
    EXPECT_EQ(table.groups(), (Groups{heartRate(), group(VSGroupID::FlightsClimbed), distance()}))
        << "one given twice counts once";
    EXPECT_EQ(table.data(table.index(0), QVDashboardTable::DisplayNameRole), heartRate()->displayName());
    table.setGroups({});
    EXPECT_EQ(table.rowCount(), 0);
    EXPECT_EQ(reset.size(), 0);
}

TEST(TimeScopeControl, PicksAndFallsBackToTheFirst) {
    QVTimeScopeControl control({QVTimeScope::Day, QVTimeScope::Week, QVTimeScope::Month, QVTimeScope::Year});
    platform::loadTranslations();
    EXPECT_EQ(control.segments(), (QStringList{"Day", "Week", "Month", "Year"}));
    QSignalSpy changed(&control, &QVTimeScopeControl::valueChanged);
    control.setSelectedTimeScope(QVTimeScope::Month);
    EXPECT_EQ(control.selectedIndex(), 2);
    EXPECT_EQ(changed.size(), 0) << "not by the user";
    control.setSelectedTimeScope(QVTimeScope::Hour);
    EXPECT_EQ(control.selectedTimeScope(), QVTimeScope::Day) << "not offered";
    control.pick(3);
    control.pick(3);
    control.pick(4);
    control.pick(-1);
    EXPECT_EQ(control.selectedTimeScope(), QVTimeScope::Year);
    EXPECT_EQ(changed.size(), 2) << "a tap on the selected segment is an action too";
}

TEST_F(DashboardTest, ItemsThatStayKeepTheirDataAndOthersGo) {
    auto* screen = show();
    ASSERT_EQ(screen->dashboardChartItems().size(), 2u);
    const auto stepsItem = screen->dashboardChartItems().at(VSGroupID::Steps);
    std::weak_ptr<QVDashboardChartItem> heartRateItem =
        screen->dashboardChartItems().at(VSGroupID::HeartRate);
    setDashboard({distance(), steps()});
    EXPECT_EQ(screen->dashboardChartItems().at(VSGroupID::Steps), stepsItem);
    EXPECT_TRUE(heartRateItem.expired());
    EXPECT_EQ(screen->dashboardDataUnitGroups(), (Groups{distance(), steps()}));
    setDashboard({distance(), steps(), heartRate()});
    EXPECT_FALSE(screen->dashboardChartItems().at(VSGroupID::HeartRate)->isActive())
        << "a fresh one, not asked for yet";
}

TEST_F(DashboardTest, ChangesMadeWhileAwayArePickedUpOnReturn) {
    auto* screen = show();
    stack_->setVisible(false);
    setDashboard({});
    EXPECT_FALSE(screen->showsEmptyState()) << "it does not look while it is away";
    stack_->setVisible(true);
    EXPECT_TRUE(screen->showsEmptyState());
    EXPECT_FALSE(screen->emptyStateTitle().isEmpty());
    setDashboard({steps()});
    EXPECT_FALSE(screen->showsEmptyState());
}

TEST_F(DashboardTest, AListThatHasNotBeenReadYetIsNotAnEmptyOne) {
    setDashboard({});
    manager_ = std::make_shared<QVControllerManager>(store_);
    auto* screen = show();
    ASSERT_FALSE(dashboard().hasLoadedDashboard());
    EXPECT_FALSE(screen->showsEmptyState());
    EXPECT_TRUE(test::waitUntil([screen] { return screen->showsEmptyState(); }));
}

TEST_F(DashboardTest, EmptyStateMarginsFollowTheScreensWidth) {
    EXPECT_EQ(QVDashboardViewController::emptyStateHelpMargin(320), 20);
    EXPECT_EQ(QVDashboardViewController::emptyStateHelpMargin(375), 50);
    EXPECT_EQ(QVDashboardViewController::emptyStateHelpMargin(376), 10);
}

TEST_F(DashboardTest, TheTimeScopeReachesTheControllerAndTheCards) {
    auto* screen = show();
    EXPECT_EQ(screen->timeScopeControl()->selectedTimeScope(), QVTimeScope::Week);
    auto cell = card(*screen, 0);
    EXPECT_EQ(cell->timeScope(), QVTimeScope::Week);
    EXPECT_EQ(cell->chartItem()->startDate(), date("2020-03-25"));
    EXPECT_TRUE(cell->chartItem()->isActive());
    const auto axis = cell->chartView().xAxisDescriptor();
    screen->prepareCell(*cell, 0);
    EXPECT_EQ(cell->chartView().xAxisDescriptor(), axis) << "nothing changed, nothing is rebuilt";

    screen->timeScopeControl()->pick(3);
    EXPECT_EQ(manager_->selectedTimeScopeController().selectedTimeScope(), QVTimeScope::Year);
    screen->prepareCell(*cell, 0);
    EXPECT_EQ(cell->chartItem()->startDate(), date("2019-04-01"));
    EXPECT_NE(cell->chartView().xAxisDescriptor(), axis);
    EXPECT_EQ(cell->chartView().xAxisDescriptor()->minValue(), date("2019-04-01"));

    manager_->selectedTimeScopeController().setSelectedTimeScope(QVTimeScope::Day);
    stack_->setVisible(false);
    stack_->setVisible(true);
    EXPECT_EQ(screen->timeScopeControl()->selectedTimeScope(), QVTimeScope::Day);
}

TEST_F(DashboardTest, ACardShowsWhatTheStoreHolds) {
    save(VSCode::HeartRate, 72, "count/min", "2020-03-31T08:30");
    save(VSCode::HeartRate, 64, "count/min", "2020-03-30T08:30");
    auto* screen = show();
    auto cell = card(*screen, 1);
    EXPECT_EQ(cell->valueText(), "") << "nothing is said before it was asked for";
    ASSERT_TRUE(settle(*cell));
    EXPECT_EQ(cell->titleText(), heartRate()->displayName());
    EXPECT_TRUE(cell->valueText().startsWith("72")) << cell->valueText().toStdString();
    EXPECT_TRUE(cell->lastUpdatedText().contains("8:30")) << cell->lastUpdatedText().toStdString();
    EXPECT_TRUE(cell->secondaryText().contains("64") && cell->secondaryText().contains("72"))
        << cell->secondaryText().toStdString();
    EXPECT_EQ(cell->accessibleValue(), "72 bpm, Min: 64 Max: 72, " + cell->lastUpdatedText())
        << "what stands apart is said apart";
    EXPECT_TRUE(cell->chartDescription().startsWith("Chart: Week, from "))
        << cell->chartDescription().toStdString();
    EXPECT_TRUE(cell->chartDescription().endsWith("to " + cell->chartBackground().maximumText()));

    auto empty = card(*screen, 0);
    ASSERT_TRUE(settle(*empty));
    EXPECT_EQ(empty->valueText(), platform::localized("NO_DATA"));
    EXPECT_EQ(empty->lastUpdatedText(), "");
    EXPECT_EQ(empty->chartDescription(), "Chart: Week, no data");
}

TEST_F(DashboardTest, ACardFollowsTheStore) {
    auto* screen = show();
    auto cell = card(*screen, 1);
    ASSERT_TRUE(settle(*cell));
    save(VSCode::HeartRate, 81, "count/min", "2020-03-31T09:00");
    EXPECT_TRUE(test::waitUntil([&] { return cell->valueText().startsWith("81"); }));
}

TEST_F(DashboardTest, ANewDayMovesTheSpanOfACard) {
    auto* screen = show();
    auto cell = card(*screen, 0);
    environment_->setNow(date("2020-04-01T00:00:01"));
    platform::SystemEvents::shared().postSignificantTimeChange();
    EXPECT_EQ(cell->chartItem()->startDate(), date("2020-03-26"));
    EXPECT_EQ(cell->chartView().xAxisDescriptor()->maxValue(), date("2020-04-02"));
}

TEST_F(DashboardTest, ALocaleChangeRebuildsTheCardOnce) {
    auto* screen = show();
    auto cell = card(*screen, 0);
    const auto axis = cell->chartView().xAxisDescriptor();
    platform::SystemEvents::shared().postLocaleChange();
    EXPECT_TRUE(cell->chartItem()->localeDidChange());
    screen->prepareCell(*cell, 0);
    EXPECT_FALSE(cell->chartItem()->localeDidChange());
    EXPECT_NE(cell->chartView().xAxisDescriptor(), axis);
}

TEST_F(DashboardTest, ItemsOfOneCardDoNotReachAnother) {
    auto* screen = show();
    auto cell = card(*screen, 0);
    const auto first = cell->chartItem();
    screen->prepareCell(*cell, 1);
    EXPECT_NE(cell->chartItem(), first);
    EXPECT_EQ(cell->titleText(), heartRate()->displayName());
    QSignalSpy changed(cell.get(), &QVDashboardTableViewCell::contentChanged);
    if (const auto delegate = first->delegate()) delegate->chartItemDidUpdateCurrentValueData(*first);
    EXPECT_EQ(changed.size(), 0);
}

TEST_F(DashboardTest, ANewOrderOfSourcesReloadsTheCardsOfThatType) {
    auto* screen = show();
    auto cell = card(*screen, 0);
    ASSERT_TRUE(settle(*cell));
    QSignalSpy reloaded(screen, &QVDashboardViewController::tableReloaded);
    manager_->dataProviderOrderController().setOrderedDataProviderSources(
        {}, VSObjectType::dataTypeWithCode(VSCode::BodyMass));
    manager_->dataProviderOrderController().setOrderedDataProviderSources(
        {}, VSObjectType::dataTypeWithCode(VSCode::StepCount));
    EXPECT_TRUE(test::waitUntil([&] { return reloaded.size() == 1; }));
    EXPECT_TRUE(settle(*cell));
}

TEST_F(DashboardTest, ACardIsPaintedOpaqueInTheColoursOfItsCategory) {
    save(VSCode::StepCount, 5000, "count", "2020-03-30T08:30");
    save(VSCode::StepCount, 9000, "count", "2020-03-31T08:30");
    auto* screen = show();
    auto cell = card(*screen, 0);
    ASSERT_TRUE(settle(*cell));
    const QImage image = cell->render(2);
    ASSERT_EQ(image.size(), QSize(750, 374));
    EXPECT_EQ(image.pixelColor(0, 0), QColor(Qt::white)) << "outside the card";
    for (int y = 0; y < image.height(); ++y)
        for (int x = 0; x < image.width(); ++x) ASSERT_EQ(qAlpha(image.pixel(x, y)), 255);
    const VSDataCategory& category = *cell->chartItem()->dataCategory();
    const QColor top = image.pixelColor(375, 10), wanted = category.gradientTopColor();
    EXPECT_NEAR(top.red(), wanted.red(), 6);
    EXPECT_NEAR(top.green(), wanted.green(), 6);
    EXPECT_NEAR(top.blue(), wanted.blue(), 6);
    // Title, value and chart leave white in their frames.
    const auto layout = cell->cellLayout();
    const auto hasWhite = [&image](const QRectF& frame) {
        for (int y = qRound(frame.top() * 2); y < qRound(frame.bottom() * 2); ++y)
            for (int x = qRound(frame.left() * 2); x < qRound(frame.right() * 2); ++x)
                if (qGray(image.pixel(x, y)) > 245) return true;
        return false;
    };
    EXPECT_TRUE(hasWhite(layout.title.adjusted(0, 0, -1, 0)));
    EXPECT_TRUE(hasWhite(layout.value));
    EXPECT_TRUE(hasWhite(layout.chart));
}

TEST_F(DashboardTest, TheCardIsMirroredForRightToLeftLanguages) {
    environment_->setLocale("ar_EG");
    platform::loadTranslations();
    auto* screen = show();
    auto cell = card(*screen, 0);
    ASSERT_TRUE(settle(*cell));
    const auto layout = cell->cellLayout();
    EXPECT_EQ(layout.value.left(), 4 + 11);
    EXPECT_EQ(layout.title.right(), 375 - 4 - 12);
    environment_->setLocale("en_US");
    platform::loadTranslations();
}

TEST_F(DashboardTest, ATapOpensTheScreenOfTheDisplayType) {
    class Detail : public platform::Screen {
     public:
        QUrl view() const override { return {}; }
    };
    const VSDataUnitGroup* opened = nullptr;
    auto screen =
        std::make_unique<QVDashboardViewController>(manager_, [&opened](const VSDataUnitGroup* chosen) {
            opened = chosen;
            return std::make_unique<Detail>();
        });
    auto* raw = screen.get();
    stack_ = std::make_unique<platform::NavigationStack>("stack", std::move(screen));
    stack_->setVisible(true);
    raw->selectRow(7);
    EXPECT_EQ(stack_->count(), 1);
    raw->selectRow(1);
    EXPECT_EQ(opened, heartRate());
    EXPECT_EQ(stack_->count(), 2);
}

}  // namespace
