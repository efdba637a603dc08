#pragma once

#include <memory>

#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Controllers/QVPlaceholderViewController.h"

/// The root of the Health Data tab: the list of categories, or the calendar of the user's days. For now the
/// list is plain and the calendar is to come. Main thread only.
class QVHealthDataViewController : public QVPlaceholderViewController {
    Q_OBJECT
 public:
    explicit QVHealthDataViewController(std::shared_ptr<QVControllerManager> controllerManager);

    bool showsCalendar() const { return showsCalendar_; }
    /// Shows the calendar or the list; the record of what is shown becomes that of the screen.
    void setShowsCalendar(bool showsCalendar);
    /// Opens the category; nothing happens when there is none of that ID.
    void openCategory(int categoryID, bool animated = true);

    /// Shows the calendar or the list as the activity says; in the list opens its category, and hands the
    /// activity on to it.
    void restoreUserActivityState(const platform::UserActivity& activity) override;
    QString restorationIdentifier() const override { return QStringLiteral("Health Data View Controller"); }
    void encodeRestorableState(platform::RestorableState& state) const override;
    void decodeRestorableState(const platform::RestorableState& state) override;

 signals:
    /// The user wants to choose a file to import.
    void importRequested();
    /// The user wants to export all records.
    void exportRequested();

 private:
    void updateContent();
    const std::shared_ptr<QVControllerManager> controllerManager_;
    bool showsCalendar_ = false;
};
