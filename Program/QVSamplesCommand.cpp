#include <algorithm>
#include <charconv>
#include <limits>

#include "Program/QVCommand.h"
#include "Program/QVDurationStatistics.h"
#include "Program/QVTabOutput.h"

namespace {

struct Request {
    std::optional<VSDate> from, to;
    std::vector<VSSource> sources;
    int64_t limit = std::numeric_limits<int64_t>::max();
    bool newestFirst = false;
};

VSResult<int64_t> readLimit(const QVCommandArguments& arguments) {
    const auto text = arguments.value("limit");
    if (!text) return std::numeric_limits<int64_t>::max();
    int64_t number = 0;
    const auto [end, error] = std::from_chars(text->data(), text->data() + text->size(), number);
    if (error != std::errc{} || end != text->data() + text->size() || number < 0)
        return VSError{VSErrorCode::Invalid, "--limit: " + *text + " is not a number"};
    return number;
}

VSResult<Request> readRequest(const QVCommandArguments& arguments) {
    Request request;
    for (const auto& [option, date] : {std::pair("from", &request.from), std::pair("to", &request.to)}) {
        const auto given = QVDateOption(arguments, option);
        if (!given) return given.error();
        *date = *given;
    }
    const auto limit = readLimit(arguments);
    if (!limit) return limit.error();
    request.limit = *limit;
    request.newestFirst = arguments.has("newest-first");
    return request;
}

/// The sources of a name or bundle identifier. NotFound.
VSResult<std::vector<VSSource>> sourcesNamed(VSHealthStore& store, const std::string& name) {
    const auto summaries = store.sourceSummaries();
    if (!summaries) return summaries.error();
    std::vector<VSSource> sources;
    for (const auto& summary : *summaries) {
        if (summary.source.name == name || summary.source.bundleIdentifier == name)
            sources.push_back(summary.source);
    }
    if (sources.empty())
        return VSError{VSErrorCode::NotFound, "there is no source " + name + "; `qelvar sources` lists them"};
    return sources;
}

std::string quantityText(const VSQuantity& quantity) {
    return QVTabOutput::number(quantity.value()) + " " + quantity.unit().unitString();
}

/// Value, unit and further details of a record of any kind.
struct Content {
    std::string value, unit, details;
};

Content workoutContent(const VSWorkout& workout) {
    Content content{QVValueText(workout), {}, {}};
    content.details = "duration=" + QVTabOutput::number(VSSecondsFromDuration(workout.duration())) + " s";
    if (workout.totalDistance()) content.details += "; distance=" + quantityText(*workout.totalDistance());
    if (workout.totalEnergyBurned())
        content.details += "; energy=" + quantityText(*workout.totalEnergyBurned());
    for (const VSWorkoutEvent& event : workout.workoutEvents()) {
        content.details += event.type == 1   ? "; pause"
                           : event.type == 2 ? "; resume"
                                             : "; event " + std::to_string(event.type);
        if (event.date) content.details += "=" + VSISO8601FromDate(*event.date, VSCalendar::current());
    }
    return content;
}

Content contentOf(const VSSample& sample) {
    if (const auto* quantity = dynamic_cast<const VSQuantitySample*>(&sample)) {
        return {
            QVTabOutput::number(quantity->quantity().value()), quantity->quantity().unit().unitString(), {}};
    }
    if (const auto* workout = dynamic_cast<const VSWorkout*>(&sample)) return workoutContent(*workout);
    Content content{QVValueText(sample), {}, {}};
    if (const auto* correlation = dynamic_cast<const VSCorrelation*>(&sample)) {
        for (const VSSamplePtr& member : correlation->objects()) {
            const Content one = contentOf(*member);
            content.value += (content.value.empty() ? "" : "; ") + std::string(member->sampleType()->name()) +
                             "=" + one.value + (one.unit.empty() ? "" : " " + one.unit);
        }
    }
    return content;
}

void writeRow(const VSSample& sample, QVTabOutput& output) {
    const Content content = contentOf(sample);
    const auto offset = sample.timeZoneOffset();
    output.row({sample.sampleType()->name(), output.date(sample.startDate()), output.date(sample.endDate()),
                content.value, content.unit, content.details, sample.sourceRevision().source.name,
                sample.sourceRevision().version, sample.device() ? sample.device()->description() : "",
                sample.creationDate() ? output.date(*sample.creationDate()) : "",
                offset ? std::to_string(*offset) : "",
                sample.metadata().empty() ? "" : VSValue(sample.metadata()).description()});
}

/// Writes in windows of a month each, so that millions of records need no memory.
VSStatus writeSamples(VSHealthStore& store, const VSHealthStore::TypeSummary& summary, const Request& request,
                      QVTabOutput& output) {
    const VSDate from = std::max(request.from.value_or(summary.firstStart), summary.firstStart);
    const VSDate to =
        std::min(request.to.value_or(summary.lastEnd + VSDuration(1)), summary.lastEnd + VSDuration(1));
    if (from >= to) return {};
    const VSCalendar calendar = VSCalendar::current();
    auto boundaries = calendar.bucketBoundaries(calendar.startOfMonth(from), {.months = 1}, from, to);
    boundaries.front() = from;
    boundaries.back() = to;
    if (request.newestFirst) std::reverse(boundaries.begin(), boundaries.end());
    int64_t left = request.limit;
    for (size_t i = 0; i + 1 < boundaries.size() && left > 0; ++i) {
        const auto [start, end] = std::minmax(boundaries[i], boundaries[i + 1]);
        VSPredicate predicate = VSPredicate::samplesWithStartDate(start, end, VSQueryOptionStrictStartDate);
        predicate.sources = request.sources;
        const int limit =
            left > std::numeric_limits<int>::max() ? VSObjectQueryNoLimit : static_cast<int>(left);
        const auto samples = store.samples(summary.type, predicate, limit,
                                           {{VSSampleSortIdentifierStartDate, !request.newestFirst}});
        if (!samples) return samples.error();
        for (const VSSamplePtr& sample : *samples) writeRow(*sample, output);
        left -= static_cast<int64_t>(samples->size());
    }
    return {};
}

QVExitStatus run(const QVCommandContext& context) {
    const auto& words = context.arguments.words();
    if (words.size() != 1) return QVFailUsage("samples", "samples needs one type");
    auto request = readRequest(context.arguments);
    if (!request) return QVFailUsage("samples", request.error().message);
    const auto type = QVTypeForArgument(words[0]);
    if (!type) return QVFail(type.error());
    auto store = QVOpenStoreForReading(context.storeFolder);
    if (!store) return QVFail(store.error());
    if (const auto name = context.arguments.value("source")) {
        auto sources = sourcesNamed(**store, *name);
        if (!sources) return QVFail(sources.error());
        request->sources = std::move(*sources);
    }
    const auto summaries = (*store)->typeSummaries();
    if (!summaries) return QVFail(summaries.error());
    if (std::none_of(summaries->begin(), summaries->end(),
                     [&type](const auto& summary) { return summary.type == *type; }))
        QVSayNoRecords(**type);
    QVTabOutput output;
    output.row({"type", "start", "end", "value", "unit", "details", "source", "version", "device", "created",
                "offset", "metadata"});
    for (const auto& summary : *summaries) {
        if (summary.type != *type) continue;
        if (const VSStatus status = writeSamples(**store, summary, *request, output); !status)
            return QVFail(status.error());
    }
    if (const VSStatus status = output.finish(); !status) return QVFail(status.error());
    return QVExitStatus::Success;
}

constexpr QVCommandOption kOptions[] = {
    {"from", true}, {"to", true}, {"source", true}, {"limit", true}, {"newest-first", false}};

}  // namespace

const QVCommand QVSamplesCommand{
    "samples", "list the records of a type",
    R"(Usage: qelvar samples TYPE [--from D] [--to D] [--source S] [--limit N] [--newest-first]

Lists the records that start in the range, by their start.

Standard output: type, start, end, value (a number, the identifier of a category's value or a workout's activity, the members
of a correlation), unit, details (of a workout), source, version, device, created, offset (seconds east of Greenwich where it was
recorded), metadata (JSON).

  --from D, --to D   the range, from D up to but not including D; by default everything
  --source S         only of the source with this name or bundle identifier
  --limit N          at most N records
  --newest-first     in the opposite order
)",
    kOptions, run};
