#pragma once

#include <atomic>
#include <chrono>
#include <cstdint>
#include <exception>
#include <filesystem>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "Vessa/Base/VSDate.h"
#include "Vessa/Base/VSError.h"

struct sqlite3;
struct sqlite3_stmt;
class VSDatabase;
class VSPageScrubber;

/// What every failure of the database becomes inside the store; it never leaves the store's operations,
/// which answer with the error it holds.
class VSDatabaseFailure final : public std::exception {
 public:
    explicit VSDatabaseFailure(VSError error) : error_(std::move(error)) {}
    const VSError& error() const { return error_; }
    const char* what() const noexcept override { return error_.message.c_str(); }

 private:
    VSError error_;
};

/// A statement borrowed from its connection's cache; given back, reset, at the end of its life. Parameters
/// and columns count from 1 and 0, as SQLite does. Every call throws VSDatabaseFailure on an error.
class VSStatement {
 public:
    VSStatement(VSStatement&& other) noexcept;
    VSStatement& operator=(VSStatement&&) = delete;
    ~VSStatement();

    VSStatement& bind(int index, int64_t value);
    VSStatement& bind(int index, int value) { return bind(index, int64_t{value}); }
    VSStatement& bindReal(int index, double value);
    /// A whole number that has an exact integer form takes that shorter form; reads back bit for bit.
    VSStatement& bindNumber(int index, double value);
    VSStatement& bindText(int index, std::string_view text);
    VSStatement& bindBlob(int index, const void* bytes, size_t size);
    VSStatement& bindNull(int index);
    VSStatement& bindOptionalText(int index, const std::optional<std::string>& text);

    /// True: there is a row to read.
    bool step();
    /// For statements without rows: steps to the end and makes it ready for the next parameters.
    void run();
    void reset();

    int64_t integer(int column) const;
    double real(int column) const;
    bool isNull(int column) const;
    std::string text(int column) const;
    std::optional<std::string> optionalText(int column) const;
    /// Valid until the next step.
    std::string_view blob(int column) const;

 private:
    friend class VSDatabase;
    VSStatement(VSDatabase& database, sqlite3_stmt* statement, std::vector<sqlite3_stmt*>& home);
    VSDatabase* database_;
    sqlite3_stmt* statement_;
    std::vector<sqlite3_stmt*>* home_;
};

/// One connection to the database file. Used by one thread at a time. Everything throws VSDatabaseFailure.
class VSDatabase {
 public:
    /// The last two are for places where nobody can write: a file without a log, and one with a log, whose
    /// index is then kept in memory.
    enum class Mode { Write, Read, ReadImmutable, ReadAlone };
    /// `patience`: how long a lock held by others is waited for before NotAccessible.
    VSDatabase(const std::filesystem::path& file, Mode mode, VSDuration patience);
    ~VSDatabase();
    VSDatabase(const VSDatabase&) = delete;
    VSDatabase& operator=(const VSDatabase&) = delete;

    /// The statement of this text, prepared once and kept.
    VSStatement use(std::string_view sql);
    /// Makes `block` known to SQL as name(integer, ...), with so many arguments (NULL is 0), in place of what
    /// had the name before. It must not throw.
    using Predicate = std::function<bool(const int64_t* arguments)>;
    void define(const char* name, int count, Predicate block);
    /// One or several statements without parameters and rows.
    void execute(const char* sql);
    int64_t integer(std::string_view sql);
    bool isReadOnly() const;
    void setPatience(VSDuration patience) { patience_ = patience; }
    /// After *deadline no lock is waited for. It outlives the connection.
    using Deadline = std::atomic<std::chrono::steady_clock::time_point>;
    void setDeadline(const Deadline* deadline) { deadline_ = deadline; }
    /// Calls block() when a lock has been waited for that long: once a lock, while it goes on waiting.
    void setLongWaitBlock(VSDuration after, std::function<void()> block) {
        longWait_ = after;
        longWaitBlock_ = std::move(block);
    }
    /// Once *flag is true, locks are not waited for. Null: no flag. The flag outlives the waiting.
    void setGiveUp(const std::atomic<bool>* flag) { giveUp_ = flag; }
    /// Whether another connection has committed since the last call.
    bool othersHaveCommitted();
    int64_t changes() const;
    sqlite3* handle() const { return handle_; }

    [[noreturn]] void fail(int code) const;

 private:
    static int waitForLock(void* self, int attempt);
    void close();

    sqlite3* handle_ = nullptr;
    std::unique_ptr<VSPageScrubber> scrubber_;  // of what this connection writes; outlives the handle
    VSDuration patience_, longWait_{};
    const Deadline* deadline_ = nullptr;
    const std::atomic<bool>* giveUp_ = nullptr;
    std::function<void()> longWaitBlock_;
    std::chrono::steady_clock::time_point waitingSince_;
    bool longWaitTold_ = false;  // of this lock
    std::optional<int64_t> dataVersion_;
    std::unordered_map<std::string, std::vector<sqlite3_stmt*>> statements_;  // those not lent out
};

/// A transaction: rolled back unless committed.
class VSTransaction {
 public:
    enum class Kind { Read, Write };
    VSTransaction(VSDatabase& database, Kind kind);
    ~VSTransaction();
    VSTransaction(const VSTransaction&) = delete;
    VSTransaction& operator=(const VSTransaction&) = delete;
    void commit();

 private:
    VSDatabase& database_;
    bool open_ = true;
};

/// The error of a failed call of the system: DiskFull, NotFound, Refused (no permission), Invalid (the name),
/// NotAccessible (later it may work) or Failed (any other: only for reading, broken). `reason`: its errno.
VSError VSErrorFromSystem(int reason, const std::string& what);
/// The error of an SQLite result code.
VSError VSErrorFromDatabaseCode(int code, const std::string& detail);
