#pragma once

#include <array>
#include <cstdint>
#include <numeric>

/// A positive or negative ratio of whole numbers, kept exact as long as both fit 63 bits (all units and their
/// usual combinations do); beyond that as long doubles, which is more than any reading needs.
struct VSUnitRatio {
    long double numerator = 1, denominator = 1;

    static constexpr VSUnitRatio of(int64_t numerator, int64_t denominator = 1) {
        return {static_cast<long double>(numerator), static_cast<long double>(denominator)};
    }
    VSUnitRatio reduced() const {
        constexpr long double kLimit = 9.2e18L;
        const auto whole = [](long double x) {
            return x > -kLimit && x < kLimit && x == static_cast<long double>(static_cast<int64_t>(x));
        };
        if (!whole(numerator) || !whole(denominator)) return *this;
        const auto n = static_cast<int64_t>(numerator), d = static_cast<int64_t>(denominator);
        const int64_t divisor = std::gcd(n, d);
        return divisor > 1 ? of(n / divisor, d / divisor) : *this;
    }
    VSUnitRatio inverse() const { return {denominator, numerator}; }
    friend VSUnitRatio operator*(const VSUnitRatio& a, const VSUnitRatio& b) {
        // Crosswise reduction first keeps the products small.
        const VSUnitRatio left = VSUnitRatio{a.numerator, b.denominator}.reduced();
        const VSUnitRatio right = VSUnitRatio{b.numerator, a.denominator}.reduced();
        return VSUnitRatio{left.numerator * right.numerator, left.denominator * right.denominator}.reduced();
    }
    friend VSUnitRatio operator-(const VSUnitRatio& a, const VSUnitRatio& b) {
        return VSUnitRatio{a.numerator * b.denominator - b.numerator * a.denominator,
                           a.denominator * b.denominator}
            .reduced();
    }
    VSUnitRatio power(int exponent) const {
        VSUnitRatio result;
        const VSUnitRatio base = exponent < 0 ? inverse() : *this;
        for (int i = exponent < 0 ? -exponent : exponent; i > 0; --i) result = result * base;
        return result;
    }
    long double applyTo(long double value) const { return value * numerator / denominator; }
};

/// The base quantities that units are products of powers of. Numbers of things (count), biological activity
/// (IU) and levels of sound are quantities of their own, so that they are never taken for a fraction or a
/// percentage.
enum VSUnitBase {
    Mass,
    Length,
    Time,
    Temperature,
    Amount,
    Current,
    Count,
    InternationalUnit,
    SoundLevel,
    VSUnitBaseCount
};
using VSUnitDimensions = std::array<int, VSUnitBaseCount>;

/// A symbol of a unit string ("mL", "mmol<180.1558>"): how much of the coherent unit (grams, metres, seconds,
/// kelvins, moles, amperes ...) it is.
struct VSUnitSymbol {
    VSUnitDimensions dimensions{};
    VSUnitRatio scale;
    VSUnitRatio offset = VSUnitRatio::of(0);  // in the coherent unit; not 0: a temperature scale
};
