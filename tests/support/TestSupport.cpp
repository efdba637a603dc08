#include "TestSupport.h"

#include <stdlib.h>

#include <cstdio>
#include <cstdlib>
#include <ostream>

void PrintTo(const VSDate& date, std::ostream* stream) {
    *stream << VSISO8601FromDate(date, VSCalendar("Etc/UTC", "en_US"));
}

namespace test {

FixedEnvironment::FixedEnvironment(const std::string& now, const std::string& zone,
                                   const std::string& locale) {
    const auto start = VSDateFromISO8601(now, VSCalendar(zone, locale));
    if (!start) {
        std::fprintf(stderr, "not a date: %s\n", now.c_str());
        std::abort();
    }
    environment_ = std::make_shared<VSFixedEnvironment>(*start, zone, locale);
    previous_ = VSEnvironment::install(environment_);
}

FixedEnvironment::~FixedEnvironment() {
    VSEnvironment::install(previous_);
}

VSDate date(const std::string& iso) {
    const auto result = VSDateFromISO8601(iso, VSCalendar::current());
    if (!result) {
        std::fprintf(stderr, "not a date: %s\n", iso.c_str());
        std::abort();
    }
    return *result;
}

TemporaryFolder::TemporaryFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "qelvar-test-XXXXXX").string();
    if (!mkdtemp(pattern.data())) std::abort();
    path_ = pattern;
}

TemporaryFolder::~TemporaryFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(path_, ignored);
}

}  // namespace test
