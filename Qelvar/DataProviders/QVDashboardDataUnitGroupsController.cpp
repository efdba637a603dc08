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
using IDs = QVDashboardDataUnitGroupsController::IDs;

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

IDs integers(const VSValue& value) {
    IDs result;
    if (const auto* array = value.array())
        for (const VSValue& entry : *array)
            if (const auto number = entry.integer()) result.push_back(static_cast<int>(*number));
    return result;
}

VSValue::Array arrayOf(const IDs& ids) {
    return VSValue::Array(ids.begin(), ids.end());
}

IDs idsOf(const Groups& groups) {
    IDs ids;
    for (const VSDataUnitGroup* group : groups) ids.push_back(group->dataUnitGroupID());
    return ids;
}

/// The IDs under the key inside the dictionary that is stored under the same key; none when never stored.
std::optional<IDs> storedIDs(const std::optional<VSValue>& stored, const char* key) {
    const VSValue* entry = stored ? (*stored)[key] : nullptr;
    if (!entry || !entry->array()) return std::nullopt;
    return integers(*entry);
}
std::optional<IDs> storedIDs(const VSResult<std::optional<VSValue>>& answer, const char* key) {
    return answer ? storedIDs(*answer, key) : std::nullopt;
}

VSValue toStore(const IDs& ids, const char* key) {
    return VSValue(VSValue::Dictionary{{key, arrayOf(ids)}});
}

template <typename T>
std::vector<T> withoutRepetition(const std::vector<T>& values) {
    std::vector<T> result;
    for (const T& value : values)
        if (!contains(result, value)) result.push_back(value);
    return result;
}

IDs united(IDs ids, const IDs& others) {
    ids.insert(ids.end(), others.begin(), others.end());
    return withoutRepetition(ids);
}

/// Those of `ids` that `others` holds too.
IDs sharedWith(const IDs& others, const IDs& ids) {
    IDs result;
    for (const int id : ids)
        if (contains(others, id)) result.push_back(id);
    return result;
}

/// `list` after what made `after` of `before`: what was removed is gone, what was moved stands in its new
/// order in the places that these had, and what was added stands at the end. What `before` never held stays.
IDs withChange(const IDs& list, const IDs& before, const IDs& after) {
    IDs result = withoutRepetition(list);
    std::erase_if(result, [&](int id) { return contains(before, id) && !contains(after, id); });
    if (sharedWith(after, before) != sharedWith(before, after)) {
        const IDs ordered = sharedWith(result, withoutRepetition(after));
        auto next = ordered.begin();
        for (int& id : result)
            if (contains(ordered, id)) id = *next++;
    }
    for (const int id : after)
        if (!contains(before, id) && !contains(result, id)) result.push_back(id);
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
    observation_ = userDefaults_.observe([this, alive = std::weak_ptr<bool>(alive_)](const std::string& key) {
        if (key != dashboardKey && key != selectionKey) return;
        platform::mainQueue().async([this, alive] {
            if (!alive.expired()) readWhatOthersWrote();
        });
    });
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

void QVDashboardDataUnitGroupsController::dashboardRead(const std::optional<IDs>& storedIDs, bool wasRead) {
    isReading_ = false;
    if (loadState_ == LoadState::Loaded) return loadSelection();  // set by the user, while it was being read
    if (!wasRead) return dashboardCouldNotBeRead();
    const bool wasFailed = std::exchange(loadState_, LoadState::Loaded) == LoadState::Failed;
    const IDs read = storedIDs ? *storedIDs : hardwareDefaultIDs();
    dashboardBase_ = dashboardStored_ = idsOf(groupsWithIDs(read));
    const bool wasChanged = wasFailed && *dashboard_ != standIn_;
    dashboard_ = groupsWithIDs(wasChanged ? withChange(read, idsOf(standIn_), idsOf(*dashboard_)) : read);
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

void QVDashboardDataUnitGroupsController::selectionRead(const std::optional<IDs>& storedIDs, bool wasRead) {
    if (selectionState_ == LoadState::Loaded) return;  // by the user, while it was being read
    // What could not be read may be there all the same, and is the user's.
    const bool isKnown = wasRead && (storedIDs || loadState_ == LoadState::Loaded);
    selectionState_ = isKnown ? LoadState::Loaded : LoadState::Failed;
    selected_ = storedIDs ? withoutRepetition(groupsWithIDs(*storedIDs)) : firstThreeOfDashboard();
    selectionBase_ = selectionStored_ = idsOf(selected_);
    if (!isKnown) return;
    if (!storedIDs && !selected_.empty()) persistSelection();
    if (std::exchange(dropUnshownWhenRead_, false)) dropUnshownFromSelection();
}

IDs QVDashboardDataUnitGroupsController::hardwareDefaultIDs() {
    const auto hardware = platform::MotionHardware::current();
    IDs ids;
    if (hardware->canCountSteps()) ids.push_back(VSGroupID::Steps);
    if (hardware->canMeasureDistance()) ids.push_back(VSGroupID::WalkingRunningDistance);
    if (hardware->canCountFloors()) ids.push_back(VSGroupID::FlightsClimbed);
    return ids;
}

QVDashboardDataUnitGroupsController::Groups QVDashboardDataUnitGroupsController::groupsWithIDs(
    const IDs& ids) const {
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
    IDs& ever = autoAddedIDs();
    IDs additions;
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

IDs& QVDashboardDataUnitGroupsController::autoAddedIDs() {
    // Another window may have added some since.
    const auto stored = platform::UserDefaults::standard().value(autoAddedKey);
    const IDs known = autoAddedIDs_.value_or(IDs{});
    return autoAddedIDs_.emplace(united(stored ? integers(*stored) : IDs{}, known));
}

// Persistence

void QVDashboardDataUnitGroupsController::persistDashboard() {
    if (loadState_ == LoadState::Failed) {
        tellObservers();
        return load();  // and then the change is made to what was read
    }
    const IDs wanted = idsOf(dataUnitGroupsForDashboard());
    ++dashboardWrites_;
    userDefaults_.updateValue(
        dashboardKey,
        [base = std::exchange(dashboardBase_, wanted), wanted](const std::optional<VSValue>& current) {
            const auto stored = storedIDs(current, dashboardKey);
            return toStore(stored && base ? withChange(*stored, *base, wanted) : wanted, dashboardKey);
        },
        [this, alive = std::weak_ptr<bool>(alive_)](const auto& answer) {
            if (!answer) VSLog(VSLogLevel::Error, "Error saving user defaults");
            platform::mainQueue().async([this, alive, ids = storedIDs(answer, dashboardKey)] {
                if (alive.expired()) return;
                --dashboardWrites_;
                if (ids)
                    adoptDashboard(*ids);
                else
                    dashboardBase_ = dashboardStored_;             // the next change brings this one too
                if (dashboardWrites_ == 0) readWhatOthersWrote();  // after this change, and told meanwhile
            });
        });
    tellObservers();
    dropUnshownFromSelection();
    if (!autoAddedIDs_) return;
    platform::UserDefaults::standard().updateValue(
        autoAddedKey, [this](const std::optional<VSValue>& stored) {
            return arrayOf(united(stored ? integers(*stored) : IDs{}, *autoAddedIDs_));
        });
}

/// What is stored, when it is not what is shown: others have changed it too.
void QVDashboardDataUnitGroupsController::adoptDashboard(const IDs& ids) {
    Groups groups = groupsWithIDs(ids);
    dashboardStored_ = idsOf(groups);
    if (dashboardWrites_ > 0 || loadState_ != LoadState::Loaded) return;  // what follows will say
    dashboardBase_ = dashboardStored_;
    if (groups == *dashboard_) return;
    dashboard_ = std::move(groups);
    tellObservers();
}

void QVDashboardDataUnitGroupsController::adoptSelection(const IDs& ids) {
    selectionStored_ = idsOf(withoutRepetition(groupsWithIDs(ids)));
    if (selectionWrites_ > 0 || selectionState_ != LoadState::Loaded) return;
    selectionBase_ = selectionStored_;
    selected_ = groupsWithIDs(*selectionStored_);
}

void QVDashboardDataUnitGroupsController::readWhatOthersWrote() {
    const int64_t ticket = ++lastRead_;
    for (const char* key : {dashboardKey, selectionKey})
        userDefaults_.valueForKey(
            key, [this, key, ticket, alive = std::weak_ptr<bool>(alive_)](const auto& answer) {
                platform::mainQueue().async([this, key, ticket, alive, ids = storedIDs(answer, key)] {
                    if (alive.expired() || !ids || ticket != lastRead_) return;
                    // An answer on its way may be older than a change that is made here meanwhile.
                    if (key == dashboardKey && dashboardWrites_ == 0) adoptDashboard(*ids);
                    if (key == selectionKey && selectionWrites_ == 0) adoptSelection(*ids);
                });
            });
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
    const IDs wanted = idsOf(selected_);
    ++selectionWrites_;
    userDefaults_.updateValue(
        selectionKey,
        [base = std::exchange(selectionBase_, wanted), wanted](const std::optional<VSValue>& current) {
            const auto stored = storedIDs(current, selectionKey);
            return toStore(stored && base ? withChange(*stored, *base, wanted) : wanted, selectionKey);
        },
        [this, alive = std::weak_ptr<bool>(alive_)](const auto& answer) {
            if (!answer) VSLog(VSLogLevel::Error, "Error saving selected dashboard data unit groups");
            platform::mainQueue().async([this, alive, ids = storedIDs(answer, selectionKey)] {
                if (alive.expired()) return;
                --selectionWrites_;
                if (ids)
                    adoptSelection(*ids);
                else
                    selectionBase_ = selectionStored_;             // the next change brings this one too
                if (selectionWrites_ == 0) readWhatOthersWrote();  // after this change, and told meanwhile
            });
        });
}

void QVDashboardDataUnitGroupsController::tellObservers() {
    const Groups groups = dataUnitGroupsForDashboard();
    observers_.tell([&](QVDashboardDataUnitGroupsObserver& observer) {
        observer.dashboardDataUnitGroupsUpdated(groups);
    });
}
