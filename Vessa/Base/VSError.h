#pragma once

#include <cassert>
#include <optional>
#include <string>
#include <utility>
#include <variant>

/// What kind of thing went wrong: all that callers may branch on. The text is for people and logs.
enum class VSErrorCode {
    NotFound,
    Invalid,        // an argument, a value or a document that cannot be accepted
    Refused,        // not permitted, or too new a store
    NotAccessible,  // the database is locked or cannot be reached now; trying again later may work
    Corrupt,        // what is on disk is damaged
    DiskFull,
    Cancelled,
    Failed,  // any other failure of the system (I/O and the like)
};

struct VSError {
    VSErrorCode code = VSErrorCode::Failed;
    std::string message;
    /// Of NotAccessible: others hold the database, so waiting for them may help.
    bool isHeldByOthers = false;

    friend bool operator==(const VSError&, const VSError&) = default;
};

/// True for the error that queries get while the store is locked: it is logged quietly.
bool vs_isDatabaseAccessibilityError(const VSError& error);

/// A word for the code ("not found", "disk full" ...), in English, for logs and the command line.
const char* VSErrorCodeName(VSErrorCode code);

/// A value or the error that took its place.
template <typename T>
class [[nodiscard]] VSResult {
 public:
    VSResult(T value) : content_(std::in_place_index<0>, std::move(value)) {}
    VSResult(VSError error) : content_(std::in_place_index<1>, std::move(error)) {}

    bool ok() const { return content_.index() == 0; }
    explicit operator bool() const { return ok(); }
    /// REQUIRES: ok().
    T& value() {
        assert(ok());
        return std::get<0>(content_);
    }
    const T& value() const {
        assert(ok());
        return std::get<0>(content_);
    }
    T& operator*() { return value(); }
    const T& operator*() const { return value(); }
    T* operator->() { return &value(); }
    const T* operator->() const { return &value(); }
    /// REQUIRES: !ok().
    const VSError& error() const {
        assert(!ok());
        return std::get<1>(content_);
    }

 private:
    std::variant<T, VSError> content_;
};

/// Success, or the error: for operations without a value.
class [[nodiscard]] VSStatus {
 public:
    VSStatus() = default;
    VSStatus(VSError error) : error_(std::move(error)) {}

    bool ok() const { return !error_; }
    explicit operator bool() const { return ok(); }
    /// REQUIRES: !ok().
    const VSError& error() const {
        assert(error_);
        return *error_;
    }
    const std::optional<VSError>& optionalError() const { return error_; }

 private:
    std::optional<VSError> error_;
};
