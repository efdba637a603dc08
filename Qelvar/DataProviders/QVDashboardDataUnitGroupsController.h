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
/// Main thread only. The lists are read from the service's default values once, after construction, and
/// written there with every change by the user.
class QVDashboardDataUnitGroupsController {
 public:
    using Groups = std::vector<const VSDataUnitGroup*>;
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
    /// Whether the list has been loaded (or set): before, an empty list says nothing.
    bool hasLoadedDashboard() const { return dashboard_.has_value(); }
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
    void load();
    void loadSelection();
    void dashboardRead(const std::optional<std::vector<int>>& storedIDs);
    void selectionRead(const std::optional<std::vector<int>>& storedIDs, bool wasRead);
    void loadDemoSelection();
    static std::vector<int> hardwareDefaultIDs();
    Groups groupsWithIDs(const std::vector<int>& ids) const;
    Groups firstThreeOfDashboard() const;
    void addGroupsForPairedWatch();
    std::vector<int>& autoAddedIDs();
    void persistDashboard();
    void persistSelection();
    void tellObservers();

    const VSDataUnitGroupController& catalogue_;
    const DemoDataLoader demoDataLoader_;
    QVUserDefaults& userDefaults_;
    std::optional<Groups> dashboard_;
    Groups selected_;
    bool selectionWasSet_ = false;
    std::vector<std::function<void()>> afterLoading_;  // changes asked for before there was a list to change
    std::optional<std::vector<int>> autoAddedIDs_;     // none: not read in this process
    platform::ObserverSet<QVDashboardDataUnitGroupsObserver> observers_;
    QMetaObject::Connection pairing_;
    std::shared_ptr<bool> alive_ = std::make_shared<bool>(true);
};
