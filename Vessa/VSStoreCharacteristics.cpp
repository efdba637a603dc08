#include "Vessa/VSStoreCharacteristics.h"

#include <array>
#include <utility>

namespace {

using TextField = std::optional<std::string> VSMedicalIDData::*;
// On disk; never change.
constexpr std::array<std::pair<const char*, TextField>, 5> textFields = {
    {{"name", &VSMedicalIDData::name},
     {"medicalConditions", &VSMedicalIDData::medicalConditions},
     {"medicalNotes", &VSMedicalIDData::medicalNotes},
     {"allergyInfo", &VSMedicalIDData::allergyInfo},
     {"medicationInfo", &VSMedicalIDData::medicationInfo}}};

}  // namespace

std::optional<int64_t> VSReadCharacteristic(VSDatabase& database, const VSObjectType* type) {
    auto row = database.use("SELECT value FROM characteristics WHERE type = ?");
    if (!row.bind(1, VSTypeCodeValue(type->code())).step()) return std::nullopt;
    return row.integer(0);
}

void VSWriteCharacteristic(VSStoreWriter& writer, const VSObjectType* type, std::optional<int64_t> value) {
    const int code = VSTypeCodeValue(type->code());
    if (value) {
        writer.database()
            .use("INSERT INTO characteristics VALUES (?1, ?2) ON CONFLICT(type) DO UPDATE SET value = ?2")
            .bind(1, code)
            .bind(2, *value)
            .run();
    } else {
        writer.database().use("DELETE FROM characteristics WHERE type = ?").bind(1, code).run();
    }
    writer.touch(type);
}

int64_t VSStoredBirthDate(const VSBirthDate& date) {
    return int64_t{date.year} * 10000 + date.month * 100 + date.day;
}

VSBirthDate VSBirthDateFromStored(int64_t value) {
    return {static_cast<int>(value / 10000), static_cast<int>(value / 100 % 100),
            static_cast<int>(value % 100)};
}

std::optional<VSMedicalIDData> VSReadMedicalID(VSDatabase& database) {
    auto row = database.use("SELECT content, picture FROM medical_id");
    if (!row.step()) return std::nullopt;
    const auto content = VSValue::fromSerialized(row.text(0));
    if (!content || !content->dictionary())
        throw VSDatabaseFailure({VSErrorCode::Corrupt, "the Medical ID of the store cannot be read"});
    VSMedicalIDData data;
    for (const auto& [key, field] : textFields) {
        if (const VSValue* value = (*content)[key]; value && value->string()) data.*field = *value->string();
    }
    if (const VSValue* value = (*content)["birthdate"]; value && value->integer())
        data.birthdate = VSBirthDateFromStored(*value->integer());
    if (const VSValue* value = (*content)["other"]; value && value->dictionary())
        data.other = *value->dictionary();
    if (!row.isNull(1)) {
        const std::string_view picture = row.blob(1);
        data.pictureData.emplace(picture.begin(), picture.end());
    }
    return data;
}

void VSWriteMedicalID(VSDatabase& database, const VSMedicalIDData& data) {
    VSValue::Dictionary content;
    for (const auto& [key, field] : textFields) {
        if (data.*field) content[key] = *(data.*field);
    }
    if (data.birthdate) content["birthdate"] = VSStoredBirthDate(*data.birthdate);
    if (!data.other.empty()) content["other"] = data.other;
    auto row = database.use(
        "INSERT INTO medical_id VALUES (1, ?1, ?2) ON CONFLICT(only) DO UPDATE SET content = ?1, picture = "
        "?2");
    row.bindText(1, VSValue(std::move(content)).serialized());
    if (data.pictureData)
        row.bindBlob(2,
                     data.pictureData->empty() ? "" : reinterpret_cast<const char*>(data.pictureData->data()),
                     data.pictureData->size());
    row.run();
}
