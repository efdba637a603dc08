#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "Vessa/VSUnitScale.h"

/// The meaning of a symbol, and its canonical spelling ("mcg" for "µg", "kcal" for "Cal").
struct VSUnitNamedSymbol {
    std::string name;
    VSUnitSymbol symbol;
};

/// What "mL", "min" or "fl_oz_us" means; none for what is no unit. Names are tried before prefixes, so "min"
/// is the minute and "ft" the foot.
std::optional<VSUnitNamedSymbol> VSUnitSymbolNamed(std::string_view name);

/// "mmol" of a substance with a molar mass in g/mol, a mass. None when the mass is no positive number, or the
/// symbol is not a (prefixed) mole.
std::optional<VSUnitNamedSymbol> VSUnitMolarSymbol(std::string_view name, std::string_view molarMass);
