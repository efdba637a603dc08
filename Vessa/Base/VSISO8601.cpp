#include <cstdio>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSCivil.h"

namespace {

/// Takes the text apart from the front; every take says whether it was there.
class Reader {
 public:
    explicit Reader(std::string_view text) : text_(text) {}

    bool atEnd() const { return text_.empty(); }
    bool take(char c) {
        if (!text_.starts_with(c)) return false;
        text_.remove_prefix(1);
        return true;
    }
    /// Exactly so many digits.
    bool takeDigits(int count, int& value) {
        value = 0;
        for (int i = 0; i < count; ++i, text_.remove_prefix(1)) {
            if (text_.empty() || text_.front() < '0' || text_.front() > '9') return false;
            value = value * 10 + (text_.front() - '0');
        }
        return true;
    }
    /// One to nine digits of a fraction of a second, as microseconds rounded to nearest.
    bool takeFraction(int64_t& microseconds) {
        int64_t nanoseconds = 0;
        int digits = 0;
        for (int digit = 0; digits < 9 && takeDigits1(digit); ++digits)
            nanoseconds = nanoseconds * 10 + digit;
        if (digits == 0) return false;
        for (int i = digits; i < 9; ++i) nanoseconds *= 10;
        microseconds = (nanoseconds + 500) / 1000;
        return true;
    }

 private:
    bool takeDigits1(int& digit) {
        if (text_.empty() || text_.front() < '0' || text_.front() > '9') return false;
        digit = text_.front() - '0';
        text_.remove_prefix(1);
        return true;
    }
    std::string_view text_;
};

/// "Z", "+02:00" or "+0200", as seconds east of Greenwich.
bool takeOffset(Reader& reader, int& seconds) {
    seconds = 0;
    if (reader.take('Z')) return true;
    const bool west = reader.take('-');
    if (!west && !reader.take('+')) return false;
    int hours = 0, minutes = 0;
    if (!reader.takeDigits(2, hours)) return false;
    reader.take(':');
    if (!reader.takeDigits(2, minutes)) return false;
    if (hours > 23 || minutes > 59) return false;
    seconds = (hours * 60 + minutes) * 60 * (west ? -1 : 1);
    return true;
}

struct TimeOfDay {
    int hour = 0, minute = 0, second = 0;
    int64_t microseconds = 0;
};

bool takeTimeOfDay(Reader& reader, TimeOfDay& time) {
    if (!reader.takeDigits(2, time.hour) || !reader.take(':') || !reader.takeDigits(2, time.minute))
        return false;
    if (reader.take(':')) {
        if (!reader.takeDigits(2, time.second)) return false;
        if (reader.take('.') && !reader.takeFraction(time.microseconds)) return false;
    }
    return true;
}

}  // namespace

std::optional<VSDate> VSDateFromISO8601(std::string_view text, const VSCalendar& calendar) {
    Reader reader(text);
    int year = 0, month = 0, day = 0;
    if (!reader.takeDigits(4, year) || !reader.take('-') || !reader.takeDigits(2, month) ||
        !reader.take('-') || !reader.takeDigits(2, day))
        return std::nullopt;
    if (reader.atEnd()) return calendar.date(year, month, day);

    TimeOfDay time;
    if (!reader.take('T') || !takeTimeOfDay(reader, time)) return std::nullopt;
    int offset = 0;
    const bool local = reader.atEnd();
    if (!local && (!takeOffset(reader, offset) || !reader.atEnd())) return std::nullopt;

    static const VSCalendar utc("Etc/UTC", "en_US");
    const auto date = (local ? calendar : utc).date(year, month, day, time.hour, time.minute, time.second);
    if (!date) return std::nullopt;
    return *date + VSDuration(time.microseconds) - std::chrono::seconds(offset);
}

std::string VSISO8601FromDate(VSDate date, const VSCalendar& calendar) {
    using namespace civil;
    // Before zones had standard times their offsets had seconds, which the format cannot say: the nearest
    // whole minute towards Greenwich is written, with the local time that belongs to it.
    const int offsetMinutes = calendar.secondsFromGMT(date) / 60;
    const int64_t local = date.microseconds() + offsetMinutes * kMinute;
    const int64_t days = floorDivide(local, kDay);
    const int64_t timeOfDay = local - days * kDay;
    const CivilDay day = civilFromDays(days);

    char text[80];
    int length =
        std::snprintf(text, sizeof text, "%04lld-%02d-%02dT%02d:%02d:%02d", static_cast<long long>(day.year),
                      day.month, day.day, static_cast<int>(timeOfDay / kHour),
                      static_cast<int>(timeOfDay / kMinute % 60), static_cast<int>(timeOfDay / kSecond % 60));
    std::string result(text, static_cast<size_t>(length));
    if (const auto fraction = static_cast<int>(timeOfDay % kSecond)) {
        length = std::snprintf(text, sizeof text, ".%06d", fraction);
        result.append(text, static_cast<size_t>(length));
    }
    const int size = offsetMinutes < 0 ? -offsetMinutes : offsetMinutes;
    length =
        std::snprintf(text, sizeof text, "%c%02d:%02d", offsetMinutes < 0 ? '-' : '+', size / 60, size % 60);
    return result.append(text, static_cast<size_t>(length));
}
