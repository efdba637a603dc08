#include "Qelvar/DataProviders/QVDataProvider.h"

#include <mutex>

#include "ProviderTestSupport.h"
#include "Qelvar/DataProviders/QVDiscreteAverageDataProvider.h"
#include "Vessa/Base/VSLog.h"

using namespace test;

namespace {

/// A provider that asks nothing: what is taken in is what the test hands it.
class SilentProvider final : public QVDataProvider {
 public:
    using QVDataProvider::QVDataProvider;
    void restartQueries() override {
        QVDataProvider::restartQueries();
        ++restarts;
    }
    const char* className() const override { return "SilentProvider"; }
    using QVDataProvider::Answer;
    using QVDataProvider::beginQuery;
    int restarts = 0;
};

class DataProviderTest : public ProviderTest {
 protected:
    void SetUp() override {
        weight->setDelegate(delegate);
        weight->setStartDate(date("2020-03-08"), date("2020-03-15"), QVTimeScope::Week);
    }
    static QVDataProvider::Points points(std::vector<std::optional<double>> values) {
        QVDataProvider::Points result;
        for (size_t i = 0; i < values.size(); ++i)
            result.push_back(
                QVChartPointNumeric::chartPoint(date("2020-03-08") + std::chrono::hours(24 * i), values[i]));
        return result;
    }
    const VSDataUnitGroup* bodyMass =
        VSDataUnitGroupController::shared().dataUnitGroupForType(type(VSCode::BodyMass));
    std::shared_ptr<SilentProvider> weight = std::make_shared<SilentProvider>(
        bodyMass->anyDataUnit(), bodyMass->chartingRules(), unitController, store);
    std::shared_ptr<RecordingDelegate> delegate = std::make_shared<RecordingDelegate>();
    const VSError broken{VSErrorCode::Corrupt, "page 7 is damaged"};
};

}  // namespace

TEST_F(DataProviderTest, StatesFollowQuestionsAndAnswers) {
    EXPECT_EQ(weight->historicalDataState(), QVDataState::NotLoaded);
    weight->restartQueries();
    EXPECT_EQ(weight->historicalDataState(), QVDataState::Loading);
    EXPECT_EQ(weight->secondaryValueDataState(), QVDataState::Loading);
    EXPECT_EQ(weight->currentValueDataState(), QVDataState::NotLoaded);
    weight->stopQueries();
    EXPECT_EQ(weight->historicalDataState(), QVDataState::NotLoaded);
    EXPECT_EQ(weight->secondaryValueDataState(), QVDataState::NotLoaded);

    weight->intake().updateHistoricalData(points({70}), QVTimeScope::Week, {});
    weight->intake().updateAverage(70, {}, {}, QVTimeScope::Week, {});
    weight->intake().updateCurrentValue(70, date("2020-03-08"), {});
    EXPECT_FALSE(weight->hasLoadedHistoricalData()) << "answers hop to the main queue";
    drainMainQueue();
    EXPECT_TRUE(weight->hasLoadedHistoricalData() && weight->hasLoadedSecondaryValues() &&
                weight->hasLoadedCurrentValue());
    weight->restartQueries();
    EXPECT_TRUE(weight->hasLoadedHistoricalData()) << "what is loaded stays so while it is asked for again";
    weight->invalidateCachedData();
    EXPECT_EQ(weight->currentValueDataState(), QVDataState::NotLoaded);
    EXPECT_EQ(weight->currentValue(), 70);
    EXPECT_TRUE(weight->hasLoadedHistoricalData());
}

TEST_F(DataProviderTest, AnswersForAnotherScopeSetItsStateButStoreNoPoints) {
    weight->setStartDate(date("2020-02-14"), date("2020-03-15"), QVTimeScope::Month);
    weight->intake().updateHistoricalData(points({70, 71}), QVTimeScope::Week, {});
    drainMainQueue();
    EXPECT_EQ(delegate->historical, 0);
    weight->setStartDate(date("2020-03-08"), date("2020-03-15"), QVTimeScope::Week);
    EXPECT_TRUE(weight->hasLoadedHistoricalData());
    EXPECT_TRUE(weight->historicalData().empty());
}

TEST_F(DataProviderTest, TellsOnlyWhatChanged) {
    const auto answer = [&] {
        weight->intake().updateHistoricalData(points({70, std::nullopt, 71}), QVTimeScope::Week, {});
    };
    answer();
    answer();
    drainMainQueue();
    EXPECT_EQ(delegate->historical, 1);
    weight->intake().updateHistoricalData(points({70, 72, 71}), QVTimeScope::Week, {});
    drainMainQueue();
    EXPECT_EQ(delegate->historical, 2);

    weight->intake().updateAverage(70, 69, 71, QVTimeScope::Week, {});
    weight->intake().updateAverage(70, 69, 71, QVTimeScope::Week, {});
    drainMainQueue();
    EXPECT_EQ(delegate->secondary, 1);
    // Missing values equal nothing.
    weight->intake().updateAverage(70, {}, {}, QVTimeScope::Week, {});
    weight->intake().updateAverage(70, {}, {}, QVTimeScope::Week, {});
    drainMainQueue();
    EXPECT_EQ(delegate->secondary, 3);

    weight->intake().updateCurrentValue(70, date("2020-03-08"), {});
    weight->intake().updateCurrentValue(70, date("2020-03-08"), {});
    weight->intake().updateCurrentValue(70, date("2020-03-09"), {});
    drainMainQueue();
    EXPECT_EQ(delegate->current, 2);
    // An invalidated value was taken off the screen: it must come back.
    weight->invalidateCachedData();
    weight->intake().updateCurrentValue(70, date("2020-03-09"), {});
    drainMainQueue();
    EXPECT_EQ(delegate->current, 3);
}

TEST_F(DataProviderTest, OneSecondaryValueServesAllScopes) {
    for (int round = 1; round <= 2; ++round) {
        weight->intake().updateSecondaryValue(5, {});
        drainMainQueue();
        EXPECT_EQ(delegate->secondary, 5 * round);
    }
    for (int scope = 0; scope < QVTimeScopeCount; ++scope) {
        weight->setStartDate({}, {}, QVTimeScope{scope});
        EXPECT_EQ(weight->averageValue(), 5);
    }
}

TEST_F(DataProviderTest, ErrorsClearThePointsAndAreLogged) {
    std::mutex mutex;
    std::vector<std::pair<VSLogLevel, std::string>> lines;
    const auto before = VSSetLogSink([&](VSLogLevel level, std::string_view line) {
        std::lock_guard lock(mutex);
        lines.emplace_back(level, line);
    });
    weight->intake().updateHistoricalData(points({70}), QVTimeScope::Week, {});
    weight->intake().updateHistoricalData({}, QVTimeScope::Week, broken);
    weight->intake().updateAverage({}, {}, {}, QVTimeScope::Year,
                                   VSError{VSErrorCode::NotAccessible, "locked"});
    weight->intake().updateCurrentValue({}, {}, broken);
    drainMainQueue();
    VSSetLogSink(before);
    EXPECT_EQ(weight->historicalDataState(), QVDataState::Failed);
    EXPECT_TRUE(weight->historicalData().empty());
    EXPECT_EQ(weight->currentValueDataState(), QVDataState::Failed);
    EXPECT_EQ(delegate->historical, 2);
    std::lock_guard lock(mutex);
    ASSERT_EQ(lines.size(), 3u);
    EXPECT_EQ(lines[0].first, VSLogLevel::Error);
    EXPECT_EQ(lines[0].second,
              "SilentProvider: Error loading historical data for time scope (2): page 7 is damaged");
    // The locked store is no news to anybody.
    EXPECT_EQ(lines[1].first, VSLogLevel::Debug);
    EXPECT_EQ(lines[1].second, "SilentProvider: Error updating average/min/max for time scope (4): locked");
    EXPECT_EQ(lines[2].second, "SilentProvider: Error updating current value data: page 7 is damaged");
}

TEST_F(DataProviderTest, AnswersNeverGoBackInTime) {
    // A query that was replaced may still be answering; for another scope it is not replaced.
    const auto replaced = weight->beginQuery(SilentProvider::Answer::Historical, QVTimeScope::Week);
    weight->beginQuery(SilentProvider::Answer::Historical, QVTimeScope::Week);
    weight->intake().updateHistoricalData(points({70}), QVTimeScope::Week, {}, {}, replaced);
    drainMainQueue();
    EXPECT_FALSE(weight->hasLoadedHistoricalData());
    const auto kept = weight->beginQuery(SilentProvider::Answer::Historical, QVTimeScope::Week);
    weight->beginQuery(SilentProvider::Answer::Historical, QVTimeScope::Month);
    weight->intake().updateHistoricalData(points({70}), QVTimeScope::Week, {}, {}, kept);
    drainMainQueue();
    EXPECT_TRUE(weight->hasLoadedHistoricalData());
}

TEST_F(DataProviderTest, UnitPreferencesConcernOnlyTheirTypes) {
    const VSUnit kg = VSUnit::fromString("kg"), lb = VSUnit::fromString("lb");
    unitController->updatePreferredUnit(kg, bodyMass->anyDataUnit());
    weight->intake().updateHistoricalData(points({70, std::nullopt}), QVTimeScope::Week, {}, kg);
    weight->intake().updateAverage(70, 69, 71, QVTimeScope::Year, {}, kg);
    weight->intake().updateCurrentValue(70, date("2020-03-08"), {}, kg);
    drainMainQueue();
    const int restarts = weight->restarts;

    const VSDataUnit* height = group(VSGroupID::Height)->anyDataUnit();
    unitController->updatePreferredUnit(VSUnit::fromString("cm"), height);
    unitController->updatePreferredUnit(VSUnit::fromString("ft"), height);
    EXPECT_EQ(weight->restarts, restarts);
    EXPECT_TRUE(weight->hasLoadedCurrentValue());

    const int told = delegate->historical, toldCurrent = delegate->current;
    unitController->updatePreferredUnit(lb, bodyMass->anyDataUnit());
    EXPECT_EQ(delegate->current, toldCurrent + 1);
    EXPECT_TRUE(weight->holdsCurrentValue()) << "it is shown while it is asked for again";
    EXPECT_EQ(weight->restarts, restarts + 1);
    EXPECT_EQ(weight->currentValueDataState(), QVDataState::NotLoaded);
    EXPECT_EQ(delegate->historical, told + 1);
    // No number in kg is left to be shown as pounds, in no scope.
    const double pounds = 70 / 0.45359237;
    EXPECT_NEAR(*weight->historicalData()[0]->maxYValue(), pounds, 1e-9);
    EXPECT_FALSE(weight->historicalData()[1]->maxYValue());
    EXPECT_NEAR(*weight->currentValue(), pounds, 1e-9);
    weight->setStartDate({}, {}, QVTimeScope::Year);
    EXPECT_NEAR(*weight->averageValue(), pounds, 1e-9);
    EXPECT_NEAR(*weight->minValue(), 69 / 0.45359237, 1e-9);

    // An answer in kg that was on its way is converted.
    weight->intake().updateAverage(80, {}, {}, QVTimeScope::Year, {}, kg);
    drainMainQueue();
    EXPECT_NEAR(*weight->averageValue(), 80 / 0.45359237, 1e-9);
}

TEST_F(DataProviderTest, SecondaryTextInTheUsersLanguage) {
    EXPECT_EQ(weight->secondaryValueText().plainText(), "Daily Average: No Data");
    unitController->updatePreferredUnit(VSUnit::fromString("kg"), bodyMass->anyDataUnit());
    weight->intake().updateAverage(1234.5, {}, {}, QVTimeScope::Week, {});
    drainMainQueue();
    EXPECT_EQ(weight->secondaryValueText().plainText(), "Daily Average: 1,234.5");
    environment->setLocale("ar_EG");
    platform::loadTranslations();
    EXPECT_EQ(weight->secondaryValueText().plainText(), QString::fromUtf8("المتوسط اليومي: ١٬٢٣٤٫٥"));
}

TEST_F(DataProviderTest, AProviderThatIsGoneIsNotTold) {
    const auto intake = weight->intake();
    weight.reset();
    intake.updateCurrentValue(70, date("2020-03-08"), {});
    intake.updateSecondaryValue(70, {});
    drainMainQueue();
    EXPECT_EQ(delegate->current + delegate->secondary, 0);
    unitController->updatePreferredUnit(VSUnit::fromString("lb"), bodyMass->anyDataUnit());
}
