#include "Vessa/VSRollupBuilder.h"

#include "Vessa/VSStoreProvenances.h"
#include "Vessa/VSStoreSchema.h"

void VSRollupBuilder::add(int type, int64_t start, int64_t duration, double value, int64_t provenance) {
    if (type != type_) {
        endType();
        beginType(type);
    }
    if (duration > VSStoreSchema::longSpan.count()) return;
    const auto [first, last] = VSQuartersOfSpan(start, duration);
    const int64_t firstDay = VSFloorDivide(first, VSQuartersPerDay),
                  lastDay = VSFloorDivide(last, VSQuartersPerDay);
    endDaysBefore(firstDay);
    const int64_t source = provenances_.sourceOfProvenance(provenance);
    for (int64_t day = firstDay; day <= lastDay; ++day) days_[{day, source}].add(day, start, duration, value);
    if (!sweep_) return;
    // A source without a summary, in a damaged store, stands at the end.
    const size_t rank = ranks_.emplace(source, ranks_.size()).first->second;
    sweep_->add({start, duration, value, rank});
}

void VSRollupBuilder::finish() {
    endType();
}

void VSRollupBuilder::beginType(int type) {
    type_ = type;
    if (!VSTypeIsMerged(type)) return;
    const auto& order = orders_[type] = VSOrderedSources(database_, provenances_, type);
    ranks_.clear();
    for (size_t rank = 0; rank < order.size(); ++rank) ranks_[order[rank]] = rank;
    sweep_.emplace([this](int64_t quarter, const VSExactSum& share) {
        const int64_t day = VSFloorDivide(quarter, VSQuartersPerDay);
        if (mergedDay_ != day) endMergedDay();
        mergedDay_ = day;
        merged_.set(static_cast<int>(quarter - day * VSQuartersPerDay), share);
    });
}

void VSRollupBuilder::endType() {
    endDaysBefore(INT64_MAX);
    if (!sweep_) return;
    sweep_->finish();
    endMergedDay();
    sweep_.reset();
}

/// No sample that comes later can touch these days.
void VSRollupBuilder::endDaysBefore(int64_t day) {
    while (!days_.empty() && days_.begin()->first.first < day) {
        const auto [itsDay, source] = days_.begin()->first;
        row_(VSRollupSlot(type_, source, itsDay), days_.begin()->second.encoded());
        days_.erase(days_.begin());
    }
}

void VSRollupBuilder::endMergedDay() {
    if (!mergedDay_) return;
    row_(VSRollupSlot(type_, VSMergedSource, *mergedDay_), merged_.encoded());
    merged_ = {};
    mergedDay_.reset();
}

void VSRebuildAllRollups(VSDatabase& database) {
    database.execute("DELETE FROM rollups; DELETE FROM merged_orders;");
    VSStoreProvenances provenances(database);
    VSRollupBuilder builder(database, provenances, [&](int64_t slot, const std::string& bytes) {
        VSWriteRollupRow(database, slot, bytes);
    });
    auto rows =
        database.use("SELECT type, start, duration, value, provenance FROM samples ORDER BY type, start, id");
    while (rows.step())
        builder.add(static_cast<int>(rows.integer(0)), rows.integer(1), rows.integer(2), rows.real(3),
                    rows.integer(4));
    builder.finish();
    for (const auto& [type, order] : builder.orders()) VSNoteOrderOfMergedRows(database, type, order);
}
