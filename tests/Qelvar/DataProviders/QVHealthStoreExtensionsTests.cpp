#include "Qelvar/DataProviders/QVHealthStoreExtensions.h"

#include "ProviderTestSupport.h"

using namespace test;

namespace {

class StoreExtensionsTest : public ProviderTest {
 protected:
    VSSamplePtr mostRecent(VSTypeCode code, const std::optional<VSPredicate>& predicate = {}) {
        Promise<VSSamplePtr> answer;
        mostRecentSampleOfType(*store, type(code), predicate, [&](const VSResult<VSSamplePtr>& result) {
            answer.set(result.ok() ? *result : nullptr);
        });
        return answer.wait().value_or(nullptr);
    }
    std::optional<double> bmi() {
        std::optional<std::optional<double>> answer;
        calculateBMI(*store, [&](std::optional<double> value) {
            EXPECT_TRUE(platform::isMainThread());
            answer = value;
        });
        EXPECT_TRUE(waitUntil([&] { return answer.has_value(); }));
        return answer.value_or(std::nullopt);
    }
};

}  // namespace

TEST_F(StoreExtensionsTest, TheMostRecentSampleEndsLastAndDoesNotStartTomorrow) {
    EXPECT_FALSE(mostRecent(VSCode::StepCount));
    save({quantity(VSCode::StepCount, 1, "count", "2020-03-14T08:00", "2020-03-14T12:00"),
          quantity(VSCode::StepCount, 2, "count", "2020-03-14T09:00", "2020-03-14T10:00"),
          quantity(VSCode::StepCount, 3, "count", "2020-03-15T00:00", "2020-03-15T01:00")});
    EXPECT_EQ(mostRecent(VSCode::StepCount)->startDate(), date("2020-03-14T08:00"));
    EXPECT_EQ(mostRecent(VSCode::StepCount, VSPredicate::samplesStartingBefore(date("2020-03-14T08:30")))
                  ->startDate(),
              date("2020-03-14T08:00"));
    // Of two that end together, the one saved last.
    save({quantity(VSCode::StepCount, 4, "count", "2020-03-14T11:00", "2020-03-14T12:00")});
    EXPECT_EQ(mostRecent(VSCode::StepCount)->startDate(), date("2020-03-14T11:00"));
    // It becomes the most recent one when its day has come.
    environment->setNow(date("2020-03-15T00:30"));
    EXPECT_EQ(mostRecent(VSCode::StepCount)->startDate(), date("2020-03-15T00:00"));
}

TEST_F(StoreExtensionsTest, AveragesInTheUnitAskedFor) {
    const auto average = [&](const VSPredicate& predicate) {
        Promise<std::optional<double>> answer;
        averageQuantityForType(*store, type(VSCode::BodyMass), VSUnit::fromString("g"), predicate,
                               [&](const VSResult<std::optional<double>>& result) {
                                   answer.set(result.ok() ? *result : std::nullopt);
                               });
        return *answer.wait();
    };
    EXPECT_FALSE(average({}));
    save({reading(VSCode::BodyMass, 70, "kg", "2020-03-01T08:00"),
          reading(VSCode::BodyMass, 72, "kg", "2020-03-02T08:00")});
    EXPECT_NEAR(*average({}), 71000, 1e-6);
    EXPECT_NEAR(*average(VSQuery::predicateForSamples(date("2020-03-02"), date("2020-03-03"), 0)), 72000,
                1e-6);
}

TEST_F(StoreExtensionsTest, BodyMassIndex) {
    EXPECT_FALSE(bmi());
    save({reading(VSCode::BodyMass, 81, "kg", "2020-03-02T08:00")});
    EXPECT_FALSE(bmi()) << "without a height there is none";
    save({reading(VSCode::Height, 180, "cm", "2020-03-01T08:00")});
    EXPECT_NEAR(bmi().value_or(0), 25.0, 1e-12);
}

TEST_F(StoreExtensionsTest, ACorrelationIsDeletedWithItsMembers) {
    const auto upper = reading(VSCode::BloodPressureSystolic, 120, "mmHg", "2020-03-10T08:00");
    const auto lower = reading(VSCode::BloodPressureDiastolic, 80, "mmHg", "2020-03-10T08:00");
    save({std::make_shared<VSCorrelation>(type(VSCode::BloodPressure), upper->startDate(), upper->endDate(),
                                          std::vector<VSSamplePtr>{upper, lower}),
          reading(VSCode::BloodPressureSystolic, 130, "mmHg", "2020-03-09T08:00")});
    const auto correlation = mostRecent(VSCode::BloodPressure);
    ASSERT_TRUE(correlation);
    const auto remove = [&](const VSSamplePtr& object) {
        Promise<bool> done;
        deleteObjectWithHealthStore(object, *store, [&](const VSStatus& status) { done.set(status.ok()); });
        return done.wait().value_or(false);
    };
    EXPECT_TRUE(remove(correlation));
    EXPECT_FALSE(mostRecent(VSCode::BloodPressure));
    EXPECT_FALSE(mostRecent(VSCode::BloodPressureDiastolic));
    const auto other = mostRecent(VSCode::BloodPressureSystolic);
    ASSERT_TRUE(other);
    EXPECT_EQ(other->startDate(), date("2020-03-09T08:00"));
    EXPECT_TRUE(remove(other));
    EXPECT_FALSE(remove(other)) << "what is gone cannot be deleted";
}
