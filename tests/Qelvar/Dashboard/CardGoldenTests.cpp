// Pictures of whole cards against tests/data/cards: one sheet of cards beneath each other for each row of a
// table. QELVAR_UPDATE_GOLDEN=1 DashboardTests writes them anew.

#include <QPainter>
#include <algorithm>

#include "CardTestSupport.h"
#include "PictureTestSupport.h"

namespace {

struct Card {
    const VSDataUnitGroup* group;
    QVTimeScope timeScope;
};

struct Sheet {
    const char* name;
    const char* locale;
    double width, scale, textScale;
    bool highContrast;
};
constexpr Sheet kSheets[] = {
    {"en-12", "en_US", 320, 2, 1, false}, {"en-24", "en_US@hours=h23", 375, 1, 2, true},
    {"de-24", "de_DE", 320, 1, 2, false}, {"de-12", "de_DE@hours=h12", 375, 2, 1, true},
    {"ar-12", "ar_EG", 320, 2, 1, false}, {"ar-24", "ar_EG@hours=h23", 320, 1, 2, true},
    {"hi-12", "hi_IN", 375, 1, 1, false}, {"hi-24", "hi_IN@hours=h23", 320, 1, 1.4, false},
};

class CardGoldens : public test::CardTest {
 protected:
    static std::vector<Card> cards() {
        const auto& all = VSDataUnitGroupController::shared().allDataUnitGroups();
        // It has no records, and its title shrinks.
        const auto* longest = *std::max_element(all.begin(), all.end(), [](const auto* a, const auto* b) {
            return a->displayName().size() < b->displayName().size();
        });
        return {{group(VSGroupID::HeartRate), QVTimeScope::Day},
                {group(VSGroupID::HeartRate), QVTimeScope::Month},
                {group(VSGroupID::Steps), QVTimeScope::Week},
                {group(VSGroupID::BloodPressure), QVTimeScope::Week},
                {group(VSGroupID::StandHours), QVTimeScope::Day},
                {group(VSGroupID::SleepAnalysis), QVTimeScope::Day},
                {group(VSGroupID::MenstrualFlow), QVTimeScope::Week},
                {group(VSGroupID::Height), QVTimeScope::Year},
                {group(1), QVTimeScope::Month},  // body mass index, above what is shown
                {longest, QVTimeScope::Week}};
    }
    /// The cards beneath each other, and where their texts stand in the picture.
    QImage picture(const Sheet& sheet, std::vector<QRect>& texts) {
        std::vector<QImage> pictures;
        int height = 0;
        for (const auto& [group, timeScope] : cards()) {
            const auto cell = card(group, timeScope, sheet.width, sheet.scale);
            const QVDashboardCellLayout layout = cell->cellLayout();
            for (const QRectF& text : {layout.title, layout.value, layout.average, layout.lastUpdated})
                if (!text.isEmpty())
                    texts.push_back(QRectF(text.topLeft() * sheet.scale, text.size() * sheet.scale)
                                        .toRect()
                                        .translated(0, height));
            pictures.push_back(cell->render(sheet.scale));
            pictures.back().setDevicePixelRatio(1);
            height += pictures.back().height();
        }
        QImage all(pictures.front().width(), height, QImage::Format_RGB32);
        QPainter painter(&all);
        int top = 0;
        for (const QImage& one : pictures) {
            painter.drawImage(0, top, one);
            top += one.height();
        }
        return all;
    }
};

TEST_F(CardGoldens, InEveryLanguageOnBothClocksNormalAndLargeInBothContrasts) {
    for (const Sheet& sheet : kSheets) {
        setLook({sheet.locale, sheet.textScale, sheet.highContrast});
        std::vector<QRect> texts;
        const QImage all = picture(sheet, texts);
        EXPECT_TRUE(test::matchesPicture(all, std::string("cards/") + sheet.name, 12, 0.002, texts));
    }
}

}  // namespace
