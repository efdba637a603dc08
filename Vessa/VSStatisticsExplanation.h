#pragma once

#include <vector>

#include "Vessa/VSStatistics.h"

/// Why the statistics of a range are what they are: every sample that lies in it, how much of it counted and
/// which samples of which sources took the rest. Amounts are in the type's canonical unit. Plain value.
struct VSStatisticsExplanation {
    /// A part of a sample's span in the range that does not count, since a sample of a source earlier in the
    /// order covers it. Parts of one sample do not overlap: where several samples cover a moment, the one of
    /// the earliest source has it (of one source the one that starts first, then the one of the lowest
    /// number). A sample without length has at most one part, without length, with its whole value.
    struct Taken {
        VSSamplePtr by;
        VSDate from, to;
        double amount = 0;
    };
    struct Contribution {
        VSSamplePtr sample;
        bool startsInRange = false;  // then it is in the count, average, minimum and maximum
        double inRange = 0;          // the share of its value that lies in the range
        double counted = 0;          // what of inRange is in the sum: all that was not taken
        std::vector<Taken> taken;    // ascending
    };
    VSStatistics statistics;                  // of the range, with those of each source
    std::vector<Contribution> contributions;  // ascending by start, then by number
};
