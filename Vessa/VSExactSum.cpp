#include "Vessa/VSExactSum.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>

static_assert(std::endian::native == std::endian::little, "sums on disk are little-endian");

namespace {

using Wide = VSExactSum::Wide;

constexpr int mantissaBits = 52;
constexpr double greatest = 0x1p63;

}  // namespace

VSExactSum::VSExactSum(double value) {
    const double magnitude = std::min(std::fabs(value), greatest);
    const uint64_t bits = std::bit_cast<uint64_t>(magnitude);
    const int exponent = static_cast<int>(bits >> mantissaBits);
    if (exponent == 0) return;  // zero, or far below what is kept
    const uint64_t mantissa = (bits & ((uint64_t{1} << mantissaBits) - 1)) | uint64_t{1} << mantissaBits;
    // The mantissa counts units of 2^-112 shifted by so many bits.
    const int shift = exponent - 1075 + fractionBits;
    if (shift >= 0) {
        const uint64_t high = shift > 128 - mantissaBits - 1 ? mantissa >> (128 - shift) : 0;
        *this = VSExactSum(high, Wide{mantissa} << shift);
    } else if (shift >= -mantissaBits - 1) {
        limbs_[0] = (mantissa + (uint64_t{1} << (-shift - 1))) >> -shift;
    }
    if (value < 0) *this = negated();
}

VSExactSum VSExactSum::dividedBy(uint64_t divisor, uint64_t& remainder) const {
    const auto signedHigh = static_cast<int64_t>(limbs_[2]);
    const auto signedDivisor = static_cast<int64_t>(divisor);
    const int64_t high = signedHigh / signedDivisor - (signedHigh % signedDivisor < 0 ? 1 : 0);
    remainder = limbs_[2] - static_cast<uint64_t>(high) * divisor;
    const Wide upper = Wide{remainder} << 64 | limbs_[1];
    remainder = static_cast<uint64_t>(upper % divisor);
    const Wide lower = Wide{remainder} << 64 | limbs_[0];
    remainder = static_cast<uint64_t>(lower % divisor);
    return VSExactSum(static_cast<uint64_t>(high),
                      (upper / divisor) << 64 | static_cast<uint64_t>(lower / divisor));
}

double VSExactSum::dividedBy(uint64_t count) const {
    const VSExactSum magnitude = isNegative() ? negated() : *this;
    uint64_t remainder = 0;
    const VSExactSum quotient = count == 1 ? magnitude : magnitude.dividedBy(count, remainder);
    // The uppermost 64 bits that are set decide, with one bit for whether anything stands below them.
    if (quotient.isZero()) return 0;
    const auto& limbs = quotient.limbs_;
    const size_t top = limbs[2] ? 2 : limbs[1] ? 1 : 0;
    const uint64_t next = top ? limbs[top - 1] : 0, last = top == 2 ? limbs[0] : 0;
    const int empty = std::countl_zero(limbs[top]);
    const uint64_t window = empty ? limbs[top] << empty | next >> (64 - empty) : limbs[top];
    const bool below = remainder || next << empty || last;
    const double rounded = static_cast<double>(window | (below ? 1 : 0));
    const double result = std::ldexp(rounded, 64 * static_cast<int>(top) - empty - fractionBits);
    return isNegative() ? -result : result;
}

void VSExactSum::appendTo(std::string& bytes) const {
    std::array<char, byteCount> all;
    std::memcpy(all.data(), limbs_.data(), byteCount);
    size_t first = 0, last = byteCount;
    while (first < last && !all[first]) ++first;
    // The last byte kept says the sign of those that follow.
    const char filler = isNegative() ? '\xff' : '\0';
    while (last > first + 1 && all[last - 1] == filler && (all[last - 2] ^ filler) >= 0) --last;
    if (first == last) first = last = 0;
    bytes.push_back(static_cast<char>(last - first));
    bytes.push_back(static_cast<char>(first));
    bytes.append(all.data() + first, last - first);
}

bool VSExactSum::readSlowly(const char*& next, const char* end) {
    if (end - next < 2) return false;
    const auto length = static_cast<unsigned char>(next[0]), first = static_cast<unsigned char>(next[1]);
    next += 2;
    if (first + length > static_cast<int>(byteCount) || end - next < length) return false;
    std::array<char, byteCount> all;
    const bool negative = length && next[length - 1] < 0;
    all.fill(negative ? '\xff' : '\0');
    if (negative) std::memset(all.data(), 0, first);
    std::memcpy(all.data() + first, next, length);
    std::memcpy(limbs_.data(), all.data(), byteCount);
    next += length;
    return true;
}

VSExactSpan::VSExactSpan(double value, int64_t duration)
    : value_(value),
      duration_(static_cast<uint64_t>(duration)),
      quotient_(value_.dividedBy(duration_, remainder_)) {}

/// floor(value * moment / duration), with value = quotient * duration + remainder so that nothing overflows.
VSExactSum VSExactSpan::upTo(int64_t moment) const {
    const auto time = static_cast<uint64_t>(moment);
    if (time == 0) return {};
    if (time == duration_) return value_;
    const auto& limbs = quotient_.limbs_;
    const Wide lower = Wide{limbs[0]} * time;
    const Wide upper = Wide{limbs[1]} * time + static_cast<uint64_t>(lower >> 64);
    VSExactSum part(limbs[2] * time + static_cast<uint64_t>(upper >> 64),
                    upper << 64 | static_cast<uint64_t>(lower));
    return part += VSExactSum(0, Wide{remainder_} * time / duration_);
}
