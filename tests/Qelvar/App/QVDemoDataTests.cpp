#include "Qelvar/App/QVDemoData.h"

#include <gtest/gtest.h>

#include <fstream>
#include <iterator>
#include <numeric>
#include <set>

#include "Platform/PropertyList.h"
#include "QtTestSupport.h"
#include "TestSupport.h"
#include "Vessa/Base/VSLog.h"

namespace {

using test::date;

const VSObjectType* type(VSTypeCode code) {
    return VSObjectType::dataTypeWithCode(code);
}

VSValue::Dictionary entry(const std::string& identifier, double value, double offset) {
    return {{"dataTypeIdentifier", identifier}, {"value", value}, {"dateOffsetInterval", offset}};
}

VSValue::Dictionary entry(VSTypeCode code, double value, double offset) {
    return entry(type(code)->identifier(), value, offset);
}

/// Everything in one list.
std::vector<VSSamplePtr> build(const VSValue::Array& entries) {
    std::vector<VSSamplePtr> all;
    const QVDemoUnits units{{type(VSCode::BloodPressureSystolic), VSUnit::fromString("mmHg")},
                            {type(VSCode::BloodPressureDiastolic), VSUnit::fromString("mmHg")},
                            {type(VSCode::StepCount), VSUnit::fromString("count")},
                            {type(VSCode::BloodGlucose), VSUnit::fromString("mg/dL")},
                            {type(VSCode::BodyMass), VSUnit::fromString("lb")}};
    QVBuildDemoSamples(
        entries, date("2020-03-31"), units, 10'000,
        [&all](std::vector<VSSamplePtr> batch, bool) { all.insert(all.end(), batch.begin(), batch.end()); });
    return all;
}

class DemoSamples : public testing::Test {
 protected:
    test::FixedEnvironment environment_{"2020-03-31T20:00"};
};

TEST_F(DemoSamples, SpansAreRelativeToTheStartOfToday) {
    auto withEnd = entry(VSCode::StepCount, 500, -3600);
    withEnd.emplace("dateOffsetIntervalEnd", 1800.5);
    withEnd.emplace("metadata", VSMetadata{{"Place", "home"}});
    auto backwards = entry(VSCode::StepCount, 1, 0);
    backwards.emplace("dateOffsetIntervalEnd", -1);
    const auto samples = build({withEnd, entry(VSCode::StepCount, 5, 60), backwards,
                                entry("VSQuantityTypeIdentifierUnknown", 1, 0),
                                entry(VSCode::DateOfBirth, 1, 0), VSValue("not an entry")});
    ASSERT_EQ(samples.size(), 2u);
    EXPECT_EQ(samples[0]->startDate(), date("2020-03-30T23:00"));
    EXPECT_EQ(samples[0]->endDate(), date("2020-03-31T00:30:00.5"));
    EXPECT_EQ(samples[0]->metadata(), (VSMetadata{{"Place", "home"}}));
    EXPECT_EQ(samples[1]->startDate(), samples[1]->endDate());
}

TEST_F(DemoSamples, UnitsAreTheEntrysThenTheTypesOwnThenThePreferredOne) {
    auto kilograms = entry(VSCode::BodyMass, 68, 0);
    kilograms.emplace("unit", "kg");
    auto unfit = kilograms;
    unfit.insert_or_assign("unit", "cm");
    auto named = entry(VSCode::BloodGlucose, 5.5, 0);
    named.emplace("unit", "mmol/L");
    const auto samples =
        build({kilograms, unfit, named, entry(VSCode::BodyMass, 150, 0), entry(VSCode::BloodGlucose, 99, 0)});
    ASSERT_EQ(samples.size(), 4u);
    const auto value = [&samples](size_t index, const char* unit) {
        return static_cast<const VSQuantitySample&>(*samples[index])
            .quantity()
            .doubleValueForUnit(VSUnit::fromString(unit));
    };
    EXPECT_DOUBLE_EQ(value(0, "kg"), 68);
    EXPECT_NEAR(value(1, "mg/dL"), 5.5 * 18.01558, 1e-9);
    EXPECT_DOUBLE_EQ(value(2, "lb"), 150);
    EXPECT_DOUBLE_EQ(value(3, "mg/dL"), 99);
}

TEST_F(DemoSamples, PressuresGatherIntoACorrelation) {
    const auto systolic = entry(VSCode::BloodPressureSystolic, 120, 0),
               diastolic = entry(VSCode::BloodPressureDiastolic, 80, 0);
    const auto together = entry(VSCode::BloodPressure, 0, 0);
    auto samples =
        build({systolic, together, diastolic, together, together, systolic, diastolic, systolic, together});
    std::vector<size_t> members;
    for (const auto& sample : samples)
        if (const auto* correlation = dynamic_cast<const VSCorrelation*>(sample.get()))
            members.push_back(correlation->objects().size());
    EXPECT_EQ(members, (std::vector<size_t>{2, 3})) << "one alone makes none; those used are not used again";
    EXPECT_EQ(samples.size(), 5u + 2u) << "the pressures stand by themselves as well";
}

TEST_F(DemoSamples, MenstrualFlowMarksTheStartOfCycles) {
    const auto flow = [](double value) { return entry(VSCode::MenstrualFlow, value, 0); };
    const auto marks = [](const std::vector<VSSamplePtr>& samples) {
        std::vector<std::pair<int, bool>> result;
        for (const auto& sample : samples)
            result.emplace_back(static_cast<const VSCategorySample&>(*sample).value(),
                                *sample->metadata().at(VSMetadataKeyMenstrualCycleStart).boolean());
        return result;
    };
    using Marks = std::vector<std::pair<int, bool>>;
    EXPECT_EQ(marks(build({flow(1), flow(3), flow(2)})), (Marks{{3, true}, {2, false}}));
    EXPECT_EQ(marks(build({flow(2), flow(9), flow(1), flow(4)})), (Marks{{2, true}, {4, false}, {4, true}}));
}

TEST_F(DemoSamples, SexualActivityKeepsItsProtectionInTheMetadata) {
    const auto samples = build({entry(VSCode::SexualActivity, 1, 0), entry(VSCode::SexualActivity, 2, 0),
                                entry(VSCode::SexualActivity, 3, 0)});
    ASSERT_EQ(samples.size(), 3u);
    EXPECT_TRUE(samples[0]->metadata().empty());
    EXPECT_EQ(samples[1]->metadata().at(VSMetadataKeySexualActivityProtectionUsed), VSValue(true));
    EXPECT_EQ(samples[2]->metadata().at(VSMetadataKeySexualActivityProtectionUsed), VSValue(false));
    for (const auto& sample : samples) EXPECT_EQ(static_cast<const VSCategorySample&>(*sample).value(), 0);
}

TEST_F(DemoSamples, WorkoutsHaveEnergyAndDistance) {
    auto plain = entry(std::string(VSWorkoutTypeIdentifier), 37, 0);
    plain.emplace("dateOffsetIntervalEnd", 1800);
    plain.emplace("metadata", VSMetadata{{"Place", "park"}});
    auto full = plain;
    full.emplace("energyBurned", 410);
    full.emplace("totalDistance", 5.5);
    const auto samples = build({plain, full});
    ASSERT_EQ(samples.size(), 2u);
    const auto& first = static_cast<const VSWorkout&>(*samples[0]);
    EXPECT_EQ(first.workoutActivityType(), 37);
    EXPECT_EQ(first.totalEnergyBurned()->doubleValueForUnit(VSUnit::kilocalorieUnit()), 250);
    EXPECT_EQ(first.totalDistance()->doubleValueForUnit(VSUnit::mileUnit()), 3);
    EXPECT_TRUE(first.metadata().empty());
    const auto& second = static_cast<const VSWorkout&>(*samples[1]);
    EXPECT_EQ(second.totalEnergyBurned()->doubleValueForUnit(VSUnit::kilocalorieUnit()), 410);
    EXPECT_EQ(second.totalDistance()->doubleValueForUnit(VSUnit::mileUnit()), 5.5);
}

TEST_F(DemoSamples, ComeInBatches) {
    const VSValue::Array entries(25'000, VSValue(entry(VSCode::StepCount, 1, 0)));
    std::vector<size_t> sizes;
    std::vector<bool> last;
    const QVDemoUnits units{{type(VSCode::StepCount), VSUnit::fromString("count")}};
    const auto note = [&](std::vector<VSSamplePtr> batch, bool isLast) {
        sizes.push_back(batch.size());
        last.push_back(isLast);
    };
    QVBuildDemoSamples(entries, date("2020-03-31"), units, 10'000, note);
    EXPECT_EQ(sizes, (std::vector<size_t>{10'000, 10'000, 5'000}));
    EXPECT_EQ(last, (std::vector<bool>{false, false, true}));
}

TEST_F(DemoSamples, AReadingAndItsValuesAreInOneBatch) {
    VSValue::Array entries;
    for (int i = 0; i < 50; ++i) {
        for (const VSTypeCode code :
             {VSCode::StepCount, VSCode::BloodPressureSystolic, VSCode::BloodPressureDiastolic})
            entries.emplace_back(entry(code, 100, i));
        entries.emplace_back(entry("VSCorrelationTypeIdentifierBloodPressure", 0, i));
    }
    for (const size_t batchSize : {1u, 2u, 3u, 5u, 7u, 1000u}) {
        size_t objects = 0;
        QVBuildDemoSamples(entries, date("2020-03-31"),
                           {{type(VSCode::StepCount), VSUnit::fromString("count")},
                            {type(VSCode::BloodPressureSystolic), VSUnit::fromString("mmHg")},
                            {type(VSCode::BloodPressureDiastolic), VSUnit::fromString("mmHg")}},
                           batchSize, [&](const std::vector<VSSamplePtr>& batch, bool) {
                               const std::set<VSSamplePtr> together(batch.begin(), batch.end());
                               for (const auto& sample : batch) {
                                   const auto* reading = dynamic_cast<const VSCorrelation*>(sample.get());
                                   for (size_t i = 0; reading && i < reading->objects().size(); ++i)
                                       EXPECT_TRUE(together.contains(reading->objects()[i])) << batchSize;
                               }
                               objects += batch.size();
                           });
        EXPECT_EQ(objects, 200u) << batchSize;
    }
}

class DemoReset : public testing::Test {
 protected:
    DemoReset() {
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        unitController_ = std::make_shared<VSUnitController>(store_);
    }

    static VSValue::Dictionary document() {
        std::ifstream file(QELVAR_TEST_DATA "/demo.plist", std::ios::binary);
        const std::string text((std::istreambuf_iterator<char>(file)), {});
        return *platform::readPropertyList(text)->dictionary();
    }
    /// Asks for a rebuild and waits for its end; whether one was made.
    bool reset(const std::string& sex) {
        QVDemoData demo(store_, unitController_, [this] { ++saves_; });
        const bool due = demo.isDue(sex);
        demo.resetDemoData(document(), sex);
        EXPECT_EQ(demo.isResetting(), due);
        EXPECT_TRUE(test::waitUntil([&demo] { return !demo.isResetting(); }));
        return due;
    }
    std::vector<VSSamplePtr> samples(VSTypeCode code) {
        return *store_->samples(type(code), VSPredicate(), 0, {});
    }

    test::FixedEnvironment environment_{"2020-03-31T20:00"};
    test::TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
    std::shared_ptr<VSUnitController> unitController_;
    int saves_ = 0;
};

TEST_F(DemoReset, ReplacesWhatIsInTheStore) {
    const auto old = std::make_shared<const VSQuantitySample>(type(VSCode::HeartRate),
                                                              VSQuantity(VSUnit::fromString("count/min"), 99),
                                                              date("2020-03-01"), date("2020-03-01"));
    const auto pressure = std::make_shared<const VSQuantitySample>(
        type(VSCode::BloodPressureSystolic), VSQuantity(VSUnit::fromString("mmHg"), 120), date("2020-03-01"),
        date("2020-03-01"));
    const auto reading =
        std::make_shared<const VSCorrelation>(type(VSCode::BloodPressure), date("2020-03-01"),
                                              date("2020-03-01"), std::vector<VSSamplePtr>{pressure});
    ASSERT_TRUE(store_->saveObjectsAndWait({old, reading}).ok());
    EXPECT_TRUE(reset("Female"));
    EXPECT_EQ(saves_, 1);
    const auto heartRates = samples(VSCode::HeartRate);
    ASSERT_EQ(heartRates.size(), 1u);
    EXPECT_EQ(heartRates[0]->startDate(), date("2020-03-30T23:00"));
    EXPECT_EQ(samples(VSCode::StepCount).size(), 1u);
    EXPECT_TRUE(samples(VSCode::BloodPressureSystolic).empty());
    EXPECT_TRUE(samples(VSCode::BloodPressure).empty()) << "a reading goes with its values";

    test::Promise<VSMedicalIDData> medicalID;
    store_->fetchMedicalIDData([&medicalID](const auto& result) {
        medicalID.set(result.ok() && *result ? **result : VSMedicalIDData());
    });
    const auto data = medicalID.wait();
    ASSERT_TRUE(data);
    EXPECT_EQ(data->name, "Kim Example");
    EXPECT_EQ(data->birthdate, (VSBirthDate{1990, 2, 3}));
    EXPECT_FALSE(data->allergyInfo);
    ASSERT_TRUE(data->pictureData) << "the picture of the resources";
    EXPECT_EQ((*data->pictureData)[0], 0xff) << "a JPEG";
    EXPECT_EQ(*store_->biologicalSex(), 1);
    EXPECT_EQ(*store_->bloodType(), 7);
    EXPECT_EQ(*store_->fitzpatrickSkinType(), 4);
    EXPECT_EQ(*store_->dateOfBirth(), (VSBirthDate{1990, 2, 3}));
}

TEST_F(DemoReset, HappensOnceADayAndVariant) {
    EXPECT_TRUE(reset(""));
    EXPECT_EQ(*store_->biologicalSex(), 2);
    EXPECT_EQ(*store_->bloodType(), 1);
    EXPECT_EQ(*store_->fitzpatrickSkinType(), 3);
    EXPECT_FALSE(reset(""));
    EXPECT_TRUE(reset("Female")) << "another variant";
    EXPECT_FALSE(reset("Female"));
    environment_->setNow(date("2020-04-01T00:00:01"));
    EXPECT_TRUE(reset("Female")) << "another day";
    EXPECT_EQ(samples(VSCode::StepCount).at(0)->startDate(), date("2020-04-01"));
    EXPECT_EQ(samples(VSCode::StepCount).size(), 1u);
}

TEST_F(DemoReset, AFailedDeletionIsTriedAgain) {
    VSHealthStore::Options options;
    options.readOnly = true;
    auto readOnly = VSHealthStore::open(folder_.path() / "store", options);
    ASSERT_TRUE(readOnly.ok());
    const auto previous = VSSetLogSink([](VSLogLevel, std::string_view) {});
    {
        QVDemoData demo(*readOnly, unitController_);
        demo.resetDemoData(document(), "");
        EXPECT_TRUE(test::waitUntil([&demo] { return !demo.isResetting(); }));
        EXPECT_TRUE(demo.isDue(""));
    }
    VSSetLogSink(previous);
    EXPECT_TRUE(reset(""));
}

TEST(DemoDocument, IsWholeAndQuickToRead) {
    test::FixedEnvironment environment;
    const auto head = QVDemoDataHead();
    ASSERT_TRUE(head);
    EXPECT_FALSE(head->contains("samples"));
    ASSERT_TRUE(head->contains("dashboardDataUnitGroups"));
    const auto dictionary = QVDemoDataDictionary();
    ASSERT_TRUE(dictionary.ok()) << dictionary.error().message;
    const VSValue::Array& entries = *dictionary->at("samples").array();
    QVDemoUnits units;
    for (const VSObjectType* each : VSObjectType::allTypes())
        if (each->isQuantityType()) units.insert_or_assign(each, each->canonicalUnit());
    size_t count = 0;
    QVBuildDemoSamples(entries, date("2020-03-31"), units, 10'000,
                       [&count](std::vector<VSSamplePtr> batch, bool) { count += batch.size(); });
    EXPECT_GT(count, entries.size() * 95 / 100) << "entries without a sample are few";
}

}  // namespace
