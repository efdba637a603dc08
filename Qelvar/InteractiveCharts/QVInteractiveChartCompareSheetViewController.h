#pragma once

#include <memory>
#include <set>

#include "Platform/Sheet.h"
#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/InteractiveCharts/QVCompareSheetTable.h"

class QVInteractiveChartCompareSheetViewController;

class QVInteractiveChartCompareSheetViewControllerDelegate {
 public:
    virtual ~QVInteractiveChartCompareSheetViewControllerDelegate() = default;
    /// The user is done: the ticked display types in the order of the list, and whether their set is another
    /// than the one that the sheet was opened with. The sheet closes after this. Not called when the user
    /// leaves without a choice.
    virtual void compareSheetViewControllerWillDismissWithSelectedGroups(
        QVInteractiveChartCompareSheetViewController& controller,
        const std::vector<const VSDataUnitGroup*>& selectedGroups, bool selectedGroupsDidChange) = 0;
};

/// The sheet in which the user ticks the display types that the landscape chart shows, at most 20 of them.
/// Main thread only.
class QVInteractiveChartCompareSheetViewController : public platform::SheetScreen {
    Q_OBJECT
    Q_PROPERTY(QAbstractItemModel* table READ table CONSTANT)
    Q_PROPERTY(bool canSelectAll READ canSelectAll CONSTANT)
    Q_PROPERTY(QString selectAllTitle READ selectAllTitle NOTIFY textsChanged)
    Q_PROPERTY(QString doneTitle READ doneTitle NOTIFY textsChanged)
    Q_PROPERTY(QString limitText READ limitText NOTIFY textsChanged)
    Q_PROPERTY(QString emptyText READ emptyText NOTIFY textsChanged)
 public:
    using Groups = QVCompareSheetTable::Groups;

    /// One row for each of `allDataUnitGroups`, in that order, ticked when it is among the selected ones.
    QVInteractiveChartCompareSheetViewController(const Groups& selectedDataUnitGroups,
                                                 const Groups& allDataUnitGroups,
                                                 std::shared_ptr<QVControllerManager> controllerManager);

    QUrl view() const override;
    /// Roles "displayName", "selected", "canToggle", "categoryIcon".
    QAbstractItemModel* table() { return &table_; }
    const std::vector<QVCompareSheetTable::SelectionStatus>& selectionStatuses() const {
        return table_.selectionStatuses();
    }
    void setDelegate(std::weak_ptr<QVInteractiveChartCompareSheetViewControllerDelegate> delegate) {
        delegate_ = std::move(delegate);
    }

    /// There is something to tick.
    bool canSelectAll() const { return table_.rowCount() > 0; }
    QString selectAllTitle() const;
    QString doneTitle() const;
    /// How many can be ticked; empty when that is as many as there are.
    QString limitText() const;
    /// What stands in place of the rows; empty when there are some.
    QString emptyText() const;

    /// The row was touched: it is ticked or unticked; nothing happens when no more can be ticked.
    Q_INVOKABLE void tapRow(int row);
    /// The button that ticks as many as can be, or none.
    Q_INVOKABLE void tapSelectAll();
    /// The done button: tells the delegate and closes.
    Q_INVOKABLE void tapDone();
    void cancel() override;

 signals:
    void textsChanged();

 private:
    void updateTitles();
    void localeDidChange();
    const std::shared_ptr<QVControllerManager> controllerManager_;
    const std::set<const VSDataUnitGroup*> initiallySelected_;
    QVCompareSheetTable table_;
    std::weak_ptr<QVInteractiveChartCompareSheetViewControllerDelegate> delegate_;
    bool finished_ = false;  // it closes: nothing can be changed any more
};
