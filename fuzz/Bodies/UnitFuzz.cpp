#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>

#include "Vessa/VSUnit.h"
#include "Vessa/VSUnitParser.h"
#include "fuzz/Bodies/FuzzBodies.h"

namespace {

void expect(bool promise, const char* what, std::string_view text) {
    if (promise) return;
    std::fprintf(stderr, "broken promise: %s: \"%.*s\"\n", what, static_cast<int>(text.size()), text.data());
    std::abort();
}

/// A conversion there and back may lose the last digits, and no more. What leaves the range of doubles or
/// falls below their smallest full precision on its way says nothing.
void convertBothWays(const VSUnit& from, const VSUnit& to, double value, std::string_view text) {
    const auto there = from.convert(value, to);
    expect(there.has_value() == from.isCompatibleWith(to), "compatible units convert, and only they", text);
    if (!there) return;
    expect(!std::isnan(*there), "a conversion is a number", text);
    if (!std::isfinite(*there) || std::abs(*there) < 1e-290) return;
    const double back = to.convert(*there, from).value_or(std::nan(""));
    const double zero = from.convert(0, to).value_or(0), zeroBack = to.convert(0, from).value_or(0);
    if (!std::isfinite(zero) || !std::isfinite(zeroBack)) return;
    // The distance of two zeros, as of degC and K, costs digits of values that are small beside it.
    const double digits = 1e-12 * (std::abs(value) + std::abs(zeroBack));
    expect(std::abs(back - value) <= digits || std::abs(value) < 1e-290, "a conversion can be undone", text);
}

}  // namespace

void VSFuzzUnit(const uint8_t* bytes, size_t size) {
    const std::string_view text(reinterpret_cast<const char*>(bytes), size);
    // The parser by itself as well: a process knows only so many units, and then refuses new ones.
    const auto parsed = VSUnitParser(text).parse();
    const auto unit = VSUnit::parse(text);
    if (!parsed) {
        expect(!unit.ok(), "what cannot be parsed is no unit", text);
        expect(!parsed.error().message.empty(), "an error says something", text);
        return;
    }
    const std::string canonical = VSUnitParser::canonicalText(*parsed);
    const auto again = VSUnitParser(canonical).parse();
    expect(again.ok(), "the canonical text parses", text);
    expect(VSUnitParser::canonicalText(*again) == canonical, "the canonical text is its own", text);
    if (!unit) return;
    expect(unit->unitString() == canonical, "a unit tells its canonical text", text);
    const auto same = VSUnit::parse(unit->unitString());
    if (!same) return;
    expect(*same == *unit, "the canonical text is the same unit", text);
    for (const char* other :
         {"kg", "m", "s", "count/min", "mmol<180.1558>/L", "degF", "kcal", "%", "IU", "L"}) {
        for (const double value : {1.0, -273.15, 7e5, 1e-9})
            convertBothWays(*unit, VSUnit::fromString(other), value, text);
    }
}
