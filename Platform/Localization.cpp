#include "Platform/Localization.h"

#include <unicode/locid.h>
#include <unicode/numfmt.h>

#include <QCoreApplication>
#include <QFile>
#include <QGuiApplication>
#include <QTranslator>
#include <map>
#include <memory>
#include <mutex>
#include <vector>

#include "Vessa/Base/VSEnvironment.h"

static void initializeTranslationResources() {
    Q_INIT_RESOURCE(qelvar_translations);
}

namespace platform {

namespace {

// The texts of one language, English behind it. Immutable once loaded; kept until the process ends.
struct Language {
    std::string code;
    bool rightToLeft = false;
    std::vector<std::unique_ptr<QTranslator>> tables;  // in the order of asking

    QString text(const char* key, int number = -1) const {
        for (const auto& table : tables) {
            QString found = table->translate(nullptr, key, nullptr, number);
            if (!found.isNull()) return found;
        }
        return QString::fromUtf8(key);
    }
};

std::unique_ptr<QTranslator> table(const std::string& language) {
    const QString path = QStringLiteral(":/translations/%1.qm").arg(QString::fromStdString(language));
    auto translator = std::make_unique<QTranslator>();
    if (!QFile::exists(path) || !translator->load(path)) return nullptr;
    return translator;
}

std::unique_ptr<Language> loadLanguage(const icu::Locale& locale) {
    static std::once_flag once;
    std::call_once(once, initializeTranslationResources);
    auto result = std::make_unique<Language>();
    result->code = "en";
    if (std::string(locale.getLanguage()) != "en") {
        if (auto own = table(locale.getLanguage())) {
            result->code = locale.getLanguage();
            result->rightToLeft = locale.isRightToLeft();
            result->tables.push_back(std::move(own));
        }
    }
    if (auto english = table("en")) result->tables.push_back(std::move(english));
    return result;
}

// The language of the user's locale as it is now. A locale that has no table of its own is in English, from
// left to right.
const Language& currentLanguage() {
    static std::mutex mutex;
    static auto* const byLocale = new std::map<std::string, const Language*>;          // guarded by mutex
    static auto* const byCode = new std::map<std::string, std::unique_ptr<Language>>;  // guarded by mutex
    const std::string identifier = VSEnvironment::current()->localeIdentifier();
    std::lock_guard lock(mutex);
    auto& found = (*byLocale)[identifier];
    if (!found) {
        const icu::Locale locale(identifier.c_str());
        auto& language = (*byCode)[locale.getLanguage()];
        if (!language) language = loadLanguage(locale);
        found = language.get();
    }
    return *found;
}

// One pass, so that a percent sign inside an argument is not taken for a placeholder.
QString filled(const QString& text, const QStringList& arguments) {
    QString result;
    result.reserve(text.size() + 16);
    for (qsizetype i = 0; i < text.size(); ++i) {
        const int digit = text[i] == u'%' && i + 1 < text.size() ? text[i + 1].digitValue() : -1;
        if (digit >= 1 && digit <= arguments.size()) {
            result += arguments[digit - 1];
            ++i;
        } else {
            result += text[i];
        }
    }
    return result;
}

QString numberText(int number) {
    UErrorCode status = U_ZERO_ERROR;
    const icu::Locale locale(VSEnvironment::current()->localeIdentifier().c_str());
    const std::unique_ptr<icu::NumberFormat> format(icu::NumberFormat::createInstance(locale, status));
    if (U_FAILURE(status)) return QString::number(number);
    icu::UnicodeString text;
    format->format(number, text);
    return QString::fromUtf16(text.getBuffer(), text.length());
}

}  // namespace

QString localized(const char* key) {
    return currentLanguage().text(key);
}

QString localized(const QString& key) {
    return currentLanguage().text(key.toUtf8().constData());
}

QString localized(const char* key, const QStringList& arguments) {
    return filled(localized(key), arguments);
}

QString localizedPlural(const char* key, int number) {
    return currentLanguage().text(key, number).replace(QLatin1String("%n"), numberText(number));
}

void loadTranslations() {
    const Language& language = currentLanguage();
    if (auto* application = QCoreApplication::instance()) {
        // For text ids in QML: the last one installed is asked first.
        static std::vector<QTranslator*> installed;
        for (auto* translator : installed) QCoreApplication::removeTranslator(translator);
        installed.clear();
        for (auto position = language.tables.rbegin(); position != language.tables.rend(); ++position) {
            QCoreApplication::installTranslator(position->get());
            installed.push_back(position->get());
        }
        if (qobject_cast<QGuiApplication*>(application))
            QGuiApplication::setLayoutDirection(language.rightToLeft ? Qt::RightToLeft : Qt::LeftToRight);
    }
}

bool isRightToLeft() {
    return currentLanguage().rightToLeft;
}

}  // namespace platform
