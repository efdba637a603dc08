#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <mutex>
#include <set>

#include "Platform/MotionHardware.h"
#include "Platform/PairedDevices.h"
#include "Platform/UserDefaults.h"
#include "ProviderTestSupport.h"
#include "Qelvar/DataProviders/QVDashboardDataUnitGroupsController.h"
#include "Qelvar/DataProviders/QVDataProviderOrderController.h"
#include "Vessa/Base/VSLog.h"

using namespace test;

namespace {

constexpr const char* dashboardKey = "QVUserSettingsActiveUnitGroupsForDashboardKey";
constexpr const char* selectionKey = "selectedLandscapeGroups";

class Hardware final : public platform::MotionHardware {
 public:
    Hardware(bool steps, bool distance, bool floors) : steps_(steps), distance_(distance), floors_(floors) {}
    bool canCountSteps() const override { return steps_; }
    bool canMeasureDistance() const override { return distance_; }
    bool canCountFloors() const override { return floors_; }

 private:
    bool steps_, distance_, floors_;
};

class Observer final : public QVDashboardDataUnitGroupsObserver {
 public:
    void dashboardDataUnitGroupsUpdated(const std::vector<const VSDataUnitGroup*>& groups) override {
        ++told;
        last = groups;
    }
    int told = 0;
    std::vector<const VSDataUnitGroup*> last;
};

class SelectionTest : public ProviderTest {
 protected:
    SelectionTest() {
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder.path() / "defaults"));
        userDefaults.setHealthStore(store);
    }
    ~SelectionTest() override {
        platform::MotionHardware::install(nullptr);
        platform::PairedDevices::shared().setActivePairedDevice(false);
    }
    /// What a process does that ends and is started again.
    void relaunch() {
        userDefaults.setHealthStore(nullptr);
        openStore();
        userDefaults.setHealthStore(store);
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder.path() / "defaults"));
    }
    std::unique_ptr<QVDashboardDataUnitGroupsController> makeController() {
        auto controller = std::make_unique<QVDashboardDataUnitGroupsController>(
            VSDataUnitGroupController::shared(), [this] { return demo; }, userDefaults);
        controller->addObserver(observer);
        return controller;
    }
    std::unique_ptr<QVDashboardDataUnitGroupsController> loadedController() {
        auto controller = makeController();
        EXPECT_TRUE(waitUntil([&] { return controller->hasLoadedDashboard(); }));
        return controller;
    }
    static std::vector<int> ids(const std::vector<const VSDataUnitGroup*>& groups) {
        std::vector<int> result;
        for (const auto* each : groups) result.push_back(each->dataUnitGroupID());
        return result;
    }
    /// What is stored, written in the order of the saves before.
    std::optional<std::vector<int>> stored(const char* key) {
        Promise<std::optional<std::vector<int>>> answer;
        userDefaults.valueForKey(key, [&](const VSResult<std::optional<VSValue>>& result) {
            const VSValue* entry = result.ok() && *result ? (**result)[key] : nullptr;
            if (!entry) return answer.set(std::nullopt);
            std::vector<int> found;
            for (const VSValue& value : *entry->array()) found.push_back(static_cast<int>(*value.integer()));
            answer.set(found);
        });
        return *answer.wait();
    }
    bool waitUntilStored(const char* key, const std::vector<int>& expected) {
        return waitUntil([&] { return stored(key) == expected; });
    }
    void storeIDs(const char* key, const std::vector<int>& groupIDs) {
        Promise<bool> done;
        userDefaults.setValue({{key, VSValue::Array(groupIDs.begin(), groupIDs.end())}}, key,
                              [&](bool success) { done.set(success); });
        ASSERT_TRUE(done.wait().value_or(false));
    }

    QVUserDefaults userDefaults;
    std::optional<VSValue::Dictionary> demo;
    std::shared_ptr<Observer> observer = std::make_shared<Observer>();
};

using IDs = std::vector<int>;

}  // namespace

TEST_F(SelectionTest, TheFirstStartShowsWhatTheHardwareCounts) {
    {
        auto controller = loadedController();
        EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{59, 7, 10}));
        EXPECT_EQ(ids(observer->last), (IDs{59, 7, 10}));
        EXPECT_TRUE(waitUntilStored(selectionKey, {59, 7, 10}));
        EXPECT_FALSE(stored(dashboardKey)) << "nothing is written until the user changes something";
    }
    platform::MotionHardware::install(std::make_shared<Hardware>(true, true, false));
    EXPECT_EQ(ids(loadedController()->dataUnitGroupsForDashboard()), (IDs{59, 7}));
}

TEST_F(SelectionTest, ChangesAreKeptAndTold) {
    {
        auto controller = loadedController();
        ASSERT_TRUE(waitUntilStored(selectionKey, {59, 7, 10}));
        const int told = observer->told;
        controller->addDataUnitGroupToDashboard(group(VSGroupID::HeartRate));
        EXPECT_EQ(observer->told, told + 1);
        controller->addDataUnitGroupToDashboard(group(VSGroupID::HeartRate));
        EXPECT_EQ(observer->told, told + 1) << "it is there already";
        EXPECT_TRUE(waitUntilStored(dashboardKey, {59, 7, 10, 6}));
        controller->removeDataUnitGroupFromDashboard(group(VSGroupID::WalkingRunningDistance));
        EXPECT_TRUE(waitUntilStored(dashboardKey, {59, 10, 6}));
        EXPECT_TRUE(waitUntilStored(selectionKey, {59, 10}))
            << "what is not on the dashboard is not compared";
        controller->setDataUnitGroupsForDashboard({group(6), group(59)});
    }
    ASSERT_TRUE(waitUntilStored(dashboardKey, {6, 59}));
    relaunch();
    auto controller = loadedController();
    EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{6, 59}));
    ASSERT_TRUE(waitUntil([&] { return ids(controller->selectedDataUnitGroupsArray()) == IDs{59}; }));
}

TEST_F(SelectionTest, UnknownAndDamagedEntriesAreSkipped) {
    storeIDs(dashboardKey, {4711, 6, -1});
    auto controller = loadedController();
    EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{6}));
}

TEST_F(SelectionTest, AChangeBeforeTheListIsLoadedLosesNothing) {
    storeIDs(dashboardKey, {13, 6});
    auto controller = makeController();
    controller->addDataUnitGroupToDashboard(group(59));
    controller->removeDataUnitGroupFromDashboard(group(13));
    ASSERT_TRUE(waitUntilStored(dashboardKey, {6, 59}));
    EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{6, 59}));
}

TEST_F(SelectionTest, WhatCannotBeReadIsNotReplaced) {
    struct Case {
        const char* what;
        void (*change)(QVDashboardDataUnitGroupsController& controller);
        IDs list, selection;
    };
    const Case cases[] = {
        {"looked at again",
         [](auto& controller) { controller.loadAgainIfFailed(); },
         {13, 7, 59, 6},
         {13, 6}},
        {"added",
         [](auto& controller) { controller.addDataUnitGroupToDashboard(group(VSGroupID::Height)); },
         {13, 7, 59, 6, VSGroupID::Height},
         {13, 6}},
        {"removed, and removed what only the stored list holds",
         [](auto& controller) {
             controller.removeDataUnitGroupFromDashboard(group(7));
             controller.removeDataUnitGroupFromDashboard(group(13));
         },
         {13, 59, 6},
         {13, 6}},
        {"put in another order",
         [](auto& controller) {
             controller.setDataUnitGroupsForDashboard({group(10), group(59), group(6), group(7)});
         },
         {13, 59, 6, 7},
         {13, 6}},
    };
    platform::PairedDevices::shared().setActivePairedDevice(true);
    platform::UserDefaults::standard().setValue("AutoAddedDataUnitGroupIDs", VSValue::Array{8});
    for (const Case& each : cases) {
        SCOPED_TRACE(each.what);
        storeIDs(dashboardKey, {13, 7, 59, 6});
        storeIDs(selectionKey, {13, 6});
        userDefaults.setHealthStore(nullptr);
        auto controller = loadedController();
        ASSERT_TRUE(waitUntil([&] { return !controller->selectedDataUnitGroupsArray().empty(); }));
        EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{59, 7, 10}))
            << "no watch adds to a list that was not read";
        userDefaults.setHealthStore(store);
        EXPECT_EQ(stored(dashboardKey), (IDs{13, 7, 59, 6}));
        each.change(*controller);
        ASSERT_TRUE(waitUntil([&] { return ids(controller->dataUnitGroupsForDashboard()) == each.list; }));
        ASSERT_TRUE(
            waitUntil([&] { return ids(controller->selectedDataUnitGroupsArray()) == each.selection; }));
        EXPECT_EQ(ids(observer->last), each.list);
        storeIDs("behind the saves before", {});
        EXPECT_EQ(stored(dashboardKey), each.list);
        EXPECT_EQ(stored(selectionKey), each.selection);
    }
}

TEST_F(SelectionTest, APairedWatchAddsItsDisplayTypesOnce) {
    platform::PairedDevices::shared().setActivePairedDevice(true);
    {
        auto controller = loadedController();
        ASSERT_TRUE(waitUntil([&] { return controller->dataUnitGroupsForDashboard().size() == 5; }));
        EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{59, 7, 10, 8, 6}));
        controller->removeDataUnitGroupFromDashboard(group(6));
        ASSERT_TRUE(waitUntilStored(dashboardKey, {59, 7, 10, 8}));
    }
    relaunch();
    const auto added = platform::UserDefaults::standard().value("AutoAddedDataUnitGroupIDs");
    ASSERT_TRUE(added && added->array());
    EXPECT_EQ(*added->array(), (VSValue::Array{8, 6}));
    auto controller = loadedController();
    EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{59, 7, 10, 8}));
    platform::PairedDevices::shared().setActivePairedDevice(false);
    platform::PairedDevices::shared().setActivePairedDevice(true);
    drainMainQueue();
    EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{59, 7, 10, 8}));
}

TEST_F(SelectionTest, DemoDataBringsItsSelection) {
    platform::UserDefaults::standard().setValue("UseDemoData", true);
    demo = VSValue::Dictionary{
        {"dashboardDataUnitGroups",
         VSValue::Array{"VSQuantityTypeIdentifierHeartRate", "VSCategoryTypeIdentifierSleepAnalysis",
                        "VSQuantityTypeIdentifierNothing", "VSCorrelationTypeIdentifierBloodPressure",
                        "VSWorkoutTypeIdentifier"}}};
    auto controller = makeController();
    const IDs shown = ids(controller->dataUnitGroupsForDashboard());
    ASSERT_GE(shown.size(), 3u);
    EXPECT_EQ(shown.front(), 6);
    EXPECT_EQ(shown.back(), 72);
    EXPECT_TRUE(waitUntilStored(dashboardKey, shown));
    EXPECT_TRUE(waitUntilStored(selectionKey, IDs(shown.begin(), shown.begin() + 3)));
}

TEST_F(SelectionTest, WithoutAStoreTheDefaultsApply) {
    std::mutex mutex;
    std::vector<std::string> lines;
    const auto before = VSSetLogSink([&](VSLogLevel, std::string_view line) {
        std::lock_guard lock(mutex);
        lines.emplace_back(line);
    });
    userDefaults.setHealthStore(nullptr);
    auto controller = loadedController();
    drainMainQueue();
    drainMainQueue();
    EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{59, 7, 10}));
    controller->removeDataUnitGroupFromDashboard(group(59));
    controller->setSelectedDataUnitGroups({group(7)});
    drainMainQueue();
    VSSetLogSink(before);
    EXPECT_EQ(ids(controller->dataUnitGroupsForDashboard()), (IDs{7, 10}));
    std::lock_guard lock(mutex);
    EXPECT_NE(std::find(lines.begin(), lines.end(), "Error saving user defaults"), lines.end());
    EXPECT_NE(std::find(lines.begin(), lines.end(), "Error saving selected dashboard data unit groups"),
              lines.end());
}

/// Two windows on one store, each with a connection of its own; each changes another card before it has heard
/// of the other's change, with its own store's answers coming when they come.
RC_GTEST_FIXTURE_PROP(SelectionTest, WindowsKeepAndShowEachOthersChanges, ()) {
    relaunch();
    QVUserDefaults otherDefaults(*VSHealthStore::open(folder.path()));
    const auto first = loadedController();
    QVDashboardDataUnitGroupsController second(VSDataUnitGroupController::shared(), {}, otherDefaults);
    RC_ASSERT(waitUntil([&] { return second.hasLoadedDashboard(); }));
    QVDashboardDataUnitGroupsController* const windows[] = {first.get(), &second};
    std::vector<int> cards;
    for (const auto* each : VSDataUnitGroupController::shared().allDataUnitGroups())
        cards.push_back(each->dataUnitGroupID());
    IDs expected = ids(first->dataUnitGroupsForDashboard());
    std::set<int> shown(expected.begin(), expected.end());
    for (int round = *rc::gen::inRange(1, 6); round > 0; --round) {
        const auto changed = *rc::gen::unique<std::vector<int>>(*rc::gen::inRange<std::size_t>(2, 5),
                                                                rc::gen::elementOf(cards));
        for (size_t i = 0; i < changed.size(); ++i) {
            auto& window = *windows[i % 2];
            if (shown.erase(changed[i])) {
                window.removeDataUnitGroupFromDashboard(group(changed[i]));
            } else {
                shown.insert(changed[i]);
                window.addDataUnitGroupToDashboard(group(changed[i]));
            }
        }
        if (*rc::gen::arbitrary<bool>()) {
            auto turned = first->dataUnitGroupsForDashboard();
            std::reverse(turned.begin(), turned.end());
            first->setDataUnitGroupsForDashboard(turned);
        }
        RC_ASSERT(waitUntil([&] {
            const IDs a = ids(first->dataUnitGroupsForDashboard()),
                      b = ids(second.dataUnitGroupsForDashboard());
            return a == b && std::set<int>(a.begin(), a.end()) == shown;
        }));
    }
}

namespace {

class OrderObserver final : public QVDataProviderOrderObserver {
 public:
    void dataProviderOrderUpdated(const std::vector<VSSource>& newOrder,
                                  const VSObjectType* dataType) override {
        order = newOrder;
        type = dataType;
    }
    std::vector<VSSource> order;
    const VSObjectType* type = nullptr;
};

}  // namespace

TEST_F(SelectionTest, TheOrderOfSourcesIsStoredAndTold) {
    const auto from = [&](const char* name, const std::string& at) {
        VSProvenance provenance;
        provenance.sourceRevision =
            std::make_shared<const VSSourceRevision>(VSSourceRevision{VSSource::forImportedName(name), ""});
        return std::make_shared<VSQuantitySample>(
            type(VSCode::StepCount), VSQuantity(VSUnit::countUnit(), 10), date(at), date(at), provenance);
    };
    save({from("Phone", "2020-03-01T08:00"), from("Watch", "2020-03-02T08:00")});
    QVDataProviderOrderController controller(store);
    auto orderObserver = std::make_shared<OrderObserver>();
    controller.addObserver(orderObserver);
    const auto sources = [&] {
        Promise<QVDataProviderOrderController::Sources> answer;
        controller.orderedDataProviderSourcesForDataType(
            type(VSCode::StepCount), [&](const auto& found, const VSObjectType*) { answer.set(found); });
        return *answer.wait();
    };
    auto order = sources();
    ASSERT_TRUE(order);
    ASSERT_EQ(order->size(), 2u);
    EXPECT_EQ(order->front().name, "Phone");
    std::reverse(order->begin(), order->end());
    controller.setOrderedDataProviderSources(*order, type(VSCode::StepCount));
    ASSERT_TRUE(waitUntil([&] { return orderObserver->type != nullptr; }));
    EXPECT_EQ(orderObserver->order, *order);
    EXPECT_EQ(sources(), order);
}

TEST_F(SelectionTest, AnOrderThatTheStoreRefusesIsTold) {
    VSHealthStore::Options options;
    options.readOnly = true;
    openStore(options);
    std::mutex mutex;
    std::vector<std::string> lines;
    const auto before = VSSetLogSink([&](VSLogLevel, std::string_view line) {
        std::lock_guard lock(mutex);
        lines.emplace_back(line);
    });
    QVDataProviderOrderController controller(store);
    auto orderObserver = std::make_shared<OrderObserver>();
    controller.addObserver(orderObserver);
    const std::vector<VSSource> order{VSSource::forImportedName("Phone")};
    controller.setOrderedDataProviderSources(order, type(VSCode::StepCount));
    const bool told = waitUntil([&] { return orderObserver->type != nullptr; });
    VSSetLogSink(before);
    EXPECT_TRUE(told);
    EXPECT_EQ(orderObserver->order, order);
    std::lock_guard lock(mutex);
    EXPECT_EQ(std::count(lines.begin(), lines.end(), "Error saving source order"), 1);
}
