#include "Qelvar/Import/QVImportReport.h"

std::string QVImportRefusal::description() const {
    std::string text = document + ":" + std::to_string(line) + ": " + element;
    if (!type.empty()) text += " " + type;
    text += ": " + reason;
    if (!detail.empty()) text += ": " + detail;
    return text;
}

int64_t QVImportReport::refusalsNotListed() const {
    int64_t all = 0;
    for (const auto& [reason, count] : refusalsByReason) all += count;
    for (const auto& [reason, count] : partRefusalsByReason) all += count;
    return all - static_cast<int64_t>(refusals.size());
}
