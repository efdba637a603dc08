#include "Vessa/VSUnitParser.h"

#include <algorithm>
#include <charconv>
#include <cstdlib>

#include "Vessa/VSUnitSymbols.h"

namespace {

constexpr size_t kLongestText = 200;
constexpr int kDeepestNesting = 8;
constexpr int kLargestExponent = 9;  // beyond that conversions would leave the range of numbers

bool isSymbolCharacter(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_' || c == '%';
}

/// A piece of a document's text for a message of one line: whole UTF-8 characters, no control characters.
std::string printable(std::string_view text, size_t longest) {
    const auto continues = [](char c) { return (static_cast<unsigned char>(c) & 0xC0) == 0x80; };
    size_t length = std::min(text.size(), longest);
    while (length < text.size() && continues(text[length])) ++length;
    std::string result(text.substr(0, length));
    std::replace_if(
        result.begin(), result.end(),
        [](char c) { return static_cast<unsigned char>(c) < 0x20 || c == 0x7F; }, '?');
    return result;
}

void appendFactor(std::string& text, const std::string& name, int exponent) {
    if (!text.empty() && text.back() != '(' && text.back() != '/') text += '*';
    text += name;
    if (exponent != 1) text += '^' + std::to_string(exponent);
}

}  // namespace

VSResult<VSUnitParser::Unit> VSUnitParser::parse() {
    Unit unit;
    if (text_.size() > kLongestText) {
        fail("is too long for a unit");
        return error_;
    }
    if (!parseProduct(unit, 0)) return error_;
    if (at_ != text_.size()) {
        fail("has an unexpected \"" + printable(text_.substr(at_), 1) + "\"");
        return error_;
    }
    return unit;
}

std::string VSUnitParser::canonicalText(const Unit& unit) {
    std::string above, below;
    int factorsBelow = 0;
    for (const auto& [name, factor] : unit)
        if (factor.exponent > 0) appendFactor(above, name, factor.exponent);
    for (const auto& [name, factor] : unit) {
        if (factor.exponent > 0) continue;
        appendFactor(below, name, -factor.exponent);
        ++factorsBelow;
    }
    std::string text = above.empty() ? "1" : above;
    if (factorsBelow == 1) text += '/' + below;
    if (factorsBelow > 1) text += "/(" + below + ')';
    return text;
}

bool VSUnitParser::parseProduct(Unit& unit, int depth) {
    bool divides = false;
    for (;;) {
        Unit factor;
        int exponent = 1;
        if (!parseFactor(factor, depth)) return false;
        if (take("^") && !parseExponent(exponent)) return false;
        if (!combine(unit, factor, divides ? -exponent : exponent)) return false;
        if (take("/"))
            divides = true;
        else if (take("*") || take(".") || take("\u00B7") || take("\u22C5"))
            divides = false;
        else
            return true;
    }
}

bool VSUnitParser::parseFactor(Unit& unit, int depth) {
    if (take("1")) return true;
    if (!take("(")) return parseSymbol(unit);
    if (depth == kDeepestNesting) return fail("is nested too deep");
    if (!parseProduct(unit, depth + 1)) return false;
    return take(")") || fail("lacks a \")\"");
}

bool VSUnitParser::parseSymbol(Unit& unit) {
    const size_t begin = at_;
    if (!take("\u00B5")) take("\u03BC");  // micro
    while (at_ < text_.size() && isSymbolCharacter(text_[at_])) ++at_;
    const std::string_view name = text_.substr(begin, at_ - begin);
    if (name.empty())
        return fail(at_ == text_.size() ? "ends where a unit is expected" : "has no unit there");

    std::optional<VSUnitNamedSymbol> symbol;
    if (take("<")) {
        const size_t end = text_.find('>', at_);
        if (end == std::string_view::npos) return fail("lacks a \">\"");
        const std::string_view molarMass = text_.substr(at_, end - at_);
        symbol = VSUnitMolarSymbol(name, molarMass);
        if (!symbol) return fail("has no molar mass there");
        at_ = end + 1;
    } else {
        symbol = VSUnitSymbolNamed(name);
    }
    if (!symbol) {
        at_ = begin;
        return fail("has an unknown unit \"" + std::string(name) + "\"");
    }
    unit.emplace(symbol->name, Factor{symbol->symbol, 1});
    return true;
}

bool VSUnitParser::parseExponent(int& exponent) {
    const char* const first = text_.data() + at_;
    const char* const last = text_.data() + text_.size();
    const auto [end, error] = std::from_chars(first, last, exponent);
    if (error == std::errc::invalid_argument) return fail("lacks an exponent");
    if (error != std::errc() || std::abs(exponent) > kLargestExponent)
        return fail("has too large an exponent");
    at_ += static_cast<size_t>(end - first);
    return true;
}

bool VSUnitParser::combine(Unit& unit, const Unit& factor, int exponent) {
    for (const auto& [name, part] : factor) {
        Factor& combined = unit[name];
        combined.symbol = part.symbol;
        combined.exponent += part.exponent * exponent;
        if (std::abs(combined.exponent) > kLargestExponent) return fail("has too large an exponent");
        if (combined.exponent == 0) unit.erase(name);
    }
    return true;
}

bool VSUnitParser::take(std::string_view token) {
    if (!text_.substr(at_).starts_with(token)) return false;
    at_ += token.size();
    return true;
}

bool VSUnitParser::fail(const std::string& message) {
    error_ = {VSErrorCode::Invalid, "The unit \"" + printable(text_, kLongestText) + "\" " + message +
                                        " (at character " + std::to_string(at_ + 1) + ")"};
    return false;
}
