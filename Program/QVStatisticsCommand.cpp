#include <algorithm>
#include <sstream>

#include "Program/QVCommand.h"
#include "Program/QVDurationStatistics.h"
#include "Program/QVTabOutput.h"

namespace {

/// What was asked for.
struct Request {
    std::vector<const VSObjectType*> types;
    bool manyTypes = false;
    std::optional<VSDate> from, to;
    std::optional<std::string> every;  // none: the range as a whole
    std::vector<std::string> columns;  // of sum, average, minimum, maximum
    bool hasOptions = false;           // the person chose the columns
    bool bySource = false, emptyBuckets = false, explain = false;
    std::vector<std::string> units;
};

struct StatisticName {
    std::string_view name;
    int option;
    std::optional<double> VSStatistics::*merged;
    std::optional<double> VSStatistics::OfSource::*ofSource;
};
constexpr StatisticName kStatistics[] = {
    {"sum", VSStatisticsOptionCumulativeSum, &VSStatistics::sum, &VSStatistics::OfSource::sum},
    {"average", VSStatisticsOptionDiscreteAverage, &VSStatistics::average, &VSStatistics::OfSource::average},
    {"minimum", VSStatisticsOptionDiscreteMin, &VSStatistics::minimum, &VSStatistics::OfSource::minimum},
    {"maximum", VSStatisticsOptionDiscreteMax, &VSStatistics::maximum, &VSStatistics::OfSource::maximum},
};
const StatisticName* statisticNamed(std::string_view name) {
    const auto found = std::find_if(std::begin(kStatistics), std::end(kStatistics),
                                    [&](const auto& one) { return one.name == name; });
    return found == std::end(kStatistics) ? nullptr : found;
}

struct Interval {
    std::string_view name;
    VSDateComponents length;
};
constexpr Interval kIntervals[] = {{"hour", {.hours = 1}},
                                   {"day", {.days = 1}},
                                   {"week", {.days = 7}},
                                   {"month", {.months = 1}},
                                   {"year", {.years = 1}}};
const Interval* intervalNamed(std::string_view name) {
    const auto found = std::find_if(std::begin(kIntervals), std::end(kIntervals),
                                    [&](const auto& one) { return one.name == name; });
    return found == std::end(kIntervals) ? nullptr : found;
}

/// The beginning of the hour, day, week, month or year that a moment lies in.
VSDate beginning(std::string_view interval, VSDate date, const VSCalendar& calendar) {
    if (interval == "hour") return calendar.startOfHour(date);
    if (interval == "month") return calendar.startOfMonth(date);
    if (interval == "year")
        return calendar.date(calendar.component(VSCalendarUnit::Year, date), 1, 1)
            .value_or(calendar.startOfMonth(date));
    const VSDate day = calendar.startOfDay(date);
    if (interval != "week") return day;
    return calendar.addDays(
        day, -((calendar.component(VSCalendarUnit::Weekday, day) - calendar.firstWeekday() + 7) % 7));
}

VSError usage(std::string message) {
    return VSError{VSErrorCode::Invalid, std::move(message)};
}

/// What adds up has sums; what is measured again and again has averages and bounds. Averages and bounds of
/// the records of what adds up say how long they happen to be, and are told to those who ask for them.
bool makesSense(const VSObjectType& type, const StatisticName& statistic, bool isAskedFor) {
    if (statistic.option == VSStatisticsOptionCumulativeSum) return type.isCumulative();
    return isAskedFor || !type.isCumulative();
}

/// Whether records of the type are told by value, with the time that they take.
bool hasDurations(const VSObjectType& type) {
    return type.kind() == VSTypeKind::Category || type.kind() == VSTypeKind::Workout;
}
bool showsDurations(const Request& request, const VSObjectType* only) {
    return !request.hasOptions && (!only || hasDurations(*only));
}

VSError noSense(const VSObjectType& type, const std::string& name) {
    const std::string what(type.name());
    if (type.isQuantityType())
        return usage("--options: a " + name + " of " + what +
                     " says nothing, since its records are measured and not added up; average, minimum and "
                     "maximum are what it has");
    if (hasDurations(type))
        return usage("--options: " + what + " has no " + name +
                     ", since its records are no numbers; without --options their number and the time that "
                     "they take are told");
    return usage("--options: " + what + " has no " + name +
                 ", since its records hold several values; ask for the types of these (`qelvar samples " +
                 what + "` shows them)");
}

/// `only` is null when all types are asked for.
VSStatus readColumns(const QVCommandArguments& arguments, const VSObjectType* only, Request& request) {
    request.hasOptions = arguments.has("options");
    std::istringstream list(arguments.value("options").value_or("sum,average,minimum,maximum"));
    for (std::string name; std::getline(list, name, ',');) {
        const StatisticName* statistic = statisticNamed(name);
        if (!statistic) return usage("--options: " + name + " is not one of sum, average, minimum, maximum");
        if (std::find(request.columns.begin(), request.columns.end(), name) != request.columns.end())
            continue;
        const bool fits =
            !only || (only->isQuantityType() && makesSense(*only, *statistic, request.hasOptions));
        if (fits || arguments.has("explain"))
            request.columns.push_back(name);
        else if (request.hasOptions)
            return noSense(*only, name);
    }
    if (request.hasOptions && request.columns.empty()) return usage("--options names nothing");
    return {};
}

VSResult<Request> readRequest(const QVCommandArguments& arguments, const VSObjectType* only) {
    Request request;
    if (const VSStatus status = readColumns(arguments, only, request); !status) return status.error();
    for (const auto& [option, date] : {std::pair("from", &request.from), std::pair("to", &request.to)}) {
        const auto given = QVDateOption(arguments, option);
        if (!given) return given.error();
        *date = *given;
    }
    if (request.from && request.to && *request.from >= *request.to) return usage("--to is not after --from");
    request.every = arguments.value("every");
    if (request.every && !intervalNamed(*request.every))
        return usage("--every: " + *request.every + " is not one of hour, day, week, month, year");
    request.bySource = arguments.has("by-source");
    request.emptyBuckets = arguments.has("empty");
    request.explain = arguments.has("explain");
    if (request.explain && (request.bySource || request.emptyBuckets || arguments.has("options")))
        return usage("--explain goes without --options, --by-source and --empty");
    request.units = arguments.values("unit");
    return request;
}

/// The statistics of one type as rows.
class TypeStatistics {
 public:
    TypeStatistics(VSHealthStore& store, const Request& request, const VSHealthStore::TypeSummary& summary,
                   QVTabOutput& output)
        : store_(store),
          request_(request),
          type_(summary.type),
          output_(output),
          from_(request.from.value_or(summary.firstStart)),
          to_(request.to.value_or(summary.lastEnd + VSDuration(1))) {
        for (const std::string& column : request.columns)
            if (has(column) || request.explain) options_ |= statisticNamed(column)->option;
        if (request.bySource) options_ |= VSStatisticsOptionSeparateBySource;
        if (request.every) beginning_ = beginning(*request.every, from_, calendar_);
        // Without a date given, the range is that of the records, in whole intervals.
        if (request.every && !request.from) from_ = beginning_;
    }

    VSStatus write() {
        if (VSStatus status = findUnit(); !status) return status;
        if (from_ >= to_) return {};
        if (request_.explain) return explain();
        if (!type_->isQuantityType()) return writeDurations();
        const auto predicate = VSPredicate::samplesWithStartDate(from_, to_, VSQueryOptionNone);
        if (!request_.every) {
            auto statistics = store_.statistics(type_, predicate, options_);
            if (!statistics) return statistics.error();
            statistics->startDate = from_;
            statistics->endDate = to_;
            writeRows(*statistics);
            return {};
        }
        const auto collection = store_.statisticsCollection(type_, predicate, options_, beginning_,
                                                            intervalNamed(*request_.every)->length);
        if (!collection) return collection.error();
        if (request_.emptyBuckets)
            (*collection)->enumerateStatistics(from_, to_, [this](const VSStatistics& one) {
                writeRows(one);
            });
        else
            for (const VSStatistics& one : (*collection)->statistics()) writeRows(one);
        return {};
    }

 private:
    /// Of a quantity.
    bool has(const std::string& column) const {
        return type_->isQuantityType() && makesSense(*type_, *statisticNamed(column), request_.hasOptions);
    }

    VSResult<VSUnit> unitFromString(const std::string& text) const {
        if (type_->isQuantityType()) return type_->unitFromString(text);
        auto unit = VSUnit::parse(text);
        if (!unit || unit->isCompatibleWith(*unit_)) return unit;
        return usage(text + " is not a unit of time, in which the durations of " +
                     std::string(type_->name()) + " are told");
    }

    /// The first of the units asked for that fits the type, else the type's own.
    VSStatus findUnit() {
        if (!type_->isQuantityType() && (request_.hasOptions || !hasDurations(*type_))) return {};
        unit_ = type_->isQuantityType() ? type_->canonicalUnit() : VSUnit::minuteUnit();
        if (request_.explain && !type_->isQuantityType()) unit_.reset();
        std::string problem;
        for (const std::string& text : request_.units) {
            const auto unit = unitFromString(text);
            if (unit) {
                unit_ = *unit;
                return {};
            }
            problem = unit.error().message;
        }
        if (!problem.empty() && !request_.manyTypes) return usage("--unit: " + problem);
        return {};
    }

    std::string value(const std::optional<double>& canonical) const {
        return canonical ? QVTabOutput::number(type_->canonicalUnit().convert(*canonical, *unit_))
                         : std::string();
    }

    /// What stands between the source and the unit.
    struct Fields {
        std::string value;
        int64_t count = 0;
        std::vector<std::string> statistics;
        std::string duration;
    };
    void writeRow(VSDate start, VSDate end, std::string_view source, const Fields& given) {
        const bool durations = showsDurations(request_, request_.manyTypes ? nullptr : type_);
        std::vector<std::string> fields;
        if (request_.manyTypes) fields.emplace_back(type_->name());
        fields.insert(fields.end(), {output_.date(start), output_.date(end)});
        if (request_.bySource) fields.emplace_back(source);
        if (durations) fields.push_back(given.value);
        fields.push_back(std::to_string(given.count));
        fields.insert(fields.end(), given.statistics.begin(), given.statistics.end());
        fields.resize(fields.size() + request_.columns.size() - given.statistics.size());
        if (durations) fields.push_back(given.duration);
        fields.push_back(unit_ ? unit_->unitString() : "");
        output_.row(fields);
    }

    void writeRows(const VSStatistics& statistics) {
        Fields fields{{}, statistics.count, {}, {}};
        for (const std::string& column : request_.columns)
            fields.statistics.push_back(has(column) ? value(statistics.*statisticNamed(column)->merged) : "");
        writeRow(statistics.startDate, statistics.endDate, "", fields);
        if (!request_.bySource) return;
        for (const auto& [source, ofSource] : statistics.bySource) {
            fields = {{}, ofSource.count, {}, {}};
            for (const std::string& column : request_.columns)
                fields.statistics.push_back(has(column) ? value(ofSource.*statisticNamed(column)->ofSource)
                                                        : "");
            writeRow(statistics.startDate, statistics.endDate, source.name, fields);
        }
    }

    /// Records without a quantity: their number, by the interval that they start in, and the time they take.
    VSStatus writeDurations() {
        std::vector<VSDate> boundaries{from_, to_};
        if (request_.every)
            boundaries =
                calendar_.bucketBoundaries(beginning_, intervalNamed(*request_.every)->length, from_, to_);
        const auto samples =
            store_.samples(type_, VSPredicate::samplesWithStartDate(from_, to_, VSQueryOptionNone),
                           VSObjectQueryNoLimit, {{VSSampleSortIdentifierStartDate, true}});
        if (!samples) return samples.error();
        // Where durations are not told, values and what reaches in from before are not told apart either.
        const bool byValue = unit_.has_value();
        QVDurationStatistics statistics(std::move(boundaries), from_, to_, byValue);
        for (const VSSamplePtr& sample : *samples) statistics.add(*sample);
        for (size_t interval = 0; interval < statistics.count(); ++interval) {
            const auto& tallies = statistics.tallies(interval);
            if (tallies.empty() && request_.emptyBuckets)
                writeRow(statistics.start(interval), statistics.end(interval), "", {});
            for (const auto& [key, tally] : tallies) {
                const auto& [value, source] = key;
                if (!source.empty() && !request_.bySource) continue;
                const auto duration =
                    unit_ ? VSUnit::secondUnit().convert(tally.seconds, *unit_) : std::nullopt;
                writeRow(statistics.start(interval), statistics.end(interval), source,
                         {value, tally.count, {}, QVTabOutput::number(duration)});
            }
        }
        return {};
    }

    /// Each interval with data, taken apart.
    VSStatus explain() {
        std::vector<std::pair<VSDate, VSDate>> intervals{{from_, to_}};
        if (request_.every) {
            const auto collection = store_.statisticsCollection(
                type_, VSPredicate::samplesWithStartDate(from_, to_, VSQueryOptionNone), options_, beginning_,
                intervalNamed(*request_.every)->length);
            if (!collection) return collection.error();
            intervals.clear();
            for (const VSStatistics& one : (*collection)->statistics())
                intervals.emplace_back(one.startDate, one.endDate);
        }
        for (const auto& [start, end] : intervals) {
            const auto inside = VSPredicate::samplesWithStartDate(std::max(start, from_), std::min(end, to_),
                                                                  VSQueryOptionNone);
            const auto explanation = store_.explainStatistics(type_, inside, options_);
            if (!explanation) return explanation.error();
            for (const auto& contribution : explanation->contributions)
                writeContribution(start, end, contribution);
        }
        return {};
    }

    void writeContribution(VSDate start, VSDate end,
                           const VSStatisticsExplanation::Contribution& contribution) {
        const auto fields = [&](std::vector<std::string> rest) {
            std::vector<std::string> row;
            if (request_.manyTypes) row.emplace_back(type_->name());
            row.insert(row.end(), {output_.date(start), output_.date(end)});
            appendSample(*contribution.sample, row);
            row.insert(row.end(), rest.begin(), rest.end());
            row.push_back(unit_ ? unit_->unitString() : "");
            output_.row(row);
        };
        fields({contribution.startsInRange ? "1" : "0", amount(contribution.inRange),
                amount(contribution.counted), "", "", "", "", "", "", ""});
        for (const auto& taken : contribution.taken) {
            std::vector<std::string> rest{
                "", "", "", amount(taken.amount), output_.date(taken.from), output_.date(taken.to)};
            appendSample(*taken.by, rest);
            fields(std::move(rest));
        }
    }

    std::string amount(double canonical) const { return unit_ ? value(canonical) : std::string(); }

    void appendSample(const VSSample& sample, std::vector<std::string>& row) const {
        const auto* quantity = dynamic_cast<const VSQuantitySample*>(&sample);
        row.insert(row.end(),
                   {sample.sourceRevision().source.name, output_.date(sample.startDate()),
                    output_.date(sample.endDate()), quantity ? amount(quantity->quantity().value()) : ""});
    }

    VSHealthStore& store_;
    const Request& request_;
    const VSObjectType* const type_;
    QVTabOutput& output_;
    const VSCalendar calendar_ = VSCalendar::current();
    VSDate from_, to_, beginning_;
    int options_ = 0;
    std::optional<VSUnit> unit_;
};

void writeHeader(const Request& request, const VSObjectType* only, QVTabOutput& output) {
    std::vector<std::string> header;
    if (request.manyTypes) header.emplace_back("type");
    header.insert(header.end(), {"start", "end"});
    if (request.explain) {
        header.insert(header.end(), {"source", "record_start", "record_end", "value", "starts", "in_interval",
                                     "counted", "taken", "taken_from", "taken_to", "by_source", "by_start",
                                     "by_end", "by_value", "unit"});
        output.row(header);
        return;
    }
    if (request.bySource) header.emplace_back("source");
    if (showsDurations(request, only)) header.emplace_back("value");
    header.emplace_back("count");
    header.insert(header.end(), request.columns.begin(), request.columns.end());
    if (showsDurations(request, only)) header.emplace_back("duration");
    header.emplace_back("unit");
    output.row(header);
}

/// The summaries of the types asked for that have records, in the order of their names.
VSResult<std::vector<VSHealthStore::TypeSummary>> summariesOf(VSHealthStore& store,
                                                              const VSObjectType* only) {
    auto summaries = store.typeSummaries();
    if (!summaries) return summaries;
    if (only) std::erase_if(*summaries, [only](const auto& summary) { return summary.type != only; });
    std::sort(summaries->begin(), summaries->end(),
              [](const auto& a, const auto& b) { return a.type->name() < b.type->name(); });
    return summaries;
}

/// What was asked for may be another thing than what was meant.
void explainColumns(const Request& request, const VSObjectType* only) {
    const bool ofRecords = std::any_of(request.columns.begin(), request.columns.end(),
                                       [](const std::string& column) { return column != "sum"; });
    if (request.hasOptions && ofRecords && only && only->isCumulative())
        QVPrintError("average, minimum and maximum of " + std::string(only->name()) +
                     " are over its single records, however long each is; a day's amount is its sum with "
                     "--every day");
}

QVExitStatus run(const QVCommandContext& context) {
    const auto& words = context.arguments.words();
    if (words.size() != 1) return QVFailUsage("statistics", "statistics needs one type, or the word all");
    const VSObjectType* only = nullptr;
    if (words[0] != "all") {
        const auto type = QVTypeForArgument(words[0]);
        if (!type) return QVFail(type.error());
        only = *type;
    }
    auto request = readRequest(context.arguments, only);
    if (!request) return QVFailUsage("statistics", request.error().message);
    request->manyTypes = !only;
    auto store = QVOpenStoreForReading(context.storeFolder);
    if (!store) return QVFail(store.error());
    const auto summaries = summariesOf(**store, only);
    if (!summaries) return QVFail(summaries.error());
    if (only && summaries->empty()) QVSayNoRecords(*only);
    QVTabOutput output;
    explainColumns(*request, only);
    writeHeader(*request, only, output);
    for (const auto& summary : *summaries) {
        if (const VSStatus status = TypeStatistics(**store, *request, summary, output).write(); !status)
            return QVFail(status.error());
    }
    if (const VSStatus status = output.finish(); !status) return QVFail(status.error());
    return QVExitStatus::Success;
}

constexpr QVCommandOption kOptions[] = {{"from", true},    {"to", true},         {"every", true},
                                        {"options", true}, {"by-source", false}, {"unit", true},
                                        {"empty", false},  {"explain", false}};

}  // namespace

const QVCommand QVStatisticsCommand{
    "statistics", "sums, averages, minima and maxima per hour, day, week, month or year",
    R"(Usage: qelvar statistics TYPE|all [--from D] [--to D] [--every hour|day|week|month|year]
                         [--options sum,average,minimum,maximum] [--by-source] [--unit U]... [--empty] [--explain]

Each kind of record gets what makes sense of it: what adds up (steps) its sum; what is measured (heart rate) average,
minimum and maximum; categories (sleep) and workouts, by value, how many they are and how long they take. Average,
minimum, maximum and count are over the records that start in the interval; a sum or a duration takes of each record
the part that lies in the interval, in proportion to time, and no moment twice. Intervals follow the calendar of the time zone (TZ); weeks begin as in the locale (LANG).

Standard output: type (with `all`), start, end, source (with --by-source), value (of categories and workouts), count,
the statistics, duration (of categories and workouts), unit; a row for each interval that has records. A statistic of
nothing, and one that says nothing of its type, is an empty field.

  --from D, --to D   the range, from D up to but not including D (2020-03-01, 2020-03-01T12:00, 2020-03-01T12:00+01:00);
                     by default that of the records. Nothing outside of it counts, in the first interval neither
  --every INTERVAL   by default one row for the range as a whole
  --options LIST     these statistics and no others; refused where the type has none such (a sum of heart rates). With
                     `all`, by default all of them, each where it makes sense
  --by-source        after each row, which counts no moment from two sources, a row for each source alone
  --unit U           by default the unit of the store, and minutes for durations; may be given several times, the first that fits the type is used
  --empty            rows for intervals without a value too
  --explain          instead of the statistics, the records that they come from: of each interval with a value the
                     records that lie in it. `value` is a record's own, `in_interval` the share of it that lies in the
                     interval, `counted` what of that is in the sum, `starts` 1 when count, average, minimum and maximum
                     have it. After a record stands a row for each part of it that does not count, since a record of
                     another source, earlier in the order of sources, covers it: what was `taken`, between which times,
                     and by which record
)",
    kOptions, run};
