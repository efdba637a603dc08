#include "Qelvar/Import/QVImportText.h"

#include <unicode/uchar.h>
#include <unicode/utf8.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <chrono>
#include <cmath>

namespace {

constexpr size_t kDateLength = 25;  // "yyyy-MM-dd HH:mm:ss +hhmm"

/// The number of `count` ASCII digits, or -1.
int digits(const char* text, int count) {
    int result = 0;
    for (int i = 0; i < count; ++i) {
        const unsigned digit = static_cast<unsigned char>(text[i]) - unsigned{'0'};
        if (digit > 9) return -1;
        result = result * 10 + static_cast<int>(digit);
    }
    return result;
}

std::optional<int64_t> dayNumber(int year, int month, int day) {
    const std::chrono::year_month_day date{std::chrono::year(year),
                                           std::chrono::month(static_cast<unsigned>(month)),
                                           std::chrono::day(static_cast<unsigned>(day))};
    if (!date.ok()) return std::nullopt;
    return std::chrono::sys_days(date).time_since_epoch().count();
}

/// The day number of "yyyy-MM-dd", whose year may have five digits and be 0: what a zone makes of the first
/// and the last day of the years 1 to 9999.
std::optional<int64_t> dayFromText(const char* text, int yearDigits = 4) {
    const char* const rest = text + yearDigits;
    if (rest[0] != '-' || rest[3] != '-') return std::nullopt;
    const int year = digits(text, yearDigits), month = digits(rest + 1, 2), day = digits(rest + 4, 2);
    if (year < 0 || month < 1 || day < 1) return std::nullopt;
    return dayNumber(year, month, day);
}

/// Seconds of "HH:mm:ss", or -1.
int timeFromText(const char* text) {
    if (text[2] != ':' || text[5] != ':') return -1;
    const int hour = digits(text, 2), minute = digits(text + 3, 2), second = digits(text + 6, 2);
    if (hour < 0 || hour > 23 || minute < 0 || minute > 59 || second < 0 || second > 59) return -1;
    return (hour * 60 + minute) * 60 + second;
}

/// Seconds of "+hhmm".
std::optional<int> offsetFromText(const char* text) {
    if (text[0] != '+' && text[0] != '-') return std::nullopt;
    const int hours = digits(text + 1, 2), minutes = digits(text + 3, 2);
    if (hours < 0 || minutes < 0 || minutes > 59) return std::nullopt;
    const int seconds = (hours * 60 + minutes) * 60;
    if (seconds > 18 * 3600) return std::nullopt;
    return text[0] == '-' ? -seconds : seconds;
}

std::optional<QVImportDate> plainDate(std::string_view text) {
    if (text.size() < kDateLength || text.size() > kDateLength + 1) return std::nullopt;
    const int extra = text.size() > kDateLength ? 1 : 0;
    const char* const rest = text.data() + extra;
    if (rest[10] != ' ' || rest[19] != ' ') return std::nullopt;
    const std::optional<int64_t> day = dayFromText(text.data(), 4 + extra);
    const int time = timeFromText(rest + 11);
    const std::optional<int> offset = offsetFromText(rest + 20);
    if (!day || time < 0 || !offset) return std::nullopt;
    return QVImportDate{VSDate::fromSeconds(*day * 86'400 + time - *offset), *offset};
}

bool isDirectionMark(UChar32 c) {
    return c == 0x200E || c == 0x200F || c == 0x061C;
}

/// The text with all scripts' digits and signs as ASCII and without marks of direction; none when it is no
/// text.
std::optional<std::string> asciiText(std::string_view text) {
    std::string result;
    const auto length = static_cast<int32_t>(text.size());
    for (int32_t i = 0; i < length;) {
        UChar32 c = 0;
        U8_NEXT(text.data(), i, length, c);
        if (c < 0) return std::nullopt;
        if (isDirectionMark(c)) continue;
        if (c == 0x2212) c = '-';
        const int32_t digit = u_charDigitValue(c);
        if (digit < 0 && c > 0x7F) return std::nullopt;
        result += digit >= 0 ? static_cast<char>('0' + digit) : static_cast<char>(c);
    }
    return result;
}

}  // namespace

std::optional<QVImportDate> QVImportDateFromText(std::string_view text) {
    if (const auto date = plainDate(text)) return date;
    if (text.size() <= kDateLength || text.size() > 4 * kDateLength) return std::nullopt;
    const auto ascii = asciiText(text);
    return ascii ? plainDate(*ascii) : std::nullopt;
}

std::optional<VSBirthDate> QVImportBirthDateFromText(std::string_view text) {
    const auto ascii = text.size() <= 64 ? asciiText(text) : std::nullopt;
    if (!ascii || ascii->size() != 10 || !dayFromText(ascii->data()) || ascii->starts_with("0000"))
        return std::nullopt;
    return VSBirthDate{digits(ascii->data(), 4), digits(ascii->data() + 5, 2), digits(ascii->data() + 8, 2)};
}

std::optional<double> QVImportNumberFromText(std::string_view text) {
    double value = 0;
    const char* const end = text.data() + text.size();
    const auto [stopped, error] = std::from_chars(text.data(), end, value);
    if (error != std::errc{} || stopped != end || !std::isfinite(value)) return std::nullopt;
    return value;
}

VSValue QVMetadataValueFromText(std::string_view key, std::string_view text) {
    static constexpr std::array kYesNo{VSMetadataKeyWasUserEntered, VSMetadataKeyMenstrualCycleStart,
                                       VSMetadataKeySexualActivityProtectionUsed};
    if (std::find(kYesNo.begin(), kYesNo.end(), key) != kYesNo.end()) {
        if (text == "1" || text == "true" || text == "YES") return true;
        if (text == "0" || text == "false" || text == "NO") return false;
    }
    return std::string(text);
}

std::string QVImportQuoted(std::string_view text, size_t length) {
    std::string result = "\"";
    const bool cut = text.size() > length;
    if (cut) {
        while (length > 0 && (static_cast<unsigned char>(text[length]) & 0xC0) == 0x80) --length;
        text = text.substr(0, length);
    }
    for (const char c : text) result += static_cast<unsigned char>(c) < 0x20 || c == 0x7F ? ' ' : c;
    return result + (cut ? "...\"" : "\"");
}
