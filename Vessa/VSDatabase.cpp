#include "Vessa/VSDatabase.h"

#include <sqlite3.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cmath>
#include <cstring>
#include <thread>

#include "Vessa/VSPageScrubber.h"

namespace {

VSErrorCode errorCode(int code) {
    switch (code & 0xff) {
        case SQLITE_FULL:
            return VSErrorCode::DiskFull;
        case SQLITE_BUSY:
        case SQLITE_LOCKED:
        case SQLITE_PROTOCOL:  // the locks of the log stayed taken
        case SQLITE_CANTOPEN:
        case SQLITE_READONLY:
        case SQLITE_PERM:
        case SQLITE_AUTH:
            return VSErrorCode::NotAccessible;
        case SQLITE_CORRUPT:
        case SQLITE_NOTADB:
            return VSErrorCode::Corrupt;
        case SQLITE_INTERRUPT:
            return VSErrorCode::Cancelled;
        default:
            return VSErrorCode::Failed;
    }
}

const char* meaning(int code) {
    switch (code & 0xff) {
        case SQLITE_FULL:
            return "the disk is full";
        case SQLITE_BUSY:
        case SQLITE_LOCKED:
        case SQLITE_PROTOCOL:
            return "the store is held by another program";
        case SQLITE_CANTOPEN:
            return "the store cannot be opened";
        case SQLITE_READONLY:
            return "the store cannot be written to";
        case SQLITE_PERM:
        case SQLITE_AUTH:
            return "the store may not be used by this user";
        case SQLITE_CORRUPT:
            return "the store's file is damaged";
        case SQLITE_NOTADB:
            return "the file is not a store";
        case SQLITE_IOERR:
            return "the disk reported a failure";
        default:
            return "the database failed";
    }
}

bool isWithoutRoom(int reason) {
    return reason == EDQUOT || reason == EFBIG || reason == ENOSPC;
}

VSErrorCode codeOfSystem(int reason) {
    if (isWithoutRoom(reason)) return VSErrorCode::DiskFull;
    switch (reason) {
        case ENOENT:
            return VSErrorCode::NotFound;
        case EACCES:
        case EPERM:
            return VSErrorCode::Refused;
        case EISDIR:
        case ELOOP:
        case ENAMETOOLONG:
        case ENOTDIR:
            return VSErrorCode::Invalid;
        case EAGAIN:
        case EBUSY:
        case EMFILE:
        case ENFILE:
        case ENOLCK:
        case ENOMEM:
        case ESTALE:
        case ETIMEDOUT:
        case ETXTBSY:
            return VSErrorCode::NotAccessible;
        default:  // a file system that can only be read (EROFS), a broken disk (EIO) ...
            return VSErrorCode::Failed;
    }
}

bool isHeld(int code) {
    return (code & 0xff) == SQLITE_BUSY || (code & 0xff) == SQLITE_LOCKED || (code & 0xff) == SQLITE_PROTOCOL;
}

/// Whether a failure of the system is that of a disk without space. SQLite says so itself only of a write
/// that got ENOSPC; a quota or a limit, a new file and the log's index are left to us.
bool isFullDisk(int code, int reason) {
    switch (code) {
        case SQLITE_IOERR_WRITE:
        case SQLITE_IOERR_FSYNC:
        case SQLITE_IOERR_TRUNCATE:
        case SQLITE_IOERR_SHMSIZE:
        case SQLITE_IOERR_SHMMAP:
        case SQLITE_IOERR_SHMOPEN:
        case SQLITE_CANTOPEN:
            return isWithoutRoom(reason);
        default:
            return false;
    }
}

}  // namespace

VSError VSErrorFromSystem(int reason, const std::string& what) {
    return {codeOfSystem(reason), what + ": " + std::strerror(reason)};
}

VSError VSErrorFromDatabaseCode(int code, const std::string& detail) {
    return {errorCode(code), std::string(meaning(code)) + " (" + detail + ", " + std::to_string(code) + ")",
            isHeld(code)};
}

// VSStatement

VSStatement::VSStatement(VSDatabase& database, sqlite3_stmt* statement, std::vector<sqlite3_stmt*>& home)
    : database_(&database), statement_(statement), home_(&home) {}

VSStatement::VSStatement(VSStatement&& other) noexcept
    : database_(other.database_), statement_(std::exchange(other.statement_, nullptr)), home_(other.home_) {}

VSStatement::~VSStatement() {
    if (!statement_) return;
    sqlite3_reset(statement_);  // repeats the error of the last step, which was reported
    sqlite3_clear_bindings(statement_);
    home_->push_back(statement_);
}

VSStatement& VSStatement::bind(int index, int64_t value) {
    if (int code = sqlite3_bind_int64(statement_, index, value)) database_->fail(code);
    return *this;
}

VSStatement& VSStatement::bindReal(int index, double value) {
    if (int code = sqlite3_bind_double(statement_, index, value)) database_->fail(code);
    return *this;
}

VSStatement& VSStatement::bindNumber(int index, double value) {
    constexpr double limit = 140737488355328.0;  // 2^47: longer integers take eight bytes, as a double does
    const bool whole =
        std::abs(value) < limit && value == std::trunc(value) && !(value == 0 && std::signbit(value));
    return whole ? bind(index, static_cast<int64_t>(value)) : bindReal(index, value);
}

VSStatement& VSStatement::bindText(int index, std::string_view text) {
    if (int code = sqlite3_bind_text64(statement_, index, text.data() ? text.data() : "", text.size(),
                                       SQLITE_TRANSIENT, SQLITE_UTF8))
        database_->fail(code);
    return *this;
}

VSStatement& VSStatement::bindBlob(int index, const void* bytes, size_t size) {
    if (int code = sqlite3_bind_blob64(statement_, index, bytes, size, SQLITE_TRANSIENT))
        database_->fail(code);
    return *this;
}

VSStatement& VSStatement::bindNull(int index) {
    if (int code = sqlite3_bind_null(statement_, index)) database_->fail(code);
    return *this;
}

VSStatement& VSStatement::bindOptionalText(int index, const std::optional<std::string>& text) {
    return text ? bindText(index, *text) : bindNull(index);
}

bool VSStatement::step() {
    const int code = sqlite3_step(statement_);
    if (code == SQLITE_ROW) return true;
    if (code == SQLITE_DONE) return false;
    database_->fail(code);
}

void VSStatement::run() {
    while (step()) {
    }
    reset();
}

void VSStatement::reset() {
    if (int code = sqlite3_reset(statement_)) database_->fail(code);
}

int64_t VSStatement::integer(int column) const {
    return sqlite3_column_int64(statement_, column);
}
double VSStatement::real(int column) const {
    return sqlite3_column_double(statement_, column);
}
bool VSStatement::isNull(int column) const {
    return sqlite3_column_type(statement_, column) == SQLITE_NULL;
}

std::string VSStatement::text(int column) const {
    const auto* bytes = reinterpret_cast<const char*>(sqlite3_column_text(statement_, column));
    return bytes ? std::string(bytes, static_cast<size_t>(sqlite3_column_bytes(statement_, column)))
                 : std::string();
}

std::optional<std::string> VSStatement::optionalText(int column) const {
    if (isNull(column)) return std::nullopt;
    return text(column);
}

std::string_view VSStatement::blob(int column) const {
    const auto* bytes = static_cast<const char*>(sqlite3_column_blob(statement_, column));
    return bytes ? std::string_view(bytes, static_cast<size_t>(sqlite3_column_bytes(statement_, column)))
                 : std::string_view();
}

// VSDatabase

VSDatabase::VSDatabase(const std::filesystem::path& file, Mode mode, VSDuration patience)
    : patience_(patience) {
    int flags = SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_EXRESCODE |
                (mode == Mode::Write ? SQLITE_OPEN_READWRITE : SQLITE_OPEN_READONLY);
    std::string name = file.string();
    if (mode == Mode::ReadImmutable) {
        flags |= SQLITE_OPEN_URI;
        std::string escaped;
        for (char c : name) {
            if (c == '%' || c == '?' || c == '#') {
                char code[4];
                std::snprintf(code, sizeof code, "%%%02X", static_cast<unsigned char>(c));
                escaped += code;
            } else {
                escaped += c;
            }
        }
        name = "file:" + escaped + "?immutable=1";
    }
    const char* locks = mode == Mode::ReadAlone ? "unix-none" : nullptr;
    const int code = sqlite3_open_v2(name.c_str(), &handle_, flags, locks);
    if (code != SQLITE_OK) {
        const int reason = errno;
        const VSError error =
            isFullDisk(code, reason)
                ? VSErrorFromDatabaseCode(SQLITE_FULL, std::strerror(reason))
                : VSErrorFromDatabaseCode(code, handle_ ? sqlite3_errmsg(handle_) : "no memory");
        close();
        throw VSDatabaseFailure(error);
    }
    if (mode == Mode::Write) scrubber_ = std::make_unique<VSPageScrubber>(handle_);
    sqlite3_busy_handler(handle_, &VSDatabase::waitForLock, this);
    if (mode == Mode::ReadAlone)
        sqlite3_exec(handle_, "PRAGMA locking_mode = EXCLUSIVE", nullptr, nullptr, nullptr);
}

VSDatabase::~VSDatabase() {
    close();
}

void VSDatabase::close() {
    for (auto& [sql, list] : statements_) {
        for (sqlite3_stmt* statement : list) sqlite3_finalize(statement);
    }
    statements_.clear();
    sqlite3_close_v2(handle_);
    handle_ = nullptr;
}

int VSDatabase::waitForLock(void* self, int attempt) {
    auto* database = static_cast<VSDatabase*>(self);
    if (database->giveUp_ && database->giveUp_->load()) return 0;
    const auto now = std::chrono::steady_clock::now();
    if (attempt == 0) {
        database->waitingSince_ = now;
        database->longWaitTold_ = false;
    }
    // In microseconds on both sides: the longest patience has no nanoseconds.
    const auto waited = std::chrono::duration_cast<VSDuration>(now - database->waitingSince_);
    if (database->longWaitBlock_ && !database->longWaitTold_ && waited >= database->longWait_) {
        database->longWaitTold_ = true;
        database->longWaitBlock_();
    }
    if (waited >= database->patience_) return 0;
    if (database->deadline_ && now >= database->deadline_->load()) return 0;
    std::this_thread::sleep_for(std::chrono::milliseconds(std::min(1 + attempt, 20)));
    return 1;
}

void VSDatabase::fail(int code) const {
    const int reason = errno;  // SQLite keeps it for some of its calls only
    VSError error = isFullDisk(code, reason) ? VSErrorFromDatabaseCode(SQLITE_FULL, std::strerror(reason))
                                             : VSErrorFromDatabaseCode(code, sqlite3_errmsg(handle_));
    throw VSDatabaseFailure(std::move(error));
}

VSStatement VSDatabase::use(std::string_view sql) {
    auto& list = statements_[std::string(sql)];
    if (!list.empty()) {
        sqlite3_stmt* statement = list.back();
        list.pop_back();
        return VSStatement(*this, statement, list);
    }
    sqlite3_stmt* statement = nullptr;
    const int code = sqlite3_prepare_v3(handle_, sql.data(), static_cast<int>(sql.size()),
                                        SQLITE_PREPARE_PERSISTENT, &statement, nullptr);
    if (code) fail(code);
    return VSStatement(*this, statement, list);
}

void VSDatabase::define(const char* name, int count, Predicate block) {
    constexpr int mostArguments = 8;
    const auto call = [](sqlite3_context* context, int given, sqlite3_value** values) {
        int64_t arguments[mostArguments];
        for (int index = 0; index < given; ++index) arguments[index] = sqlite3_value_int64(values[index]);
        const auto& predicate = *static_cast<const Predicate*>(sqlite3_user_data(context));
        sqlite3_result_int(context, predicate(arguments) ? 1 : 0);
    };
    const int code = count > mostArguments ? SQLITE_TOOBIG
                                           : sqlite3_create_function_v2(
                                                 handle_, name, count, SQLITE_UTF8 | SQLITE_DIRECTONLY,
                                                 new Predicate(std::move(block)), call, nullptr, nullptr,
                                                 [](void* data) { delete static_cast<Predicate*>(data); });
    if (code) fail(code);
}

void VSDatabase::execute(const char* sql) {
    if (int code = sqlite3_exec(handle_, sql, nullptr, nullptr, nullptr)) fail(code);
}

int64_t VSDatabase::integer(std::string_view sql) {
    auto statement = use(sql);
    return statement.step() ? statement.integer(0) : 0;
}

bool VSDatabase::isReadOnly() const {
    return sqlite3_db_readonly(handle_, "main") == 1;
}

bool VSDatabase::othersHaveCommitted() {
    const int64_t version = integer("PRAGMA data_version");
    const bool changed = dataVersion_ != version;
    dataVersion_ = version;
    return changed;
}

int64_t VSDatabase::changes() const {
    return sqlite3_changes64(handle_);
}

// VSTransaction

VSTransaction::VSTransaction(VSDatabase& database, Kind kind) : database_(database) {
    database.use(kind == Kind::Write ? "BEGIN IMMEDIATE" : "BEGIN").run();
}

VSTransaction::~VSTransaction() {
    if (!open_ || sqlite3_get_autocommit(database_.handle())) return;
    sqlite3_exec(database_.handle(), "ROLLBACK", nullptr, nullptr, nullptr);
}

void VSTransaction::commit() {
    database_.use("COMMIT").run();
    open_ = false;
}
