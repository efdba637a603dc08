#include "Qelvar/Export/QVExportText.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>

#include "Vessa/Base/VSCivil.h"

namespace {

constexpr size_t kZoneLength = 5;  // of "-0700"

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
