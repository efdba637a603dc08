#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "Vessa/Base/VSError.h"

/// A unit of measurement, made from a unit string:
///
///   unit     = factor { ("*" | "." | "·" | "/") factor }         "/" divides by the factor that follows it
///   factor   = symbol [ "^" integer ] | "(" unit ")" [ "^" integer ] | "1"
///   symbol   = [SI prefix] base symbol, or a name without prefix
///
/// With prefix: g, m, L, s, J, cal, Pa, K, S, V, Hz, IU, mol, and mol<molar mass in g/mol>, which is a mass.
/// Without: count, %, min, hr, d, Cal (the same as kcal), degC, degF, mmHg, cmAq, atm, in, ft, yd, mi, lb,
/// oz, st, fl_oz_us, cup_us, pt_us, fl_oz_imp, cup_imp, pt_imp, dBASPL. Names go before prefixes: "min" is
/// the minute. Prefixes: p n mc (or µ) m c d da h k M G T. Spaces and anything else are errors.
///
/// "%" is the unit of a fraction: the quantity 0.23 "%" is 23 percent (stored 0.23, in documents 0.23; the
/// screens multiply by 100). "count" does not convert to "%" or "1", nor does a plain mole to a mass.
///
/// Conversions are exact to the definition of each unit (the international foot 0.3048 m, the avoirdupois
/// pound 0.45359237 kg, the thermochemical calorie 4.184 J, mmHg 133.322387415 Pa, US and imperial fluid
/// measures ...; the sources stand beside them in VSUnitSymbols.cpp). Temperatures convert with their offsets
/// only when they stand alone. Immutable value, cheap to copy; any thread.
class VSUnit {
 public:
    /// The unit of a string, or an Invalid error that says what is wrong and where in the string.
    static VSResult<VSUnit> parse(std::string_view text);
    /// The same for strings written in code. REQUIRES: text is a valid unit string.
    static VSUnit fromString(std::string_view text);

    static VSUnit countUnit();
    static VSUnit footUnit();
    static VSUnit inchUnit();
    static VSUnit minuteUnit();
    static VSUnit secondUnit();
    static VSUnit hourUnit();
    static VSUnit kilocalorieUnit();
    static VSUnit mileUnit();
    static VSUnit percentUnit();
    /// mmol of glucose: "mmol<180.1558>".
    static double glucoseMolarMass();

    /// The canonical text: parses to an equal unit. Factors stand in alphabetical order, those below the line
    /// behind one slash ("count/min", "mL/(kg*min)" for "mL/min/kg", "mmol<180.1558>/L", "mcg" for "µg").
    const std::string& unitString() const;
    /// The same; what documents name a unit by.
    const std::string& description() const { return unitString(); }

    bool isCompatibleWith(const VSUnit& other) const;
    /// A value in this unit expressed in another; none when the dimensions differ.
    std::optional<double> convert(double value, const VSUnit& to) const;

    /// Equal when they have the same canonical text.
    friend bool operator==(const VSUnit& a, const VSUnit& b) { return a.definition_ == b.definition_; }

    struct Definition;

 private:
    explicit VSUnit(const Definition* definition) : definition_(definition) {}
    const Definition* definition_;  // interned, lives until the process ends
};
