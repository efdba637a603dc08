#pragma once

#include <atomic>
#include <filesystem>
#include <memory>

#include "Vessa/Base/VSError.h"
#include "Vessa/VSDatabase.h"

/// The tables of the store, described in docs/store-format.md. Numbers here are on disk: never change or
/// reuse them.
namespace VSStoreSchema {

inline constexpr int32_t applicationID = 0x56455353;  // "VESS"
inline constexpr int currentVersion = 2;
inline constexpr const char* fileName = "vessa.sqlite";
/// Its time stamp changes after each commit; the running programs watch it.
inline constexpr const char* noticeFileName = "vessa.notice";

/// Spans longer than this are found through their own index and are in no rollup. Also in the SQL below.
inline constexpr VSDuration longSpan = std::chrono::hours(48);
#define VS_LONG_SPAN_SQL "172800000000"
static_assert(longSpan.count() == 172800000000);

/// Makes the folder and the empty database file (readable by the user only) where they are missing, then
/// opens the file, makes the tables of a new one, migrates an older one. Throws VSDatabaseFailure: Refused
/// for another program's or a newer database, Corrupt for a damaged file, NotAccessible where it cannot be
/// opened for writing, also soon after *giveUp became true (null: no flag; it outlives the connection).
std::unique_ptr<VSDatabase> openForWriting(const std::filesystem::path& folder, bool createIfMissing,
                                           bool survivesPowerLoss, VSDuration patience,
                                           const std::atomic<bool>* giveUp = nullptr);
/// The same without any change to the disk.
std::unique_ptr<VSDatabase> openForReading(const std::filesystem::path& folder, VSDuration patience);

/// Whether the file has the pointer map with which it shrinks in steps; those of earlier programs have none.
bool canShrink(VSDatabase& database);

}  // namespace VSStoreSchema
