#include "Qelvar/Export/QVExportText.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>

#include "Vessa/Base/VSCivil.h"

namespace {

constexpr char32_t kNoCharacter = 0xFFFFFFFF;
constexpr size_t kZoneLength = 5;  // of "-0700"

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

/// Writes the number with so many digits, or as many as it has; returns what follows.
char* putDigits(char* at, int64_t number, int count) {
    if (count == 4 && number >= 10'000) return at + std::sprintf(at, "%lld", static_cast<long long>(number));
    for (int i = count - 1; i >= 0; --i, number /= 10) at[i] = static_cast<char>('0' + number % 10);
    return at + count;
}

}  // namespace

std::string QVExportNumberText(double number) {
    std::array<char, 32> text{};
    const auto end =
        std::to_chars(text.data(), text.data() + text.size(), number, std::chars_format::general, 6);
    return {text.data(), end.ptr};
}

std::string QVExportDefaultNumberText(double number) {
    std::array<char, 32> text{};
    const double size = std::fabs(number);
    const bool plain = size == 0 || (size >= 1e-5 && size < 1e15);
    const auto end = std::to_chars(text.data(), text.data() + text.size(), number,
                                   plain ? std::chars_format::fixed : std::chars_format::scientific);
    return {text.data(), end.ptr};
}

bool QVExportIsXMLText(std::string_view text) {
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

std::string QVExportXMLText(std::string_view text) {
    return replacing(text, [](char32_t) { return "\xEF\xBF\xBD"; });
}

std::string QVExportExactValueText(const VSValue& value) {
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

QVExportDateFormatter::QVExportDateFormatter(int secondsFromGMT)
    : offset_(secondsFromGMT / 60 * civil::kMinute) {
    const int minutes = std::abs(secondsFromGMT / 60);
    std::snprintf(zone_.data(), zone_.size(), "%c%02d%02d", secondsFromGMT <= -60 ? '-' : '+',
                  minutes / 60 % 100, minutes % 60);
}

QVExportDateFormatter::Fields QVExportDateFormatter::fieldsOf(VSDate date) const {
    const int64_t local = date.microseconds() + offset_;
    const int64_t days = civil::floorDivide(local, civil::kDay);
    const int64_t second = (local - days * civil::kDay) / civil::kSecond;
    const civil::CivilDay day = civil::civilFromDays(days);
    return {day.year,
            day.month,
            day.day,
            static_cast<int>(second / 3600),
            static_cast<int>(second / 60 % 60),
            static_cast<int>(second % 60)};
}

const char* QVExportDateFormatter::recordsString(VSDate date) {
    const Fields fields = fieldsOf(date);
    char* at = putDigits(buffer_.data(), fields.year, 4);
    const auto put = [&at](char separator, int number) {
        *at++ = separator;
        at = putDigits(at, number, 2);
    };
    put('-', fields.month);
    put('-', fields.day);
    put(' ', fields.hour);
    put(':', fields.minute);
    put(':', fields.second);
    *at++ = ' ';
    *std::copy(zone_.begin(), zone_.begin() + kZoneLength, at) = '\0';
    return buffer_.data();
}

const char* QVExportDateFormatter::clinicalString(VSDate date) {
    const Fields fields = fieldsOf(date);
    char* at = putDigits(buffer_.data(), fields.year, 4);
    for (const int number : {fields.month, fields.day, fields.hour, fields.minute, fields.second})
        at = putDigits(at, number, 2);
    *std::copy(zone_.begin(), zone_.begin() + kZoneLength, at) = '\0';
    return buffer_.data();
}
