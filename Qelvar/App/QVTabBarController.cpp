#include "Qelvar/App/QVTabBarController.h"

#include <cassert>

#include "Platform/Localization.h"

namespace {

// In saved states; never changed.
constexpr const char* kSelectedStackKey = "Selected Stack";
constexpr const char* kStacksKey = "Stacks";

}  // namespace

QVTabBarController::QVTabBarController(std::vector<Tab> tabs) : tabs_(std::move(tabs)) {
    assert(!tabs_.empty());
    for (const Tab& tab : tabs_)
        connect(tab.stack.get(), &platform::NavigationStack::restorableStateChanged, this,
                &QVTabBarController::restorableStateChanged);
    connect(this, &QVTabBarController::selectedIndexChanged, this,
            &QVTabBarController::restorableStateChanged);
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
        case ShowsTransfersRole:
            return tab.showsTransfers;
        default:
            return {};
    }
}

QHash<int, QByteArray> QVTabBarController::roleNames() const {
    return {{TitleRole, "title"},
            {ImageRole, "image"},
            {SelectedImageRole, "selectedImage"},
            {StackRole, "stack"},
            {ShowsTransfersRole, "showsTransfers"}};
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

// Tabs go by the names of their stacks: another device may not have all of them.
VSValue::Dictionary QVTabBarController::encodeState(const platform::StateRestoration& restoration) const {
    VSValue::Dictionary stacks;
    for (const Tab& tab : tabs_)
        stacks[tab.stack->restorationIdentifier().toStdString()] = restoration.encodeStack(*tab.stack);
    return {{kSelectedStackKey, selectedStack()->restorationIdentifier().toStdString()},
            {kStacksKey, std::move(stacks)}};
}

void QVTabBarController::decodeState(const platform::StateRestoration& restoration,
                                     const VSValue::Dictionary& state) {
    assert(!shown_);
    const VSValue values(state);
    const VSValue* stacks = values[kStacksKey];
    const VSValue* selected = values[kSelectedStackKey];
    for (int index = 0; index < count(); ++index) {
        const std::string name = stack(index)->restorationIdentifier().toStdString();
        const VSValue* screens = stacks ? (*stacks)[name] : nullptr;
        if (screens && screens->array()) restoration.decodeStack(*stack(index), *screens->array());
        if (selected && selected->string() && *selected->string() == name) setSelectedIndex(index);
    }
}
