#pragma once

#include <filesystem>
#include <memory>
#include <mutex>
#include <vector>

#include "Vessa/Base/VSError.h"
#include "Vessa/VSStoreReader.h"

/// Reading connections, lent to one user at a time. Any thread.
class VSReaderPool {
 public:
    explicit VSReaderPool(std::filesystem::path folder) : folder_(std::move(folder)) {}

    /// Runs `block(VSStoreReader&)` in one snapshot of the store and answers what it returned, or the
    /// failure.
    template <typename Block>
    auto read(Block block) -> VSResult<decltype(block(std::declval<VSStoreReader&>()))> {
        try {
            auto connection = borrow();
            VSTransaction snapshot(*connection->database, VSTransaction::Kind::Read);
            auto answer = block(connection->reader);
            snapshot.commit();
            giveBack(std::move(connection));
            return answer;
        } catch (const VSDatabaseFailure& failure) {
            return failure.error();  // the connection is not used again
        }
    }

    /// Closes the connections that nobody uses.
    void close();

 private:
    struct Connection {
        explicit Connection(std::unique_ptr<VSDatabase> opened)
            : database(std::move(opened)), reader(*database) {}
        std::unique_ptr<VSDatabase> database;
        VSStoreReader reader;
    };
    std::unique_ptr<Connection> borrow();
    void giveBack(std::unique_ptr<Connection> connection);

    const std::filesystem::path folder_;
    std::mutex mutex_;
    std::vector<std::unique_ptr<Connection>> idle_;  // guarded by mutex_
};
