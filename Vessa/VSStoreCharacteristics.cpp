#include "Vessa/VSStoreCharacteristics.h"

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

std::optional<VSMedicalIDData> VSReadMedicalID(VSDatabase& database) {
    auto row = database.use("SELECT content, picture FROM medical_id");
    if (!row.step()) return std::nullopt;
    const auto content = VSValue::fromSerialized(row.text(0));
    if (!content || !content->dictionary())
        throw VSDatabaseFailure({VSErrorCode::Corrupt, "the Medical ID of the store cannot be read"});
    VSMedicalIDData data = VSMedicalIDFromContent(*content->dictionary());
    if (!row.isNull(1)) {
        const std::string_view picture = row.blob(1);
        data.pictureData.emplace(picture.begin(), picture.end());
    }
    return data;
}

void VSWriteMedicalID(VSDatabase& database, const VSMedicalIDData& data) {
    auto row = database.use(
        "INSERT INTO medical_id VALUES (1, ?1, ?2) ON CONFLICT(only) DO UPDATE SET content = ?1, picture = "
        "?2");
    row.bindText(1, VSValue(VSMedicalIDContent(data)).serialized());
    if (data.pictureData)
        row.bindBlob(2,
                     data.pictureData->empty() ? "" : reinterpret_cast<const char*>(data.pictureData->data()),
                     data.pictureData->size());
    row.run();
}
