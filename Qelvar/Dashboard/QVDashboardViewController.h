#pragma once

#include <QAbstractListModel>
#include <functional>
#include <map>
#include <memory>
#include <vector>

#include "Platform/Screen.h"
#include "Qelvar/Charts/QVTimeScopeControl.h"
#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Dashboard/QVDashboardChartItem.h"

class QVDashboardTableViewCell;
class QVDashboardTable;

/// The first tab: a list of chart cards, one for each display type that the user put on the dashboard, all in
/// the time scope of the control above them; or, when there is none, how to get one. Main thread only.
class QVDashboardViewController : public platform::Screen {
    Q_OBJECT
    Q_PROPERTY(QAbstractItemModel* table READ table CONSTANT)
    Q_PROPERTY(QVTimeScopeControl* timeScopeControl READ timeScopeControl CONSTANT)
    Q_PROPERTY(bool showsEmptyState READ showsEmptyState NOTIFY emptyStateChanged)
    Q_PROPERTY(QString emptyStateTitle READ emptyStateTitle NOTIFY textsChanged)
    Q_PROPERTY(QString emptyStateHelp READ emptyStateHelp NOTIFY textsChanged)
    Q_PROPERTY(QString importTitle READ importTitle NOTIFY textsChanged)
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
    /// The margins beside the help text on a screen of that width, in points.
    Q_INVOKABLE static double emptyStateHelpMargin(double screenWidth);

    /// Gives a cell what belongs to its row, just before it is shown, and starts the item's queries.
    void prepareCell(QVDashboardTableViewCell& cell, int row);
    /// The row's display type was tapped.
    Q_INVOKABLE void selectRow(int row);
    /// Makes every visible card take its row's content again.
    void reloadTable();

 signals:
    void tableReloaded();
    void emptyStateChanged();
    void textsChanged();
    /// The user wants to import a document.
    void importRequested();

 protected:
    void willAppear() override;
    void willDisappear() override;

 private:
    struct Observer;

    void reloadDataUnitGroups();
    void updateEmptyState();
    void timeScopeDidChange();
    void localeDidChange();
    void dataProviderOrderUpdated(const VSObjectType* dataType);

    const std::shared_ptr<QVControllerManager> controllerManager_;
    const ScreenFactory detailScreen_;
    const std::unique_ptr<QVTimeScopeControl> timeScopeControl_;
    Groups dashboardDataUnitGroups_;
    std::map<int, std::shared_ptr<QVDashboardChartItem>> dashboardChartItems_;
    bool showsEmptyState_ = false;
    const std::unique_ptr<QVDashboardTable> table_;
    std::shared_ptr<Observer> observer_;
};
