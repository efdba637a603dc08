#include "Vessa/VSStoreCleaning.h"

#include <sqlite3.h>

#include <algorithm>

#include "Vessa/Base/VSLog.h"
#include "Vessa/VSStoreSchema.h"

namespace {

/// Of a step: a millisecond or two.
#define VS_PAGES_AT_ONCE "256"
/// Of SQLite's small instructions, between two questions whether a step is still wanted.
constexpr int instructionsAtOnce = 20'000;
constexpr VSDuration longestWait = std::chrono::seconds(30);

/// The temporary file of a VACUUM lies in the store's own folder (it loses its name at once), not where
/// others keep theirs and not in memory, which may not hold it.
class TemporaryFilesIn {
 public:
    TemporaryFilesIn(VSDatabase& database, const std::filesystem::path& folder)
        : database_(database), lock_(mutex()) {
        sqlite3_temp_directory = sqlite3_mprintf("%s", std::filesystem::absolute(folder).c_str());
        database_.execute("PRAGMA temp_store = FILE");
    }
    ~TemporaryFilesIn() {
        sqlite3_exec(database_.handle(), "PRAGMA temp_store = MEMORY", nullptr, nullptr, nullptr);
        sqlite3_free(std::exchange(sqlite3_temp_directory, nullptr));
    }
    TemporaryFilesIn(const TemporaryFilesIn&) = delete;
    TemporaryFilesIn& operator=(const TemporaryFilesIn&) = delete;

 private:
    /// SQLite has one such folder for the whole process; no other connection of ours makes temporary files.
    static std::mutex& mutex() {
        static std::mutex instance;
        return instance;
    }
    VSDatabase& database_;
    std::lock_guard<std::mutex> lock_;
};

}  // namespace

bool VSCutLog(VSDatabase& database) {
    // The first moves the pages beside everyone's reading and writing, so that the second has little to do.
    for (const char* sql : {"PRAGMA wal_checkpoint(PASSIVE)", "PRAGMA wal_checkpoint(TRUNCATE)"}) {
        auto row = database.use(sql);
        if (row.step() && row.integer(0) != 0) return false;
    }
    return true;
}

// VSStoreCleaning

VSStoreCleaning::VSStoreCleaning(std::filesystem::path folder, VSDuration patience,
                                 std::function<bool()> isUnwanted)
    : folder_(std::move(folder)), patience_(patience), isUnwanted_(std::move(isUnwanted)) {}

VSStoreCleaning::~VSStoreCleaning() = default;

VSStoreCleaning::Outcome VSStoreCleaning::step() {
    try {
        return takeStep();
    } catch (const VSDatabaseFailure& failure) {
        if (failure.error().isHeldByOthers || failure.error().code == VSErrorCode::Cancelled)
            return Outcome::Held;
        throw;
    }
}

VSStoreCleaning::Outcome VSStoreCleaning::takeStep() {
    if (!database_) {
        // Of these steps a lost power supply may take some back; none is half done.
        database_ = VSStoreSchema::openForWriting(folder_, false, false, patience_);
        if (isUnwanted_)
            sqlite3_progress_handler(
                database_->handle(), instructionsAtOnce,
                [](void* self) { return static_cast<VSStoreCleaning*>(self)->isUnwanted_() ? 1 : 0; }, this);
    }
    if (!VSStoreSchema::canShrink(*database_)) {
        givePointerMap();
        return Outcome::GoesOn;
    }
    if (database_->integer("PRAGMA freelist_count") > 0) {
        database_->use("PRAGMA incremental_vacuum(" VS_PAGES_AT_ONCE ")").run();
        return Outcome::GoesOn;
    }
    return VSCutLog(*database_) ? Outcome::Clean : Outcome::Held;
}

/// A file made by an earlier program has no pointer map, without which it cannot shrink in steps. It gets one
/// in one long transaction, once. Its rows stay what they are.
void VSStoreCleaning::givePointerMap() {
    const TemporaryFilesIn temporaryFiles(*database_, folder_);
    database_->execute("PRAGMA auto_vacuum = INCREMENTAL; VACUUM");
}

// VSStoreCleaner

void VSStoreCleaner::wake() {
    {
        std::lock_guard lock(mutex_);
        wanted_ = true;
    }
    condition_.notify_one();
}

void VSStoreCleaner::finish() {
    {
        std::lock_guard lock(mutex_);
        finishing_ = true;
    }
    condition_.notify_one();
    if (thread_.joinable()) thread_.join();
}

void VSStoreCleaner::run() {
    std::unique_lock lock(mutex_);
    std::optional<VSDuration> again;  // how long to wait before going on with what is not done
    while (!finishing_) {
        if (!wanted_ && !again) condition_.wait(lock, [this] { return finishing_ || wanted_; });
        // Every new change begins the quiet time anew.
        do {
            wanted_ = false;
            condition_.wait_for(lock, std::max(quiet_, again.value_or(quiet_)),
                                [this] { return finishing_ || wanted_; });
        } while (wanted_ && !finishing_);
        if (finishing_) return;
        lock.unlock();
        again = clean();
        lock.lock();
    }
}

std::optional<VSDuration> VSStoreCleaner::clean() {
    const auto isUnwanted = [this] { return finishing_.load() || isBusy_(); };
    try {
        VSStoreCleaning cleaning(folder_, VSDuration(0), isUnwanted);
        while (!isUnwanted()) {
            const auto outcome = cleaning.step();
            if (outcome == VSStoreCleaning::Outcome::GoesOn) continue;
            if (outcome == VSStoreCleaning::Outcome::Clean) patience_ = quiet_;
            if (outcome == VSStoreCleaning::Outcome::Clean) return std::nullopt;
            patience_ = std::clamp(2 * patience_, quiet_, std::max(quiet_, longestWait));
            return patience_;
        }
        return quiet_;
    } catch (const VSDatabaseFailure& failure) {
        // Not before the next change: a full disk, a damaged file.
        VSLog(VSLogLevel::Debug, "The store's files cannot be cleaned now: " + failure.error().message);
        return std::nullopt;
    }
}
