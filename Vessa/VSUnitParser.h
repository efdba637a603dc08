#pragma once

#include <map>
#include <string>
#include <string_view>

#include "Vessa/Base/VSError.h"
#include "Vessa/VSUnitScale.h"

/// Reads a unit string by the grammar in VSUnit.h. Used once, on one thread.
class VSUnitParser {
 public:
    struct Factor {
        VSUnitSymbol symbol;
        int exponent = 0;
    };
    /// The symbols of a unit by their canonical names; exponents are not 0. Empty: the unit "1".
    using Unit = std::map<std::string, Factor>;

    explicit VSUnitParser(std::string_view text) : text_(text) {}
    VSResult<Unit> parse();
    /// The one text of all spellings of a unit: factors by name, those below the line behind one slash.
    static std::string canonicalText(const Unit& unit);

 private:
    bool parseProduct(Unit& unit, int depth);
    bool parseFactor(Unit& unit, int depth);
    bool parseSymbol(Unit& unit);
    bool parseExponent(int& exponent);
    bool combine(Unit& unit, const Unit& factor, int exponent);
    bool take(std::string_view token);
    bool fail(const std::string& message);

    std::string_view text_;
    size_t at_ = 0;
    VSError error_;
};
