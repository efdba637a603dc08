#pragma once

#include <locale.h>

/// While it lives, names of an archive's entries are UTF-8 whatever the locale of the process: this thread's
/// is another one meanwhile.
class QVUtf8Locale {
 public:
    QVUtf8Locale() : locale_(newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr)), previous_(uselocale(locale_)) {}
    ~QVUtf8Locale() {
        uselocale(previous_);
        if (locale_) freelocale(locale_);
    }
    QVUtf8Locale(const QVUtf8Locale&) = delete;
    QVUtf8Locale& operator=(const QVUtf8Locale&) = delete;

 private:
    const locale_t locale_;
    const locale_t previous_;
};
