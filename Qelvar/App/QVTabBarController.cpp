#include "Qelvar/App/QVTabBarController.h"

#include <cassert>

#include "Platform/Localization.h"

QVTabBarController::QVTabBarController(std::vector<Tab> tabs) : tabs_(std::move(tabs)) {
    assert(!tabs_.empty());
}

int QVTabBarController::rowCount(const QModelIndex& parent) const {
    return parent.isValid() ? 0 : count();
}

QVariant QVTabBarController::data(const QModelIndex& index, int role) const {
    if (!checkIndex(index, CheckIndexOption::IndexIsValid | CheckIndexOption::ParentIsInvalid)) return {};
    const Tab& tab = tabs_[static_cast<size_t>(index.row())];
    switch (role) {
        case Qt::DisplayRole:
        case TitleRole:
            return platform::localized(tab.titleKey);
        case ImageRole:
            return tab.image;
        case SelectedImageRole:
            return tab.selectedImage;
        case StackRole:
            return QVariant::fromValue(tab.stack.get());
        default:
            return {};
    }
}

QHash<int, QByteArray> QVTabBarController::roleNames() const {
    return {{TitleRole, "title"},
            {ImageRole, "image"},
            {SelectedImageRole, "selectedImage"},
            {StackRole, "stack"}};
}

void QVTabBarController::setSelectedIndex(int index) {
    if (index < 0 || index >= count() || index == selectedIndex_) return;
    if (shown_) selectedStack()->setVisible(false);
    selectedIndex_ = index;
    if (shown_) selectedStack()->setVisible(true);
    emit selectedIndexChanged();
}

void QVTabBarController::tap(int index) {
    if (index < 0 || index >= count() || (shouldSelect_ && !shouldSelect_(index))) return;
    if (index == selectedIndex_) return selectedStack()->popToRoot();
    setSelectedIndex(index);
}

void QVTabBarController::show() {
    shown_ = true;
    selectedStack()->setVisible(true);
}

void QVTabBarController::updateTitles() {
    emit dataChanged(index(0), index(count() - 1));
}
