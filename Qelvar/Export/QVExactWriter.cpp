#include "Qelvar/Export/QVExactWriter.h"

#include <algorithm>

#include "Qelvar/Import/QVXMLText.h"
#include "Vessa/VSMedicalID.h"

namespace {

/// Small enough for every reader, with all escapes.
constexpr size_t kPieceLength = 48 * 1024;

int microsecondsOf(VSDate date) {
    constexpr int64_t kSecond = 1'000'000;
    return static_cast<int>((date.microseconds() % kSecond + kSecond) % kSecond);
}

VSValue numbersValue(const auto& numbers) {
    VSValue::Array array;
    for (const auto number : numbers) array.emplace_back(int64_t{number});
    return array;
}

/// Where a piece of at most so many bytes ends: before a character.
size_t endOfPiece(const std::string& text, size_t begin) {
    size_t end = std::min(text.size(), begin + kPieceLength);
    while (end < text.size() && (static_cast<unsigned char>(text[end]) & 0xC0) == 0x80) --end;
    return end;
}

}  // namespace

void QVExactWriter::setRelations(VSStoreSnapshot::Relations relations) {
    relations_ = std::move(relations);
    lastNumber_ = static_cast<int64_t>(relations_.workouts.size());
}

void QVExactWriter::writeVersion() {
    writeValue(kQVExactVersionName, VSValue(kQVExactVersion));
}

void QVExactWriter::writeMedicalID(const VSMedicalIDData& data) {
    VSValue::Dictionary content = VSMedicalIDContent(data);
    if (data.pictureData) content.emplace(kQVExactPicture, *data.pictureData);
    const std::string text = VSValue(std::move(content)).serialized();
    for (size_t begin = 0; begin < text.size();) {
        const size_t end = endOfPiece(text, begin);
        writeValue(kQVExactMedicalID, VSValue(text.substr(begin, end - begin)));
        begin = end;
    }
}

void QVExactWriter::writeProvenance(const VSSample& sample, const std::string& deviceText) {
    const VSSourceRevision& revision = sample.sourceRevision();
    writeText("sourceName", revision.source.name);
    writeText("sourceVersion", revision.version);
    if (sample.device() && deviceText.empty())
        writeValue("device", VSValue(VSValue::Dictionary{}));
    else
        writeText("device", deviceText);
    writeSource(revision.source);
    if (const auto offset = sample.timeZoneOffset(); offset != timeZone_) {
        writeValue(kQVExactTimeZone,
                   offset ? VSValue(*offset) : VSValue(std::string(kQVExactUnknownTimeZone)));
        timeZone_ = offset;
    }
    writeMicroseconds({microsecondsOf(sample.startDate()), microsecondsOf(sample.endDate()),
                       sample.creationDate() ? microsecondsOf(*sample.creationDate()) : 0});
}

void QVExactWriter::writeSource(const VSSource& source) {
    const std::optional<std::string> said = sources_.identifierOf(source.name);
    const bool isOfName = source == VSSource::forImportedName(source.name);
    if (isOfName ? !said : said == source.bundleIdentifier) return;
    const auto identifier = isOfName ? std::nullopt : std::optional(source.bundleIdentifier);
    VSValue::Array pair{VSValue(source.name)};
    if (!isOfName) pair.emplace_back(*identifier);
    writeValue(kQVExactSource, VSValue(std::move(pair)));
    sources_.set(source.name, identifier);
}

void QVExactWriter::writeEventDate(VSDate date) {
    writeMicroseconds({microsecondsOf(date)});
}

void QVExactWriter::writeMicroseconds(std::vector<int> dates) {
    while (!dates.empty() && dates.back() == 0) dates.pop_back();
    if (!dates.empty()) writeValue(kQVExactMicroseconds, numbersValue(dates));
}

const std::vector<int64_t>& QVExactWriter::workoutsOf(VSObjectID sample) {
    found_.clear();
    const auto& all = relations_.samplesOfWorkouts;
    for (auto at = std::lower_bound(all.begin(), all.end(), std::pair(sample, int64_t{0}));
         at != all.end() && at->first == sample; ++at)
        found_.push_back(at->second);
    return found_;
}

void QVExactWriter::writeRelations(const VSSample& record) {
    const VSObjectID id = record.dataID();
    const auto workout = relations_.workouts.find(id);
    if (workout != relations_.workouts.end()) {
        writeValue(kQVExactNumber, VSValue(workout->second));
    } else if (relations_.namedMembers.contains(id)) {
        numbers_[id] = ++lastNumber_;
        writeValue(kQVExactNumber, VSValue(lastNumber_));
    }
    if (relations_.samplesOfWorkouts.empty() || workoutsOf(id) == workouts_) return;
    writeValue(kQVExactWorkouts, numbersValue(found_));
    workouts_ = found_;
}

void QVExactWriter::writeMember(const VSSample& member) {
    const auto named = numbers_.find(member.dataID());
    if (named != numbers_.end()) writeValue(kQVExactNumber, VSValue(named->second));
}

void QVExactWriter::writeValue(std::string_view name, const VSValue& value) {
    const std::string content = std::string(name) + " " + QVExactValueText(value);
    writer_.processingInstruction(kQVExactTarget, std::span(&content, 1));
}

void QVExactWriter::writeText(std::string_view name, const std::string& text) {
    if (!QVIsXMLText(text)) writeValue(name, VSValue(text));
}
