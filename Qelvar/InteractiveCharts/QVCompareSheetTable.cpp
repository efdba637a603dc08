#include "Qelvar/InteractiveCharts/QVCompareSheetTable.h"

#include <algorithm>

QVCompareSheetTable::QVCompareSheetTable(const Groups& selected, const Groups& all,
                                         const VSDataCategoryController& categories)
    : categories_(categories) {
    for (const VSDataUnitGroup* group : all) {
        const auto isGroup = [group](const SelectionStatus& status) { return status.dataUnitGroup == group; };
        if (std::any_of(statuses_.begin(), statuses_.end(), isGroup)) continue;
        const bool ticked = std::find(selected.begin(), selected.end(), group) != selected.end();
        statuses_.push_back({group, ticked});
        selectedCount_ += ticked;
    }
}

int QVCompareSheetTable::rowCount(const QModelIndex& parent) const {
    return parent.isValid() ? 0 : static_cast<int>(statuses_.size());
}

QVariant QVCompareSheetTable::data(const QModelIndex& index, int role) const {
    if (!checkIndex(index, CheckIndexOption::IndexIsValid | CheckIndexOption::ParentIsInvalid)) return {};
    const SelectionStatus& status = statuses_[static_cast<size_t>(index.row())];
    switch (role) {
        case Qt::DisplayRole:
        case DisplayNameRole:
            return status.dataUnitGroup->displayName();
        case Qt::CheckStateRole:
            return status.selected ? Qt::Checked : Qt::Unchecked;
        case SelectedRole:
            return status.selected;
        case CanToggleRole:
            return canToggle(status);
        case CategoryIconRole: {
            const auto* category = categories_.categoryWithID(status.dataUnitGroup->categoryID());
            return category ? category->listIcon() : QString();
        }
        default:
            return {};
    }
}

QHash<int, QByteArray> QVCompareSheetTable::roleNames() const {
    return {{DisplayNameRole, "displayName"},
            {SelectedRole, "selected"},
            {CanToggleRole, "canToggle"},
            {CategoryIconRole, "categoryIcon"}};
}

QVCompareSheetTable::Groups QVCompareSheetTable::selectedGroups() const {
    Groups groups;
    for (const SelectionStatus& status : statuses_)
        if (status.selected) groups.push_back(status.dataUnitGroup);
    return groups;
}

bool QVCompareSheetTable::isAllSelected() const {
    // More than the limit are ticked when so many were handed in.
    return selectedCount_ >= std::min(rowCount(), kLimit);
}

bool QVCompareSheetTable::toggle(int row) {
    if (row < 0 || row >= rowCount()) return false;
    SelectionStatus& status = statuses_[static_cast<size_t>(row)];
    if (!canToggle(status)) return false;
    const bool wasFull = selectedCount_ >= kLimit;
    status.selected = !status.selected;
    selectedCount_ += status.selected ? 1 : -1;
    tell(row, row, wasFull != (selectedCount_ >= kLimit));
    return true;
}

void QVCompareSheetTable::setAllSelected(bool selected) {
    if (statuses_.empty()) return;
    for (SelectionStatus& status : statuses_) {
        if (status.selected == selected || (selected && selectedCount_ >= kLimit)) continue;
        status.selected = selected;
        selectedCount_ += selected ? 1 : -1;
    }
    tell(0, rowCount() - 1, true);
}

void QVCompareSheetTable::updateNames() {
    if (!statuses_.empty())
        emit dataChanged(index(0), index(rowCount() - 1), {Qt::DisplayRole, DisplayNameRole});
}

void QVCompareSheetTable::tell(int firstRow, int lastRow, bool limitCrossed) {
    emit dataChanged(index(firstRow), index(lastRow), {Qt::CheckStateRole, SelectedRole, CanToggleRole});
    if (limitCrossed) emit dataChanged(index(0), index(rowCount() - 1), {CanToggleRole});
}
