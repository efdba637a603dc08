#pragma once

#include <cstdint>
#include <filesystem>
#include <map>
#include <memory>
#include <mutex>
#include <random>
#include <string>
#include <vector>

struct sqlite3_vfs;

namespace test {

/// A file system below SQLite that fails when it is told to and remembers what a lost power supply may lose.
/// While one lives, every connection that is opened in this process goes through it to the real one; none may
/// be open when it ends. One at a time. Any thread.
class FaultyFileSystem {
 public:
    FaultyFileSystem();
    ~FaultyFileSystem();
    FaultyFileSystem(const FaultyFileSystem&) = delete;
    FaultyFileSystem& operator=(const FaultyFileSystem&) = delete;

    enum class Fault {
        OneFailure,  // one operation gives an I/O error; a write lands in part before
        BrokenDisk,  // every operation from there on
        FullDisk     // every one from there on that needs space
    };
    /// The n-th operation from now on (0: the next) and what follows fail in this way. Operations are
    /// opening, writing, cutting, syncing and deleting files, growing the shared memory, and with `reads`
    /// reading too.
    void failAt(int n, Fault fault, bool reads = false);
    /// Nothing fails any more.
    void heal();
    /// How many operations there were since the last failAt or heal.
    int operations() const;

    /// What was done to the files of a folder, in order, for playing it back.
    struct Event {
        enum Kind { Open, Write, Truncate, Sync, Delete, SyncFolder } kind;
        std::string name;  // the file's, without the folder
        int64_t offset = 0;
        std::string bytes;
    };
    void startRecording(const std::filesystem::path& folder);
    std::vector<Event> recorded() const;
    size_t recordedCount() const;

    // For the functions that SQLite calls.
    enum class Kind { Open, Create, Write, Grow, Truncate, Sync, Delete, SharedMemory, Read };
    /// Whether this operation fails; counts it.
    bool fails(Kind kind);
    bool isFull() const;
    void note(Event event, const std::string& path);
    sqlite3_vfs* real() const { return real_; }

 private:
    sqlite3_vfs* real_;
    std::unique_ptr<sqlite3_vfs> vfs_;
    mutable std::mutex mutex_;
    // Guarded by mutex_:
    bool armed_ = false, reads_ = false, recording_ = false;
    Fault fault_ = Fault::OneFailure;
    int failing_ = 0, count_ = 0;
    std::string folder_;
    std::vector<Event> events_;
};

/// The folder of a store while a recorded run is played back: what is certainly on the disk, and what was
/// written since and may be.
class DiskModel {
 public:
    /// REQUIRES: the files that stand in `folder` now are those before the first event.
    explicit DiskModel(const std::filesystem::path& folder);
    void play(const FaultyFileSystem::Event& event);
    /// Writes into an empty folder what a power supply lost at this moment may leave: of the writes since the
    /// last sync of each file any, in any order, each sector of 512 bytes by itself, and of the names made
    /// and removed since the folder's last sync any.
    void cut(const std::filesystem::path& into, std::mt19937& random) const;

 private:
    struct File {
        std::string durable;
        std::vector<FaultyFileSystem::Event> pending;
        bool entryPending = false;  // the folder does not surely know it
    };
    static void apply(std::string& bytes, const FaultyFileSystem::Event& event, std::mt19937* torn);
    void syncFolder();

    std::map<std::string, std::shared_ptr<File>> files_;    // as the running program sees them
    std::map<std::string, std::shared_ptr<File>> durable_;  // as the folder on the disk surely has them
};

}  // namespace test
