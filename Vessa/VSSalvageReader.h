#pragma once

#include <array>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "Vessa/VSPageReader.h"

/// The tables and indexes of a store that a salvage reads. What is not among them follows from these.
enum class VSSalvageTable : uint8_t {
    None,
    Samples,
    SamplesByID,
    Members,
    Workouts,
    WorkoutEvents,
    Deleted,
    Sources,
    Devices,
    Provenances,
    Metadata,
    TypeSources,
    Types,
    State,
    SourceOrder,
    Batches,
    BatchNumbers,
    BatchClaims,
    BatchCharacteristics,
    Authorizations,
    Defaults,
    Characteristics,
    MedicalID,
    Count
};
const char* VSSalvageTableName(VSSalvageTable table);

/// Finds the rows of a damaged store's tables: those of each table's tree as far as its pages lead on, and
/// those of pages that nothing leads to any more, by the shape of their rows. Used by one thread.
class VSSalvageReader {
 public:
    using Table = VSSalvageTable;
    /// `layout` is a sound store with the tables in their usual places, for a file that has lost its list of
    /// tables.
    VSSalvageReader(const std::filesystem::path& file, const std::filesystem::path& layout);

    const std::optional<std::string>& error() const { return pages_.error(); }
    /// Whether anything of the table was found.
    bool found(Table table) const { return !pagesOf_[index(table)].empty(); }
    /// Whether a part of the table could not be read.
    bool isDamaged(Table table) const { return damaged_.contains(table); }
    /// Calls block(row) for every row of the table's shape, each page at most once. Rows of pages that are
    /// only guessed to belong to it come last. Rows may come twice where the file holds them twice.
    void forEachRow(Table table, const std::function<void(const VSPageRow&)>& block);

 private:
    static size_t index(Table table) { return static_cast<size_t>(table); }
    void readSchema(const std::filesystem::path& layout);
    void walk(Table table, uint32_t root);
    void adoptOrphans();
    Table tableOfOrphan(uint32_t page);
    /// Whether a page is worth reading as one of the table's: it has rows of the shape, or no rows at all.
    bool fits(Table table, uint32_t page);

    VSPageReader pages_;
    std::vector<bool> known_;  // by page: it belongs to a tree or is free
    std::array<std::vector<uint32_t>, static_cast<size_t>(Table::Count)> pagesOf_;
    std::array<uint32_t, static_cast<size_t>(Table::Count)> roots_{};
    std::set<Table> damaged_;
};
