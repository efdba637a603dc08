#pragma once

#include <cstdint>
#include <string>

#include "Vessa/Base/VSDate.h"

/// One import: its name and time, and what it added. It may have added nothing: then it holds on to what was
/// there before. Plain value.
struct VSBatch {
    int64_t id = 0;  // never used again
    std::string name;
    VSDate date;
    int64_t added = 0;    // objects that it added
    int64_t present = 0;  // of these, those that are still in the store
};

/// What taking back an import did.
struct VSUndoReport {
    /// Objects that only this import had brought, and correlations that thereby lost their last member.
    int64_t removed = 0;
    int64_t kept = 0;  // objects that another import had in its documents too: they are that one's now
    int64_t gone = 0;  // objects that had been deleted before
    int64_t characteristics =
        0;  // characteristics that it had set and that still had its value: not set again
};
