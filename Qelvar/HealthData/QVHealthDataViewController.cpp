#include "Qelvar/HealthData/QVHealthDataViewController.h"

#include "Platform/Localization.h"
#include "Platform/NavigationStack.h"
#include "Platform/RestorableState.h"
#include "Platform/UserActivity.h"
#include "Qelvar/Controllers/QVUserActivityManager.h"
#include "Qelvar/HealthData/QVDataCategoryDetailViewController.h"

namespace {

constexpr const char* kShowsCalendarKey = "Health Data View Controller Calendar";

std::function<QString()> text(const char* key) {
    return [key] { return platform::localized(key); };
}

}  // namespace

QVHealthDataViewController::QVHealthDataViewController(std::shared_ptr<QVControllerManager> controllerManager)
    : QVPlaceholderViewController(text("HEALTH_DATA"), QStringLiteral("healthdata_selected"),
                                  "HEALTH_DATA_PENDING"),
      controllerManager_(std::move(controllerManager)) {
    setIconIsGlyph(true);
    setActivityFactory([this] {
        return QVUserActivityManager::activity(
            platform::localized(showsCalendar_ ? "HEALTH_DATA_CALENDAR" : "HEALTH_DATA_LIST"), {},
            QVUserActivityTab::HealthData, showsCalendar_);
    });
    updateContent();
}

void QVHealthDataViewController::updateContent() {
    if (showsCalendar_)
        return setContent("HEALTH_DATA_CALENDAR_PENDING",
                          {{text("LIST"), [this] { setShowsCalendar(false); }}});
    std::vector<Action> actions{{text("IMPORT_ACTION"), [this] { emit importRequested(); }},
                                {text("EXPORT_ACTION"), [this] { emit exportRequested(); }},
                                {text("CALENDAR"), [this] { setShowsCalendar(true); }}};
    for (const VSDataCategory& category : controllerManager_->dataCategoryController().allDataCategories())
        actions.push_back({[&category] { return category.displayName(); },
                           [this, id = category.categoryID()] { openCategory(id); }});
    setContent("HEALTH_DATA_PENDING", std::move(actions));
}

void QVHealthDataViewController::setShowsCalendar(bool showsCalendar) {
    if (showsCalendar == showsCalendar_) return;
    showsCalendar_ = showsCalendar;
    updateContent();
    updateActivity();
    emit restorableStateChanged();
}

void QVHealthDataViewController::openCategory(int categoryID, bool animated) {
    const VSDataCategory* category = controllerManager_->dataCategoryController().categoryWithID(categoryID);
    if (!category || !navigationStack()) return;
    navigationStack()->push(
        std::make_unique<QVDataCategoryDetailViewController>(category, controllerManager_), animated);
}

void QVHealthDataViewController::restoreUserActivityState(const platform::UserActivity& activity) {
    setShowsCalendar(activity.userInfo.value(QString::fromLatin1(QVUserActivityKey::Calendar)).toBool());
    const QVariant category = activity.userInfo.value(QString::fromLatin1(QVUserActivityKey::DataCategory));
    if (showsCalendar_ || !category.isValid() || !navigationStack()) return;
    openCategory(category.toInt(), false);
    platform::Screen* top = navigationStack()->topScreen();
    if (top != this) top->restoreUserActivityState(activity);
}

void QVHealthDataViewController::encodeRestorableState(platform::RestorableState& state) const {
    state.setObject(QVControllerManager::RestorationIdentifier, controllerManager_.get());
    state.set(kShowsCalendarKey, showsCalendar_ ? 1 : 0);
}

void QVHealthDataViewController::decodeRestorableState(const platform::RestorableState& state) {
    setShowsCalendar(state.integer(kShowsCalendarKey) == 1);
}
