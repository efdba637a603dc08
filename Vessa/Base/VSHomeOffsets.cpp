#include "Vessa/Base/VSHomeOffsets.h"

bool VSHomeOffsets::contains(int offset, VSDate date) {
    constexpr VSDuration month = std::chrono::hours(30 * 24);
    const int64_t number = date.microseconds() / month.count();
    const auto [known, isNew] = known_.try_emplace({offset, number}, false);
    for (int64_t n = number - 6; isNew && n <= number + 6 && !known->second; ++n)
        known->second = calendar_.secondsFromGMT(VSDate::fromMicroseconds(n * month.count())) == offset;
    return known->second;
}
