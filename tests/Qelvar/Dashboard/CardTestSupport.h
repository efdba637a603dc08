#pragma once

#include <gtest/gtest.h>

#include <cmath>

#include "Platform/Appearance.h"
#include "Platform/Localization.h"
#include "Platform/TextScale.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "QtTestSupport.h"
#include "TestSupport.h"

namespace test {

/// A store of a month of records of many kinds, and cards that show it.
class CardTest : public testing::Test {
 protected:
    CardTest() {
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
        for (int day = 1; day <= 31; ++day) {
            const auto at = [day](const char* time) {
                return date("2020-03-" + std::string(day < 10 ? "0" : "") + std::to_string(day) + time);
            };
            add(VSCode::StepCount, 4000 + 3000 * std::sin(day * 1.7), "count", at("T10:00"));
            for (const char* time : {"T08:30", "T13:00", "T18:15"})
                add(VSCode::HeartRate, 70 + 25 * std::sin(day + time[2]), "count/min", at(time));
            const double systolic = 125 + 12 * std::sin(day * 2.1);
            const auto part = [&](VSTypeCode code, double value) {
                return std::make_shared<const VSQuantitySample>(VSObjectType::dataTypeWithCode(code),
                                                                VSQuantity(VSUnit::fromString("mmHg"), value),
                                                                at("T07:45"), at("T07:45"));
            };
            samples_.push_back(part(VSCode::BloodPressureSystolic, systolic));
            samples_.push_back(part(VSCode::BloodPressureDiastolic, systolic - 45));
        }
        add(VSCode::Height, 1.78, "m", date("2019-11-20T12:00"));
        add(VSCode::BodyMassIndex, 420, "count", date("2020-03-28T12:00"));
        for (const int hour : {8, 9, 10, 13, 14, 17})
            category(VSCode::ZentroStandHour, hour % 3 == 0 ? 1 : 0, hour, hour + 1);
        category(VSCode::SleepAnalysis, 1, 0, 6);
        for (const int day : {-5, -4, -3, -1})
            category(VSCode::MenstrualFlow, 1, 24 * day + 8, 24 * day + 9,
                     {{VSMetadataKeyMenstrualCycleStart, day == -5}});
        EXPECT_TRUE(store_->saveObjectsAndWait(samples_).ok());
    }
    ~CardTest() override {
        setLook({});
        QVUserDefaults::sharedDefaults().setHealthStore(nullptr);
    }

    void add(VSTypeCode code, double value, const char* unit, VSDate at) {
        samples_.push_back(std::make_shared<const VSQuantitySample>(
            VSObjectType::dataTypeWithCode(code), VSQuantity(VSUnit::fromString(unit), value), at, at));
    }
    void category(VSTypeCode code, int value, int from, int to, VSMetadata metadata = {}) {
        const VSDate day = date("2020-03-31");
        VSProvenance provenance;
        provenance.metadata = std::make_shared<const VSMetadata>(std::move(metadata));
        samples_.push_back(std::make_shared<const VSCategorySample>(
            VSObjectType::dataTypeWithCode(code), value, day + std::chrono::hours(from),
            day + std::chrono::hours(to), provenance));
    }

    /// How cards are to look.
    struct Look {
        std::string locale = "en_US";
        double textScale = 1;
        bool highContrast = false;
    };
    void setLook(const Look& look) {
        environment_->setLocale(look.locale);
        platform::loadTranslations();
        platform::TextScale::shared().set(look.textScale);
        platform::Appearance::shared().setHighContrast(look.highContrast);
        manager_ = std::make_shared<QVControllerManager>(store_);
    }
    static const VSDataUnitGroup* group(int id) {
        return VSDataUnitGroupController::shared().dataUnitGroupWithID(id);
    }
    /// A card in the colours of a category (its own when null), at rest.
    std::unique_ptr<QVDashboardTableViewCell> card(const VSDataUnitGroup* group, QVTimeScope timeScope,
                                                   double width, double scale,
                                                   const VSDataCategory* category = nullptr) {
        if (!category) category = VSDataCategoryController::shared().categoryWithID(group->categoryID());
        const auto item = QVDashboardChartItem::create(group, category, manager_->unitController(), store_);
        auto cell = std::make_unique<QVDashboardTableViewCell>();
        const auto time = std::make_shared<QVAnimationTime>(1);
        cell->chartView().setAnimationClock([time] { return *time; });
        cell->setSize({width, QVDashboardTableViewCell::preferredCellHeight()});
        cell->setDateCache(std::shared_ptr<QVDateCache>(manager_, &manager_->dateCache()));
        cell->setTimeScope(timeScope);
        cell->setChartItem(item);
        item->activate();
        EXPECT_TRUE(waitUntil([&] {
            cell->render(scale);
            *time += std::chrono::seconds(1);
            cell->chartView().advance(*time);
            return cell->isSettled();
        }));
        return cell;
    }

    FixedEnvironment environment_{"2020-03-31T20:00"};
    TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
    std::shared_ptr<QVControllerManager> manager_;
    std::vector<VSSamplePtr> samples_;
};

}  // namespace test
