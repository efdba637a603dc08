#pragma once

#include <memory>

#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Controllers/QVPlaceholderViewController.h"

/// The display types of a category, each opening its own screen. Main thread only.
class QVDataCategoryDetailViewController : public QVPlaceholderViewController {
    Q_OBJECT
 public:
    static QString RestorationIdentifier() { return QStringLiteral("Data Category Detail View Controller"); }
    /// The screen of a saved state; null when its category or what it was built on is no more.
    static std::unique_ptr<platform::Screen> fromRestorableState(const platform::RestorableState& state);

    QVDataCategoryDetailViewController(const VSDataCategory* category,
                                       std::shared_ptr<QVControllerManager> controllerManager);

    const VSDataCategory* category() const { return category_; }
    const std::vector<const VSDataUnitGroup*>& dataUnitGroups() const { return dataUnitGroups_; }
    /// Opens the row's display type.
    void selectRow(size_t row, bool animated = true);

    /// Opens the display type that the activity names, when it is one of these.
    void restoreUserActivityState(const platform::UserActivity& activity) override;
    QString restorationIdentifier() const override { return RestorationIdentifier(); }
    void encodeRestorableState(platform::RestorableState& state) const override;

 private:
    const VSDataCategory* const category_;
    const std::shared_ptr<QVControllerManager> controllerManager_;
    const std::vector<const VSDataUnitGroup*> dataUnitGroups_;
};
