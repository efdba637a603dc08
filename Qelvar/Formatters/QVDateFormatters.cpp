#include "Qelvar/Formatters/QVDateFormatters.h"

#include <unicode/dtptngen.h>
#include <unicode/gregocal.h>
#include <unicode/reldatefmt.h>
#include <unicode/smpdtfmt.h>

#include <algorithm>
#include <cctype>
#include <map>
#include <memory>
#include <mutex>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSEnvironment.h"

namespace {

// Of whom the text is for, at the moment of the call.
struct User {
    std::string locale, zone;
    bool uses24HourClock = false;

    static User current() {
        const auto environment = VSEnvironment::current();
        return {environment->localeIdentifier(), environment->timeZoneIdentifier(),
                environment->uses24HourClock()};
    }
    friend auto operator<=>(const User&, const User&) = default;
};

QString qString(const icu::UnicodeString& text) {
    return QString::fromUtf16(text.getBuffer(), text.length());
}

// All reckoning is in the Gregorian calendar, so that is what is shown.
icu::Locale icuLocale(const User& user) {
    icu::Locale locale(user.locale.c_str());
    UErrorCode status = U_ZERO_ERROR;
    locale.setKeywordValue("calendar", "gregorian", status);
    return locale;
}

// ICU's patterns for times may hold a narrow no-break space, which few fonts have.
icu::UnicodeString withPlainSpaces(icu::UnicodeString pattern) {
    return pattern.findAndReplace(icu::UnicodeString(char16_t{0x202F}), icu::UnicodeString(u' '));
}

icu::DateFormat::EStyle icuStyle(QVDateStyle style) {
    switch (style) {
        case QVDateStyle::Short:
            return icu::DateFormat::kShort;
        case QVDateStyle::Medium:
            return icu::DateFormat::kMedium;
        case QVDateStyle::Long:
            return icu::DateFormat::kLong;
        case QVDateStyle::Full:
            return icu::DateFormat::kFull;
        case QVDateStyle::None:
            break;
    }
    return icu::DateFormat::kNone;
}

// The letters of a template, which name its fields. The hour brings the marker of the half day with it.
icu::UnicodeString skeleton(const std::string& fields, bool uses24HourClock) {
    icu::UnicodeString result;
    for (const char letter : fields) {
        if (!std::isalpha(static_cast<unsigned char>(letter)) || letter == 'a') continue;
        result += letter == 'j' ? (uses24HourClock ? u'H' : u'h') : static_cast<char16_t>(letter);
    }
    return result;
}

icu::UnicodeString templatePattern(const User& user, const std::string& fields) {
    UErrorCode status = U_ZERO_ERROR;
    const std::unique_ptr<icu::DateTimePatternGenerator> generator(
        icu::DateTimePatternGenerator::createInstance(icuLocale(user), status));
    if (U_FAILURE(status)) return icu::UnicodeString::fromUTF8(fields);
    return generator->getBestPattern(skeleton(fields, user.uses24HourClock), status);
}

// How the locale puts a date ({1}) and a time ({0}) together.
icu::UnicodeString dateTimeGlue(const User& user) {
    UErrorCode status = U_ZERO_ERROR;
    const std::unique_ptr<icu::DateTimePatternGenerator> generator(
        icu::DateTimePatternGenerator::createInstance(icuLocale(user), status));
    return U_SUCCESS(status) ? generator->getDateTimeFormat() : icu::UnicodeString(u"{1} {0}");
}

icu::UnicodeString glued(icu::UnicodeString glue, const icu::UnicodeString& date,
                         const icu::UnicodeString& time) {
    return glue.findAndReplace(u"{1}", date).findAndReplace(u"{0}", time);
}

bool has24Hours(const icu::UnicodeString& pattern) {
    return pattern.indexOf(u'H') >= 0 || pattern.indexOf(u'k') >= 0;
}

icu::UnicodeString stylePattern(const User& user, QVDateStyle dateStyle, QVDateStyle timeStyle) {
    const std::unique_ptr<icu::DateFormat> format(
        dateStyle == QVDateStyle::None
            ? icu::DateFormat::createTimeInstance(icuStyle(timeStyle), icuLocale(user))
        : timeStyle == QVDateStyle::None
            ? icu::DateFormat::createDateInstance(icuStyle(dateStyle), icuLocale(user))
            : icu::DateFormat::createDateTimeInstance(icuStyle(dateStyle), icuStyle(timeStyle),
                                                      icuLocale(user)));
    icu::UnicodeString pattern;
    if (const auto* simple = dynamic_cast<const icu::SimpleDateFormat*>(format.get()))
        simple->toPattern(pattern);
    if (timeStyle == QVDateStyle::None || has24Hours(pattern) == user.uses24HourClock) return pattern;
    // The styles know the locale's own hour cycle only.
    const auto time = templatePattern(user, timeStyle == QVDateStyle::Short ? "jmm" : "jmmss");
    return dateStyle == QVDateStyle::None
               ? time
               : glued(dateTimeGlue(user), stylePattern(user, dateStyle, QVDateStyle::None), time);
}

// Making a format costs milliseconds. One is kept for each user and pattern, and used under the lock, since
// ICU's write to themselves when they format.
class FormatCache {
 public:
    static FormatCache& shared() {
        static auto* const cache = new FormatCache;
        return *cache;
    }

    template <typename MakePattern>
    QString format(const User& user, const std::string& key, VSDate date, MakePattern makePattern) {
        std::lock_guard lock(mutex_);
        icu::UnicodeString text;
        if (const auto* format = find(user, key, makePattern)) format->format(date.icuMilliseconds(), text);
        return qString(text);
    }

    template <typename MakePattern>
    QString pattern(const User& user, const std::string& key, MakePattern makePattern) {
        std::lock_guard lock(mutex_);
        icu::UnicodeString text;
        if (const auto* format = find(user, key, makePattern)) format->toPattern(text);
        return qString(text);
    }

 private:
    template <typename MakePattern>
    const icu::SimpleDateFormat* find(const User& user, const std::string& key, MakePattern makePattern) {
        auto& format = formats_[{user, key}];
        if (!format) format = make(user, withPlainSpaces(makePattern()));
        return format.get();
    }

    static std::unique_ptr<icu::SimpleDateFormat> make(const User& user, const icu::UnicodeString& pattern) {
        UErrorCode status = U_ZERO_ERROR;
        const icu::Locale locale = icuLocale(user);
        auto format = std::make_unique<icu::SimpleDateFormat>(pattern, locale, status);
        if (U_FAILURE(status)) return nullptr;
        format->adoptTimeZone(icu::TimeZone::createTimeZone(icu::UnicodeString::fromUTF8(user.zone)));
        return format;
    }

    std::mutex mutex_;
    std::map<std::pair<User, std::string>, std::unique_ptr<icu::SimpleDateFormat>>
        formats_;  // guarded by mutex_
};

// "Today" and "Yesterday" as they begin a line.
icu::UnicodeString relativeDayName(const User& user, UDateDirection direction) {
    UErrorCode status = U_ZERO_ERROR;
    const icu::RelativeDateTimeFormatter formatter(icuLocale(user), nullptr, UDAT_STYLE_LONG,
                                                   UDISPCTX_CAPITALIZATION_FOR_BEGINNING_OF_SENTENCE, status);
    icu::UnicodeString name;
    if (U_SUCCESS(status)) formatter.format(direction, UDAT_ABSOLUTE_DAY, name, status);
    return name;
}

// The day's name stands in the pattern as a literal text.
icu::UnicodeString relativePattern(const User& user, UDateDirection direction) {
    icu::UnicodeString name = relativeDayName(user, direction);
    name.findAndReplace(u"'", u"''");
    const icu::UnicodeString quoted = icu::UnicodeString(u'\'') + name + u'\'';
    return glued(dateTimeGlue(user), quoted, stylePattern(user, QVDateStyle::None, QVDateStyle::Short));
}

}  // namespace

QVDateFormatter QVDateFormatter::withPattern(std::string pattern) {
    return {Kind::Pattern, std::move(pattern), QVDateStyle::None, QVDateStyle::None};
}

QVDateFormatter QVDateFormatter::withTemplate(std::string fields) {
    return {Kind::Template, std::move(fields), QVDateStyle::None, QVDateStyle::None};
}

QVDateFormatter QVDateFormatter::withStyles(QVDateStyle dateStyle, QVDateStyle timeStyle) {
    return {Kind::Styles, {}, dateStyle, timeStyle};
}

std::u16string QVDateFormatter::resolvedPattern() const {
    const User user = User::current();
    const icu::UnicodeString pattern = kind_ == Kind::Pattern    ? icu::UnicodeString::fromUTF8(text_)
                                       : kind_ == Kind::Template ? templatePattern(user, text_)
                                                                 : stylePattern(user, dateStyle_, timeStyle_);
    return {pattern.getBuffer(), static_cast<size_t>(pattern.length())};
}

std::string QVDateFormatter::cacheKey() const {
    std::string key;
    for (const int part :
         {static_cast<int>(kind_), static_cast<int>(dateStyle_), static_cast<int>(timeStyle_)})
        key += std::to_string(part) + ' ';
    return key + text_;
}

QString QVDateFormatter::stringFromDate(VSDate date) const {
    return FormatCache::shared().format(User::current(), cacheKey(), date,
                                        [this] { return icu::UnicodeString(resolvedPattern().c_str()); });
}

QString QVDateFormatter::pattern() const {
    return FormatCache::shared().pattern(User::current(), cacheKey(),
                                         [this] { return icu::UnicodeString(resolvedPattern().c_str()); });
}

QVDateFormatter QVHourOfDayFormatter() {
    return VSEnvironment::current()->uses24HourClock() ? QVDateFormatter::withPattern("H")
                                                       : QVDateFormatter::withTemplate("ha");
}

QVDateFormatter QVShortDateFormatter() {
    return QVDateFormatter::withStyles(QVDateStyle::Short, QVDateStyle::None);
}
QVDateFormatter QVMediumDateFormatter() {
    return QVDateFormatter::withStyles(QVDateStyle::Medium, QVDateStyle::None);
}
QVDateFormatter QVMediumDateTimeFormatter() {
    return QVDateFormatter::withStyles(QVDateStyle::Medium, QVDateStyle::Short);
}
QVDateFormatter QVTimeOfDayFormatter() {
    return QVDateFormatter::withTemplate("j:mm a");
}
QVDateFormatter QVMonthDayTimeFormatter() {
    return QVDateFormatter::withTemplate("MMM d, j:mm a");
}

QString QVRecentDateString(VSDate date) {
    const int years = VSCalendar::current().wholeYearsBetween(date, VSEnvironment::current()->now());
    return (years < 1 ? QVMonthDayTimeFormatter() : QVMediumDateTimeFormatter()).stringFromDate(date);
}

QString QVLastUpdatedString(VSDate date) {
    const VSCalendar calendar = VSCalendar::current();
    const bool today = calendar.isToday(date);
    if (today || calendar.isYesterday(date)) {
        const User user = User::current();
        return FormatCache::shared().format(user, today ? "today" : "yesterday", date, [&] {
            return relativePattern(user, today ? UDAT_DIRECTION_THIS : UDAT_DIRECTION_LAST);
        });
    }
    const auto year = [&](VSDate when) { return calendar.component(VSCalendarUnit::Year, when); };
    const bool otherYear = year(date) != year(VSEnvironment::current()->now());
    return QVDateFormatter::withTemplate(otherYear ? "M/d/yy j:mm a" : "M/d j:mm a").stringFromDate(date);
}
