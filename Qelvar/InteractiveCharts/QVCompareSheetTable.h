#pragma once

#include <QAbstractListModel>
#include <vector>

#include "VessaUI/VSDataCategory.h"
#include "VessaUI/VSDataUnitGroup.h"

/// The rows of the compare sheet: the display types that are offered, each with its tick. Holds the limit.
/// Main thread only.
class QVCompareSheetTable : public QAbstractListModel {
    Q_OBJECT
 public:
    enum Role { DisplayNameRole = Qt::UserRole + 1, SelectedRole, CanToggleRole, CategoryIconRole };
    using Groups = std::vector<const VSDataUnitGroup*>;
    struct SelectionStatus {
        const VSDataUnitGroup* dataUnitGroup;
        bool selected;
    };
    /// So many can be ticked.
    static constexpr int kLimit = 20;

    /// One row for each display type of `all`, in that order; one given twice counts once.
    QVCompareSheetTable(const Groups& selected, const Groups& all,
                        const VSDataCategoryController& categories);

    int rowCount(const QModelIndex& parent = {}) const override;
    QVariant data(const QModelIndex& index, int role) const override;
    QHash<int, QByteArray> roleNames() const override;

    const std::vector<SelectionStatus>& selectionStatuses() const { return statuses_; }
    int selectedCount() const { return selectedCount_; }
    /// The display types of the ticked rows, in the order of the list.
    Groups selectedGroups() const;
    /// All rows that can be ticked are.
    bool isAllSelected() const;

    /// Ticks or unticks a row. False: the row stays as it is, since there is none of that number, or the
    /// limit is reached.
    bool toggle(int row);
    /// Ticks rows in the order of the list until the limit is reached, or unticks all.
    void setAllSelected(bool selected);
    /// The names changed with the language.
    void updateNames();

 private:
    bool canToggle(const SelectionStatus& status) const { return status.selected || selectedCount_ < kLimit; }
    void tell(int firstRow, int lastRow, bool limitCrossed);
    const VSDataCategoryController& categories_;
    std::vector<SelectionStatus> statuses_;
    int selectedCount_ = 0;
};
