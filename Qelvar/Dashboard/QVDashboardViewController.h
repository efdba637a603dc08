#pragma once

#include <QAbstractListModel>
#include <QPointer>
#include <functional>
#include <map>
#include <memory>
#include <vector>

#include "Qelvar/Charts/QVTimeScopeControl.h"
#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Dashboard/QVDashboardChartItem.h"
#include "Qelvar/Dashboard/QVReorderableTableViewController.h"

class QVDashboardTableViewCell;
class QVDashboardTable;

/// The first tab: a list of chart cards, one for each display type that the user put on the dashboard, all in
/// the time scope of the control above them; or, when there is none, how to get one. The user puts the cards
/// in another order by dragging them or by the keyboard. Main thread only.
class QVDashboardViewController : public QVReorderableTableViewController {
    Q_OBJECT
    Q_PROPERTY(QAbstractItemModel* table READ table CONSTANT)
    Q_PROPERTY(QVTimeScopeControl* timeScopeControl READ timeScopeControl CONSTANT)
    Q_PROPERTY(double rowHeight READ rowHeight NOTIFY rowHeightChanged)
    Q_PROPERTY(bool showsEmptyState READ showsEmptyState NOTIFY emptyStateChanged)
    Q_PROPERTY(QString emptyStateTitle READ emptyStateTitle NOTIFY textsChanged)
    Q_PROPERTY(QString emptyStateHelp READ emptyStateHelp NOTIFY textsChanged)
    Q_PROPERTY(QString importTitle READ importTitle NOTIFY textsChanged)
    Q_PROPERTY(QString moveHelp READ moveHelp NOTIFY textsChanged)
 public:
    using Groups = QVDashboardDataUnitGroupsController::Groups;
    using ScreenFactory = std::function<std::unique_ptr<platform::Screen>(const VSDataUnitGroup*)>;

    /// `detailScreen` makes the screen of a display type that a tapped card opens. Without it cards open
    /// nothing.
    explicit QVDashboardViewController(std::shared_ptr<QVControllerManager> controllerManager,
                                       ScreenFactory detailScreen = {});
    ~QVDashboardViewController() override;

    QUrl view() const override;
    /// One row for each card, with the role "displayName".
    QAbstractItemModel* table() const;
    double rowHeight() const;
    QVTimeScopeControl* timeScopeControl() const { return timeScopeControl_.get(); }
    const Groups& dashboardDataUnitGroups() const { return dashboardDataUnitGroups_; }
    /// The items by display-type ID.
    const std::map<int, std::shared_ptr<QVDashboardChartItem>>& dashboardChartItems() const {
        return dashboardChartItems_;
    }

    /// Nothing is on the dashboard. False until the list has been read.
    bool showsEmptyState() const { return showsEmptyState_; }
    QString emptyStateTitle() const;
    QString emptyStateHelp() const;
    QString importTitle() const;
    /// How the keyboard puts the cards in another order.
    QString moveHelp() const;
    /// The margins beside the help text on a screen of that width, in points.
    Q_INVOKABLE static double emptyStateHelpMargin(double screenWidth);

    /// Gives a cell what belongs to its row, just before it is shown, and starts the item's queries.
    void prepareCell(QVDashboardTableViewCell& cell, int row);
    /// The row's display type was tapped.
    Q_INVOKABLE void selectRow(int row);
    /// Moves a card some places without a drag, and says where it is now. What is out of the list stays in
    /// its place.
    Q_INVOKABLE void moveCard(int row, int places);
    /// Makes every visible card take its row's content again.
    void reloadTable();

    // What a later session begins with.

    QString restorationIdentifier() const override { return QStringLiteral("Dashboard View Controller"); }
    void encodeRestorableState(platform::RestorableState& state) const override;
    void decodeRestorableState(const platform::RestorableState& state) override;
    QVTimeScope selectedTimeScope() const { return timeScopeControl_->selectedTimeScope(); }
    /// A time scope that is not offered changes nothing.
    void restoreTimeScope(QVTimeScope timeScope);
    /// How far the cards are scrolled, in points.
    double scrollOffset() const;
    /// Scrolls as soon as the list has been read and laid out, at most to its end.
    void restoreScrollOffset(double offset);

 signals:
    void tableReloaded();
    void rowHeightChanged();
    void emptyStateChanged();
    void textsChanged();
    /// The user wants to import a document.
    void importRequested();

 protected:
    void willAppear() override;
    void willDisappear() override;
    int numberOfRows() const override;
    QImage snapshotOfRow(int row) override;
    void restoreRows() override;
    void tableDidLayOut() override { applyScrollOffset(); }

 private:
    struct Observer;

    void reorderingDidBegin(int row);
    void rowDidMove(int fromRow, int toRow);
    void reorderingDidFinish();

    void reloadDataUnitGroups();
    void takeDataUnitGroups(Groups groups);
    void takeDataUnitGroupsDuringDrag(Groups groups);
    const VSDataUnitGroup* draggedGroup() const;
    void applyScrollOffset();
    void updateEmptyState();
    void timeScopeDidChange();
    void localeDidChange();
    void dataProviderOrderUpdated(const VSObjectType* dataType);

    const std::shared_ptr<QVControllerManager> controllerManager_;
    const ScreenFactory detailScreen_;
    const std::unique_ptr<QVTimeScopeControl> timeScopeControl_;
    /// In the order that the user sees, also during a drag.
    Groups dashboardDataUnitGroups_;
    std::map<int, std::shared_ptr<QVDashboardChartItem>> dashboardChartItems_;
    std::optional<int> placeholderRow_;  // none: no card is being dragged
    std::vector<QPointer<QVDashboardTableViewCell>> cells_;
    std::optional<double> wantedScrollOffset_;  // until it can be applied
    bool showsEmptyState_ = false;
    const std::unique_ptr<QVDashboardTable> table_;
    std::shared_ptr<Observer> observer_;
};
