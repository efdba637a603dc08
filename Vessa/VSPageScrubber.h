#pragma once

#include <sqlite3.h>

/// Pages reach the database file without copies of rows that they held before. SQLite itself overwrites what
/// is deleted where it lies (secure_delete), but when it divides or joins pages it leaves copies of the rows
/// that moved in the unused middle of a page, where nothing ever finds them to overwrite them. They become
/// zeroes here, on the way into the file; what SQLite reads from a page is the same.
class VSPageScrubber {
 public:
    /// For what this connection writes to its main file. REQUIRES: lives until the connection is closed; no
    /// other one of the connection.
    explicit VSPageScrubber(sqlite3* connection);
    VSPageScrubber(const VSPageScrubber&) = delete;
    VSPageScrubber& operator=(const VSPageScrubber&) = delete;

 private:
    static int write(sqlite3_file* file, const void* bytes, int size, sqlite3_int64 offset);

    // The file's functions as SQLite calls them; first, so that a file leads to its scrubber.
    sqlite3_io_methods methods_{};
    const sqlite3_io_methods* real_ = nullptr;
};
