// Every display type is whole: its type, units, ranges, rules, texts and icons.

#include <gtest/gtest.h>

#include <QImage>
#include <cmath>
#include <map>
#include <set>

#include "Platform/Icons.h"
#include "Platform/Localization.h"
#include "TestSupport.h"
#include "VessaUI/VSDataCategory.h"
#include "VessaUI/VSDataUnitGroupCatalogue.h"

namespace {

const std::vector<const VSDataUnitGroup*>& allGroups() {
    return VSDataUnitGroupController::shared().allDataUnitGroups();
}

const VSDataUnitGroup* group(int id) {
    return VSDataUnitGroupController::shared().dataUnitGroupWithID(id);
}

std::string nameOf(const VSDataUnitGroup* group) {
    return group->displayName().toStdString();
}

// A key without a text shows itself.
bool isText(const QString& text) {
    return !text.isEmpty() && !text.startsWith("DISPLAY_TYPE_") && !text.startsWith("UNIT_NAME_");
}

double luminance(const QColor& color) {
    const auto linear = [](double c) {
        return c <= 0.03928 ? c / 12.92 : std::pow((c + 0.055) / 1.055, 2.4);
    };
    return 0.2126 * linear(color.redF()) + 0.7152 * linear(color.greenF()) + 0.0722 * linear(color.blueF());
}
double contrastWithWhite(const QColor& color) {
    return 1.05 / (luminance(color) + 0.05);
}

TEST(Catalogue, ShowsEveryTypeOnce) {
    std::map<const VSObjectType*, int> shown;
    for (const VSDataUnitGroup* g : allGroups())
        for (const VSDataUnit* unit : g->dataUnits()) shown[unit->dataType()] += 1;
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        const VSDataUnitGroup* g = VSDataUnitGroupController::shared().dataUnitGroupForType(type);
        if (type->kind() == VSTypeKind::Correlation) {
            // A meal is shown through its nutrients; a reading of blood pressure is one thing.
            EXPECT_EQ(g != nullptr, type->code() == VSCode::BloodPressure) << type->identifier();
            continue;
        }
        ASSERT_NE(g, nullptr) << type->identifier();
        EXPECT_EQ(shown[type], 1) << type->identifier();
        EXPECT_EQ(g->isCharacteristic(), type->kind() == VSTypeKind::Characteristic) << type->identifier();
    }
}

TEST(Catalogue, BuildsEveryRowOfItsTables) {
    size_t rows = 0, unitsOfRows = 0, units = 0;
    for (const auto& table : {VSBodyMeasurementDisplayTypes(), VSFitnessDisplayTypes(),
                              VSVitalsDisplayTypes(), VSNutritionDisplayTypes(), VSResultsDisplayTypes(),
                              VSSleepDisplayTypes(), VSReproductiveHealthDisplayTypes(), VSMeDisplayTypes()})
        for (const VSDataUnitGroupRow& row : table) {
            rows += 1;
            unitsOfRows += row.units.size();
        }
    std::set<int> ids;
    for (const VSDataUnitGroup* g : allGroups()) {
        ids.insert(g->dataUnitGroupID());
        units += g->dataUnits().size();
        for (const VSDataUnit* unit : g->dataUnits()) EXPECT_EQ(unit->dataUnitGroup(), g);
    }
    EXPECT_EQ(allGroups().size(), rows);
    EXPECT_EQ(units, unitsOfRows) << "a row names a type that the service does not have";
    EXPECT_EQ(ids.size(), rows) << "an ID is given twice";
}

TEST(Catalogue, KeepsTheNumbersThatTheProgramSpeaksOf) {
    // clang-format off
    const std::pair<int, const char*> types[] = {
        {3, "Height"}, {6, "HeartRate"}, {7, "DistanceWalkingRunning"}, {8, "ActiveEnergyBurned"},
        {10, "FlightsClimbed"}, {13, "BloodPressureSystolic"}, {58, "SleepAnalysis"}, {59, "StepCount"},
        {71, "DistanceCycling"}, {72, "Workout"}, {73, "DietaryWater"}, {75, "ZentroStandHour"},
        {76, "BasalBodyTemperature"}, {77, "CervicalMucusQuality"}, {78, "OvulationTestResult"},
        {79, "SexualActivity"}, {80, "MenstrualFlow"}, {81, "UVExposure"},
        {82, "IntermenstrualBleeding"}, {1, "BodyMassIndex"}, {2, "BodyFatPercentage"}, {4, "BodyMass"},
        {5, "LeanBodyMass"}, {9, "BasalEnergyBurned"}, {11, "NikeFuel"}, {12, "OxygenSaturation"},
        {14, "BloodGlucose"}, {15, "BloodAlcoholContent"}, {16, "PeripheralPerfusionIndex"},
        {18, "DietaryFatTotal"}, {55, "DietaryCaffeine"}, {56, "RespiratoryRate"},
        {57, "BodyTemperature"}, {60, "NumberOfTimesFallen"}, {61, "InhalerUsage"},
        {62, "ForcedVitalCapacity"}, {63, "ForcedExpiratoryVolume1"}, {64, "PeakExpiratoryFlowRate"},
        {65, "WaistCircumference"}, {66, "DateOfBirth"}, {67, "BiologicalSex"}, {68, "BloodType"},
        {69, "FitzpatrickSkinType"}};
    // clang-format on
    for (const auto& [id, type] : types) {
        ASSERT_NE(group(id), nullptr) << id;
        EXPECT_EQ(group(id)->anyDataUnit()->dataType()->name(), type) << id;
    }
    EXPECT_EQ(group(0), nullptr);
    EXPECT_EQ(group(1000), nullptr);
}

TEST(Catalogue, BloodPressureIsTwoUnitsJoinedByASlash) {
    const VSDataUnitGroup* pressure = group(VSGroupID::BloodPressure);
    ASSERT_EQ(pressure->dataUnits().size(), 2u);
    EXPECT_EQ(pressure->dataUnits()[0]->labelDisplayName(), "Systolic");
    EXPECT_EQ(pressure->dataUnits()[1]->labelDisplayName(), "Diastolic");
    EXPECT_EQ(pressure->joinString(), "/");
    for (const VSDataUnitGroup* g : allGroups())
        if (g != pressure) {
            EXPECT_EQ(g->dataUnits().size(), 1u) << nameOf(g);
        }
}

TEST(Catalogue, EveryUnitConvertsFromTheCanonicalUnitAndBack) {
    for (const VSDataUnitGroup* g : allGroups())
        for (const VSDataUnit* unit : g->dataUnits()) {
            EXPECT_EQ(unit->row().units.empty(), !unit->dataType()->isQuantityType()) << nameOf(g);
            std::set<std::string> seen;
            for (const VSUnitChoice& choice : unit->row().units) {
                const auto parsed = VSUnit::parse(choice.unit);
                ASSERT_TRUE(parsed) << choice.unit;
                EXPECT_TRUE(seen.insert(parsed->unitString()).second)
                    << nameOf(g) << " offers " << choice.unit << " twice";
                const auto there = unit->dataType()->canonicalUnit().convert(37.5, *parsed);
                ASSERT_TRUE(there) << nameOf(g) << " in " << choice.unit;
                const auto back = parsed->convert(*there, unit->dataType()->canonicalUnit());
                EXPECT_NEAR(*back, 37.5, 1e-9) << nameOf(g) << " in " << choice.unit;
                EXPECT_GE(choice.precision, 0);
                EXPECT_LE(choice.precision, 4);
                EXPECT_EQ(g->chartingRules().allowedDecimalPrecisionForUnit(*parsed), choice.precision)
                    << nameOf(g);
            }
            const double shown = unit->adjustedValueForDaemonValue(0.25);
            EXPECT_EQ(shown,
                      unit->row().units.empty() || std::string(unit->row().units[0].unit) != "%" ? 0.25 : 25)
                << nameOf(g) << ": percentages, and nothing else, are shown a hundredfold";
            EXPECT_EQ(unit->adjustedValueForClientValue(shown), 0.25);
        }
}

TEST(Catalogue, RangesLieWithinEachOther) {
    const auto within = [](const VSValueRange& inner, const VSValueRange& outer) {
        return (!outer.minimum || (inner.minimum && *inner.minimum >= *outer.minimum)) &&
               (!outer.maximum || (inner.maximum && *inner.maximum <= *outer.maximum));
    };
    for (const VSDataUnitGroup* g : allGroups())
        for (const VSDataUnit* unit : g->dataUnits()) {
            const auto display = unit->row().displayRange.range(),
                       absolute = unit->row().absoluteRange.range(),
                       confirm = unit->row().confirmRange.range();
            for (const auto& range : {display, absolute, confirm})
                if (range && range->maximum) {
                    EXPECT_LT(*range->minimum, *range->maximum) << nameOf(g);
                }
            if (unit->dataType()->isQuantityType()) {
                EXPECT_TRUE(display) << nameOf(g);
                EXPECT_EQ(g->allowsManualEntry(), absolute.has_value()) << nameOf(g);
                EXPECT_EQ(g->allowsManualEntry(), confirm.has_value()) << nameOf(g);
                // A total is never hidden behind "more than".
                if (unit->dataType()->isCumulative()) {
                    EXPECT_FALSE(display->maximum) << nameOf(g);
                }
            }
            if (absolute) {
                EXPECT_TRUE(within(*absolute, *display)) << nameOf(g);
            }
            if (confirm) {
                EXPECT_TRUE(within(*confirm, *absolute)) << nameOf(g);
            }
        }
}

TEST(Catalogue, ChartsEveryScopeInAWayItsProviderCanFeed) {
    for (const VSDataUnitGroup* g : allGroups()) {
        if (g->isCharacteristic()) continue;
        const VSDataUnitGroupChartingRules& rules = g->chartingRules();
        EXPECT_TRUE(rules.intervalComponentsForTimeScope(0).isZero()) << nameOf(g);
        for (int scope = 0; scope <= 4; ++scope) {
            const VSChartStyle style = rules.chartStyleForTimeScope(scope);
            EXPECT_NE(style, VSChartStyle::None) << nameOf(g) << " " << scope;
            if (scope > 0) {
                EXPECT_FALSE(rules.intervalComponentsForTimeScope(scope).isZero())
                    << nameOf(g) << " " << scope;
            }
            // Markers of neighbouring buckets must not run into each other (10 points a day in the month).
            EXPECT_GT(rules.chartPointRadiusForTimeScope(scope), 0);
            EXPECT_LE(rules.chartPointRadiusForTimeScope(scope), scope == 3 ? 4 : 5);
            EXPECT_GT(rules.chartPointLineWidthForTimeScope(scope), 0);
            const VSObjectType* type = g->anyDataUnit()->dataType();
            if (type->isCumulative()) {
                EXPECT_EQ(style, VSChartStyle::Bars) << nameOf(g);
            }
            // A range needs minimum and maximum, which the provider of ranges gives only by its default
            // style.
            if (type->isQuantityType() && rules.defaultChartStyle() == VSChartStyle::MinMax) {
                EXPECT_EQ(style, VSChartStyle::MinMax) << nameOf(g);
            }
            if (type->isQuantityType() && !type->isCumulative() &&
                rules.defaultChartStyle() != VSChartStyle::MinMax &&
                g->dataUnitGroupID() != VSGroupID::BasalBodyTemperature) {
                EXPECT_EQ(style, VSChartStyle::Line) << nameOf(g);
            }
        }
    }
    EXPECT_EQ(group(VSGroupID::BasalBodyTemperature)->chartingRules().chartStyleForTimeScope(4),
              VSChartStyle::MinMax);
    EXPECT_EQ(group(VSGroupID::SleepAnalysis)->chartingRules().chartStyleForTimeScope(1),
              VSChartStyle::Periods);
    EXPECT_EQ(group(VSGroupID::SleepAnalysis)->chartingRules().chartStyleForTimeScope(2), VSChartStyle::Bars);
    EXPECT_EQ(group(VSGroupID::StandHours)->chartingRules().chartStyleForTimeScope(1),
              VSChartStyle::StackedPeriods);
    EXPECT_EQ(group(VSGroupID::MenstrualFlow)->chartingRules().chartStyleForTimeScope(4),
              VSChartStyle::CenteredLine);
    for (const VSDataUnitGroup* g : allGroups())
        EXPECT_EQ(g->chartingRules().shouldStartDayAtNoon(),
                  g->dataUnitGroupID() == VSGroupID::SleepAnalysis);
}

TEST(Catalogue, ChartsSleepAsleepAndHoursStood) {
    const VSDataUnit* sleep = group(VSGroupID::SleepAnalysis)->anyDataUnit();
    for (int scope = 0; scope <= 4; ++scope)
        EXPECT_EQ(sleep->chartingPredicateForTimeScope(scope)->categoryValue, 1);
    const VSDataUnit* stand = group(VSGroupID::StandHours)->anyDataUnit();
    EXPECT_FALSE(stand->chartingPredicateForTimeScope(1));  // the day draws both rows
    for (int scope = 2; scope <= 4; ++scope)
        EXPECT_EQ(stand->chartingPredicateForTimeScope(scope)->categoryValue, 0);
    EXPECT_FALSE(group(VSGroupID::Steps)->anyDataUnit()->chartingPredicateForTimeScope(2));
}

TEST(Catalogue, HasEveryText) {
    test::FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", "en_US");
    std::set<QString> names;
    for (const VSDataUnitGroup* g : allGroups()) {
        EXPECT_TRUE(isText(g->displayName())) << g->dataUnitGroupID();
        EXPECT_TRUE(names.insert(g->displayName()).second) << nameOf(g) << " is the name of two";
        EXPECT_TRUE(isText(g->summary())) << nameOf(g);
        EXPECT_GE(g->summary().size(), 60) << nameOf(g);
        EXPECT_GE(g->keywords().size(), 3) << nameOf(g);
        for (const QString& keyword : g->keywords()) EXPECT_TRUE(isText(keyword)) << nameOf(g);
        EXPECT_EQ(isText(g->unitChangeCautionaryText()), g->unitPreferencesRequireChangeConfirmation())
            << nameOf(g);
        for (const VSDataUnit* unit : g->dataUnits())
            for (const VSUnitChoice& choice : unit->row().units)
                if (*choice.nameKey) {
                    EXPECT_TRUE(isText(platform::localized(choice.nameKey))) << choice.nameKey;
                }
    }
    for (const VSDataCategory& category : VSDataCategoryController::shared().allDataCategories())
        EXPECT_FALSE(category.displayName().startsWith("DATA_CATEGORY")) << category.categoryID();
}

TEST(Catalogue, HasEveryIcon) {
    std::set<QString> names;
    for (const VSDataUnitGroup* g : allGroups())
        for (const QString& name : {g->listIcon(), g->groupIcon(), g->unitIcon()})
            if (!name.isEmpty()) names.insert(name);
    for (const VSDataCategory& category : VSDataCategoryController::shared().allDataCategories())
        names.insert(category.listIcon());
    for (const char* name : {"dashboard", "dashboard_selected", "healthdata", "healthdata_selected",
                             "sources", "sources_selected", "medical_ID", "medical_ID_selected",
                             "dashboard_glyph_emptydashboard", "healthdata_glyph_all", "calendar_glyph",
                             "add", "import", "close", "checkmark", "chevron_right", "qelvar"})
        names.insert(name);
    for (const QString& name : names) {
        const QImage image = platform::icon(name, QSizeF(25, 25), 2, {}, false);
        ASSERT_FALSE(image.isNull()) << name.toStdString();
        int painted = 0;
        for (int y = 0; y < image.height(); ++y)
            for (int x = 0; x < image.width(); ++x) painted += qAlpha(image.pixel(x, y)) > 127;
        EXPECT_GT(painted, 80) << name.toStdString() << " is all but empty";
        EXPECT_LT(painted, image.width() * image.height()) << name.toStdString() << " has no shape";
    }
    EXPECT_TRUE(group(11)->isNikeFuel());
    EXPECT_FALSE(group(11)->groupIcon().isEmpty());
    EXPECT_FALSE(group(VSGroupID::Steps)->isNikeFuel());
}

TEST(Categories, AreToldApartAndCanBeWrittenOnInWhite) {
    const auto& categories = VSDataCategoryController::shared().allDataCategories();
    std::set<int> ids;
    std::set<QRgb> colors;
    for (const VSDataCategory& category : categories) {
        ids.insert(category.categoryID());
        colors.insert(category.color().rgb());
        EXPECT_GE(contrastWithWhite(category.gradientTopColor()), 4.5) << category.categoryID();
        EXPECT_GE(contrastWithWhite(category.gradientBottomColor()), 4.5) << category.categoryID();
        EXPECT_EQ(category.isMe(), category.categoryID() == VSCategoryID::Me);
        EXPECT_FALSE(
            VSDataUnitGroupController::shared().dataUnitGroupsInCategory(category.categoryID()).empty());
    }
    EXPECT_EQ(ids.size(), categories.size());
    EXPECT_EQ(colors.size(), categories.size());
    EXPECT_GE(contrastWithWhite(VSDataUnitGroupController::shared().keyColor()), 4.5);
    for (const VSDataUnitGroup* g : allGroups()) EXPECT_TRUE(ids.contains(g->categoryID())) << nameOf(g);
    EXPECT_EQ(VSDataCategoryController::shared().categoryWithID(0), nullptr);
}

TEST(Categories, DrawARoundedGradient) {
    const VSDataCategory& category = *VSDataCategoryController::shared().categoryWithID(VSCategoryID::Vitals);
    const QImage image = category.roundedGradient(QSizeF(100, 187), 2);
    EXPECT_EQ(image.size(), QSize(200, 374));
    EXPECT_EQ(image.devicePixelRatio(), 2);
    for (const QPoint& corner : {QPoint(0, 0), QPoint(199, 0), QPoint(0, 373), QPoint(199, 373)})
        EXPECT_EQ(qAlpha(image.pixel(corner)), 0);
    // The corner's arc has a radius of 8 points: 16 pixels from the corner the edge is reached.
    EXPECT_EQ(qAlpha(image.pixel(17, 0)), 255);
    EXPECT_LT(qAlpha(image.pixel(8, 0)), 128);
    const auto near = [](QRgb a, const QColor& b) {
        return std::abs(qRed(a) - b.red()) <= 2 && std::abs(qGreen(a) - b.green()) <= 2 &&
               std::abs(qBlue(a) - b.blue()) <= 2;
    };
    EXPECT_TRUE(near(image.pixel(100, 0), category.gradientTopColor()));
    EXPECT_TRUE(near(image.pixel(100, 373), category.gradientBottomColor()));
}

}  // namespace
