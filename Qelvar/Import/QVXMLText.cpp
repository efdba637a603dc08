#include "Qelvar/Import/QVXMLText.h"

#include <array>
#include <cstdio>

namespace {

constexpr char32_t kNoCharacter = 0xFFFFFFFF;

/// The character that begins the text, with its length in bytes; kNoCharacter for a byte that begins none.
struct Character {
    char32_t point;
    size_t length;
};

Character firstCharacter(std::string_view text) {
    const auto byte = [&](size_t i) { return static_cast<unsigned char>(text[i]); };
    const unsigned char lead = byte(0);
    if (lead < 0x80) return {lead, 1};
    const size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
    if (lead < 0xC2 || lead > 0xF4 || text.size() < length) return {kNoCharacter, 1};
    char32_t point = lead & (0x7FU >> length);
    for (size_t i = 1; i < length; ++i) {
        if ((byte(i) & 0xC0) != 0x80) return {kNoCharacter, 1};
        point = point << 6 | (byte(i) & 0x3F);
    }
    constexpr char32_t kLeast[] = {0, 0, 0x80, 0x800, 0x10000};
    if (point < kLeast[length] || point > 0x10FFFF || (point >= 0xD800 && point < 0xE000))
        return {kNoCharacter, 1};
    return {point, length};
}

/// What XML 1.0 calls a Char.
bool isXMLCharacter(char32_t point) {
    if (point < 0x20) return point == '\t' || point == '\n' || point == '\r';
    return point < 0xFFFE || (point >= 0x10000 && point != kNoCharacter);
}

/// Copies the text and asks replace(point) for what stands in the place of characters that XML does not have.
template <typename Replace>
std::string replacing(std::string_view text, Replace replace) {
    std::string result;
    result.reserve(text.size());
    while (!text.empty()) {
        const auto [point, length] = firstCharacter(text);
        if (isXMLCharacter(point))
            result += text.substr(0, length);
        else
            result += replace(point);
        text.remove_prefix(length);
    }
    return result;
}

}  // namespace

bool QVIsXMLText(std::string_view text) {
    while (!text.empty()) {
        const auto byte = static_cast<unsigned char>(text[0]);
        if (byte >= 0x20 && byte < 0x80) {
            text.remove_prefix(1);
            continue;
        }
        const auto [point, length] = firstCharacter(text);
        if (!isXMLCharacter(point)) return false;
        text.remove_prefix(length);
    }
    return true;
}

std::string QVXMLText(std::string_view text) {
    return replacing(text, [](char32_t) { return "\xEF\xBF\xBD"; });
}

std::string QVExactValueText(const VSValue& value) {
    std::string text = replacing(value.serialized(), [](char32_t point) {
        std::array<char, 16> escape{};
        std::snprintf(escape.data(), escape.size(), "\\u%04x",
                      static_cast<unsigned>(point == kNoCharacter ? 0xFFFD : point));
        return std::string(escape.data());
    });
    // The end of an instruction; it can stand in strings only.
    for (size_t at = 0; (at = text.find("?>", at)) != std::string::npos;) text.replace(at + 1, 1, "\\u003e");
    return text;
}
