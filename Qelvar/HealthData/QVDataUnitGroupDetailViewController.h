#pragma once

#include <memory>

#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Controllers/QVPlaceholderViewController.h"

/// The screen of a display type: whether the dashboard shows it. Its other rows are still to come. Main
/// thread only.
class QVDataUnitGroupDetailViewController : public QVPlaceholderViewController {
    Q_OBJECT
 public:
    static QString RestorationIdentifier() {
        return QStringLiteral("Data Unit Group Detail View Controller");
    }
    /// The screen of a saved state; null when its display type or what it was built on is no more.
    static std::unique_ptr<platform::Screen> fromRestorableState(const platform::RestorableState& state);

    QVDataUnitGroupDetailViewController(const VSDataUnitGroup* dataUnitGroup,
                                        std::shared_ptr<QVControllerManager> controllerManager);

    const VSDataUnitGroup* dataUnitGroup() const { return dataUnitGroup_; }

    QString restorationIdentifier() const override { return RestorationIdentifier(); }
    void encodeRestorableState(platform::RestorableState& state) const override;

 private:
    struct Observer;
    bool isOnDashboard() const;
    void setIsOnDashboard(bool isOnDashboard);

    const VSDataUnitGroup* const dataUnitGroup_;
    const std::shared_ptr<QVControllerManager> controllerManager_;
    const std::shared_ptr<Observer> observer_;
};
