#include "Vessa/VSMedicalID.h"

#include <array>
#include <utility>

namespace {

using TextField = std::optional<std::string> VSMedicalIDData::*;
// On disk and in documents; never change.
constexpr std::array<std::pair<const char*, TextField>, 5> textFields = {
    {{"name", &VSMedicalIDData::name},
     {"medicalConditions", &VSMedicalIDData::medicalConditions},
     {"medicalNotes", &VSMedicalIDData::medicalNotes},
     {"allergyInfo", &VSMedicalIDData::allergyInfo},
     {"medicationInfo", &VSMedicalIDData::medicationInfo}}};

}  // namespace

int64_t VSStoredBirthDate(const VSBirthDate& date) {
    return int64_t{date.year} * 10000 + date.month * 100 + date.day;
}

VSBirthDate VSBirthDateFromStored(int64_t value) {
    return {static_cast<int>(value / 10000), static_cast<int>(value / 100 % 100),
            static_cast<int>(value % 100)};
}

VSValue::Dictionary VSMedicalIDContent(const VSMedicalIDData& data) {
    VSValue::Dictionary content;
    for (const auto& [key, field] : textFields) {
        if (data.*field) content[key] = *(data.*field);
    }
    if (data.birthdate) content["birthdate"] = VSStoredBirthDate(*data.birthdate);
    if (!data.other.empty()) content["other"] = data.other;
    return content;
}

VSMedicalIDData VSMedicalIDFromContent(const VSValue::Dictionary& content) {
    const VSValue fields(content);
    VSMedicalIDData data;
    for (const auto& [key, field] : textFields) {
        if (const VSValue* value = fields[key]; value && value->string()) data.*field = *value->string();
    }
    if (const VSValue* value = fields["birthdate"]; value && value->integer())
        data.birthdate = VSBirthDateFromStored(*value->integer());
    if (const VSValue* value = fields["other"]; value && value->dictionary())
        data.other = *value->dictionary();
    return data;
}
