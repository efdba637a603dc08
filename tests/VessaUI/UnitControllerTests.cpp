// The user's units: by region, chosen, kept, and told of.

#include <gtest/gtest.h>

#include <QSet>
#include <vector>

#include "Platform/SystemEvents.h"
#include "QtTestSupport.h"
#include "TestSupport.h"
#include "Vessa/VSHealthStore.h"
#include "VessaUI/VSUnitController.h"

namespace {

const VSObjectType* type(std::string_view name) {
    return VSObjectType::typeForIdentifier(name);
}

const VSDataUnitGroup* groupOf(std::string_view name) {
    return VSDataUnitGroupController::shared().dataUnitGroupForType(type(name));
}
const VSDataUnit* unitOf(std::string_view name) {
    return groupOf(name)->anyDataUnit();
}

/// What the controller told, one entry a signal.
struct Changes {
    explicit Changes(const VSUnitController& units) {
        QObject::connect(&units, &VSUnitController::unitPreferencesDidChange, &receiver,
                         [this](const QSet<const VSObjectType*>& changed) { told.push_back(changed); });
    }
    size_t size() const { return told.size(); }
    std::vector<QSet<const VSObjectType*>> told;
    QObject receiver;
};

class Units : public ::testing::Test {
 protected:
    static std::shared_ptr<VSHealthStore> open(const test::TemporaryFolder& folder) {
        auto store = VSHealthStore::open(folder.path());
        EXPECT_TRUE(store) << (store ? "" : store.error().message);
        return store ? *store : nullptr;
    }
    static std::string unit(const VSUnitController& units, std::string_view name) {
        return units.unitForDataUnit(unitOf(name)).unitString();
    }
    static VSUnit parsed(const char* text) { return VSUnit::fromString(text); }
    /// What is in the store under the key, read through a connection of its own.
    static std::optional<VSValue> stored(const std::shared_ptr<VSHealthStore>& store) {
        test::Promise<std::optional<VSValue>> answer;
        store->getDefaultValue("VSPreferredUnits", [&](const VSResult<std::optional<VSValue>>& result) {
            answer.set(result ? *result : std::nullopt);
        });
        return answer.wait().value_or(std::nullopt);
    }

    test::FixedEnvironment environment{"2020-03-31T20:00", "Europe/Copenhagen", "en_US"};
    test::TemporaryFolder folder;
};

TEST_F(Units, FollowTheRegion) {
    struct Expected {
        const char *locale, *weight, *height, *distance, *temperature, *glucose, *energy, *drink;
    };
    const std::string mmol = VSUnit::fromString("mmol<180.1558>/L").unitString();
    const Expected regions[] = {
        {"en_US", "lb", "ft", "mi", "degF", "mg/dL", "kcal", "fl_oz_us"},
        {"en_GB", "kg", "ft", "mi", "degC", mmol.c_str(), "kcal", "mL"},
        {"de_DE", "kg", "cm", "km", "degC", "mg/dL", "kcal", "mL"},
        {"da_DK", "kg", "cm", "km", "degC", mmol.c_str(), "kcal", "mL"},
        {"ar_EG", "kg", "cm", "km", "degC", "mg/dL", "kcal", "mL"},
        {"hi_IN", "kg", "cm", "km", "degC", "mg/dL", "kcal", "mL"},
        {"en_AU", "kg", "cm", "km", "degC", mmol.c_str(), "kJ", "mL"},
        {"my_MM", "lb", "ft", "mi", "degC", "mg/dL", "kcal", "mL"},
        {"en_KY", "kg", "cm", "km", "degF", "mg/dL", "kcal", "mL"},
        // Of a language alone the region where most speak it; of nothing the metric world.
        {"da", "kg", "cm", "km", "degC", mmol.c_str(), "kcal", "mL"},
        {"en", "lb", "ft", "mi", "degF", "mg/dL", "kcal", "fl_oz_us"},
    };
    const VSUnitController units(open(folder));
    for (const Expected& expected : regions) {
        SCOPED_TRACE(expected.locale);
        environment->setLocale(expected.locale);
        EXPECT_EQ(unit(units, "BodyMass"), expected.weight);
        EXPECT_EQ(unit(units, "Height"), expected.height);
        EXPECT_EQ(unit(units, "DistanceWalkingRunning"), expected.distance);
        EXPECT_EQ(unit(units, "BodyTemperature"), expected.temperature);
        EXPECT_EQ(unit(units, "BloodGlucose"), expected.glucose);
        EXPECT_EQ(unit(units, "ActiveEnergyBurned"), expected.energy);
        EXPECT_EQ(unit(units, "DietaryWater"), expected.drink);
        EXPECT_EQ(unit(units, "HeartRate"), "count/min");
    }
}

TEST_F(Units, SurviveAReopenedStore) {
    {
        auto store = open(folder);
        VSUnitController units(store);
        const Changes changes(units);
        units.updatePreferredUnit(parsed("st"), unitOf("BodyMass"));
        EXPECT_EQ(unit(units, "BodyMass"), "st");  // at once
        ASSERT_EQ(changes.size(), 1u);
        EXPECT_TRUE(changes.told[0] == QSet<const VSObjectType*>{type("BodyMass")});
        ASSERT_TRUE(test::waitUntil([&] { return stored(store).has_value(); }));
        // Chosen again, nothing changes.
        units.updatePreferredUnit(parsed("st"), unitOf("BodyMass"));
        units.updatePreferredUnit(parsed("km"), unitOf("BodyMass"));  // of another kind
        EXPECT_EQ(unit(units, "BodyMass"), "st");
        EXPECT_EQ(changes.size(), 1u);
    }
    VSUnitController units(open(folder));
    const Changes changes(units);
    EXPECT_EQ(unit(units, "BodyMass"), "lb");  // the region's, until the store has answered
    ASSERT_TRUE(test::waitUntil([&] { return changes.size() == 1; }));
    EXPECT_EQ(unit(units, "BodyMass"), "st");
    EXPECT_EQ(unit(units, "Height"), "ft");
}

TEST_F(Units, AChoiceBeforeTheStoreAnsweredLosesNothing) {
    auto store = open(folder);
    test::Promise<bool> saved;
    // Of another version: a type and a unit that this one does not know.
    store->setDefaultValue(VSValue::Dictionary{{"VSQuantityTypeIdentifierHeight", "m"},
                                               {"VSQuantityTypeIdentifierBodyTemperature", "parsec"},
                                               {"VSQuantityTypeIdentifierOfTomorrow", "kg"}},
                           "VSPreferredUnits", [&](const VSStatus& status) { saved.set(status.ok()); });
    ASSERT_EQ(saved.wait(), true);

    VSUnitController units(store);
    units.updatePreferredUnit(parsed("kJ"), unitOf("ActiveEnergyBurned"));
    ASSERT_TRUE(test::waitUntil([&] {
        const auto value = stored(store);
        return value && (*value)["VSQuantityTypeIdentifierActiveEnergyBurned"];
    }));
    const auto value = stored(store);
    for (const auto& [key, text] : {std::pair{"VSQuantityTypeIdentifierHeight", "m"},
                                    {"VSQuantityTypeIdentifierBodyTemperature", "parsec"},
                                    {"VSQuantityTypeIdentifierOfTomorrow", "kg"},
                                    {"VSQuantityTypeIdentifierActiveEnergyBurned", "kJ"}}) {
        ASSERT_TRUE((*value)[key]) << key;
        EXPECT_EQ(*(*value)[key]->string(), text);
    }
    ASSERT_TRUE(test::waitUntil([&] { return unit(units, "Height") == "m"; }));
    EXPECT_EQ(unit(units, "BodyTemperature"), "degF");
    EXPECT_EQ(unit(units, "ActiveEnergyBurned"), "kJ");
}

TEST_F(Units, OfTwoWindowsAreEachOthers) {
    VSUnitController units(open(folder)), others(open(folder));
    units.updatePreferredUnit(parsed("kJ"), unitOf("ActiveEnergyBurned"));
    others.updatePreferredUnit(parsed("st"), unitOf("BodyMass"));
    for (const VSUnitController* each : {&units, &others})
        EXPECT_TRUE(test::waitUntil(
            [&] { return unit(*each, "ActiveEnergyBurned") == "kJ" && unit(*each, "BodyMass") == "st"; }));
}

TEST_F(Units, ALocaleChangeIsToldForWhatItChanges) {
    VSUnitController units(open(folder));
    units.updatePreferredUnit(parsed("lb"), unitOf("BodyMass"));
    const Changes changes(units);
    environment->setLocale("en_GB");
    platform::SystemEvents::shared().postLocaleChange();
    ASSERT_EQ(changes.size(), 1u);
    const auto told = changes.told[0];
    EXPECT_TRUE(told.contains(type("BodyTemperature")));
    EXPECT_TRUE(told.contains(type("BloodGlucose")));
    EXPECT_TRUE(told.contains(type("LeanBodyMass")));
    EXPECT_FALSE(told.contains(type("BodyMass")));  // chosen by the user
    EXPECT_FALSE(told.contains(type("Height")));    // in feet there too
    platform::SystemEvents::shared().postLocaleChange();
    EXPECT_EQ(changes.size(), 1u);
}

TEST_F(Units, AreNamedForTheNumberBesideThem) {
    VSUnitController units(open(folder));
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("StepCount")), "steps");
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("StepCount"), 1), "step");
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("StepCount"), 0.996), "step");
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("StepCount"), 0), "steps");
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("StepCount"), 5e12), "steps");
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("FlightsClimbed"), 1), "floor");
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("HeartRate"), 72), "bpm");
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("OxygenSaturation"), 97), "%");
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("BodyTemperature")), QString::fromUtf8("°F"));
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("BodyTemperature"), parsed("degC")),
              QString::fromUtf8("°C"));
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("UVExposure")), "");
    EXPECT_EQ(units.displayNameForDataUnit(unitOf("SleepAnalysis")), "");
    EXPECT_EQ(units.displayNameForDataUnitGroup(groupOf("BloodPressureSystolic")), "mmHg");
    EXPECT_EQ(units.availableUnits(groupOf("BloodGlucose")).size(), 2u);
    EXPECT_TRUE(units.availableUnits(groupOf("SleepAnalysis")).empty());
    EXPECT_EQ(units.unitForDataUnit(unitOf("SleepAnalysis")), VSUnit::hourUnit());
    EXPECT_EQ(units.unitForDataUnit(unitOf("MenstrualFlow")), VSUnit::countUnit());
}

TEST_F(Units, RangesAreInTheUnitShownAndStayNested) {
    VSUnitController units(open(folder));
    // 45 to 230 cm, in feet of two digits.
    const auto height = units.manualEntryConfirmRangeForDataUnit(unitOf("Height"));
    EXPECT_EQ(height, (VSValueRange{1.48, 7.55}));
    EXPECT_EQ(units.manualEntryConfirmRangeForDataUnit(unitOf("BodyTemperature")),
              (VSValueRange{93.2, 107.6}));
    EXPECT_EQ(units.manualEntryConfirmRangeForDataUnit(unitOf("OxygenSaturation")), (VSValueRange{70, 100}));
    EXPECT_EQ(units.displayRangeForDataUnit(unitOf("StepCount")), (VSValueRange{0, std::nullopt}));
    EXPECT_FALSE(units.manualEntryAbsoluteRangeForDataUnit(unitOf("NikeFuel")));
    EXPECT_FALSE(units.displayRangeForDataUnit(unitOf("MenstrualFlow")));
    for (const VSDataUnitGroup* group : VSDataUnitGroupController::shared().allDataUnitGroups())
        for (const VSUnit& unit : units.availableUnits(group))
            for (const VSDataUnit* dataUnit : group->dataUnits()) {
                units.updatePreferredUnit(unit, dataUnit);
                const auto display = units.displayRangeForDataUnit(dataUnit);
                const auto absolute = units.manualEntryAbsoluteRangeForDataUnit(dataUnit);
                const auto confirm = units.manualEntryConfirmRangeForDataUnit(dataUnit);
                ASSERT_TRUE(display);
                if (!absolute) continue;
                SCOPED_TRACE(dataUnit->dataType()->identifier() + " in " + unit.unitString());
                EXPECT_TRUE(display->containsValue(*absolute->minimum) &&
                            display->containsValue(*absolute->maximum));
                EXPECT_TRUE(absolute->containsValue(*confirm->minimum) &&
                            absolute->containsValue(*confirm->maximum));
                EXPECT_LT(*confirm->minimum, *confirm->maximum);
            }
}

}  // namespace
