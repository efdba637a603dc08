// Pictures of whole cards against tests/data/cards: one sheet of cards beneath each other for each locale,
// clock and scale. QELVAR_UPDATE_GOLDEN=1 DashboardTests writes them anew.

#include <QPainter>
#include <algorithm>
#include <cmath>

#include "PictureTestSupport.h"
#include "Platform/Localization.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/Controllers/QVControllerManager.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "QtTestSupport.h"
#include "TestSupport.h"

namespace {

constexpr double kWidth = 320;

class CardGoldens : public testing::Test {
 protected:
    CardGoldens() {
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
        for (int day = 1; day <= 31; ++day) {
            const auto at = [day](const char* time) {
                return test::date("2020-03-" + std::string(day < 10 ? "0" : "") + std::to_string(day) + time);
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
        add(VSCode::Height, 1.78, "m", test::date("2019-11-20T12:00"));
        add(VSCode::BodyMassIndex, 420, "count", test::date("2020-03-28T12:00"));
        for (const int hour : {8, 9, 10, 13, 14, 17})
            category(VSCode::ZentroStandHour, hour % 3 == 0 ? 1 : 0, hour, hour + 1);
        category(VSCode::SleepAnalysis, 1, 0, 6);
        for (const int day : {-5, -4, -3, -1})
            category(VSCode::MenstrualFlow, 1, 24 * day + 8, 24 * day + 9,
                     {{VSMetadataKeyMenstrualCycleStart, day == -5}});
        EXPECT_TRUE(store_->saveObjectsAndWait(samples_).ok());
    }
    ~CardGoldens() override { QVUserDefaults::sharedDefaults().setHealthStore(nullptr); }

    void add(VSTypeCode code, double value, const char* unit, VSDate at) {
        samples_.push_back(std::make_shared<const VSQuantitySample>(
            VSObjectType::dataTypeWithCode(code), VSQuantity(VSUnit::fromString(unit), value), at, at));
    }
    void category(VSTypeCode code, int value, int from, int to, VSMetadata metadata = {}) {
        const VSDate day = test::date("2020-03-31");
        VSProvenance provenance;
        provenance.metadata = std::make_shared<const VSMetadata>(std::move(metadata));
        samples_.push_back(std::make_shared<const VSCategorySample>(
            VSObjectType::dataTypeWithCode(code), value, day + std::chrono::hours(from),
            day + std::chrono::hours(to), provenance));
    }

    struct Card {
        const VSDataUnitGroup* group;
        QVTimeScope timeScope;
    };
    static std::vector<Card> cards() {
        const auto& groups = VSDataUnitGroupController::shared();
        const auto& all = groups.allDataUnitGroups();
        // It has no records, and its title shrinks.
        const auto* longest = *std::max_element(all.begin(), all.end(), [](const auto* a, const auto* b) {
            return a->displayName().size() < b->displayName().size();
        });
        const auto group = [&groups](int id) { return groups.dataUnitGroupWithID(id); };
        return {{group(VSGroupID::HeartRate), QVTimeScope::Day},
                {group(VSGroupID::Steps), QVTimeScope::Week},
                {group(VSGroupID::BloodPressure), QVTimeScope::Week},
                {group(VSGroupID::StandHours), QVTimeScope::Day},
                {group(VSGroupID::SleepAnalysis), QVTimeScope::Day},
                {group(VSGroupID::MenstrualFlow), QVTimeScope::Week},
                {group(VSGroupID::Height), QVTimeScope::Year},
                {group(1), QVTimeScope::Month},  // body mass index, above what is shown
                {longest, QVTimeScope::Week}};
    }
    /// The card, and where its texts stand in its picture.
    QImage picture(const Card& card, double scale, std::vector<QRect>& texts) {
        const auto item = QVDashboardChartItem::create(
            card.group, VSDataCategoryController::shared().categoryWithID(card.group->categoryID()),
            manager_->unitController(), store_);
        QVDashboardTableViewCell cell;
        QVAnimationTime time{1};
        cell.chartView().setAnimationClock([&time] { return time; });
        cell.setSize({kWidth, QVDashboardTableViewCell::preferredCellHeight()});
        cell.setDateCache(std::shared_ptr<QVDateCache>(manager_, &manager_->dateCache()));
        cell.setTimeScope(card.timeScope);
        cell.setChartItem(item);
        item->activate();
        EXPECT_TRUE(test::waitUntil([&] {
            cell.render(scale);
            time += std::chrono::seconds(1);
            cell.chartView().advance(time);
            return cell.isSettled();
        }));
        const QVDashboardCellLayout layout = cell.cellLayout();
        for (const QRectF& text : {layout.title, layout.value, layout.average, layout.lastUpdated})
            if (!text.isEmpty())
                texts.push_back(QRectF(text.topLeft() * scale, text.size() * scale).toRect());
        return cell.render(scale);
    }

    test::FixedEnvironment environment_{"2020-03-31T20:00"};
    test::TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
    std::shared_ptr<QVControllerManager> manager_;
    std::vector<VSSamplePtr> samples_;
};

TEST_F(CardGoldens, InEveryLanguageOnBothClocksAtTwoScales) {
    struct Sheet {
        const char* locale;
        double scale;
        const char* name;
    };
    for (const auto& [locale, scale, name] :
         {Sheet{"en_US", 2, "en-12"}, Sheet{"en_US@hours=h23", 1, "en-24"}, Sheet{"de_DE", 1, "de-24"},
          Sheet{"de_DE@hours=h12", 2, "de-12"}, Sheet{"ar_EG", 2, "ar-12"},
          Sheet{"ar_EG@hours=h23", 1, "ar-24"}, Sheet{"hi_IN", 1, "hi-12"},
          Sheet{"hi_IN@hours=h23", 2, "hi-24"}}) {
        environment_->setLocale(locale);
        platform::loadTranslations();
        manager_ = std::make_shared<QVControllerManager>(store_);
        std::vector<QImage> pictures;
        std::vector<QRect> texts;
        for (const Card& card : cards()) {
            std::vector<QRect> own;
            pictures.push_back(picture(card, scale, own));
            const int top = pictures.front().height() * static_cast<int>(pictures.size() - 1);
            for (const QRect& text : own) texts.push_back(text.translated(0, top));
        }
        QImage sheet(pictures.front().width(), pictures.front().height() * static_cast<int>(pictures.size()),
                     QImage::Format_RGB32);
        QPainter painter(&sheet);
        for (size_t i = 0; i < pictures.size(); ++i) {
            pictures[i].setDevicePixelRatio(1);
            painter.drawImage(0, pictures[i].height() * static_cast<int>(i), pictures[i]);
        }
        painter.end();
        EXPECT_TRUE(test::matchesPicture(sheet, std::string("cards/") + name, 12, 0.002, texts));
    }
    environment_->setLocale("en_US");
    platform::loadTranslations();
}

}  // namespace
