#pragma once

#include <functional>
#include <utility>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/VSQuery.h"
#include "Vessa/VSReaderPool.h"
#include "Vessa/VSStoreAuthorizations.h"

/// One look at the store: what an answer is made from.
class VSQueryLook {
 public:
    VSQueryLook(VSReaderPool& readers, const VSStoreAccess& access, const VSCalendar& calendar)
        : readers_(readers), access_(access), calendar_(calendar) {}

    /// Runs block(VSStoreReader&) in one snapshot, if what the query asks may be read; else Refused.
    template <typename Block>
    auto read(const VSQuery& query, Block block) {
        return readers_.read([&](VSStoreReader& reader) {
            lastChange_ = reader.lastNumber();
            if (query.type()) access_.requireReading(reader.database(), query.type(), query.predicate());
            return block(reader);
        });
    }
    /// In such a block, for queries about all types.
    bool mayRead(VSStoreReader& reader, const VSObjectType* type) const {
        return access_.mayRead(reader.database(), type, {});
    }
    /// That of the query's start.
    const VSCalendar& calendar() const { return calendar_; }
    /// The newest change that the last read knew; 0: nothing was read.
    int64_t lastChange() const { return lastChange_; }

    /// The query is to answer again at once: there is more.
    void goOn() { goesOn_ = true; }
    bool goesOn() const { return goesOn_; }

 private:
    VSReaderPool& readers_;
    const VSStoreAccess& access_;
    const VSCalendar& calendar_;
    int64_t lastChange_ = 0;
    bool goesOn_ = false;
};

/// Answers one executing query, which outlives it. Used by one thread at a time.
class VSQueryAnswerer {
 public:
    virtual ~VSQueryAnswerer() = default;
    /// Whether the query lives on after its first answer.
    virtual bool isLive() const { return false; }
    /// Calls the handler with the answer. Empty: there is nothing to tell.
    using Delivery = std::function<void()>;
    virtual Delivery answer(VSQueryLook& look) = 0;
};

/// A delivery of the answer to the handler, which the query holds and which may be empty.
template <typename Handler, typename Answer>
VSQueryAnswerer::Delivery VSDeliver(const Handler& handler, Answer answer) {
    if (!handler) return {};
    return [&handler, answer = std::move(answer)] { handler(answer); };
}
