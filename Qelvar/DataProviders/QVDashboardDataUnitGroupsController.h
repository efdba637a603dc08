#pragma once

#include <QMetaObject>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Platform/ObserverSet.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "VessaUI/VSDataUnitGroup.h"

class QVDashboardDataUnitGroupsObserver {
 public:
    virtual ~QVDashboardDataUnitGroupsObserver() = default;
    virtual void dashboardDataUnitGroupsUpdated(
        const std::vector<const VSDataUnitGroup*>& dashboardDataUnitGroups) = 0;
};

/// Which display types the dashboard shows, in which order, and which of them the landscape chart compares.
/// Main thread only. The lists are read from the service's default values after construction and whenever
/// another window or program has written them, and every change by the user is made to what is stored then:
/// windows on one store show, and keep, each other's changes. A list that could not be read may be there all
/// the same: the defaults are shown in its place, nothing is added on its own account, and the user's next
/// change reads it again and is made to what is then read.
class QVDashboardDataUnitGroupsController {
 public:
    using Groups = std::vector<const VSDataUnitGroup*>;
    using IDs = std::vector<int>;
    /// Reads the demo document ("demodata.plist" of the resources); none when it is missing or broken.
    using DemoDataLoader = std::function<std::optional<VSValue::Dictionary>()>;

    /// Starts to load. When the local default "UseDemoData" is true, the demo document's selection is taken
    /// instead and stored. REQUIRES: the catalogue and `userDefaults` live longer.
    explicit QVDashboardDataUnitGroupsController(
        const VSDataUnitGroupController& dataUnitGroupController, DemoDataLoader demoDataLoader = {},
        QVUserDefaults& userDefaults = QVUserDefaults::sharedDefaults());
    QVDashboardDataUnitGroupsController() = delete;
    QVDashboardDataUnitGroupsController(const QVDashboardDataUnitGroupsController&) = delete;
    QVDashboardDataUnitGroupsController& operator=(const QVDashboardDataUnitGroupsController&) = delete;
    ~QVDashboardDataUnitGroupsController();

    /// A copy; empty until first loaded.
    Groups dataUnitGroupsForDashboard() const { return dashboard_.value_or(Groups{}); }
    /// Whether there is a list to show (the user's, or the defaults where that could not be read): before, an
    /// empty list says nothing.
    bool hasLoadedDashboard() const { return dashboard_.has_value(); }
    /// Whether that is the user's own list, and not what stands in for one that could not be read.
    bool hasReadDashboard() const { return loadState_ == LoadState::Loaded; }
    /// Reads again what could not be read; else nothing happens.
    void loadAgainIfFailed();
    /// Replaces the whole list and stores it.
    void setDataUnitGroupsForDashboard(Groups dataUnitGroups);
    /// At the end; nothing happens when it is there already. Before the list is loaded, this and the next
    /// wait for it.
    void addDataUnitGroupToDashboard(const VSDataUnitGroup* dataUnitGroup);
    void removeDataUnitGroupFromDashboard(const VSDataUnitGroup* dataUnitGroup);
    bool isOnDashboard(const VSDataUnitGroup* dataUnitGroup) const;

    /// The display types selected for the landscape chart, without repetition, in no particular order.
    const Groups& selectedDataUnitGroupsArray() const { return selected_; }
    void setSelectedDataUnitGroups(const Groups& dataUnitGroups);

    void addObserver(const std::shared_ptr<QVDashboardDataUnitGroupsObserver>& observer) {
        observers_.add(observer);
    }
    void removeObserver(const QVDashboardDataUnitGroupsObserver* observer) { observers_.remove(observer); }

 private:
    enum class LoadState { Loading, Loaded, Failed };
    void load();
    void loadSelection();
    void dashboardRead(const std::optional<IDs>& storedIDs, bool wasRead);
    void dashboardCouldNotBeRead();
    void selectionRead(const std::optional<IDs>& storedIDs, bool wasRead);
    void loadDemoSelection();
    static IDs hardwareDefaultIDs();
    Groups groupsWithIDs(const IDs& ids) const;
    Groups firstThreeOfDashboard() const;
    void addGroupsForPairedWatch();
    IDs& autoAddedIDs();
    void persistDashboard();
    void dropUnshownFromSelection();
    void persistSelection();
    void tellObservers();
    void adoptDashboard(const IDs& ids);
    void adoptSelection(const IDs& ids);
    void readWhatOthersWrote();

    const VSDataUnitGroupController& catalogue_;
    const DemoDataLoader demoDataLoader_;
    QVUserDefaults& userDefaults_;
    std::optional<Groups> dashboard_;
    LoadState loadState_ = LoadState::Loading;
    Groups standIn_;          // after a failed read: the defaults, without the user's changes since
    bool isReading_ = false;  // the dashboard, for the first time or again
    Groups selected_;
    LoadState selectionState_ = LoadState::Loading;
    bool dropUnshownWhenRead_ = false;
    // What is stored as far as it is known here, without what the catalogue does not know; and the same with
    // the changes that are on their way, which is what the next change is measured against (without it a list
    // is replaced as a whole). And how many are on their way.
    std::optional<IDs> dashboardStored_, selectionStored_, dashboardBase_, selectionBase_;
    int dashboardWrites_ = 0, selectionWrites_ = 0;
    int64_t lastRead_ = 0;  // the answers of earlier ones may be older than what is known
    std::vector<std::function<void()>> afterLoading_;  // changes asked for before there was a list to change
    std::optional<IDs> autoAddedIDs_;                  // none: not read in this process
    platform::ObserverSet<QVDashboardDataUnitGroupsObserver> observers_;
    std::shared_ptr<const void> observation_;
    QMetaObject::Connection pairing_;
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
};
