#include <map>

#include "Program/QVCommand.h"
#include "Program/QVTabOutput.h"

// The commands that list what is there: types, sources, check.

namespace {

const char* kindName(VSTypeKind kind) {
    switch (kind) {
        case VSTypeKind::Quantity:
            return "quantity";
        case VSTypeKind::Category:
            return "category";
        case VSTypeKind::Correlation:
            return "correlation";
        case VSTypeKind::Workout:
            return "workout";
        case VSTypeKind::Characteristic:
            break;
    }
    return "characteristic";
}

QVExitStatus finish(QVTabOutput& output) {
    if (const VSStatus status = output.finish(); !status) return QVFail(status.error());
    return QVExitStatus::Success;
}

QVExitStatus runTypes(const QVCommandContext& context) {
    if (!context.arguments.words().empty()) return QVFailUsage("types", "types takes no words");
    std::map<const VSObjectType*, VSHealthStore::TypeSummary> summaries;
    auto store = QVOpenStoreForReading(context.storeFolder);
    // The catalogue is there without any store.
    if (!store && store.error().code != VSErrorCode::NotFound) return QVFail(store.error());
    if (store) {
        const auto found = (*store)->typeSummaries();
        if (!found) return QVFail(found.error());
        for (const auto& summary : *found) summaries.emplace(summary.type, summary);
    }
    QVTabOutput output;
    output.row({"type", "kind", "unit", "combines", "count", "first_start", "last_end"});
    for (const VSObjectType* type : VSObjectType::allTypes()) {
        if (!type->isSampleType()) continue;
        const auto summary = summaries.find(type);
        if (summary == summaries.end() && context.arguments.has("recorded")) continue;
        std::vector<std::string> fields{std::string(type->name()), kindName(type->kind()),
                                        type->isQuantityType() ? type->canonicalUnit().unitString() : "",
                                        !type->isQuantityType() ? ""
                                        : type->isCumulative()  ? "sum"
                                                                : "average"};
        if (summary == summaries.end())
            fields.insert(fields.end(), {"0", "", ""});
        else
            fields.insert(fields.end(),
                          {std::to_string(summary->second.count), output.date(summary->second.firstStart),
                           output.date(summary->second.lastEnd)});
        output.row(fields);
    }
    return finish(output);
}

QVExitStatus runSources(const QVCommandContext& context) {
    if (!context.arguments.words().empty()) return QVFailUsage("sources", "sources takes no words");
    auto store = QVOpenStoreForReading(context.storeFolder);
    if (!store) return QVFail(store.error());
    const auto summaries = (*store)->sourceSummaries();
    if (!summaries) return QVFail(summaries.error());
    QVTabOutput output;
    output.row({"source", "bundle", "count", "first_start", "last_end"});
    for (const auto& summary : *summaries) {
        output.row({summary.source.name, summary.source.bundleIdentifier, std::to_string(summary.count),
                    output.date(summary.firstStart), output.date(summary.lastEnd)});
    }
    return finish(output);
}

QVExitStatus runCheck(const QVCommandContext& context) {
    if (!context.arguments.words().empty()) return QVFailUsage("check", "check takes no words");
    auto store = QVOpenStoreForReading(context.storeFolder);
    if (!store) return QVFail(store.error());
    const auto report = (*store)->check();
    if (!report) return QVFail(report.error());
    QVTabOutput output;
    output.row({"result", "samples", "problems"});
    output.row({report->problems.empty() ? "ok" : "damaged", std::to_string(report->samples),
                std::to_string(report->problems.size())});
    const QVExitStatus status = finish(output);
    for (const std::string& problem : report->problems) QVPrintError(problem);
    if (report->problems.empty()) return status;
    return QVFail({VSErrorCode::Corrupt, "the store in " + context.storeFolder.string() + " is damaged"});
}

constexpr QVCommandOption kTypesOptions[] = {{"recorded", false}};

}  // namespace

const QVCommand QVTypesCommand{"types", "list the types of records, and how many of each the store has",
                               R"(Usage: qelvar types [--recorded]

Standard output: type, kind (quantity, category, correlation, workout), unit (in which the store keeps it),
combines (sum or average), count, first_start, last_end; a row for each type in the order of their codes.

  --recorded    only types of which the store has records
)",
                               kTypesOptions, runTypes};

const QVCommand QVSourcesCommand{"sources",
                                 "list the programs and devices that records come from",
                                 R"(Usage: qelvar sources

Standard output: source, bundle (its identifier), count, first_start, last_end; a row for each source.
)",
                                 {},
                                 runSources};

const QVCommand QVCheckCommand{"check",
                               "verify the store",
                               R"(Usage: qelvar check

Checks the database, and that what is kept beside the records for speed says the same as the records.
Standard output: result (ok or damaged), samples, problems (their number). Each problem is a line on standard
error. Nothing is changed. Exit status 7 when there is a problem.
)",
                               {},
                               runCheck};
