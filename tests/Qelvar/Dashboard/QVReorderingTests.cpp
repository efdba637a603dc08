#include <gtest/gtest.h>

#include <QAbstractItemModelTester>
#include <QSignalSpy>
#include <chrono>

#include "Platform/Announcement.h"
#include "Platform/Localization.h"
#include "Platform/NavigationStack.h"
#include "Platform/PairedDevices.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"
#include "Qelvar/Dashboard/QVDashboardViewController.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "QtTestSupport.h"
#include "TestSupport.h"

namespace {

using namespace std::chrono_literals;
using Groups = QVDashboardViewController::Groups;

constexpr QVAnimationTime kFrame(16'667);

QVTableGeometry tableOf(int rows, double offset) {
    QVTableGeometry table;
    table.width = 375;
    table.visibleHeight = 500;  // so the edge zones are 100 high
    table.contentOffset = offset;
    table.bottomInset = 4;
    table.headerHeight = 0.5;
    table.rowHeight = 187;
    table.rowCount = rows;
    return table;
}

TEST(TableGeometry, SpeedsGrowIntoTheEdgeZonesAndAreLimited) {
    const struct {
        double offset, y, speed;
    } cases[] = {
        {0, 250, 0},     {0, 400, 0},       {0, 405, 1},     {0, 450, 10},         {0, 475, 15},
        {0, 499, 15},    {0, 9000, 15},     {0, 100, 0},     {0, 95, -1},          {0, 50, -10},
        {0, 25, -15},    {0, 0, -15},       {0, -9000, -15}, {300, 700, 0},        {300, 750, 10},
        {300, 350, -10}, {300.5, 400.5, 0}, {-20, 430, 10},  {1374.5, 1874.5, 15},
    };
    for (const auto& test : cases)
        EXPECT_DOUBLE_EQ(tableOf(10, test.offset).autoScrollSpeed(test.y), test.speed)
            << test.offset << ", " << test.y;
}

TEST(TableGeometry, ScrollingStaysWithinTheContent) {
    const struct {
        int rows;
        double offset, points, scrolled;
    } cases[] = {
        {10, 100, 15, 115},     {10, 100, -15, 85},      {10, 5, -15, 0},       {10, 0, -1, 0},
        {10, 1370, 15, 1374.5}, {10, 1374.5, 1, 1374.5}, {10, 1380, 1, 1374.5}, {2, 0, 15, 0},
        {2, 3, 15, 3},          {2, 3, -5, 0},           {0, 0, 15, 0},
    };
    for (const auto& test : cases)
        EXPECT_DOUBLE_EQ(tableOf(test.rows, test.offset).offsetScrolledBy(test.points), test.scrolled)
            << test.rows << ", " << test.offset << ", " << test.points;
    QVTableGeometry inset = tableOf(10, 0);
    inset.topInset = 30;
    EXPECT_DOUBLE_EQ(inset.offsetScrolledBy(-15), -15);
    EXPECT_DOUBLE_EQ(inset.offsetScrolledBy(-45), -30);

    EXPECT_EQ(tableOf(10, 0).restingOffset(9000), 1374.5);
    EXPECT_EQ(tableOf(10, 0).restingOffset(-1), 0);
    EXPECT_EQ(tableOf(2, 0).restingOffset(50), 0);
    EXPECT_EQ(tableOf(10, 0).restingOffset(std::nan("")), 0);
}

TEST(TableGeometry, RowsLieBelowTheHeader) {
    const QVTableGeometry table = tableOf(3, 0);
    EXPECT_EQ(table.contentHeight(), 561.5);
    EXPECT_EQ(table.rectOfRow(2), QRectF(0, 374.5, 375, 187));
    const struct {
        double y;
        std::optional<int> row;
    } cases[] = {{-1, {}}, {0.4, {}}, {0.5, 0}, {187.4, 0}, {187.5, 1}, {561.4, 2}, {561.5, {}}, {9000, {}}};
    for (const auto& test : cases) EXPECT_EQ(table.rowAt(test.y), test.row) << test.y;
    EXPECT_EQ(tableOf(0, 0).rowAt(0.5), std::nullopt);
    EXPECT_EQ(QVTableGeometry().rowAt(0), std::nullopt) << "not laid out yet";
}

/// Letters in a table of 500 x 375 points, with rows of 100 below a header of half a point.
class Letters final : public QVReorderableTableViewController {
 public:
    struct Log final : QVReorderableTableViewControllerDelegate {
        explicit Log(Letters& owner) : letters(owner) {}
        void reorderingDidBegin(QVReorderableTableViewController&, int row) override {
            lines << QStringLiteral("begin %1").arg(row);
        }
        void rowDidMove(QVReorderableTableViewController&, int from, int to) override {
            lines << QStringLiteral("%1>%2").arg(from).arg(to);
            std::swap(letters.text[from], letters.text[to]);
        }
        void reorderingDidFinish(QVReorderableTableViewController&) override { lines << "finish"; }
        Letters& letters;
        QStringList lines;
    };

    explicit Letters(const QString& rows) : text(rows), before_(rows) {
        setDelegate(log);
        setDraggingViewOpacity(0.8);
        setAnimationClock([this] { return time; });
        setTableGeometry(375, 500, 0.5, 100, 4);
        connect(this, &QVReorderableTableViewController::scrollRequested, this,
                &QVReorderableTableViewController::tableDidScroll);
    }
    QUrl view() const override { return {}; }
    void pass(QVAnimationTime duration) { advance(time += duration); }
    double offset() const { return tableGeometry().contentOffset; }
    double center() const { return draggingView()->frame.center().y(); }
    void changeRows(const QString& rows, std::optional<int> current) {
        text = rows;
        rowsDidChange(current);
    }

    QString text;
    QStringList hooks;
    QVAnimationTime time{1s};
    std::shared_ptr<Log> log = std::make_shared<Log>(*this);

 protected:
    int numberOfRows() const override { return static_cast<int>(text.size()); }
    QImage snapshotOfRow(int row) override {
        QImage image(1, 1, QImage::Format_ARGB32);
        image.setText("row", text.mid(row, 1));
        return image;
    }
    void willBeginReordering() override { hooks << "will begin"; }
    void didEndReordering() override { hooks << "did end"; }
    void restoreRows() override {
        const QChar dragged = text[*currentRow()];
        text = before_;
        rowsDidChange(static_cast<int>(text.indexOf(dragged)));
    }

 private:
    const QString before_;
};

TEST(Reordering, TheThirdToTheTopSwapsStepByStep) {
    Letters table("ABCDE");
    ASSERT_TRUE(table.pressAndHoldBegan(250));
    EXPECT_EQ(table.draggingView()->image.text("row"), "C");
    for (double y = 250; y >= 120; y -= 10) table.pressAndHoldChanged(y);
    EXPECT_EQ(table.text, "ACBDE");
    for (double y = 110; y >= 10; y -= 10) table.pressAndHoldChanged(y);
    EXPECT_EQ(table.text, "CABDE");
    EXPECT_EQ(table.currentRow(), 0);
    EXPECT_EQ(table.hooks, QStringList{"will begin"});
    table.pressAndHoldEnded();
    EXPECT_EQ(table.hooks, (QStringList{"will begin", "did end"}));
    EXPECT_EQ(table.log->lines, (QStringList{"begin 2", "2>1", "1>0"})) << "it settles first";
    table.pass(299ms);
    EXPECT_EQ(table.log->lines.size(), 3);
    table.pass(1ms);
    EXPECT_EQ(table.log->lines.last(), "finish");
    EXPECT_EQ(table.currentRow(), std::nullopt);

    // A fast finger passes rows without touching them: the two change places.
    table.pass(1s);
    table.log->lines.clear();
    table.pressAndHoldBegan(450);
    table.pressAndHoldChanged(50);
    EXPECT_EQ(table.text, "EABDC");
    EXPECT_EQ(table.log->lines, (QStringList{"begin 4", "4>0"}));
}

TEST(Reordering, TheDraggingViewRisesFollowsAndSettles) {
    Letters table("ABCDE");
    EXPECT_FALSE(table.draggingView());
    QSignalSpy changed(&table, &QVReorderableTableViewController::draggingViewChanged);
    ASSERT_TRUE(table.pressAndHoldBegan(230));
    EXPECT_EQ(table.draggingView()->frame, QRectF(0, 200.5, 375, 100)) << "over its row";
    EXPECT_EQ(table.draggingView()->opacity, 1);
    EXPECT_EQ(table.draggingView()->scale, 1);
    EXPECT_TRUE(table.isMoving());
    table.pass(125ms);
    EXPECT_DOUBLE_EQ(table.draggingView()->opacity, 0.9);
    EXPECT_DOUBLE_EQ(table.draggingView()->scale, 1.025);
    EXPECT_DOUBLE_EQ(table.center(), (250.5 + 230) / 2);
    table.pressAndHoldChanged(240);
    EXPECT_DOUBLE_EQ(table.center(), 240 + (250.5 - 230) / 2) << "what moves it does not disturb its way";
    table.pass(125ms);
    EXPECT_DOUBLE_EQ(table.draggingView()->opacity, 0.8);
    EXPECT_DOUBLE_EQ(table.draggingView()->scale, 1.05);
    EXPECT_EQ(table.draggingView()->frame.center(), QPointF(187.5, 240));
    EXPECT_FALSE(table.isMoving()) << "it hangs still: no frames are needed";

    // It follows up to 50 points below the content, and not above its top.
    const struct {
        double y, center;
    } cases[] = {{300, 300}, {0, 0}, {-1, 0}, {500, 500}, {550.5, 550.5}, {551, 550.5}, {320, 320}};
    for (const auto& test : cases) {
        table.pressAndHoldChanged(test.y);
        EXPECT_DOUBLE_EQ(table.center(), test.center) << test.y;
    }
    EXPECT_EQ(table.currentRow(), 3);
    changed.clear();
    table.pressAndHoldEnded();
    table.pass(150ms);
    EXPECT_GT(changed.size(), 0);
    EXPECT_DOUBLE_EQ(table.center(), (320 + 350.5) / 2);
    EXPECT_DOUBLE_EQ(table.draggingView()->opacity, 0.9);
    table.pass(150ms);
    EXPECT_EQ(table.draggingView()->frame, QRectF(0, 300.5, 375, 100));
    EXPECT_EQ(table.draggingView()->opacity, 1);
    EXPECT_EQ(table.draggingView()->scale, 1);
    EXPECT_EQ(table.log->lines.last(), "finish");
    table.pass(149ms);
    EXPECT_TRUE(table.draggingView()) << "until the row shows itself";
    table.pass(1ms);
    EXPECT_FALSE(table.draggingView());
    EXPECT_FALSE(table.isMoving());
}

TEST(Reordering, TheEdgesScrollAndTheRowFollows) {
    Letters table("ABCDEFGHIJ");  // 1000.5 points high: the offset ends at 504.5
    table.pressAndHoldBegan(250);
    table.pass(1s);
    table.pressAndHoldChanged(450);
    EXPECT_EQ(table.scrollSpeed(), 10);
    EXPECT_TRUE(table.isMoving());
    EXPECT_EQ(table.offset(), 0) << "with the next frame";
    table.pass(kFrame);
    EXPECT_EQ(table.offset(), 10);
    EXPECT_EQ(table.center(), 450) << "it stays at the finger";
    table.pass(kFrame);
    EXPECT_NEAR(table.offset(), 20, 0.01);
    table.pass(kFrame / 2);
    EXPECT_NEAR(table.offset(), 25, 0.01) << "half a frame, half the way";
    table.pass(10s);
    EXPECT_NEAR(table.offset(), 55, 0.01) << "no leap after a pause";
    EXPECT_EQ(table.currentRow(), 5);
    for (int frame = 0; frame < 100; ++frame) table.pass(kFrame);
    EXPECT_EQ(table.offset(), 504.5);
    EXPECT_EQ(table.currentRow(), 9);
    EXPECT_EQ(table.text, "ABEDFGHIJC") << "after the leap, each one that it passed moved up";

    table.pressAndHoldChanged(250);
    EXPECT_EQ(table.scrollSpeed(), 0);
    EXPECT_FALSE(table.isMoving());
    table.pressAndHoldChanged(10);
    EXPECT_EQ(table.scrollSpeed(), -15);
    for (int frame = 0; frame < 100; ++frame) table.pass(kFrame);
    EXPECT_EQ(table.offset(), 0);
    EXPECT_EQ(table.text.indexOf('C'), 0);
    table.pressAndHoldEnded();
    EXPECT_EQ(table.scrollSpeed(), 0);
    table.pass(1s);
    EXPECT_EQ(table.offset(), 0);
}

TEST(Reordering, NothingIsDraggedWhereNoRowIs) {
    Letters empty("");
    EXPECT_FALSE(empty.pressAndHoldBegan(50));
    Letters table("AB");
    EXPECT_FALSE(table.pressAndHoldBegan(201)) << "below the last row";
    EXPECT_FALSE(table.pressAndHoldBegan(0.2)) << "the header";
    table.pressAndHoldChanged(50);
    table.pressAndHoldEnded();
    table.cancelReordering();
    EXPECT_TRUE(table.log->lines.isEmpty() && table.hooks.isEmpty());
    // A drag over no row leaves the order as it is.
    table.pressAndHoldBegan(50);
    table.pressAndHoldChanged(240);
    table.pressAndHoldChanged(-30);
    EXPECT_EQ(table.text, "AB");
}

TEST(Reordering, EveryEndIsClean) {
    Letters table("ABCDE");
    table.pressAndHoldBegan(250);
    table.pressAndHoldChanged(10);
    table.cancelReordering();
    EXPECT_EQ(table.text, "ABCDE") << "not wanted: as it was";
    EXPECT_EQ(table.currentRow(), 2);
    table.pressAndHoldChanged(400);
    table.pressAndHoldEnded();
    EXPECT_EQ(table.text, "ABCDE") << "the finger that is still there drags no more";
    table.pass(300ms);
    EXPECT_EQ(table.log->lines.count("finish"), 1);

    // Nobody is looking any more: at once.
    table.pressAndHoldBegan(250);
    table.pressAndHoldChanged(150);
    table.finishReordering();
    EXPECT_EQ(table.log->lines.count("finish"), 2);
    EXPECT_FALSE(table.draggingView());
    EXPECT_FALSE(table.isMoving());
    EXPECT_EQ(table.text, "ACBDE");
    EXPECT_EQ(table.hooks.count("did end"), 2);

    // The next drag begins while the last one settles.
    table.pressAndHoldBegan(50);
    table.pressAndHoldEnded();
    table.pressAndHoldBegan(450);
    EXPECT_EQ(table.log->lines.count("finish"), 3);
    EXPECT_EQ(table.currentRow(), 4);

    // Rows come and go under it, and then the row itself.
    table.changeRows("XACBDE", 5);
    table.pressAndHoldChanged(350);
    EXPECT_EQ(table.text, "XACEDB");
    table.changeRows("XACDB", std::nullopt);
    EXPECT_FALSE(table.isDragging());
    EXPECT_EQ(table.log->lines.count("finish"), 4);
    EXPECT_EQ(table.hooks.count("will begin"), table.hooks.count("did end"));
}

TEST(Reordering, ARowMovesWithoutADrag) {
    Letters table("ABCDE");
    EXPECT_TRUE(table.moveRow(0, 2));
    EXPECT_EQ(table.text, "BCADE");
    EXPECT_EQ(table.log->lines, (QStringList{"begin 0", "0>1", "1>2", "finish"}));
    EXPECT_FALSE(table.moveRow(0, -1));
    EXPECT_FALSE(table.moveRow(4, 1));
    EXPECT_FALSE(table.moveRow(-1, 1));
    table.pressAndHoldBegan(250);
    EXPECT_FALSE(table.moveRow(0, 1)) << "one thing at a time";
}

/// The dashboard with the cards of A steps, B heart rate, C distance, D flights.
class DashboardOrderTest : public testing::Test {
 protected:
    DashboardOrderTest() {
        platform::loadTranslations();
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
        manager_ = std::make_shared<QVControllerManager>(store_);
        EXPECT_TRUE(test::waitUntil([this] { return controller().hasLoadedDashboard(); }));
        controller().setDataUnitGroupsForDashboard(groups("ABCD"));
        auto screen = std::make_unique<QVDashboardViewController>(manager_);
        screen_ = screen.get();
        screen_->setAnimationClock([this] { return time_; });
        stack_ = std::make_unique<platform::NavigationStack>("stack", std::move(screen));
        stack_->setVisible(true);
        screen_->setTableGeometry(375, 500, 0.5, 187, 4);
        tester_ = std::make_unique<QAbstractItemModelTester>(
            screen_->table(), QAbstractItemModelTester::FailureReportingMode::Fatal);
    }
    ~DashboardOrderTest() override {
        stack_.reset();
        QVUserDefaults::sharedDefaults().setHealthStore(nullptr);
    }

    static constexpr int kIDs[] = {VSGroupID::Steps, VSGroupID::HeartRate, VSGroupID::WalkingRunningDistance,
                                   VSGroupID::FlightsClimbed, VSGroupID::ActiveEnergy};
    static Groups groups(const std::string& letters) {
        Groups result;
        for (const char letter : letters)
            result.push_back(VSDataUnitGroupController::shared().dataUnitGroupWithID(kIDs[letter - 'A']));
        return result;
    }
    static std::string letters(const Groups& groups) {
        std::string result;
        for (const auto* group : groups)
            result += static_cast<char>(
                'A' + (std::find(std::begin(kIDs), std::end(kIDs), group->dataUnitGroupID()) - kIDs));
        return result;
    }
    QVDashboardDataUnitGroupsController& controller() {
        return manager_->dashboardDataUnitGroupsController();
    }
    std::string shown() const { return letters(screen_->dashboardDataUnitGroups()); }
    std::string kept() { return letters(controller().dataUnitGroupsForDashboard()); }
    void pass(QVAnimationTime duration) { screen_->advance(time_ += duration); }
    void dragTo(double from, double to) {
        ASSERT_TRUE(screen_->pressAndHoldBegan(from));
        for (double y = from; std::abs(y - to) > 20; y += y < to ? 20 : -20) screen_->pressAndHoldChanged(y);
        screen_->pressAndHoldChanged(to);
    }

    test::FixedEnvironment environment_{"2020-03-31T20:00"};
    test::TemporaryFolder folder_;
    QVAnimationTime time_{1s};
    std::shared_ptr<VSHealthStore> store_;
    std::shared_ptr<QVControllerManager> manager_;
    std::unique_ptr<platform::NavigationStack> stack_;
    std::unique_ptr<QAbstractItemModelTester> tester_;
    QVDashboardViewController* screen_ = nullptr;
};

TEST_F(DashboardOrderTest, IsStoredWhenTheFingerIsLiftedAndNotBefore) {
    EXPECT_EQ(screen_->draggingViewOpacity(), 0.8);
    QVDashboardTableViewCell cell;
    cell.setSize({375, 187});
    screen_->prepareCell(cell, 2);
    const auto item = cell.chartItem();
    dragTo(450, 20);
    EXPECT_EQ(shown(), "CABD");
    EXPECT_EQ(kept(), "ABCD");
    screen_->prepareCell(cell, 0);
    EXPECT_EQ(cell.chartItem(), item) << "the cards are not made anew";
    EXPECT_TRUE(cell.isContentHidden());
    screen_->prepareCell(cell, 1);
    EXPECT_FALSE(cell.isContentHidden()) << "only the placeholder";
    screen_->selectRow(1);
    EXPECT_EQ(stack_->count(), 1) << "nothing opens during a drag";
    screen_->prepareCell(cell, 0);
    screen_->pressAndHoldEnded();
    EXPECT_EQ(kept(), "ABCD");
    pass(300ms);
    EXPECT_EQ(kept(), "CABD");
    screen_->prepareCell(cell, 0);
    EXPECT_FALSE(cell.isContentHidden());

    QVControllerManager later(store_);
    auto& stored = later.dashboardDataUnitGroupsController();
    ASSERT_TRUE(test::waitUntil([&stored] { return stored.hasLoadedDashboard(); }));
    EXPECT_EQ(letters(stored.dataUnitGroupsForDashboard()), "CABD");
}

TEST_F(DashboardOrderTest, AChangeOfTheListDuringADragIsKept) {
    dragTo(450, 20);
    controller().addDataUnitGroupToDashboard(groups("E").front());
    EXPECT_TRUE(screen_->isDragging());
    EXPECT_EQ(shown(), "CABDE") << "a new card at the end, the order as it is dragged";
    controller().removeDataUnitGroupFromDashboard(groups("A").front());
    EXPECT_EQ(shown(), "CBDE");
    EXPECT_EQ(screen_->currentRow(), 0);
    screen_->pressAndHoldChanged(200);
    EXPECT_EQ(shown(), "BCDE");
    screen_->pressAndHoldEnded();
    controller().removeDataUnitGroupFromDashboard(groups("B").front());
    EXPECT_EQ(shown(), "CDE") << "while it settles";
    EXPECT_EQ(screen_->currentRow(), 0);
    pass(300ms);
    EXPECT_EQ(kept(), "CDE");

    // The dragged card itself goes: no drag, and what the others have stands.
    dragTo(20, 300);
    EXPECT_EQ(shown(), "DCE");
    controller().setDataUnitGroupsForDashboard(groups("EDAB"));
    EXPECT_FALSE(screen_->isDragging());
    EXPECT_EQ(shown(), "EDAB");
    EXPECT_EQ(kept(), "EDAB");

    dragTo(20, 300);
    controller().setDataUnitGroupsForDashboard({});
    EXPECT_TRUE(screen_->showsEmptyState());
    EXPECT_EQ(kept(), "");
}

TEST_F(DashboardOrderTest, EscapePutsTheCardBackAndLeavingKeepsTheOrder) {
    dragTo(450, 20);
    controller().addDataUnitGroupToDashboard(groups("E").front());
    screen_->cancelReordering();
    EXPECT_EQ(shown(), "ABCDE");
    EXPECT_EQ(screen_->currentRow(), 2);
    pass(300ms);
    EXPECT_EQ(kept(), "ABCDE");
    pass(1s);

    dragTo(450, 20);
    stack_->setVisible(false);
    EXPECT_FALSE(screen_->draggingView());
    EXPECT_EQ(kept(), "CABDE");
    controller().setDataUnitGroupsForDashboard(groups("DC"));
    stack_->setVisible(true);
    EXPECT_EQ(shown(), "DC");
}

TEST_F(DashboardOrderTest, PuttingACardBackStoresNothing) {
    struct Counter final : QVDashboardDataUnitGroupsObserver {
        void dashboardDataUnitGroupsUpdated(const Groups&) override { ++count; }
        int count = 0;
    };
    const auto counter = std::make_shared<Counter>();
    controller().addObserver(counter);
    dragTo(450, 20);
    screen_->pressAndHoldChanged(250);
    screen_->pressAndHoldChanged(450);
    EXPECT_EQ(shown(), "ABCD") << "back the way it came";
    screen_->pressAndHoldEnded();
    pass(300ms);
    EXPECT_EQ(counter->count, 0);
}

TEST_F(DashboardOrderTest, TheKeyboardMovesACardAndItIsSaid) {
    QStringList said;
    const auto listener =
        QObject::connect(&platform::Announcements::shared(), &platform::Announcements::posted,
                         [&said](const QString& text) { said << text; });
    screen_->moveCard(0, 1);
    EXPECT_EQ(shown(), "BACD");
    EXPECT_EQ(kept(), "BACD") << "at once";
    screen_->moveCard(3, 1);
    screen_->moveCard(0, -1);
    screen_->moveCard(17, 1);
    EXPECT_EQ(kept(), "BACD");
    EXPECT_EQ(said, (QStringList{"Steps, moved to 2 of 4", "Flights Climbed, stays at 4 of 4",
                                 "Heart Rate, stays at 1 of 4"}));
    environment_->setLocale("ar_EG");
    said.clear();
    screen_->moveCard(1, 1);
    EXPECT_TRUE(said.value(0).contains(QString::fromUtf8("٣")) &&
                said.value(0).contains(QString::fromUtf8("٤")))
        << said.value(0).toStdString();
    environment_->setLocale("en_US");
    QObject::disconnect(listener);
}

TEST_F(DashboardOrderTest, TheSnapshotIsTheCardWithoutItsGround) {
    QVDashboardTableViewCell cell;
    cell.setSize({375, 187});
    screen_->prepareCell(cell, 1);
    ASSERT_TRUE(screen_->pressAndHoldBegan(250));
    const QImage image = screen_->draggingView()->image;
    ASSERT_EQ(image.size(), QSize(375, 187));
    EXPECT_EQ(qAlpha(image.pixel(1, 100)), 0);
    EXPECT_EQ(qAlpha(image.pixel(187, 1)), 0);
    EXPECT_EQ(qAlpha(image.pixel(187, 100)), 255);
}

TEST_F(DashboardOrderTest, ScopeAndScrollAreRestoredWhenTheListIsThere) {
    QSignalSpy scrolled(screen_, &QVReorderableTableViewController::scrollRequested);
    screen_->tableDidScroll(100);
    EXPECT_EQ(screen_->scrollOffset(), 100);
    screen_->tableDidScroll(9000);
    EXPECT_EQ(screen_->scrollOffset(), 4 * 187 + 4.5 - 500) << "where it comes to rest";

    manager_ = std::make_shared<QVControllerManager>(store_);
    auto fresh = std::make_unique<QVDashboardViewController>(manager_);
    auto* screen = fresh.get();
    screen->restoreTimeScope(QVTimeScope::Year);
    screen->restoreTimeScope(QVTimeScope::Hour);
    screen->restoreTimeScope(static_cast<QVTimeScope>(99));
    screen->restoreScrollOffset(200);
    EXPECT_EQ(screen->scrollOffset(), 200) << "a state saved before it was applied";
    platform::NavigationStack stack("stack", std::move(fresh));
    QSignalSpy applied(screen, &QVReorderableTableViewController::scrollRequested);
    screen->setTableGeometry(375, 500, 0.5, 187, 4);
    stack.setVisible(true);
    EXPECT_EQ(screen->selectedTimeScope(), QVTimeScope::Year);
    EXPECT_EQ(manager_->selectedTimeScopeController().selectedTimeScope(), QVTimeScope::Year);
    screen->tableDidScroll(0);
    EXPECT_EQ(applied.size(), 0) << "there are no cards yet";
    ASSERT_TRUE(test::waitUntil([&applied] { return applied.size() == 1; }));
    EXPECT_EQ(applied[0][0].toDouble(), 200);
    screen->restoreScrollOffset(9000);
    EXPECT_EQ(applied[1][0].toDouble(), 4 * 187 + 4.5 - 500);
    screen->tableDidScroll(30);
    EXPECT_EQ(screen->scrollOffset(), 30);
}

}  // namespace
