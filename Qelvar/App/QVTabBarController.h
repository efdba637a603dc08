#pragma once

#include <QAbstractListModel>
#include <functional>
#include <memory>
#include <vector>

#include "Platform/NavigationStack.h"
#include "Platform/StateRestoration.h"

/// The container of the application's tabs: each a navigation stack under a title and an image. Main thread
/// only.
class QVTabBarController : public QAbstractListModel {
    Q_OBJECT
    Q_PROPERTY(int selectedIndex READ selectedIndex NOTIFY selectedIndexChanged)
    Q_PROPERTY(platform::NavigationStack* selectedStack READ selectedStack NOTIFY selectedIndexChanged)
 public:
    enum Role { TitleRole = Qt::UserRole + 1, ImageRole, SelectedImageRole, StackRole, ShowsTransfersRole };
    struct Tab {
        const char* titleKey;
        QString image, selectedImage;
        std::unique_ptr<platform::NavigationStack> stack;
        bool showsTransfers = false;  // imports and exports are begun here, and told here
    };
    static QString restorationIdentifier() { return QStringLiteral("Tab Bar Controller"); }

    /// The first tab is selected. REQUIRES: at least one.
    explicit QVTabBarController(std::vector<Tab> tabs);

    /// Asked before a tab that the user taps is selected; tabs are selected without it too.
    void setShouldSelect(std::function<bool(int index)> shouldSelect) {
        shouldSelect_ = std::move(shouldSelect);
    }

    int rowCount(const QModelIndex& parent = {}) const override;
    QVariant data(const QModelIndex& index, int role) const override;
    QHash<int, QByteArray> roleNames() const override;

    int count() const { return static_cast<int>(tabs_.size()); }
    platform::NavigationStack* stack(int index) const {
        return tabs_.at(static_cast<size_t>(index)).stack.get();
    }
    int selectedIndex() const { return selectedIndex_; }
    platform::NavigationStack* selectedStack() const { return stack(selectedIndex_); }
    /// Nothing happens for an index without a tab.
    void setSelectedIndex(int index);
    /// The user tapped a tab: it is selected unless refused; the one that is selected already returns to its
    /// root.
    Q_INVOKABLE void tap(int index);
    /// The tabs are on the display from now on: the screen of the selected one appears.
    void show();
    /// The user's language changed.
    void updateTitles();

    /// The selected tab, and what is in each.
    VSValue::Dictionary encodeState(const platform::StateRestoration& restoration) const;
    /// REQUIRES: not shown yet, and every stack has only its root.
    void decodeState(const platform::StateRestoration& restoration, const VSValue::Dictionary& state);

 signals:
    void selectedIndexChanged();
    /// What encodeState() gives may be another than before.
    void restorableStateChanged();

 private:
    const std::vector<Tab> tabs_;
    std::function<bool(int)> shouldSelect_;
    int selectedIndex_ = 0;
    bool shown_ = false;
};
