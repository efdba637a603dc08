#include "RecordsText.h"

#include <algorithm>
#include <charconv>
#include <vector>

#include "Vessa/Base/VSCalendar.h"

namespace test {

namespace {

std::string dateText(VSDate date) {
    return VSISO8601FromDate(date, VSCalendar::current());
}

std::string numberText(double value) {
    char buffer[32];
    return {buffer, std::to_chars(buffer, buffer + sizeof buffer, value).ptr};
}

std::string textOfQuantity(const VSQuantity& quantity) {
    return numberText(quantity.value()) + " " + quantity.unit().unitString();
}

std::string textOfContent(const VSSample& sample) {
    if (const auto* quantity = dynamic_cast<const VSQuantitySample*>(&sample))
        return textOfQuantity(quantity->quantity());
    if (const auto* category = dynamic_cast<const VSCategorySample*>(&sample))
        return std::to_string(category->value());
    if (const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample)) {
        std::vector<std::string> members;
        for (const auto& member : correlation->objects()) {
            members.push_back(std::string(member->sampleType()->name()) + "=" + textOfContent(*member));
        }
        std::sort(members.begin(), members.end());
        std::string text;
        for (const auto& member : members) text += (text.empty() ? "" : ", ") + member;
        return "{" + text + "}";
    }
    const auto& workout = dynamic_cast<const VSWorkout&>(sample);
    std::string text = std::to_string(workout.workoutActivityType()) + " for " +
                       numberText(VSSecondsFromDuration(workout.duration())) + " s";
    if (workout.totalDistance()) text += ", " + textOfQuantity(*workout.totalDistance());
    if (workout.totalEnergyBurned()) text += ", " + textOfQuantity(*workout.totalEnergyBurned());
    for (const auto& event : workout.workoutEvents()) {
        text += ", event " + std::to_string(event.type) + (event.date ? " at " + dateText(*event.date) : "");
    }
    return text;
}

std::string textOfSample(const VSSample& sample) {
    std::string text = std::string(sample.sampleType()->name()) + " " + dateText(sample.startDate()) + " " +
                       dateText(sample.endDate()) + " | " + textOfContent(sample) + " | " +
                       sample.sourceRevision().source.name;
    if (!sample.sourceRevision().version.empty()) text += " version " + sample.sourceRevision().version;
    if (sample.device()) text += " | " + sample.device()->description();
    if (sample.timeZoneOffset()) text += " | offset " + std::to_string(*sample.timeZoneOffset());
    for (const auto& [key, value] : sample.metadata()) text += " | " + key + "=" + value.serialized();
    return text + "\n";
}

}  // namespace

std::string textOfReport(const VSResult<QVImportReport>& report) {
    if (!report)
        return std::string("error ") + VSErrorCodeName(report.error().code) + ": " + report.error().message +
               "\n";
    const auto counts = [](const QVImportCount& count) {
        return "read " + std::to_string(count.read) + ", added " + std::to_string(count.added) +
               ", already had " + std::to_string(count.alreadyHad) + ", refused " +
               std::to_string(count.refused) + "\n";
    };
    std::string text = "total: " + counts(report->total);
    for (const auto& [type, count] : report->byType) text += type + ": " + counts(count);
    for (const auto& document : report->documents) text += "document " + document + "\n";
    for (const auto& note : report->notes) text += "note " + note + "\n";
    for (const auto& refusal : report->refusals) text += "refused " + refusal.description() + "\n";
    for (const auto& [reason, count] : report->refusalsByReason)
        text += "reason " + reason + ": " + std::to_string(count) + "\n";
    for (const auto& [reason, count] : report->partRefusalsByReason)
        text += "part reason " + reason + ": " + std::to_string(count) + "\n";
    return text;
}

std::string textOfStore(VSHealthStore& store) {
    std::string text;
    const auto birth = store.dateOfBirth();
    if (birth.ok() && *birth) {
        text += "born " + std::to_string((*birth)->year) + "-" + std::to_string((*birth)->month) + "-" +
                std::to_string((*birth)->day) + "\n";
    }
    for (const auto& [name, value] :
         {std::pair("sex", store.biologicalSex()), std::pair("blood", store.bloodType()),
          std::pair("skin", store.fitzpatrickSkinType())}) {
        if (value.ok() && *value != 0) text += std::string(name) + " " + std::to_string(*value) + "\n";
    }
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        if (!type->isSampleType()) continue;
        const auto samples =
            store.samples(type, {}, VSObjectQueryNoLimit, {{VSSampleSortIdentifierStartDate, true}});
        if (!samples) return text + "error " + samples.error().message + "\n";
        std::vector<std::string> lines;
        for (const auto& sample : *samples) lines.push_back(textOfSample(*sample));
        std::sort(lines.begin(), lines.end());
        for (const auto& line : lines) text += line;
    }
    return text;
}

}  // namespace test
