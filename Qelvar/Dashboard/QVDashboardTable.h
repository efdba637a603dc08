#pragma once

#include <QAbstractListModel>

#include "Qelvar/DataProviders/QVDashboardDataUnitGroupsController.h"

/// The rows of the dashboard: a display type each. A new list is reached by removing, moving and inserting
/// rows, so that the cards of those that stay are not made anew. Main thread only.
class QVDashboardTable : public QAbstractListModel {
    Q_OBJECT
 public:
    enum Role { DisplayNameRole = Qt::UserRole + 1, GroupIDRole };
    using Groups = QVDashboardDataUnitGroupsController::Groups;

    int rowCount(const QModelIndex& parent = {}) const override;
    QVariant data(const QModelIndex& index, int role) const override;
    QHash<int, QByteArray> roleNames() const override;

    const Groups& groups() const { return groups_; }
    /// A display type given twice counts once.
    void setGroups(const Groups& groups);
    /// The names changed with the language.
    void updateNames();

 private:
    Groups groups_;
};
