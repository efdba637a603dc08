#include "Qelvar/Dashboard/QVDashboardTable.h"

#include <algorithm>

int QVDashboardTable::rowCount(const QModelIndex& parent) const {
    return parent.isValid() ? 0 : static_cast<int>(groups_.size());
}

QVariant QVDashboardTable::data(const QModelIndex& index, int role) const {
    if (!checkIndex(index, CheckIndexOption::IndexIsValid | CheckIndexOption::ParentIsInvalid)) return {};
    const VSDataUnitGroup* group = groups_[static_cast<size_t>(index.row())];
    switch (role) {
        case Qt::DisplayRole:
        case DisplayNameRole:
            return group->displayName();
        case GroupIDRole:
            return group->dataUnitGroupID();
        default:
            return {};
    }
}

QHash<int, QByteArray> QVDashboardTable::roleNames() const {
    return {{DisplayNameRole, "displayName"}, {GroupIDRole, "groupID"}};
}

void QVDashboardTable::setGroups(const Groups& groups) {
    Groups wanted;
    for (const VSDataUnitGroup* group : groups)
        if (std::find(wanted.begin(), wanted.end(), group) == wanted.end()) wanted.push_back(group);

    for (int row = static_cast<int>(groups_.size()) - 1; row >= 0; --row) {
        if (std::find(wanted.begin(), wanted.end(), groups_[static_cast<size_t>(row)]) != wanted.end())
            continue;
        beginRemoveRows({}, row, row);
        groups_.erase(groups_.begin() + row);
        endRemoveRows();
    }
    for (int row = 0; row < static_cast<int>(wanted.size()); ++row) {
        const VSDataUnitGroup* group = wanted[static_cast<size_t>(row)];
        const auto found = std::find(groups_.begin() + row, groups_.end(), group);
        if (found == groups_.end()) {
            beginInsertRows({}, row, row);
            groups_.insert(groups_.begin() + row, group);
            endInsertRows();
        } else if (const int from = static_cast<int>(found - groups_.begin()); from != row) {
            beginMoveRows({}, from, from, {}, row);
            std::rotate(groups_.begin() + row, found, found + 1);
            endMoveRows();
        }
    }
}

void QVDashboardTable::updateNames() {
    if (!groups_.empty()) emit dataChanged(index(0), index(rowCount() - 1));
}
