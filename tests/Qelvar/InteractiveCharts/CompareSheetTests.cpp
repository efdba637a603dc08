#include <gtest/gtest.h>

#include <QAbstractItemModelTester>
#include <QSignalSpy>

#include "Platform/Localization.h"
#include "Platform/SystemEvents.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "Qelvar/InteractiveCharts/QVInteractiveChartCompareSheetViewController.h"
#include "TestSupport.h"

namespace {

using Sheet = QVInteractiveChartCompareSheetViewController;
using Groups = Sheet::Groups;

Groups firstGroups(size_t count) {
    const auto& all = VSDataUnitGroupController::shared().allDataUnitGroups();
    return {all.begin(), all.begin() + static_cast<Groups::difference_type>(count)};
}

struct Delegate : QVInteractiveChartCompareSheetViewControllerDelegate {
    void compareSheetViewControllerWillDismissWithSelectedGroups(Sheet&, const Groups& selectedGroups,
                                                                 bool selectedGroupsDidChange) override {
        ++calls;
        selected = selectedGroups;
        changed = selectedGroupsDidChange;
    }
    int calls = 0;
    Groups selected;
    bool changed = false;
};

class CompareSheetTest : public testing::Test {
 protected:
    CompareSheetTest() {
        platform::loadTranslations();
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
        manager_ = std::make_shared<QVControllerManager>(store_);
    }
    ~CompareSheetTest() override { QVUserDefaults::sharedDefaults().setHealthStore(nullptr); }

    std::unique_ptr<Sheet> sheet(const Groups& selected, const Groups& all) {
        auto result = std::make_unique<Sheet>(selected, all, manager_);
        tester_ = std::make_unique<QAbstractItemModelTester>(
            result->table(), QAbstractItemModelTester::FailureReportingMode::Fatal);
        result->setDelegate(delegate_);
        return result;
    }
    /// The ticks as a screen sees them, row by row; "-" for a row that cannot be ticked.
    static std::string ticks(Sheet& sheet) {
        std::string result;
        auto* table = sheet.table();
        for (int row = 0; row < table->rowCount(); ++row) {
            const auto index = table->index(row, 0);
            const bool ticked = index.data(QVCompareSheetTable::SelectedRole).toBool();
            EXPECT_EQ(ticked, sheet.selectionStatuses()[static_cast<size_t>(row)].selected);
            EXPECT_EQ(index.data(Qt::CheckStateRole).toInt(), ticked ? Qt::Checked : Qt::Unchecked);
            result += ticked ? 'x' : index.data(QVCompareSheetTable::CanToggleRole).toBool() ? '.' : '-';
        }
        return result;
    }

    test::FixedEnvironment environment_{"2020-03-31T20:00"};
    test::TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
    std::shared_ptr<QVControllerManager> manager_;
    std::shared_ptr<Delegate> delegate_ = std::make_shared<Delegate>();
    std::unique_ptr<QAbstractItemModelTester> tester_;
};

// Rows, those selected at the start, what is done (a number taps that row, "all" the button), and the ticks,
// count and button afterwards.
TEST_F(CompareSheetTest, TicksUnderTheLimit) {
    struct Case {
        size_t rows;
        std::vector<size_t> selected;
        QStringList actions;
        std::string ticks;
        const char* title;
        const char* button;
    };
    const std::string x20(20, 'x');
    std::vector<size_t> twenty, allOf25;
    for (size_t i = 5; i < 25; ++i) twenty.push_back(i);
    for (size_t i = 0; i < 25; ++i) allOf25.push_back(i);
    const Case cases[] = {
        {3, {1}, {}, ".x.", "1 Selected", "Select All"},
        {3, {1}, {"0", "2"}, "xxx", "3 Selected", "Deselect All"},
        {3, {1}, {"1", "-1", "3"}, "...", "0 Selected", "Select All"},
        {3, {1}, {"all"}, "xxx", "3 Selected", "Deselect All"},
        {3, {1}, {"all", "all"}, "...", "0 Selected", "Select All"},
        {20, {}, {"all"}, x20, "20 Selected", "Deselect All"},
        {25, {}, {"all"}, x20 + "-----", "20 Selected", "Deselect All"},
        {25, {}, {"all", "24"}, x20 + "-----", "20 Selected", "Deselect All"},
        {25, {24, 23}, {"all"}, std::string(18, 'x') + "-----xx", "20 Selected", "Deselect All"},
        {25, {}, {"all", "0", "24"}, "-" + std::string(19, 'x') + "----x", "20 Selected", "Deselect All"},
        {25, {}, {"all", "3"}, "xxx." + std::string(16, 'x') + ".....", "19 Selected", "Select All"},
        {25, twenty, {"all"}, std::string(25, '.'), "0 Selected", "Select All"},
        // More than can be ticked were handed in: they can be taken away, and none comes in their place.
        {25, allOf25, {}, std::string(25, 'x'), "25 Selected", "Deselect All"},
        {25, allOf25, {"0", "0"}, "-" + std::string(24, 'x'), "24 Selected", "Deselect All"},
        {25, allOf25, {"all"}, std::string(25, '.'), "0 Selected", "Select All"},
        {0, {}, {"all", "0"}, "", "0 Selected", "Deselect All"},
    };
    for (const Case& test : cases) {
        SCOPED_TRACE(test.actions.join(' ').toStdString() + " on " + std::to_string(test.rows));
        const Groups all = firstGroups(test.rows);
        Groups selected;
        for (const size_t row : test.selected) selected.push_back(all[row]);
        const auto screen = sheet(selected, all);
        // What a layout shows is what it was told of last.
        QString button = screen->selectAllTitle();
        QObject::connect(screen.get(), &Sheet::textsChanged, [&] { button = screen->selectAllTitle(); });
        for (const QString& action : test.actions) {
            if (action == "all")
                screen->tapSelectAll();
            else
                screen->tapRow(action.toInt());
        }
        EXPECT_EQ(ticks(*screen), test.ticks);
        EXPECT_EQ(screen->title(), test.title);
        EXPECT_EQ(button, test.button);
        EXPECT_EQ(screen->canSelectAll(), test.rows > 0);
        EXPECT_EQ(screen->emptyText().isEmpty(), test.rows > 0);
        EXPECT_EQ(screen->limitText(), test.rows > 20 ? "At most 20 can be selected." : "");
    }
}

TEST_F(CompareSheetTest, RowsAreToldWhenTheLimitIsReachedAndLeft) {
    const auto screen = sheet({}, firstGroups(25));
    for (int row = 0; row < 19; ++row) screen->tapRow(row);
    QSignalSpy changes(screen->table(), &QAbstractItemModel::dataChanged);
    const auto lastRowTold = [&changes] {
        int last = -1;
        for (const auto& change : changes)
            if (change[2].value<QList<int>>().contains(QVCompareSheetTable::CanToggleRole))
                last = std::max(last, change[1].toModelIndex().row());
        changes.clear();
        return last;
    };
    screen->tapRow(19);
    EXPECT_EQ(lastRowTold(), 24) << "the others are dimmed";
    screen->tapRow(24);
    EXPECT_EQ(changes.size(), 0);
    screen->tapRow(2);
    EXPECT_EQ(lastRowTold(), 24) << "and come back";
    screen->tapRow(3);
    EXPECT_EQ(lastRowTold(), 3);
}

TEST_F(CompareSheetTest, DoneGivesTheTickedInTheOrderOfTheListAndWhetherTheirSetIsAnother) {
    const Groups all = firstGroups(5);
    const auto done = [&](const Groups& selected, const std::vector<int>& taps) {
        const auto screen = sheet(selected, all);
        QSignalSpy closed(screen.get(), &Sheet::closeRequested);
        for (const int row : taps) screen->tapRow(row);
        screen->tapDone();
        // It is on its way out: nothing more happens.
        screen->tapDone();
        screen->cancel();
        screen->tapRow(0);
        screen->tapSelectAll();
        ASSERT_EQ(closed.size(), 1);
        EXPECT_TRUE(closed[0][0].toBool()) << "animated";
    };
    done({all[3], all[1]}, {});
    EXPECT_EQ(delegate_->selected, (Groups{all[1], all[3]}));
    EXPECT_FALSE(delegate_->changed) << "the order is no change";
    done({all[3]}, {0, 1, 0, 1});
    EXPECT_FALSE(delegate_->changed) << "there and back";
    done({all[3]}, {0, 3});
    EXPECT_EQ(delegate_->selected, Groups{all[0]});
    EXPECT_TRUE(delegate_->changed) << "as many, but others";
    done({all[3]}, {3});
    EXPECT_TRUE(delegate_->selected.empty());
    EXPECT_TRUE(delegate_->changed);
    const Groups gone{firstGroups(6).back()};
    done(gone, {});
    EXPECT_TRUE(delegate_->changed) << "one that is not offered any more is lost";
    EXPECT_EQ(delegate_->calls, 5);
}

TEST_F(CompareSheetTest, LeavingWithoutAChoiceTellsNobody) {
    const auto screen = sheet({}, firstGroups(3));
    QSignalSpy closed(screen.get(), &Sheet::closeRequested);
    screen->tapRow(1);
    screen->cancel();
    screen->tapDone();
    EXPECT_EQ(closed.size(), 1);
    EXPECT_EQ(delegate_->calls, 0);
}

TEST_F(CompareSheetTest, NamesAndCountsFollowTheLanguage) {
    const Groups all = firstGroups(25);
    const auto screen = sheet({}, Groups{all[0], all[1], all[0]});
    EXPECT_EQ(screen->table()->rowCount(), 2) << "one given twice is one row";
    screen->tapRow(1);
    environment_->setLocale("ar_EG");
    platform::SystemEvents::shared().postLocaleChange();
    EXPECT_EQ(screen->title(), QString::fromUtf8("١ محددة"));
    EXPECT_EQ(screen->selectAllTitle(), QString::fromUtf8("تحديد الكل"));
    EXPECT_EQ(screen->table()->index(0, 0).data(), all[0]->displayName());
    EXPECT_EQ(sheet({}, all)->limitText(), QString::fromUtf8("يمكن تحديد ٢٠ على الأكثر."));
    environment_->setLocale("en_US");
    platform::SystemEvents::shared().postLocaleChange();
    EXPECT_EQ(screen->title(), "1 Selected");
}

}  // namespace
