#pragma once

#include <QColor>
#include <QObject>
#include <filesystem>
#include <memory>

#include "Platform/StateRestoration.h"
#include "Platform/UserActivity.h"
#include "Qelvar/App/QVDemoData.h"
#include "Qelvar/App/QVExportController.h"
#include "Qelvar/App/QVImportController.h"
#include "Qelvar/App/QVQuitController.h"
#include "Qelvar/App/QVTabBarController.h"
#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Dashboard/QVDashboardViewController.h"

/// The application: builds the controllers, the tabs and their screens at launch, rebuilds the
/// demonstration's records, and brings the user to where a link leads. The window's root item gets it as its
/// property `app`. Main thread only.
class QVAppDelegate : public QObject {
    Q_OBJECT
    Q_PROPERTY(QVTabBarController* tabBarController READ tabBarController CONSTANT)
    Q_PROPERTY(QVImportController* importController READ importController CONSTANT)
    Q_PROPERTY(QVExportController* exportController READ exportController CONSTANT)
    Q_PROPERTY(QVQuitController* quitController READ quitController CONSTANT)
    Q_PROPERTY(QColor keyColor READ keyColor CONSTANT)
    Q_PROPERTY(bool rightToLeft READ isRightToLeft NOTIFY localeChanged)
    Q_PROPERTY(QString tabBarName READ tabBarName NOTIFY localeChanged)
 public:
    /// `stateFile` keeps what the user was at for the next session; empty: nothing is kept.
    /// `medicalIDIsSupported`: whether this device can show a Medical ID; without it there is no such tab.
    explicit QVAppDelegate(std::shared_ptr<VSHealthStore> healthStore, std::filesystem::path stateFile = {},
                           bool medicalIDIsSupported = true);
    ~QVAppDelegate() override;

    /// Builds everything but the window, as the session before left it. Once. A link that the application is
    /// started with is opened after this.
    void willFinishLaunching();
    /// The tabs are on the display from now on.
    void didFinishLaunching();
    /// The window is out of sight: saves what the user is at.
    void didEnterBackground() { stateRestoration_.save(); }
    /// The same, and waits until it is written.
    void willTerminate() { stateRestoration_.finish(); }
    /// Rebuilds the demonstration's records when demo data is in use and it is due.
    void didBecomeActive();
    bool isResettingDemoData() const { return loadingDemoData_ || (demoData_ && demoData_->isResetting()); }
    /// Brings the user to the tab that the activity names, and its root to the activity's state. False, and
    /// nothing happens, when the activity is of another type. A tab that does not exist leaves the selection
    /// as it is.
    bool continueUserActivity(const platform::UserActivity& activity);
    /// The same for a link ("qelvar://HealthDataTab"); false when it is no link of the application.
    bool openLink(const QString& link);

    const std::shared_ptr<QVControllerManager>& controllerManager() const { return controllerManager_; }
    QVDashboardViewController* dashboard() const { return dashboard_; }
    QVTabBarController* tabBarController() const { return tabBarController_.get(); }
    QVImportController* importController() const { return importController_.get(); }
    QVExportController* exportController() const { return exportController_.get(); }
    QVQuitController* quitController() const { return quitController_.get(); }
    QColor keyColor() const;
    bool isRightToLeft() const;
    /// What a screen reader calls the row of tabs.
    QString tabBarName() const;

 signals:
    void localeChanged();
    /// The user wants to choose a file to import.
    void importRequested();

 private:
    std::unique_ptr<platform::NavigationStack> dashboardStack();
    std::unique_ptr<platform::NavigationStack> healthDataStack();
    std::unique_ptr<platform::NavigationStack> sourcesStack();
    std::unique_ptr<platform::NavigationStack> medicalIDStack();
    void restoreState();
    bool shouldSelectTab(int index) const;
    void resetDemoData(VSResult<VSValue::Dictionary> dictionary, const std::string& demoDataSex);

    const std::shared_ptr<VSHealthStore> healthStore_;
    const bool medicalIDIsSupported_;
    platform::StateRestoration stateRestoration_;
    std::shared_ptr<QVControllerManager> controllerManager_;
    std::unique_ptr<QVDemoData> demoData_;
    bool loadingDemoData_ = false;
    std::unique_ptr<QVImportController> importController_;
    std::unique_ptr<QVExportController> exportController_;
    std::unique_ptr<QVQuitController> quitController_;
    std::unique_ptr<QVTabBarController> tabBarController_;
    QVDashboardViewController* dashboard_ = nullptr;                 // in the first tab's stack
    platform::NavigationStack* medicalIDNavigationStack_ = nullptr;  // null: there is no such tab
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
    std::shared_ptr<platform::Queue> worker_;  // reads the demonstration's document
};
