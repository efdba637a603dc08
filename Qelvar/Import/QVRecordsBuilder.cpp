#include "Qelvar/Import/QVRecordsBuilder.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>

#include "Vessa/VSLimits.h"
#include "Vessa/VSMedicalID.h"

namespace {

/// An exact value may be shorter than its text: a date is.
constexpr size_t kLongestMetadataTexts = 4 * VSLimits::longestMetadata;
constexpr size_t kGreatestBatch = 4 * 1024 * 1024;
constexpr int kAllDigits = 14;  // that survive a conversion and back
constexpr size_t kListedUnknownTypes = 200;
constexpr const char* kOtherUnknownTypes = "(other unknown types)";

std::string attributeText(QVAttributeName attribute, std::string_view value) {
    return std::string(kQVAttributeNames[static_cast<size_t>(attribute)]) + " " + QVImportQuoted(value);
}

std::string attributeName(QVAttributeName attribute) {
    return kQVAttributeNames[static_cast<size_t>(attribute)];
}

/// How long an attribute can be at most so that the store takes what it says.
size_t longestText(QVAttributeName attribute) {
    constexpr size_t deviceFields = 8, escaped = 2;
    const bool isDevice = attribute == QVAttributeName::Device;
    return isDevice ? deviceFields * (escaped * VSLimits::longestText + 32) : VSLimits::longestText;
}

/// Of a thing that has no identifier: the number that stands for it.
std::optional<int> exactNumber(const QVElement& element, QVAttributeName attribute) {
    const VSValue* exact = element.exactValue(attribute);
    const auto number = exact ? exact->integer() : std::nullopt;
    if (!number || *number < INT32_MIN || *number > INT32_MAX) return std::nullopt;
    return static_cast<int>(*number);
}

}  // namespace

void QVRecordsBuilder::Draft::reset() {
    type = nullptr;
    provenance = {};
    quantity.reset();
    value = 0;
    metadata.clear();
    metadataBytes = 0;
    relations = {};
    refusal.reset();
}

QVRecordsBuilder::QVRecordsBuilder(size_t listedRefusals, QVImportQueue& queue)
    : listedRefusals_(listedRefusals), queue_(queue), counts_(128) {
    batch_.items.reserve(QVImportBatch::kSize);
}

void QVRecordsBuilder::beginDocument(const std::string& name) {
    batch_.document = std::make_shared<const std::string>(name);
    report_.documents.push_back(name);
    instructions_ = {};
}

void QVRecordsBuilder::endDocument() {
    flush();
}

void QVRecordsBuilder::start(const QVElement& element, QVElementName parent) {
    const bool inCorrelation = parent == QVElementName::Correlation;
    switch (element.name) {
        case QVElementName::Record:
            return startRecord(element, inCorrelation ? member_ : record_);
        case QVElementName::Correlation:
            return startCorrelation(element);
        case QVElementName::Workout:
            return startWorkout(element);
        case QVElementName::MetadataEntry:
            return addMetadata(element, member_.type || member_.refusal ? member_ : record_);
        case QVElementName::WorkoutEvent:
            return addWorkoutEvent(element);
        case QVElementName::Me:
            return readPerson(element);
        case QVElementName::ExportDate:
            return readExportDate(element);
        default:
            return;
    }
}

void QVRecordsBuilder::end(QVElementName name, QVElementName parent) {
    if (name == QVElementName::Record)
        return parent == QVElementName::Correlation ? endMember() : endRecord();
    if (name == QVElementName::Correlation) return endCorrelation();
    if (name == QVElementName::Workout) return endWorkout();
}

void QVRecordsBuilder::unexpectedElement(const QVElement& element) {
    refuse(element, {"unexpected element", "it and what it holds is passed over"});
}

// --- Starts ---------------------------------------------------------------------------------------------

void QVRecordsBuilder::startRecord(const QVElement& element, Draft& draft) {
    draft.reset();
    draft.line = element.line;
    draft.type = types_.find(element[QVAttributeName::Type]);
    Check problem = readCommon(element, draft);
    if (!problem && !draft.type->isQuantityType() && !draft.type->isCategoryType()) {
        problem = Problem{"not a type of a Record",
                          attributeText(QVAttributeName::Type, element[QVAttributeName::Type])};
    }
    if (!problem) problem = readValue(element, draft);
    if (problem) draft.refusal = refusal(element, std::move(*problem));
    if (draft.refusal && &draft == &record_) givenType_ = element[QVAttributeName::Type];
}

void QVRecordsBuilder::startCorrelation(const QVElement& element) {
    record_.reset();
    members_.clear();
    record_.line = element.line;
    record_.type = types_.find(element[QVAttributeName::Type]);
    givenType_ = element[QVAttributeName::Type];
    Check problem = readCommon(element, record_);
    if (!problem && record_.type->kind() != VSTypeKind::Correlation) {
        problem = Problem{"not a type of a Correlation", attributeText(QVAttributeName::Type, givenType_)};
    }
    if (problem) record_.refusal = refusal(element, std::move(*problem));
}

void QVRecordsBuilder::startWorkout(const QVElement& element) {
    record_.reset();
    workout_ = {};
    record_.line = element.line;
    record_.type = VSObjectType::workoutType();
    givenType_ = element[QVAttributeName::WorkoutActivityType];
    Check problem = checkLengths(element);
    if (!problem) problem = readDates(element, record_);
    if (!problem) problem = readOrigin(element, record_);
    if (!problem) {
        const bool isGiven = element.has(QVAttributeName::WorkoutActivityType);
        const auto activity = isGiven ? VSWorkoutActivityTypeForIdentifier(givenType_)
                                      : exactNumber(element, QVAttributeName::WorkoutActivityType);
        if (!activity && !isGiven)
            problem = Problem{"missing attribute", attributeName(QVAttributeName::WorkoutActivityType)};
        else if (!activity)
            problem =
                Problem{"unknown activity", attributeText(QVAttributeName::WorkoutActivityType, givenType_)};
        record_.value = activity.value_or(0);
    }
    if (!problem) problem = readDuration(element, workout_.duration);
    if (!problem) {
        problem = readAmount(element, QVAttributeName::TotalDistance, QVAttributeName::TotalDistanceUnit,
                             VSCode::DistanceWalkingRunning, workout_.distance);
    }
    if (!problem) {
        problem =
            readAmount(element, QVAttributeName::TotalEnergyBurned, QVAttributeName::TotalEnergyBurnedUnit,
                       VSCode::ActiveEnergyBurned, workout_.energy);
    }
    if (problem) record_.refusal = refusal(element, std::move(*problem));
}

void QVRecordsBuilder::addMetadata(const QVElement& element, Draft& draft) {
    if (draft.refusal) return;
    const std::string_view key = element[QVAttributeName::Key], value = element[QVAttributeName::Value];
    for (const auto attribute : {QVAttributeName::Key, QVAttributeName::Value}) {
        if (!element.has(attribute)) return refuse(element, {"missing attribute", attributeName(attribute)});
    }
    const size_t bytes = key.size() + value.size();
    if (draft.metadataBytes + bytes > kLongestMetadataTexts)
        return refuse(element, {"attribute too long", std::to_string(bytes) + " bytes"});
    draft.metadataBytes += bytes;
    const VSValue* exact = element.exactValue(QVAttributeName::Value);
    VSValue meant =
        exact && QVExactAgrees(exact->description(), value) ? *exact : QVMetadataValueFromText(key, value);
    if (!draft.metadata.emplace(std::string(key), std::move(meant)).second) {
        refuse(element, {"metadata key given twice", attributeText(QVAttributeName::Key, key)});
    }
}

void QVRecordsBuilder::addWorkoutEvent(const QVElement& element) {
    if (record_.refusal) return;
    VSWorkoutEvent event;
    const std::string_view type = element[QVAttributeName::Type];
    if (!element.has(QVAttributeName::Type))
        event.type = exactNumber(element, QVAttributeName::Type).value_or(0);
    else if (type == "VSWorkoutEventTypePause")
        event.type = 1;
    else if (type == "VSWorkoutEventTypeResume")
        event.type = 2;
    else if (!type.empty())
        return refuse(element, {"unknown event", attributeText(QVAttributeName::Type, type)});
    if (element.has(QVAttributeName::Date)) {
        QVImportDate date;
        if (auto problem = readDate(element[QVAttributeName::Date], QVAttributeName::Date, date))
            return refuse(element, std::move(*problem));
        event.date = date.date + element.microsecondsOf(QVExactStart);
    }
    workout_.events.push_back(event);
}

void QVRecordsBuilder::readPerson(const QVElement& element) {
    QVImportPerson person;
    if (const auto text = element[QVAttributeName::DateOfBirth]; !text.empty()) {
        person.birthDate = QVImportBirthDateFromText(text);
        if (!person.birthDate)
            refuse(element, {"not a date", attributeText(QVAttributeName::DateOfBirth, text)});
    }
    const auto readValue = [&](QVAttributeName attribute, VSTypeCode code, int& value) {
        const std::string_view text = element[attribute];
        if (text.empty()) return;
        const VSObjectType* type = VSObjectType::dataTypeWithCode(code);
        const auto known = type ? type->valueForIdentifier(text) : std::nullopt;
        if (known)
            value = *known;
        else
            refuse(element, {"unknown value", attributeText(attribute, text)});
    };
    readValue(QVAttributeName::BiologicalSex, VSCode::BiologicalSex, person.biologicalSex);
    readValue(QVAttributeName::BloodType, VSCode::BloodType, person.bloodType);
    readValue(QVAttributeName::FitzpatrickSkinType, VSCode::FitzpatrickSkinType, person.skinType);
    if (element.exact && !element.exact->medicalID.empty()) readMedicalID(element, person);
    batch_.person = person;
    flush();
}

void QVRecordsBuilder::readMedicalID(const QVElement& element, QVImportPerson& person) {
    const auto content = VSValue::fromSerialized(element.exact->medicalID);
    if (!content || !content->dictionary()) return;
    VSMedicalIDData data = VSMedicalIDFromContent(*content->dictionary());
    if (const VSValue* picture = (*content)[kQVExactPicture]; picture && picture->data())
        data.pictureData = *picture->data();
    if (auto objection = VSObjectionToMedicalID(data))
        return refuse(element, {"not a Medical ID", objection->message});
    person.medicalID = std::move(data);
}

void QVRecordsBuilder::readExportDate(const QVElement& element) {
    const std::string_view text = element[QVAttributeName::Value];
    const auto date = QVImportDateFromText(text);
    if (!date) return refuse(element, {"not a date", attributeText(QVAttributeName::Value, text)});
    if (!report_.exportDate || *report_.exportDate < date->date) report_.exportDate = date->date;
}

// --- Ends -----------------------------------------------------------------------------------------------

void QVRecordsBuilder::endRecord() {
    count(record_, givenType_);
    if (!record_.refusal) {
        finishMetadata(record_);
        if (record_.quantity)
            emit<VSQuantitySample>(record_.type, *record_.quantity, record_.start, record_.end,
                                   std::move(record_.provenance));
        else
            emit<VSCategorySample>(record_.type, record_.value, record_.start, record_.end,
                                   std::move(record_.provenance));
    }
}

void QVRecordsBuilder::endMember() {
    if (member_.refusal && !record_.refusal) {
        // A correlation without one of its members would say something that the document does not say.
        record_.refusal = std::move(member_.refusal);
        record_.refusal->detail = std::string(record_.refusal->reason) + ": " + record_.refusal->detail;
        record_.refusal->reason = "a member of the correlation is refused";
    }
    if (!record_.refusal) {
        finishMetadata(member_);
        if (member_.quantity)
            members_.push_back(std::make_shared<const VSQuantitySample>(
                member_.type, *member_.quantity, member_.start, member_.end, member_.provenance));
        else
            members_.push_back(std::make_shared<const VSCategorySample>(
                member_.type, member_.value, member_.start, member_.end, member_.provenance));
        record_.relations.members.push_back(member_.relations.number);
    }
    member_.reset();
}

void QVRecordsBuilder::endCorrelation() {
    if (!record_.refusal && members_.empty()) {
        QVElement element;
        element.name = QVElementName::Correlation;
        element.givenName = "Correlation";
        element.line = record_.line;
        record_.refusal = refusal(element, {"no members", {}});
        record_.refusal->type = givenType_;
    }
    count(record_, givenType_);
    if (!record_.refusal) {
        finishMetadata(record_);
        emit<VSCorrelation>(record_.type, record_.start, record_.end, std::move(members_),
                            std::move(record_.provenance));
        members_.clear();
    }
}

void QVRecordsBuilder::endWorkout() {
    count(record_, givenType_);
    if (record_.refusal) return;
    finishMetadata(record_);
    emit<VSWorkout>(record_.value, record_.start, record_.end, workout_.duration, workout_.energy,
                    workout_.distance, std::move(workout_.events), std::move(record_.provenance));
}

// --- Attributes -----------------------------------------------------------------------------------------

QVRecordsBuilder::Check QVRecordsBuilder::checkLengths(const QVElement& element) {
    for (size_t i = 0; i < kQVAttributeCount; ++i) {
        const auto attribute = static_cast<QVAttributeName>(i);
        if (element.present >> i & 1U && element.values[i].size() > longestText(attribute))
            return Problem{"attribute too long", attributeText(attribute, element.values[i])};
    }
    return {};
}

QVRecordsBuilder::Check QVRecordsBuilder::readCommon(const QVElement& element, Draft& draft) {
    if (Check problem = checkLengths(element)) return problem;
    if (!draft.type) {
        const std::string_view type = element[QVAttributeName::Type];
        if (type.empty()) return Problem{"missing attribute", attributeName(QVAttributeName::Type)};
        return Problem{"unknown type", attributeText(QVAttributeName::Type, type)};
    }
    if (Check problem = readDates(element, draft)) return problem;
    return readOrigin(element, draft);
}

QVRecordsBuilder::Check QVRecordsBuilder::readDates(const QVElement& element, Draft& draft) {
    const std::string_view startText = element[QVAttributeName::StartDate],
                           endText = element[QVAttributeName::EndDate],
                           creationText = element[QVAttributeName::CreationDate];
    QVImportDate start, end;
    if (Check problem = readDate(startText, QVAttributeName::StartDate, start)) return problem;
    if (endText == startText)
        end = start;
    else if (Check problem = readDate(endText, QVAttributeName::EndDate, end))
        return problem;
    if (end.date < start.date) {
        return Problem{"ends before it starts", attributeText(QVAttributeName::StartDate, startText) + ", " +
                                                    attributeText(QVAttributeName::EndDate, endText)};
    }
    draft.start = start.date + element.microsecondsOf(QVExactStart);
    draft.end = end.date + element.microsecondsOf(QVExactEnd);
    if (draft.end < draft.start) {
        draft.start = start.date;
        draft.end = end.date;
    }
    // Earlier exports said the offset of a journey so.
    const auto noted = exactNumber(element, QVAttributeName::StartDate);
    const bool isOffset = noted && std::abs(*noted) <= VSLimits::greatestTimeZoneOffset;
    draft.provenance.timeZoneOffset = isOffset ? *noted : instructions_.timeZoneOffset(start.offset);
    if (element.has(QVAttributeName::CreationDate)) {
        QVImportDate creation = start;
        if (creationText == endText)
            creation = end;
        else if (creationText != startText) {
            if (Check problem = readDate(creationText, QVAttributeName::CreationDate, creation))
                return problem;
        }
        draft.provenance.creationDate = creation.date + element.microsecondsOf(QVExactCreation);
    }
    return {};
}

QVRecordsBuilder::Check QVRecordsBuilder::readDate(std::string_view text, QVAttributeName attribute,
                                                   QVImportDate& date) {
    if (text.empty()) return Problem{"missing attribute", attributeName(attribute)};
    const auto parsed = QVImportDateFromText(text);
    if (!parsed) return Problem{"not a date", attributeText(attribute, text)};
    if (!VSLimits::isDate(parsed->date))
        return Problem{"absurd date",
                       attributeText(attribute, text) + " lies outside of the years 1 to 9999"};
    date = *parsed;
    return {};
}

QVRecordsBuilder::Check QVRecordsBuilder::readOrigin(const QVElement& element, Draft& draft) {
    if (!element.has(QVAttributeName::SourceName))
        return Problem{"missing attribute", attributeName(QVAttributeName::SourceName)};
    const std::string_view name = element[QVAttributeName::SourceName],
                           version = element[QVAttributeName::SourceVersion];
    const std::optional<std::string>& identifier = instructions_.sources().identifierOf(name);
    revisionKey_.assign(std::to_string(name.size())).append(1, ' ').append(name).append(version);
    if (identifier)
        revisionKey_.append(1, '\0')
            .append(std::to_string(version.size()))
            .append(1, ' ')
            .append(*identifier);
    draft.provenance.sourceRevision = revisions_.get(revisionKey_, [&] {
        VSSource source = VSSource::forImportedName(std::string(name));
        if (identifier) source.bundleIdentifier = *identifier;
        return VSSourceRevision{std::move(source), std::string(version)};
    });
    const std::string_view device = element[QVAttributeName::Device];
    const VSValue* exactDevice = element.exactValue(QVAttributeName::Device);
    if (!device.empty() || (exactDevice && exactDevice->dictionary())) {
        draft.provenance.device =
            devices_.get(device, [&] { return VSDevice::fromDescription(std::string(device)); });
    }
    batchBytes_ += name.size() + version.size() + device.size();
    draft.relations.number = element.exact ? element.exact->number : 0;
    if (&draft == &record_) draft.relations.workouts = instructions_.workouts();
    return {};
}

QVRecordsBuilder::Check QVRecordsBuilder::readValue(const QVElement& element, Draft& draft) {
    const std::string_view text = element[QVAttributeName::Value];
    if (text.empty()) return Problem{"missing attribute", attributeName(QVAttributeName::Value)};
    if (draft.type->isQuantityType()) return readQuantity(element, draft);
    const auto value = draft.type->valueForIdentifier(text);
    if (!value) return Problem{"unknown value", attributeText(QVAttributeName::Value, text)};
    draft.value = *value;
    return {};
}

QVRecordsBuilder::Check QVRecordsBuilder::readQuantity(const QVElement& element, Draft& draft) {
    const std::string_view text = element[QVAttributeName::Value], unitText = element[QVAttributeName::Unit];
    const auto number = QVImportNumberFromText(text);
    if (!number) return Problem{"not a number", attributeText(QVAttributeName::Value, text)};
    if (unitText.empty()) return Problem{"missing attribute", attributeName(QVAttributeName::Unit)};
    const QVUnitIndex::Entry& unit = units_.find(draft.type, unitText);
    if (!unit.unit)
        return Problem{"unknown or unfit unit",
                       attributeText(QVAttributeName::Unit, unitText) + " (" + unit.problem + ")"};
    const VSUnit& canonical = draft.type->canonicalUnit();
    const auto value = unit.isCanonical ? number : unit.unit->convert(*number, canonical);
    if (!value || !std::isfinite(*value))
        return Problem{"not a number", attributeText(QVAttributeName::Value, text)};
    const VSValue* exact = element.exactValue(QVAttributeName::Value);
    if (exact && exact->number() && QVExactAgrees(*exact->number(), canonical, *number, *unit.unit, 6)) {
        draft.quantity.emplace(canonical, *exact->number());
        return {};
    }
    // In the document's own unit: whether the store has it already is seen in the digits that stand there.
    draft.quantity.emplace(unit.isCanonical ? canonical : *unit.unit, *number);
    return {};
}

/// The total of a workout. Documents write 0 where a workout has none, so 0 is none unless it is said
/// exactly.
QVRecordsBuilder::Check QVRecordsBuilder::readAmount(const QVElement& element, QVAttributeName amount,
                                                     QVAttributeName unitName, VSTypeCode code,
                                                     std::optional<VSQuantity>& result) {
    const std::string_view text = element[amount], unitText = element[unitName];
    if (text.empty()) return {};
    const auto number = QVImportNumberFromText(text);
    if (!number) return Problem{"not a number", attributeText(amount, text)};
    const VSValue* exact = element.exactValue(amount);
    if (*number == 0 && !exact) return {};
    if (unitText.empty()) return Problem{"missing attribute", attributeName(unitName)};
    const VSObjectType* type = VSObjectType::dataTypeWithCode(code);
    const QVUnitIndex::Entry& unit = units_.find(type, unitText);
    if (!unit.unit)
        return Problem{"unknown or unfit unit",
                       attributeText(unitName, unitText) + " (" + unit.problem + ")"};
    const auto value = unit.unit->convert(*number, type->canonicalUnit());
    if (!value || !std::isfinite(*value)) return Problem{"not a number", attributeText(amount, text)};
    const bool isExact =
        exact && exact->number() &&
        QVExactAgrees(*exact->number(), type->canonicalUnit(), *number, *unit.unit, kAllDigits);
    result.emplace(type->canonicalUnit(), isExact ? *exact->number() : *value);
    return {};
}

QVRecordsBuilder::Check QVRecordsBuilder::readDuration(const QVElement& element, VSDuration& duration) {
    const double longest = VSSecondsFromDuration(VSLimits::latestDate - VSLimits::earliestDate);
    const std::string_view text = element[QVAttributeName::Duration],
                           unitText = element[QVAttributeName::DurationUnit];
    if (text.empty()) return {};
    const auto number = QVImportNumberFromText(text);
    if (!number) return Problem{"not a number", attributeText(QVAttributeName::Duration, text)};
    if (*number < 0) return Problem{"negative amount", attributeText(QVAttributeName::Duration, text)};
    if (unitText.empty()) return Problem{"missing attribute", attributeName(QVAttributeName::DurationUnit)};
    const auto unit = VSUnit::parse(unitText);
    const auto seconds = unit.ok() ? unit->convert(*number, VSUnit::secondUnit()) : std::nullopt;
    if (!seconds)
        return Problem{"unknown or unfit unit", attributeText(QVAttributeName::DurationUnit, unitText)};
    if (!(*seconds <= longest))
        return Problem{"absurd duration", attributeText(QVAttributeName::Duration, text)};
    duration = VSDurationFromSeconds(*seconds);
    const VSValue* exact = element.exactValue(QVAttributeName::Duration);
    if (exact && exact->integer() &&
        std::abs(*exact->integer() - duration.count()) <= 1 + (duration.count() >> 40))
        duration = VSDuration(*exact->integer());
    return {};
}

// --- Results --------------------------------------------------------------------------------------------

QVImportRefusal QVRecordsBuilder::refusal(const QVElement& element, Problem problem) const {
    const std::string_view type =
        element.name == QVElementName::Workout         ? element[QVAttributeName::WorkoutActivityType]
        : element.name == QVElementName::MetadataEntry ? element[QVAttributeName::Key]
                                                       : element[QVAttributeName::Type];
    const std::string shownType = type.empty() ? std::string() : std::string(type.substr(0, 100));
    return {*batch_.document, element.line,   std::string(element.givenName.substr(0, 100)),
            shownType,        problem.reason, std::move(problem.detail),
            element.excerpt()};
}

void QVRecordsBuilder::refuse(const QVElement& element, Problem problem) {
    QVImportRefusal part = refusal(element, std::move(problem));
    ++report_.partRefusalsByReason[part.reason];
    list(std::move(part));
}

void QVRecordsBuilder::list(QVImportRefusal refusal) {
    if (report_.refusals.size() < listedRefusals_) report_.refusals.push_back(std::move(refusal));
}

QVImportCount& QVRecordsBuilder::countOf(const VSObjectType* type, std::string_view typeAsGiven) {
    if (type) return counts_[static_cast<size_t>(VSTypeCodeValue(type->code()))];
    const std::string quoted = QVImportQuoted(typeAsGiven, 100);
    const std::string key = typeAsGiven.empty() ? "(no type)" : quoted.substr(1, quoted.size() - 2);
    const auto known = report_.byType.find(key);
    if (known != report_.byType.end()) return known->second;
    return report_.byType[report_.byType.size() < kListedUnknownTypes ? key : kOtherUnknownTypes];
}

void QVRecordsBuilder::count(const Draft& draft, std::string_view typeAsGiven) {
    QVImportCount& ofType = countOf(draft.type, typeAsGiven);
    ++ofType.read;
    ++report_.total.read;
    if (!draft.refusal) return;
    ++ofType.refused;
    ++report_.total.refused;
    ++report_.refusalsByReason[draft.refusal->reason];
    list(*draft.refusal);
}

void QVRecordsBuilder::finishMetadata(Draft& draft) {
    if (draft.metadata.empty()) return;
    if (!lastMetadata_ || *lastMetadata_ != draft.metadata)
        lastMetadata_ = std::make_shared<const VSMetadata>(std::move(draft.metadata));
    draft.provenance.metadata = lastMetadata_;
}

template <typename Sample, typename... Arguments>
void QVRecordsBuilder::emit(Arguments&&... arguments) {
    QVImportItem item{Sample(std::forward<Arguments>(arguments)...), record_.line, nullptr};
    VSImportRelations& relations = record_.relations;
    const bool namesMembers = std::any_of(relations.members.begin(), relations.members.end(),
                                          [](int64_t number) { return number != 0; });
    if (relations.number || !relations.workouts.empty() || namesMembers)
        item.relations = std::make_unique<const VSImportRelations>(std::move(relations));
    batch_.items.push_back(std::move(item));
    batchBytes_ += record_.metadataBytes;
    if (batch_.items.size() >= QVImportBatch::kSize || batchBytes_ > kGreatestBatch) flush();
}

void QVRecordsBuilder::flush() {
    if (batch_.items.empty() && !batch_.person) return;
    batchBytes_ = 0;
    QVImportBatch next;
    next.document = batch_.document;
    next.items.reserve(QVImportBatch::kSize);
    if (!queue_.push(std::exchange(batch_, std::move(next)))) stopped_ = true;
}

QVImportReport QVRecordsBuilder::takeReport() {
    for (size_t code = 0; code < counts_.size(); ++code) {
        if (counts_[code].read == 0) continue;
        const VSObjectType* type = VSObjectType::dataTypeWithCode(static_cast<int>(code));
        // A document may name a type that it has not by the bare name of one that there is.
        QVImportCount& count = report_.byType[std::string(type->name())];
        count.read += counts_[code].read;
        count.refused += counts_[code].refused;
    }
    return std::move(report_);
}
