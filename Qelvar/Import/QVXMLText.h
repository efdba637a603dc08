#pragma once

#include <string>
#include <string_view>

#include "Vessa/Base/VSValue.h"

// Texts as XML can hold them: what an export writes, and what an import compares. Pure functions; any thread.

/// Whether XML can hold the text: UTF-8 without control characters (but tabs and line ends) and
/// noncharacters.
bool QVIsXMLText(std::string_view text);
/// The same with U+FFFD in the place of what XML cannot hold.
std::string QVXMLText(std::string_view text);
/// The value for a processing instruction: VSValue::serialized(), with escapes where XML cannot hold it.
std::string QVExactValueText(const VSValue& value);
