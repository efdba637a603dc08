#include "Qelvar/DataProviders/QVDashboardDataUnitGroupsController.h"

#include <algorithm>
#include <utility>

#include "Platform/MotionHardware.h"
#include "Platform/PairedDevices.h"
#include "Platform/Queue.h"
#include "Platform/UserDefaults.h"
#include "Vessa/Base/VSLog.h"

namespace {

using Groups = QVDashboardDataUnitGroupsController::Groups;

// Names of settings on disk: never change.
constexpr const char* dashboardKey = "QVUserSettingsActiveUnitGroupsForDashboardKey";
constexpr const char* selectionKey = "selectedLandscapeGroups";
constexpr const char* autoAddedKey = "AutoAddedDataUnitGroupIDs";
constexpr const char* useDemoDataKey = "UseDemoData";
constexpr const char* demoDashboardKey = "dashboardDataUnitGroups";

/// A paired watch brings these, in this order.
constexpr int watchGroupIDs[] = {VSGroupID::ActiveEnergy, VSGroupID::HeartRate};
constexpr size_t defaultSelectionSize = 3;

template <typename T>
bool contains(const std::vector<T>& values, const T& value) {
    return std::find(values.begin(), values.end(), value) != values.end();
}

std::vector<int> integers(const VSValue& value) {
    std::vector<int> result;
    if (const auto* array = value.array())
        for (const VSValue& entry : *array)
            if (const auto number = entry.integer()) result.push_back(static_cast<int>(*number));
    return result;
}

VSValue::Array arrayOf(const std::vector<int>& ids) {
    return VSValue::Array(ids.begin(), ids.end());
}

std::vector<int> idsOf(const Groups& groups) {
    std::vector<int> ids;
    for (const VSDataUnitGroup* group : groups) ids.push_back(group->dataUnitGroupID());
    return ids;
}

/// The IDs under the key inside the dictionary that is stored under the same key; none when never stored.
std::optional<std::vector<int>> storedIDs(const VSResult<std::optional<VSValue>>& answer, const char* key) {
    if (!answer || !*answer) return std::nullopt;
    const VSValue* entry = (**answer)[key];
    if (!entry || !entry->array()) return std::nullopt;
    return integers(*entry);
}

Groups withoutRepetition(const Groups& groups) {
    Groups result;
    for (const VSDataUnitGroup* group : groups)
        if (!contains(result, group)) result.push_back(group);
    return result;
}

/// Those of `groups` that `others` holds too.
Groups sharedWith(const Groups& others, const Groups& groups) {
    Groups result;
    for (const VSDataUnitGroup* group : groups)
        if (contains(others, group)) result.push_back(group);
    return result;
}

/// `list` after what made `after` of `before`: what was removed is gone, what was moved stands in its new
/// order in the places that these had, and what was added stands at the end. What `before` never held stays.
Groups withChange(const Groups& list, const Groups& before, const Groups& after) {
    Groups result = withoutRepetition(list);
    std::erase_if(result, [&](const VSDataUnitGroup* group) {
        return contains(before, group) && !contains(after, group);
    });
    if (sharedWith(after, before) != sharedWith(before, after)) {
        const Groups ordered = sharedWith(result, withoutRepetition(after));
        auto next = ordered.begin();
        for (const VSDataUnitGroup*& group : result)
            if (contains(ordered, group)) group = *next++;
    }
    for (const VSDataUnitGroup* group : after)
        if (!contains(before, group) && !contains(result, group)) result.push_back(group);
    return result;
}

const VSObjectType* typeForDemoIdentifier(const std::string& identifier) {
    if (const auto* type = VSObjectType::quantityTypeForIdentifier(identifier)) return type;
    if (const auto* type = VSObjectType::categoryTypeForIdentifier(identifier)) return type;
    if (const auto* type = VSObjectType::characteristicTypeForIdentifier(identifier)) return type;
    if (const auto* type = VSObjectType::correlationTypeForIdentifier(identifier)) return type;
    return identifier == VSWorkoutTypeIdentifier ? VSObjectType::workoutType() : nullptr;
}

}  // namespace

QVDashboardDataUnitGroupsController::QVDashboardDataUnitGroupsController(
    const VSDataUnitGroupController& dataUnitGroupController, DemoDataLoader demoDataLoader,
    QVUserDefaults& userDefaults)
    : catalogue_(dataUnitGroupController),
      demoDataLoader_(std::move(demoDataLoader)),
      userDefaults_(userDefaults) {
    if (platform::UserDefaults::standard().boolean(useDemoDataKey)) {
        loadDemoSelection();
        return;
    }
    load();
    pairing_ = QObject::connect(&platform::PairedDevices::shared(), &platform::PairedDevices::deviceDidPair,
                                [this] { addGroupsForPairedWatch(); });
}

QVDashboardDataUnitGroupsController::~QVDashboardDataUnitGroupsController() {
    QObject::disconnect(pairing_);
}

// Loading

void QVDashboardDataUnitGroupsController::load() {
    if (std::exchange(isReading_, true)) return;
    userDefaults_.valueForKey(dashboardKey, [this, alive = std::weak_ptr<bool>(alive_)](const auto& answer) {
        platform::mainQueue().async(
            [this, alive, ids = storedIDs(answer, dashboardKey), wasRead = answer.ok()] {
                if (!alive.expired()) dashboardRead(ids, wasRead);
            });
    });
}

void QVDashboardDataUnitGroupsController::loadAgainIfFailed() {
    if (loadState_ == LoadState::Failed)
        load();
    else if (selectionState_ == LoadState::Failed)
        loadSelection();
}

void QVDashboardDataUnitGroupsController::dashboardRead(const std::optional<std::vector<int>>& storedIDs,
                                                        bool wasRead) {
    isReading_ = false;
    if (loadState_ == LoadState::Loaded) return loadSelection();  // set by the user, while it was being read
    if (!wasRead) return dashboardCouldNotBeRead();
    const bool wasFailed = std::exchange(loadState_, LoadState::Loaded) == LoadState::Failed;
    const Groups read = groupsWithIDs(storedIDs ? *storedIDs : hardwareDefaultIDs());
    const bool wasChanged = wasFailed && *dashboard_ != standIn_;
    dashboard_ = wasChanged ? withChange(read, standIn_, *dashboard_) : read;
    if (wasChanged) persistDashboard();
    if (platform::PairedDevices::shared().hasActivePairedDevice()) addGroupsForPairedWatch();
    tellObservers();
    for (const auto& change : std::exchange(afterLoading_, {})) change();
    // Only now, so that the default selection sees the dashboard that it is taken from.
    loadSelection();
}

void QVDashboardDataUnitGroupsController::dashboardCouldNotBeRead() {
    if (loadState_ == LoadState::Failed) {
        if (*dashboard_ != standIn_) VSLog(VSLogLevel::Error, "Error saving user defaults");
        return;
    }
    loadState_ = LoadState::Failed;
    standIn_ = groupsWithIDs(hardwareDefaultIDs());
    dashboard_ = standIn_;
    tellObservers();
    for (const auto& change : std::exchange(afterLoading_, {})) change();
    loadSelection();
}

void QVDashboardDataUnitGroupsController::loadSelection() {
    userDefaults_.valueForKey(selectionKey, [this, alive = std::weak_ptr<bool>(alive_)](const auto& answer) {
        platform::mainQueue().async(
            [this, alive, ids = storedIDs(answer, selectionKey), wasRead = answer.ok()] {
                if (!alive.expired()) selectionRead(ids, wasRead);
            });
    });
}

void QVDashboardDataUnitGroupsController::selectionRead(const std::optional<std::vector<int>>& storedIDs,
                                                        bool wasRead) {
    if (selectionState_ == LoadState::Loaded) return;  // by the user, while it was being read
    // What could not be read may be there all the same, and is the user's.
    const bool isKnown = wasRead && (storedIDs || loadState_ == LoadState::Loaded);
    selectionState_ = isKnown ? LoadState::Loaded : LoadState::Failed;
    selected_ = storedIDs ? withoutRepetition(groupsWithIDs(*storedIDs)) : firstThreeOfDashboard();
    if (!isKnown) return;
    if (!storedIDs && !selected_.empty()) persistSelection();
    if (std::exchange(dropUnshownWhenRead_, false)) dropUnshownFromSelection();
}

std::vector<int> QVDashboardDataUnitGroupsController::hardwareDefaultIDs() {
    const auto hardware = platform::MotionHardware::current();
    std::vector<int> ids;
    if (hardware->canCountSteps()) ids.push_back(VSGroupID::Steps);
    if (hardware->canMeasureDistance()) ids.push_back(VSGroupID::WalkingRunningDistance);
    if (hardware->canCountFloors()) ids.push_back(VSGroupID::FlightsClimbed);
    return ids;
}

QVDashboardDataUnitGroupsController::Groups QVDashboardDataUnitGroupsController::groupsWithIDs(
    const std::vector<int>& ids) const {
    Groups groups;
    for (const int id : ids)
        if (const VSDataUnitGroup* group = catalogue_.dataUnitGroupWithID(id)) groups.push_back(group);
    return groups;
}

QVDashboardDataUnitGroupsController::Groups QVDashboardDataUnitGroupsController::firstThreeOfDashboard()
    const {
    Groups groups = withoutRepetition(dataUnitGroupsForDashboard());
    if (groups.size() > defaultSelectionSize) groups.resize(defaultSelectionSize);
    return groups;
}

void QVDashboardDataUnitGroupsController::loadDemoSelection() {
    Groups groups;
    const auto document = demoDataLoader_ ? demoDataLoader_() : std::nullopt;
    const auto entry = document ? document->find(demoDashboardKey) : VSValue::Dictionary::const_iterator();
    if (document && entry != document->end() && entry->second.array()) {
        for (const VSValue& identifier : *entry->second.array()) {
            const auto* type = identifier.string() ? typeForDemoIdentifier(*identifier.string()) : nullptr;
            const VSDataUnitGroup* group = type ? catalogue_.dataUnitGroupForType(type) : nullptr;
            if (group && !contains(groups, group)) groups.push_back(group);
        }
    }
    dashboard_ = std::move(groups);
    loadState_ = selectionState_ = LoadState::Loaded;
    persistDashboard();
    selected_ = firstThreeOfDashboard();
    persistSelection();
}

// Changes

void QVDashboardDataUnitGroupsController::setDataUnitGroupsForDashboard(Groups dataUnitGroups) {
    dashboard_ = std::move(dataUnitGroups);
    if (loadState_ == LoadState::Loading) loadState_ = LoadState::Loaded;
    persistDashboard();
}

void QVDashboardDataUnitGroupsController::addDataUnitGroupToDashboard(const VSDataUnitGroup* dataUnitGroup) {
    if (!dashboard_)
        return afterLoading_.push_back([=, this] { addDataUnitGroupToDashboard(dataUnitGroup); });
    if (isOnDashboard(dataUnitGroup)) return;
    Groups groups = *dashboard_;
    groups.push_back(dataUnitGroup);
    setDataUnitGroupsForDashboard(std::move(groups));
}

void QVDashboardDataUnitGroupsController::removeDataUnitGroupFromDashboard(
    const VSDataUnitGroup* dataUnitGroup) {
    if (!dashboard_)
        return afterLoading_.push_back([=, this] { removeDataUnitGroupFromDashboard(dataUnitGroup); });
    Groups groups = *dashboard_;
    std::erase(groups, dataUnitGroup);
    setDataUnitGroupsForDashboard(std::move(groups));
}

bool QVDashboardDataUnitGroupsController::isOnDashboard(const VSDataUnitGroup* dataUnitGroup) const {
    return dashboard_ && contains(*dashboard_, dataUnitGroup);
}

void QVDashboardDataUnitGroupsController::setSelectedDataUnitGroups(const Groups& dataUnitGroups) {
    selectionState_ = LoadState::Loaded;
    selected_ = withoutRepetition(dataUnitGroups);
    persistSelection();
}

void QVDashboardDataUnitGroupsController::addGroupsForPairedWatch() {
    // Before the list is loaded there is nothing to add to; loading looks for a paired watch itself.
    if (loadState_ != LoadState::Loaded) return;
    std::vector<int>& ever = autoAddedIDs();
    std::vector<int> additions;
    for (const int id : watchGroupIDs) {
        const VSDataUnitGroup* group = catalogue_.dataUnitGroupWithID(id);
        if ((group && isOnDashboard(group)) || contains(ever, id)) continue;
        ever.push_back(id);
        additions.push_back(id);
    }
    if (additions.empty()) return;
    Groups groups = *dashboard_;
    for (const VSDataUnitGroup* group : groupsWithIDs(additions)) groups.push_back(group);
    setDataUnitGroupsForDashboard(std::move(groups));
}

std::vector<int>& QVDashboardDataUnitGroupsController::autoAddedIDs() {
    if (!autoAddedIDs_) {
        const auto stored = platform::UserDefaults::standard().value(autoAddedKey);
        autoAddedIDs_ = stored ? integers(*stored) : std::vector<int>{};
    }
    return *autoAddedIDs_;
}

// Persistence

void QVDashboardDataUnitGroupsController::persistDashboard() {
    if (loadState_ == LoadState::Failed) {
        tellObservers();
        return load();  // and then the change is made to what was read
    }
    userDefaults_.setValue({{dashboardKey, arrayOf(idsOf(dataUnitGroupsForDashboard()))}}, dashboardKey,
                           [](bool success) {
                               if (!success) VSLog(VSLogLevel::Error, "Error saving user defaults");
                           });
    tellObservers();
    dropUnshownFromSelection();
    if (autoAddedIDs_) platform::UserDefaults::standard().setValue(autoAddedKey, arrayOf(*autoAddedIDs_));
}

void QVDashboardDataUnitGroupsController::dropUnshownFromSelection() {
    const auto unshown = [this](const VSDataUnitGroup* group) { return !isOnDashboard(group); };
    const bool dropped = std::erase_if(selected_, unshown) > 0;
    if (selectionState_ != LoadState::Loaded)
        dropUnshownWhenRead_ = true;
    else if (dropped)
        persistSelection();
}

void QVDashboardDataUnitGroupsController::persistSelection() {
    userDefaults_.setValue({{selectionKey, arrayOf(idsOf(selected_))}}, selectionKey, [](bool success) {
        if (!success) VSLog(VSLogLevel::Error, "Error saving selected dashboard data unit groups");
    });
}

void QVDashboardDataUnitGroupsController::tellObservers() {
    const Groups groups = dataUnitGroupsForDashboard();
    observers_.tell([&](QVDashboardDataUnitGroupsObserver& observer) {
        observer.dashboardDataUnitGroupsUpdated(groups);
    });
}
