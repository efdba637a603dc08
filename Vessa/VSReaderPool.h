#pragma once

#include <filesystem>
#include <memory>
#include <mutex>
#include <vector>

#include "Vessa/Base/VSError.h"
#include "Vessa/VSStoreReader.h"

/// Of a damaged store: the same, with its folder in the message.
VSError VSErrorNamingStore(VSError error, const std::filesystem::path& folder);

/// Reading connections, lent to one user at a time. Any thread.
class VSReaderPool {
 public:
    /// `patience`: how long a store that is held by others is waited for.
    VSReaderPool(std::filesystem::path folder, VSDuration patience)
        : folder_(std::move(folder)), patience_(patience) {}

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
            return VSErrorNamingStore(failure.error(), folder_);  // the connection is not used again
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
    const VSDuration patience_;
    std::mutex mutex_;
    std::vector<std::unique_ptr<Connection>> idle_;  // guarded by mutex_
};
