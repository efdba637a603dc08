#include "Vessa/VSHealthStoreConnection.h"

#include "Vessa/VSLimits.h"
#include "Vessa/VSStoreBatches.h"
#include "Vessa/VSStoreCharacteristics.h"

namespace {

std::optional<VSValue> readDefaultValue(VSDatabase& database, const std::string& application,
                                        const std::string& key) {
    auto row = database.use("SELECT value FROM defaults WHERE application = ? AND key = ?");
    if (!row.bindText(1, application).bindText(2, key).step()) return std::nullopt;
    auto value = VSValue::fromSerialized(row.text(0));
    if (!value)
        throw VSDatabaseFailure({VSErrorCode::Corrupt, "the default value " + key + " cannot be read"});
    return value;
}

void writeDefaultValue(VSDatabase& database, const std::string& application, const std::string& key,
                       const VSValue& value) {
    database
        .use(
            "INSERT INTO defaults VALUES (?1, ?2, ?3) ON CONFLICT(application, key) DO UPDATE SET value = ?3")
        .bindText(1, application)
        .bindText(2, key)
        .bindText(3, value.serialized())
        .run();
}

}  // namespace

VSResult<std::optional<VSBirthDate>> VSHealthStoreConnection::dateOfBirth() {
    const auto* type = VSObjectType::dataTypeWithCode(VSCode::DateOfBirth);
    return readOf(type, {}, [type](VSStoreReader& reader) -> std::optional<VSBirthDate> {
        const auto value = VSReadCharacteristic(reader.database(), type);
        if (!value) return std::nullopt;
        return VSBirthDateFromStored(*value);
    });
}

void VSHealthStoreConnection::setDateOfBirth(std::optional<VSBirthDate> date, Completion completion) {
    writeCharacteristic(VSObjectType::dataTypeWithCode(VSCode::DateOfBirth),
                        date ? std::optional(VSStoredBirthDate(*date)) : std::nullopt,
                        date ? VSObjectionToBirthDate(*date) : std::nullopt, std::move(completion));
}

void VSHealthStoreConnection::setCharacteristic(const VSObjectType* type, int value, Completion completion) {
    std::optional<VSError> objection;
    if (value && !type->identifierForValue(value))
        objection =
            VSError{VSErrorCode::Invalid, type->identifier() + ": has no value " + std::to_string(value)};
    writeCharacteristic(type, value ? std::optional<int64_t>(value) : std::nullopt, objection,
                        std::move(completion));
}

void VSHealthStoreConnection::fetchMedicalIDData(
    std::function<void(const VSResult<std::optional<VSMedicalIDData>>&)> completion) {
    core_->readLater(
        [&access = core_->access](VSStoreReader& reader) {
            if (auto objection = access.objectionToManaging()) throw VSDatabaseFailure(*objection);
            return VSReadMedicalID(reader.database());
        },
        std::move(completion));
}

void VSHealthStoreConnection::updateMedicalIDData(VSMedicalIDData data, Completion completion) {
    writeAsOwner(
        [data = std::move(data)](VSStoreWriter& writer) {
            if (auto objection = VSObjectionToMedicalID(data)) return VSStatus(*objection);
            VSWriteMedicalID(writer.database(), data);
            VSForgetBatchMedicalID(writer.database());
            return VSStatus();
        },
        std::move(completion));
}

void VSHealthStoreConnection::setDefaultValue(VSValue value, std::string key, Completion completion) {
    core_->write(
        [application = core_->options.applicationIdentifier, value = std::move(value),
         key = std::move(key)](VSStoreWriter& writer) {
            writeDefaultValue(writer.database(), application, key, value);
            return VSStatus();
        },
        std::move(completion));
}

void VSHealthStoreConnection::updateDefaultValue(
    std::string key, DefaultValueChange change,
    std::function<void(const VSResult<std::optional<VSValue>>&)> completion) {
    auto stored = std::make_shared<std::optional<VSValue>>();
    core_->write(
        [application = core_->options.applicationIdentifier, key = std::move(key), change = std::move(change),
         stored](VSStoreWriter& writer) {
            *stored = readDefaultValue(writer.database(), application, key);
            if (auto changed = change(*stored); changed && changed != *stored) {
                writeDefaultValue(writer.database(), application, key, *changed);
                *stored = std::move(changed);
            }
            return VSStatus();
        },
        [completion = std::move(completion), stored](const VSStatus& status) {
            if (!completion) return;
            if (status)
                completion(std::move(*stored));
            else
                completion(status.error());
        });
}

void VSHealthStoreConnection::getDefaultValue(
    std::string key, std::function<void(const VSResult<std::optional<VSValue>>&)> handler) {
    core_->readLater(
        [application = core_->options.applicationIdentifier, key = std::move(key)](VSStoreReader& reader) {
            return readDefaultValue(reader.database(), application, key);
        },
        std::move(handler));
}

VSResult<int> VSHealthStoreConnection::characteristic(VSTypeCode code) {
    const auto* type = VSObjectType::dataTypeWithCode(code);
    return readOf(type, {}, [type](VSStoreReader& reader) {
        return static_cast<int>(VSReadCharacteristic(reader.database(), type).value_or(0));
    });
}

void VSHealthStoreConnection::writeCharacteristic(const VSObjectType* type, std::optional<int64_t> value,
                                                  const std::optional<VSError>& objectionToValue,
                                                  Completion completion) {
    core_->write(
        [&access = core_->access, type, value, objectionToValue](VSStoreWriter& writer) {
            if (objectionToValue) return VSStatus(*objectionToValue);
            if (auto objection = access.objectionToSharing(writer.database(), type))
                return VSStatus(*objection);
            VSWriteCharacteristic(writer, type, value);
            // What the person says is no import's any more, even where it is the same.
            writer.database()
                .use("DELETE FROM batch_characteristics WHERE type = ?")
                .bind(1, VSTypeCodeValue(type->code()))
                .run();
            return VSStatus();
        },
        std::move(completion));
}

void VSHealthStoreConnection::deleteMedicalIDData(Completion completion) {
    writeAsOwner(
        [](VSStoreWriter& writer) {
            writer.database().use("DELETE FROM medical_id").run();
            VSForgetBatchMedicalID(writer.database());
            return VSStatus();
        },
        std::move(completion));
}
