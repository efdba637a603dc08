#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>

/// A sum of values without rounding, whatever the order in which they come: a whole number of 2^-112 in 192
/// bits. Doubles of a magnitude from 2^-60 to 2^47 are in it bit for bit, smaller ones rounded to the nearest
/// multiple; greater ones cannot be saved, and where an older store has one of 2^63 or more it counts as
/// that. There is room for 2^32 of the greatest. Plain value.
class VSExactSum {
 public:
    __extension__ using Wide = unsigned __int128;
    static constexpr int fractionBits = 112;
    static constexpr size_t byteCount = 24;

    constexpr VSExactSum() = default;
    explicit VSExactSum(double value);

    VSExactSum& operator+=(const VSExactSum& other) {
        const Wide sum = low() + other.low();
        limbs_[2] += other.limbs_[2] + (sum < other.low() ? 1 : 0);
        setLow(sum);
        return *this;
    }
    VSExactSum& operator-=(const VSExactSum& other) {
        limbs_[2] -= other.limbs_[2] + (low() < other.low() ? 1 : 0);
        setLow(low() - other.low());
        return *this;
    }
    friend VSExactSum operator+(VSExactSum a, const VSExactSum& b) { return a += b; }
    friend VSExactSum operator-(VSExactSum a, const VSExactSum& b) { return a -= b; }
    friend bool operator==(const VSExactSum&, const VSExactSum&) = default;
    bool isZero() const { return !(limbs_[0] | limbs_[1] | limbs_[2]); }

    /// The nearest double; of two equally near the even one.
    double value() const { return dividedBy(1); }
    /// The double nearest to the quotient. REQUIRES: count > 0.
    double dividedBy(uint64_t count) const;

    /// Its bytes on disk: the number of bytes, which of the 24 is the first, and the bytes (two's complement,
    /// little-endian) without those at either end that follow from the others.
    void appendTo(std::string& bytes) const;
    /// Reads what appendTo wrote and moves `next` behind it. False: the bytes are not such a sum.
    bool readFrom(const char*& next, const char* end) {
        return readQuickly(next, end) || readSlowly(next, end);
    }

 private:
    friend class VSExactSpan;
    VSExactSum(uint64_t high, Wide low)
        : limbs_{static_cast<uint64_t>(low), static_cast<uint64_t>(low >> 64), high} {}
    /// A positive number of at most seven bytes, with something behind it: what most are.
    bool readQuickly(const char*& next, const char* end) {
        if (end - next < 10) return false;
        const auto length = static_cast<unsigned char>(next[0]), first = static_cast<unsigned char>(next[1]);
        if (length - 1u >= 7u || first + length > static_cast<int>(byteCount) || next[1 + length] < 0)
            return false;
        uint64_t bytes;
        std::memcpy(&bytes, next + 2, sizeof bytes);
        bytes &= (uint64_t{1} << (8 * length)) - 1;
        const size_t limb = first / 8;
        const int shift = first % 8 * 8;
        limbs_ = {};
        limbs_[limb] = bytes << shift;
        if (shift && limb < 2) limbs_[limb + 1] = bytes >> (64 - shift);
        next += 2 + length;
        return true;
    }
    bool readSlowly(const char*& next, const char* end);
    Wide low() const { return Wide{limbs_[1]} << 64 | limbs_[0]; }
    void setLow(Wide low) {
        limbs_[0] = static_cast<uint64_t>(low);
        limbs_[1] = static_cast<uint64_t>(low >> 64);
    }
    bool isNegative() const { return limbs_[2] >> 63; }
    VSExactSum negated() const { return VSExactSum() - *this; }
    /// Towards minus infinity; the remainder is not negative.
    VSExactSum dividedBy(uint64_t divisor, uint64_t& remainder) const;

    std::array<uint64_t, 3> limbs_{};  // two's complement, the lowest first: as on disk
};

/// A value spread evenly over a span. Its part up to a moment is rounded down, and the part between two
/// moments is the difference: so parts that meet add up without a rest, and all parts to the value itself.
class VSExactSpan {
 public:
    /// REQUIRES: duration > 0.
    VSExactSpan(double value, int64_t duration);
    /// From and to count from the start of the span. REQUIRES: 0 <= from <= to <= duration.
    VSExactSum part(int64_t from, int64_t to) const { return upTo(to) - upTo(from); }

 private:
    VSExactSum upTo(int64_t moment) const;

    const VSExactSum value_;
    const uint64_t duration_;
    uint64_t remainder_ = 0;  // before the quotient, whose computation sets it
    const VSExactSum quotient_;
};

/// The part between two moments of a value that is spread over a span, or the whole value of a span without
/// length. From and to count from the start of the span.
inline VSExactSum VSShareOfSpan(double value, int64_t duration, int64_t from, int64_t to) {
    if (from == 0 && to == duration) return VSExactSum(value);
    return VSExactSpan(value, duration).part(from, to);
}
