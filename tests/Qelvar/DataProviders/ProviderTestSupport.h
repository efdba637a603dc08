#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include "Platform/Localization.h"
#include "Qelvar/DataProviders/QVDataProvider.h"
#include "Qelvar/Models/Data/QVTimeScope.h"
#include "QtTestSupport.h"
#include "TestSupport.h"
#include "Vessa/VSHealthStore.h"
#include "VessaUI/VSDataUnitGroup.h"
#include "VessaUI/VSUnitController.h"

namespace test {

/// A store of its own on disk and a fixed Saturday evening in Copenhagen.
class ProviderTest : public ::testing::Test {
 protected:
    ProviderTest() {
        platform::loadTranslations();
        openStore();
    }
    /// Closes the store, if it is open, and opens it again, as the next session does.
    void openStore(VSHealthStore::Options options = {}) {
        unitController.reset();
        store.reset();
        auto opened = VSHealthStore::open(folder.path(), options);
        if (!opened) ADD_FAILURE() << opened.error().message;
        store = opened.value();
        unitController = std::make_shared<VSUnitController>(store);
    }

    static const VSObjectType* type(VSTypeCode code) { return VSObjectType::dataTypeWithCode(code); }
    static const VSDataUnitGroup* group(int id) {
        return VSDataUnitGroupController::shared().dataUnitGroupWithID(id);
    }

    static VSSamplePtr quantity(VSTypeCode code, double value, const char* unit, const std::string& start,
                                const std::string& end) {
        return std::make_shared<VSQuantitySample>(type(code), VSQuantity(VSUnit::fromString(unit), value),
                                                  date(start), date(end));
    }
    static VSSamplePtr reading(VSTypeCode code, double value, const char* unit, const std::string& at) {
        return quantity(code, value, unit, at, at);
    }
    static VSSamplePtr category(VSTypeCode code, int value, const std::string& start, const std::string& end,
                                VSMetadata metadata = {}) {
        VSProvenance provenance;
        if (!metadata.empty()) provenance.metadata = std::make_shared<const VSMetadata>(std::move(metadata));
        return std::make_shared<VSCategorySample>(type(code), value, date(start), date(end), provenance);
    }
    void save(std::vector<VSSamplePtr> samples) {
        const VSStatus status = store->saveObjectsAndWait(std::move(samples));
        ASSERT_TRUE(status) << status.error().message;
    }
    void deleteAll(VSTypeCode code) {
        Promise<bool> done;
        store->deleteAllSamples({type(code)}, std::nullopt,
                                [&](const VSStatus& status) { done.set(status.ok()); });
        ASSERT_TRUE(done.wait().value_or(false));
    }

    template <typename Provider>
    std::shared_ptr<Provider> provider(int groupID) {
        const VSDataUnitGroup* of = group(groupID);
        return std::make_shared<Provider>(of->anyDataUnit(), of->chartingRules(), unitController, store);
    }
    /// Shows today's span of the scope and asks for it.
    static void show(QVDataProvider& provider, QVTimeScope scope, bool noon = false) {
        const auto span = QVTimeScopeSpan(scope, VSEnvironment::current()->now(), noon);
        provider.setStartDate(span->start, span->end, scope);
        provider.restartQueries();
    }
    static bool waitUntilLoaded(const QVDataProvider& provider) {
        return waitUntil(
            [&] { return provider.hasLoadedHistoricalData() && provider.hasLoadedSecondaryValues(); });
    }

    FixedEnvironment environment{"2020-03-14T20:00"};
    TemporaryFolder folder;
    std::shared_ptr<VSHealthStore> store;
    std::shared_ptr<VSUnitController> unitController;
};

class RecordingDelegate final : public QVDataProviderDelegate {
 public:
    void dataProviderDidUpdateHistoricalData(QVDataProvider&) override { ++historical; }
    void dataProviderDidUpdateCurrentValueData(QVDataProvider&) override { ++current; }
    void dataProviderDidUpdateSecondaryData(QVDataProvider&) override { ++secondary; }
    int historical = 0, current = 0, secondary = 0;
};

inline std::vector<std::optional<double>> yValues(const QVDataProvider& provider) {
    std::vector<std::optional<double>> values;
    for (const auto& point : provider.historicalData()) values.push_back(point->maxYValue());
    return values;
}

/// Lets everything run that is in the main queue now.
inline void drainMainQueue() {
    bool reached = false;
    platform::mainQueue().async([&] { reached = true; });
    ASSERT_TRUE(waitUntil([&] { return reached; }));
}

}  // namespace test
