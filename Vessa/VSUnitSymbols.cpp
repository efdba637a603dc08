#include "Vessa/VSUnitSymbols.h"

#include <array>

namespace {

constexpr VSUnitDimensions dimensions(int mass, int length, int time, int current = 0) {
    VSUnitDimensions result{};
    result[Mass] = mass;
    result[Length] = length;
    result[Time] = time;
    result[Current] = current;
    return result;
}

constexpr VSUnitDimensions only(VSUnitBase base) {
    VSUnitDimensions result{};
    result[base] = 1;
    return result;
}

struct Entry {
    std::string_view name;
    bool takesPrefix;
    VSUnitSymbol symbol;
};

constexpr Entry si(std::string_view name, VSUnitDimensions d, VSUnitRatio scale = {}) {
    return {name, true, {d, scale}};
}
constexpr Entry named(std::string_view name, VSUnitDimensions d, VSUnitRatio scale = {}) {
    return {name, false, {d, scale}};
}
constexpr Entry temperature(std::string_view name, VSUnitRatio scale, VSUnitRatio offset) {
    return {name, false, {only(Temperature), scale, offset}};
}

constexpr VSUnitDimensions kNone{};
constexpr VSUnitDimensions kVolume = dimensions(0, 3, 0);
constexpr VSUnitDimensions kEnergy = dimensions(1, 2, -2);
constexpr VSUnitDimensions kPressure = dimensions(1, -1, -2);

// In grams, metres and seconds. Sources: SI, The International System of Units, 9th edition (BIPM 2019); NIST
// Special Publication 811 (2008), appendix B, and NIST Handbook 44 (appendix C) for the inch, pound and
// gallon families; Units of Measurement Regulations 1995 (United Kingdom) for imperial volumes.
constexpr std::array kSymbols{
    si("g", dimensions(1, 0, 0)), si("m", dimensions(0, 1, 0)), si("s", dimensions(0, 0, 1)),
    si("L", kVolume, VSUnitRatio::of(1, 1000)),  // a cubic decimetre
    si("J", kEnergy, VSUnitRatio::of(1000)),     // kg m2/s2
    si("cal", kEnergy, VSUnitRatio::of(4184)),   // thermochemical: 4.184 J
    si("Pa", kPressure, VSUnitRatio::of(1000)),  // kg/(m s2)
    si("K", only(Temperature)), si("mol", only(Amount)),
    si("S", dimensions(-1, -2, 3, 2), VSUnitRatio::of(1, 1000)),  // A2 s3/(kg m2)
    si("V", dimensions(1, 2, -3, -1), VSUnitRatio::of(1000)),     // kg m2/(A s3)
    si("Hz", dimensions(0, 0, -1)), si("IU", only(InternationalUnit)),

    named("count", only(Count)), named("%", kNone),  // see VSUnit.h: the number beside it is the fraction
    named("dBASPL", only(SoundLevel)), named("min", dimensions(0, 0, 1), VSUnitRatio::of(60)),
    named("hr", dimensions(0, 0, 1), VSUnitRatio::of(3600)),
    named("d", dimensions(0, 0, 1), VSUnitRatio::of(86'400)),
    named("Cal", kEnergy,
          VSUnitRatio::of(4'184'000)),  // the large calorie of food labels; canonically "kcal"

    named("atm", kPressure, VSUnitRatio::of(101'325'000)),
    named("mmHg", kPressure,
          VSUnitRatio::of(133'322'387'415, 1'000'000)),      // 13 595.1 kg/m3 * 9.80665 m/s2 * 1 mm
    named("cmAq", kPressure, VSUnitRatio::of(980'665, 10)),  // 1000 kg/m3 * 9.80665 m/s2 * 1 cm

    named("in", dimensions(0, 1, 0), VSUnitRatio::of(254, 10'000)),
    named("ft", dimensions(0, 1, 0), VSUnitRatio::of(3048, 10'000)),
    named("yd", dimensions(0, 1, 0), VSUnitRatio::of(9144, 10'000)),
    named("mi", dimensions(0, 1, 0), VSUnitRatio::of(1'609'344, 1000)),

    named("lb", dimensions(1, 0, 0), VSUnitRatio::of(45'359'237, 100'000)),
    named("oz", dimensions(1, 0, 0), VSUnitRatio::of(45'359'237, 1'600'000)),  // lb/16
    named("st", dimensions(1, 0, 0), VSUnitRatio::of(45'359'237 * 14, 100'000)),

    // The US gallon is 231 cubic inches: 3.785411784 L; the imperial gallon 4.54609 L.
    named("fl_oz_us", kVolume, VSUnitRatio::of(3'785'411'784, 128'000'000'000'000)),
    named("cup_us", kVolume, VSUnitRatio::of(3'785'411'784, 16'000'000'000'000)),
    named("pt_us", kVolume, VSUnitRatio::of(3'785'411'784, 8'000'000'000'000)),
    named("fl_oz_imp", kVolume, VSUnitRatio::of(454'609, 160 * int64_t{100'000'000})),
    named("cup_imp", kVolume, VSUnitRatio::of(454'609, 16 * int64_t{100'000'000})),
    named("pt_imp", kVolume, VSUnitRatio::of(454'609, 8 * int64_t{100'000'000})),

    temperature("degC", VSUnitRatio::of(1), VSUnitRatio::of(27'315, 100)),
    temperature("degF", VSUnitRatio::of(5, 9), VSUnitRatio::of(45'967, 180)),  // K = (degF + 459.67) * 5/9
};

struct Prefix {
    std::string_view name;
    VSUnitRatio scale;
};

// "mc" stands before "m" and "da" before "d", so that the longer one is tried first.
constexpr std::array kPrefixes{Prefix{"mc", VSUnitRatio::of(1, 1'000'000)},
                               Prefix{"da", VSUnitRatio::of(10)},
                               Prefix{"p", VSUnitRatio::of(1, 1'000'000'000'000)},
                               Prefix{"n", VSUnitRatio::of(1, 1'000'000'000)},
                               Prefix{"m", VSUnitRatio::of(1, 1000)},
                               Prefix{"c", VSUnitRatio::of(1, 100)},
                               Prefix{"d", VSUnitRatio::of(1, 10)},
                               Prefix{"h", VSUnitRatio::of(100)},
                               Prefix{"k", VSUnitRatio::of(1000)},
                               Prefix{"M", VSUnitRatio::of(1'000'000)},
                               Prefix{"G", VSUnitRatio::of(1'000'000'000)},
                               Prefix{"T", VSUnitRatio::of(1'000'000'000'000)}};

const Entry* entryNamed(std::string_view name) {
    for (const Entry& entry : kSymbols)
        if (entry.name == name) return &entry;
    return nullptr;
}

struct PrefixedEntry {
    const Entry* entry;
    const Prefix* prefix;  // null: none
};

std::optional<PrefixedEntry> find(std::string_view name) {
    if (const Entry* entry = entryNamed(name)) return PrefixedEntry{entry, nullptr};
    for (const Prefix& prefix : kPrefixes) {
        if (!name.starts_with(prefix.name)) continue;
        const Entry* entry = entryNamed(name.substr(prefix.name.size()));
        if (entry && entry->takesPrefix) return PrefixedEntry{entry, &prefix};
    }
    return std::nullopt;
}

/// "mc" for the micro sign and for the Greek letter mu, which keyboards and documents mix up.
std::string withoutMicroSign(std::string_view name) {
    for (const std::string_view sign : {"\u00B5", "\u03BC"})
        if (name.starts_with(sign)) return "mc" + std::string(name.substr(sign.size()));
    return std::string(name);
}

/// A plain decimal number greater than 0 ("180.1558"), exactly; at most 15 digits.
std::optional<VSUnitRatio> decimal(std::string_view text) {
    int64_t digits = 0, divisor = 1;
    int count = 0;
    bool afterPoint = false;
    for (const char c : text) {
        if (c == '.' && !afterPoint && count > 0) {
            afterPoint = true;
        } else if (c >= '0' && c <= '9' && count < 15) {
            digits = digits * 10 + (c - '0');
            if (afterPoint) divisor *= 10;
            ++count;
        } else {
            return std::nullopt;
        }
    }
    if (digits == 0 || text.back() == '.') return std::nullopt;
    return VSUnitRatio::of(digits, divisor).reduced();
}

/// The number without zeros that say nothing: "180.10" is "180.1", "018" is "18".
std::string canonicalDecimal(std::string_view text) {
    const size_t point = text.find('.');
    while (point != std::string_view::npos && (text.back() == '0' || text.back() == '.')) {
        const bool wasPoint = text.back() == '.';
        text.remove_suffix(1);
        if (wasPoint) break;
    }
    while (text.size() > 1 && text[0] == '0' && text[1] != '.') text.remove_prefix(1);
    return std::string(text);
}

}  // namespace

std::optional<VSUnitNamedSymbol> VSUnitSymbolNamed(std::string_view written) {
    const std::string name = withoutMicroSign(written);
    const auto found = find(name);
    if (!found) return std::nullopt;
    VSUnitSymbol symbol = found->entry->symbol;
    if (found->prefix) symbol.scale = symbol.scale * found->prefix->scale;
    return VSUnitNamedSymbol{name == "Cal" ? "kcal" : name, symbol};
}

std::optional<VSUnitNamedSymbol> VSUnitMolarSymbol(std::string_view written, std::string_view molarMass) {
    const auto mole = VSUnitSymbolNamed(written);
    if (!mole || mole->symbol.dimensions != only(Amount)) return std::nullopt;
    const auto mass = decimal(molarMass);
    if (!mass) return std::nullopt;
    return VSUnitNamedSymbol{mole->name + '<' + canonicalDecimal(molarMass) + '>',
                             {dimensions(1, 0, 0), mole->symbol.scale * *mass}};
}
