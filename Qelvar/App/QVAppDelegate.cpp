#include "Qelvar/App/QVAppDelegate.h"

#include "Platform/Localization.h"
#include "Platform/SystemEvents.h"
#include "Qelvar/Controllers/QVPlaceholderViewController.h"
#include "Qelvar/Controllers/QVUserActivityManager.h"
#include "Qelvar/HealthData/QVDataCategoryDetailViewController.h"
#include "Qelvar/HealthData/QVDataUnitGroupDetailViewController.h"
#include "Qelvar/HealthData/QVHealthDataViewController.h"
#include "Vessa/Base/VSLog.h"

namespace {

constexpr const char* kDemoDataSex = "DemoDataSex";

std::string demoDataSexDefault() {
    const auto value = platform::UserDefaults::standard().value(kDemoDataSex);
    return value && value->string() ? *value->string() : std::string();
}

std::optional<int> indexOfTab(const QString& tab) {
    const char* const tabs[] = {QVUserActivityTab::Dashboard, QVUserActivityTab::HealthData,
                                QVUserActivityTab::Sources, QVUserActivityTab::MedicalID};
    for (int index = 0; index < 4; ++index)
        if (tab == QLatin1String(tabs[index])) return index;
    return std::nullopt;
}

/// The screen of a tab whose rooms are not built yet.
std::unique_ptr<platform::NavigationStack> placeholderStack(const char* stackIdentifier, const char* titleKey,
                                                            const char* icon, const char* messageKey,
                                                            const char* tab) {
    auto screen = std::make_unique<QVPlaceholderViewController>(
        [titleKey] { return platform::localized(titleKey); }, QString::fromLatin1(icon), messageKey);
    screen->setIconIsGlyph(true);
    screen->setActivityFactory(
        [titleKey, tab] { return QVUserActivityManager::activity(platform::localized(titleKey), {}, tab); });
    return std::make_unique<platform::NavigationStack>(QString::fromLatin1(stackIdentifier),
                                                       std::move(screen));
}

}  // namespace

QVAppDelegate::QVAppDelegate(std::shared_ptr<VSHealthStore> healthStore, std::filesystem::path stateFile,
                             bool medicalIDIsSupported)
    : healthStore_(std::move(healthStore)),
      medicalIDIsSupported_(medicalIDIsSupported),
      stateRestoration_(std::move(stateFile)) {}

QVAppDelegate::~QVAppDelegate() = default;

void QVAppDelegate::willFinishLaunching() {
    controllerManager_ = std::make_shared<QVControllerManager>(healthStore_, &QVDemoDataHead);
    importController_ = std::make_unique<QVImportController>(healthStore_);
    exportController_ = std::make_unique<QVExportController>(controllerManager_);
    quitController_ = std::make_unique<QVQuitController>(
        std::vector<QVTransferController*>{importController_.get(), exportController_.get()});

    std::vector<QVTabBarController::Tab> tabs;
    tabs.push_back(
        {"DASHBOARD", QStringLiteral("dashboard"), QStringLiteral("dashboard_selected"), dashboardStack()});
    tabs.push_back({"HEALTH_DATA", QStringLiteral("healthdata"), QStringLiteral("healthdata_selected"),
                    healthDataStack(), true});
    tabs.push_back(
        {"SOURCES", QStringLiteral("sources"), QStringLiteral("sources_selected"), sourcesStack()});
    if (medicalIDIsSupported_) {
        tabs.push_back({"MEDICAL_ID", QStringLiteral("medical_ID"), QStringLiteral("medical_ID_selected"),
                        medicalIDStack()});
        medicalIDNavigationStack_ = tabs.back().stack.get();
    }
    tabBarController_ = std::make_unique<QVTabBarController>(std::move(tabs));
    tabBarController_->setShouldSelect([this](int index) { return shouldSelectTab(index); });
    connect(&platform::SystemEvents::shared(), &platform::SystemEvents::localeDidChange, this, [this] {
        tabBarController_->updateTitles();
        emit localeChanged();
    });
    restoreState();
}

void QVAppDelegate::restoreState() {
    stateRestoration_.objects().add(QVControllerManager::RestorationIdentifier, controllerManager_);
    stateRestoration_.setScreenFactory(QVDataCategoryDetailViewController::RestorationIdentifier(),
                                       &QVDataCategoryDetailViewController::fromRestorableState);
    stateRestoration_.setScreenFactory(QVDataUnitGroupDetailViewController::RestorationIdentifier(),
                                       &QVDataUnitGroupDetailViewController::fromRestorableState);
    const std::string tabBar = QVTabBarController::restorationIdentifier().toStdString();
    const auto& saved = stateRestoration_.savedState();
    const auto found = saved ? saved->find(tabBar) : VSValue::Dictionary::const_iterator();
    if (saved && found != saved->end() && found->second.dictionary())
        tabBarController_->decodeState(stateRestoration_, *found->second.dictionary());
    stateRestoration_.setState([this, tabBar] {
        return VSValue::Dictionary{{tabBar, tabBarController_->encodeState(stateRestoration_)}};
    });
    connect(tabBarController_.get(), &QVTabBarController::restorableStateChanged, &stateRestoration_,
            &platform::StateRestoration::stateDidChange);
}

void QVAppDelegate::didFinishLaunching() {
    tabBarController_->show();
}

std::unique_ptr<platform::NavigationStack> QVAppDelegate::dashboardStack() {
    auto detailScreen =
        [manager = controllerManager_](const VSDataUnitGroup* group) -> std::unique_ptr<platform::Screen> {
        return std::make_unique<QVDataUnitGroupDetailViewController>(group, manager);
    };
    auto screen = std::make_unique<QVDashboardViewController>(controllerManager_, detailScreen);
    dashboard_ = screen.get();
    connect(dashboard_, &QVDashboardViewController::importRequested, this, &QVAppDelegate::importRequested);
    return std::make_unique<platform::NavigationStack>(QStringLiteral("Dashboard Navigation Controller"),
                                                       std::move(screen));
}

std::unique_ptr<platform::NavigationStack> QVAppDelegate::healthDataStack() {
    auto screen = std::make_unique<QVHealthDataViewController>(controllerManager_);
    connect(screen.get(), &QVHealthDataViewController::importRequested, this,
            &QVAppDelegate::importRequested);
    connect(screen.get(), &QVHealthDataViewController::exportRequested, exportController_.get(),
            &QVExportController::verifyExport);
    return std::make_unique<platform::NavigationStack>(QStringLiteral("Health Data Navigation Controller"),
                                                       std::move(screen));
}

std::unique_ptr<platform::NavigationStack> QVAppDelegate::sourcesStack() {
    return placeholderStack("Sources Navigation Controller", "SOURCES", "sources_selected", "SOURCES_PENDING",
                            QVUserActivityTab::Sources);
}

std::unique_ptr<platform::NavigationStack> QVAppDelegate::medicalIDStack() {
    return placeholderStack("Medical ID Navigation Controller", "MEDICAL_ID", "medical_ID_selected",
                            "MEDICAL_ID_PENDING", QVUserActivityTab::MedicalID);
}

bool QVAppDelegate::shouldSelectTab(int index) const {
    // A second tap on the Medical ID would leave its editor half way.
    const bool isMedicalID =
        medicalIDNavigationStack_ && tabBarController_->stack(index) == medicalIDNavigationStack_;
    return !(isMedicalID && tabBarController_->selectedIndex() == index);
}

void QVAppDelegate::didBecomeActive() {
    controllerManager_->dashboardDataUnitGroupsController().loadAgainIfFailed();
    if (!QVUsesDemoData() || isResettingDemoData()) return;
    const std::string demoDataSex = demoDataSexDefault();
    if (!demoData_)
        demoData_ = std::make_unique<QVDemoData>(healthStore_, controllerManager_->unitController(),
                                                 [this] { dashboard_->reloadTable(); });
    // The document is long: it is read only when it is needed, and not by the main thread.
    if (!demoData_->isDue(demoDataSex)) return;
    loadingDemoData_ = true;
    if (!worker_) worker_ = platform::makeSerialQueue("demo data");
    worker_->async([this, demoDataSex, alive = std::weak_ptr<bool>(alive_)] {
        auto dictionary = QVDemoDataDictionary();
        platform::mainQueue().async([this, demoDataSex, alive, dictionary = std::move(dictionary)]() mutable {
            if (!alive.expired()) resetDemoData(std::move(dictionary), demoDataSex);
        });
    });
}

void QVAppDelegate::resetDemoData(VSResult<VSValue::Dictionary> dictionary, const std::string& demoDataSex) {
    loadingDemoData_ = false;
    if (dictionary)
        demoData_->resetDemoData(std::move(*dictionary), demoDataSex);
    else
        VSLog(VSLogLevel::Error, "The demonstration's records cannot be read: " + dictionary.error().message);
}

bool QVAppDelegate::continueUserActivity(const platform::UserActivity& activity) {
    if (activity.activityType != QLatin1String(QVUserActivityManager::TabActivityType)) return false;
    const QString tab = activity.userInfo.value(QString::fromLatin1(QVUserActivityKey::MainTab)).toString();
    if (const auto index = indexOfTab(tab)) tabBarController_->setSelectedIndex(*index);
    platform::NavigationStack* stack = tabBarController_->selectedStack();
    stack->popToRoot(false);
    stack->rootScreen()->restoreUserActivityState(activity);
    return true;
}

bool QVAppDelegate::openLink(const QString& link) {
    const auto activity = QVUserActivityManager::activityFromLink(link);
    return activity && continueUserActivity(*activity);
}

QColor QVAppDelegate::keyColor() const {
    return VSDataUnitGroupController::shared().keyColor();
}

bool QVAppDelegate::isRightToLeft() const {
    return platform::isRightToLeft();
}

QString QVAppDelegate::tabBarName() const {
    return platform::localized("TAB_BAR");
}
