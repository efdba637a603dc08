#include "Vessa/VSObjectType.h"

#include <gtest/gtest.h>

#include <set>

#include "Vessa/VSTypeTable.h"

namespace {

TEST(VSObjectType, EveryCodeIsATypeOrReserved) {
    const std::set<int> reserved(VSReservedTypeCodes().begin(), VSReservedTypeCodes().end());
    int last = -1;
    for (int code = -1; code <= 99; ++code) {
        const auto* type = VSObjectType::dataTypeWithCode(code);
        EXPECT_EQ(type != nullptr, code >= 0 && code <= 98 && !reserved.contains(code)) << code;
    }
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        EXPECT_GT(VSTypeCodeValue(type->code()), last);
        last = VSTypeCodeValue(type->code());
        EXPECT_EQ(VSObjectType::dataTypeWithCode(type->code()), type);
    }
    EXPECT_EQ(VSObjectType::allTypes().size() + reserved.size(), 99U);
}

TEST(VSObjectType, EveryTypeIsFoundByItsIdentifiersAndNoOther) {
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        const auto& identifier = type->identifier();
        EXPECT_EQ(VSObjectType::typeForIdentifier(identifier), type);
        EXPECT_EQ(VSObjectType::typeForIdentifier(type->name()), type);
        EXPECT_EQ(VSObjectType::quantityTypeForIdentifier(identifier),
                  type->isQuantityType() ? type : nullptr);
        EXPECT_EQ(VSObjectType::categoryTypeForIdentifier(identifier),
                  type->isCategoryType() ? type : nullptr);
        EXPECT_EQ(VSObjectType::correlationTypeForIdentifier(identifier),
                  type->kind() == VSTypeKind::Correlation ? type : nullptr);
        EXPECT_EQ(VSObjectType::characteristicTypeForIdentifier(identifier),
                  type->kind() == VSTypeKind::Characteristic ? type : nullptr);
        EXPECT_EQ(type->isSampleType(), type->kind() != VSTypeKind::Characteristic);
    }
    const std::pair<VSTypeCode, const char*> identifiers[] = {
        {VSCode::HeartRate, "VSQuantityTypeIdentifierHeartRate"},
        {VSCode::SleepAnalysis, "VSCategoryTypeIdentifierSleepAnalysis"},
        {VSCode::BloodPressure, "VSCorrelationTypeIdentifierBloodPressure"},
        {VSCode::DateOfBirth, "VSCharacteristicTypeIdentifierDateOfBirth"},
        {VSCode::Workout, "VSWorkoutTypeIdentifier"}};
    for (const auto& [code, identifier] : identifiers)
        EXPECT_EQ(VSObjectType::dataTypeWithCode(code)->identifier(), identifier);
    EXPECT_EQ(VSObjectType::workoutType(), VSObjectType::dataTypeWithCode(VSCode::Workout));
    for (const char* none : {"", "heartrate", "VSQuantityTypeIdentifier",
                             "VSQuantityTypeIdentifierSleepAnalysis", "VSQuantityTypeIdentifierHeartRate "})
        EXPECT_EQ(VSObjectType::typeForIdentifier(none), nullptr) << none;
}

TEST(VSObjectType, QuantityTypesHaveUnitsThatConvert) {
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        if (!type->isQuantityType()) continue;
        const auto unit = type->unitFromString(type->canonicalUnit().unitString());
        ASSERT_TRUE(unit.ok()) << type->identifier();
        EXPECT_EQ(*unit, type->canonicalUnit());
        EXPECT_TRUE(type->enumeratedValues().empty());
    }
}

TEST(VSObjectType, UnitsOfDocuments) {
    const auto* glucose = VSObjectType::dataTypeWithCode(VSCode::BloodGlucose);
    const auto molar = glucose->unitFromString("mmol/L");
    ASSERT_TRUE(molar.ok());
    EXPECT_EQ(molar->unitString(), "mmol<180.1558>/L");
    EXPECT_EQ(molar->convert(5.5, glucose->canonicalUnit()), 5.5 * 18.01558);
    EXPECT_TRUE(glucose->unitFromString("mmol<180.15588>/L").ok());
    EXPECT_FALSE(glucose->unitFromString("mmol").ok());
    EXPECT_FALSE(glucose->unitFromString("mmol/").ok());
    EXPECT_FALSE(VSObjectType::dataTypeWithCode(VSCode::StepCount)->unitFromString("mmol/L").ok());

    const auto refusal = VSObjectType::dataTypeWithCode(VSCode::StepCount)->unitFromString("%");
    ASSERT_FALSE(refusal.ok());
    EXPECT_EQ(refusal.error().code, VSErrorCode::Invalid);
    EXPECT_EQ(refusal.error().message,
              "The unit \"%\" does not convert to \"count\", in which StepCount is kept");
}

TEST(VSObjectType, EnumeratedValuesGoBothWays) {
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        for (const auto& [value, identifier] : type->enumeratedValues()) {
            ASSERT_NE(type->identifierForValue(value), nullptr);
            EXPECT_EQ(*type->identifierForValue(value), identifier);
            EXPECT_EQ(type->valueForIdentifier(identifier), value);
        }
        const bool enumerated = type->isCategoryType() || (type->kind() == VSTypeKind::Characteristic &&
                                                           type->code() != VSCode::DateOfBirth);
        EXPECT_EQ(!type->enumeratedValues().empty(), enumerated) << type->identifier();
    }
    const auto* sleep = VSObjectType::dataTypeWithCode(VSCode::SleepAnalysis);
    EXPECT_EQ(*sleep->identifierForValue(1), "VSCategoryValueSleepAnalysisAsleep");
    EXPECT_EQ(sleep->identifierForValue(2), nullptr);
    EXPECT_FALSE(sleep->valueForIdentifier("VSCategoryValueNotApplicable"));
    EXPECT_EQ(VSObjectType::dataTypeWithCode(VSCode::SexualActivity)
                  ->valueForIdentifier("VSCategoryValueNotApplicable"),
              0);
}

TEST(VSWorkoutActivity, IdentifiersGoBothWays) {
    for (int activity = -1; activity <= 3001; ++activity) {
        const std::string* identifier = VSWorkoutActivityTypeIdentifier(activity);
        ASSERT_EQ(identifier != nullptr, (activity >= 1 && activity <= 57) || activity == 3000) << activity;
        if (identifier) {
            EXPECT_EQ(VSWorkoutActivityTypeForIdentifier(*identifier), activity);
        }
    }
    EXPECT_EQ(*VSWorkoutActivityTypeIdentifier(1), "VSWorkoutActivityTypeAmericanFootball");
    EXPECT_EQ(*VSWorkoutActivityTypeIdentifier(37), "VSWorkoutActivityTypeRunning");
    EXPECT_EQ(*VSWorkoutActivityTypeIdentifier(57), "VSWorkoutActivityTypeYoga");
    EXPECT_EQ(*VSWorkoutActivityTypeIdentifier(3000), "VSWorkoutActivityTypeOther");
    EXPECT_FALSE(VSWorkoutActivityTypeForIdentifier("Running"));
}

}  // namespace
