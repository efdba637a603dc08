#pragma once

#include <atomic>
#include <condition_variable>
#include <filesystem>
#include <functional>
#include <memory>
#include <mutex>
#include <thread>

#include "Vessa/VSDatabase.h"

/// Takes away what changes leave in the files of a store: old pages in the log, pages that hold nothing. What
/// is deleted is overwritten where it lies by the change itself; this takes the copies and gives the space
/// back to the disk. In small steps, each a transaction of its own, over a connection of its own. Used by one
/// thread.
class VSStoreCleaning {
 public:
    /// `isUnwanted`: ends a long step early once it answers true; it is called often and on the thread of the
    /// steps. May be empty.
    /// `patience`: how long others are waited for.
    VSStoreCleaning(std::filesystem::path folder, VSDuration patience, std::function<bool()> isUnwanted);
    ~VSStoreCleaning();

    enum class Outcome {
        Clean,   // nothing is left to do
        GoesOn,  // there is more
        Held     // somebody else's reading or writing is in the way, or it became unwanted; later
    };
    /// Throws VSDatabaseFailure.
    Outcome step();

 private:
    void givePointerMap();
    Outcome takeStep();

    const std::filesystem::path folder_;
    const VSDuration patience_;
    const std::function<bool()> isUnwanted_;
    std::unique_ptr<VSDatabase> database_;
};

/// Moves the log into the file and cuts it to nothing. False: somebody reads or writes; then as much as could
/// be is moved. REQUIRES: no transaction of this connection is open. Throws VSDatabaseFailure.
bool VSCutLog(VSDatabase& database);

/// A thread that cleans a store when it was changed and has been quiet for a while.
class VSStoreCleaner {
 public:
    /// `quiet`: how long nothing must have been asked. `isBusy`: whether something is asked right now.
    VSStoreCleaner(std::filesystem::path folder, VSDuration quiet, std::function<bool()> isBusy)
        : folder_(std::move(folder)), quiet_(quiet), isBusy_(std::move(isBusy)) {}
    ~VSStoreCleaner() { finish(); }
    VSStoreCleaner(const VSStoreCleaner&) = delete;
    VSStoreCleaner& operator=(const VSStoreCleaner&) = delete;

    void start() {
        thread_ = std::thread([this] { run(); });
    }
    /// There may be something to clean. Any thread.
    void wake();
    /// Ends the thread, soon. Once; not on that thread.
    void finish();

 private:
    void run();
    /// Steps until there is nothing to do, something is in the way or the store is asked for something.
    /// Returns how long to wait before going on; none: nothing is left to do.
    std::optional<VSDuration> clean();

    const std::filesystem::path folder_;
    const VSDuration quiet_;
    const std::function<bool()> isBusy_;
    std::mutex mutex_;
    std::condition_variable condition_;
    bool wanted_ = false;  // guarded by mutex_
    std::atomic<bool> finishing_ = false;
    VSDuration patience_{};  // of the thread: for who is in the way
    std::thread thread_;     // of the thread that starts and finishes
};
