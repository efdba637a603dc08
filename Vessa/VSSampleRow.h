#pragma once

#include <cstdint>

#include "Vessa/VSDatabase.h"

/// A row of `samples` but its type. Times in microseconds since 1970.
struct VSSampleRow {
    int64_t start = 0, id = 0, duration = 0;
    double value = 0;  // canonical unit; category value; workout activity; 0 of a correlation
    int64_t provenance = 0;
    int64_t created = 0;   // creation less start
    int64_t metadata = 0;  // 0: none
    int64_t end() const { return start + duration; }
};

#define VS_SAMPLE_COLUMNS "start, id, duration, value, provenance, created, metadata"

inline VSSampleRow VSReadSampleRow(const VSStatement& row) {
    return {row.integer(0), row.integer(1), row.integer(2), row.real(3),
            row.integer(4), row.integer(5), row.integer(6)};
}
