#include "Vessa/VSReaderPool.h"

#include "Vessa/VSStoreSchema.h"

namespace {
constexpr size_t idleAtMost = 4;
}  // namespace

VSError VSErrorNamingStore(VSError error, const std::filesystem::path& folder) {
    if (error.code == VSErrorCode::Corrupt && error.message.find(folder.string()) == std::string::npos)
        error.message = folder.string() + ": " + error.message;
    return error;
}

std::unique_ptr<VSReaderPool::Connection> VSReaderPool::borrow() {
    {
        std::lock_guard lock(mutex_);
        if (!idle_.empty()) {
            auto connection = std::move(idle_.back());
            idle_.pop_back();
            return connection;
        }
    }
    return std::make_unique<Connection>(VSStoreSchema::openForReading(folder_, patience_));
}

void VSReaderPool::giveBack(std::unique_ptr<Connection> connection) {
    std::lock_guard lock(mutex_);
    if (idle_.size() < idleAtMost) idle_.push_back(std::move(connection));
}

void VSReaderPool::close() {
    std::lock_guard lock(mutex_);
    idle_.clear();
}
