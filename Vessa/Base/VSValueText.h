#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "Vessa/Base/VSValue.h"

/// The texts of VSValue: JSON, with what JSON lacks as objects of one key: {"date": microseconds since 1970},
/// {"data": "hex"}, {"real": "nan" | "inf" | "-inf"}, and every dictionary as {"dict": {...}}. Whole numbers
/// are integers, numbers with a point or an exponent are reals. Kept on disk: the form never changes.
namespace valuetext {

/// The shortest text that reads back as the same number.
std::string shortest(double number);
/// Two lower-case digits a byte.
std::string hexadecimal(const VSValue::Data& data);
void append(std::string& text, const VSValue& value);
/// None when the text is not exactly one such value, or is nested deeper than any value of ours.
std::optional<VSValue> parse(std::string_view text);

}  // namespace valuetext
