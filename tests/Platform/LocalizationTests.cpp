#include "Platform/Localization.h"

#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QDirIterator>
#include <QFile>
#include <QGuiApplication>
#include <QRegularExpression>
#include <QSet>
#include <map>

#include "TestSupport.h"

namespace {

using platform::localized;

constexpr const char* englishOnlyKey = "DISPLAY_TYPE_STEPS_SUMMARY";

TEST(Localization, TextOfTheUsersLanguageElseEnglishElseTheKey) {
    test::FixedEnvironment english("2020-03-31T20:00", "Europe/Copenhagen", "en_GB");
    const QString englishText = localized(englishOnlyKey);
    EXPECT_NE(englishText, englishOnlyKey);
    EXPECT_EQ(localized("DAY"), "Day");
    EXPECT_EQ(localized("NOT_A_KEY %@"), "NOT_A_KEY %@");
    {
        test::FixedEnvironment german("2020-03-31T20:00", "Europe/Copenhagen", "de_DE");
        EXPECT_EQ(localized("DAY"), "Tag");
        EXPECT_FALSE(platform::isRightToLeft());
        // The long texts are in English only.
        EXPECT_EQ(localized(englishOnlyKey), englishText);
    }
    {
        test::FixedEnvironment arabic("2020-03-31T20:00", "Africa/Cairo", "ar_EG");
        EXPECT_EQ(localized("DAY"), QString::fromUtf8("يوم"));
        EXPECT_TRUE(platform::isRightToLeft());
    }
    {
        test::FixedEnvironment hindi("2020-03-31T20:00", "Asia/Kolkata", "hi_IN");
        EXPECT_EQ(localized("DAY"), QString::fromUtf8("दिन"));
        EXPECT_EQ(localized(englishOnlyKey), englishText) << "key by key";
        EXPECT_FALSE(platform::isRightToLeft());
    }
    {
        // Without a table the texts are English, and so is their direction.
        test::FixedEnvironment hebrew("2020-03-31T20:00", "Asia/Jerusalem", "he_IL");
        EXPECT_EQ(localized("DAY"), "Day");
        EXPECT_FALSE(platform::isRightToLeft());
    }
    EXPECT_EQ(localized("DAY"), "Day");
}

TEST(Localization, PlaceholdersAreFilledOnceEach) {
    test::FixedEnvironment english;
    EXPECT_EQ(localized("FEET_INCH_FORMAT %@ %@", {"5", "11"}), "5 ft 11 in");
    // What an argument holds is no placeholder.
    EXPECT_EQ(localized("FEET_INCH_FORMAT %@ %@", {"%2", "%1"}), "%2 ft %1 in");
    EXPECT_EQ(localized("FEET_INCH_FORMAT %@ %@", {"5"}), "5 ft %2 in");
}

TEST(Localization, PluralsFollowTheLanguage) {
    test::FixedEnvironment english;
    EXPECT_EQ(platform::localizedPlural("UNIT_NAME_STEPS", 1), "step");
    EXPECT_EQ(platform::localizedPlural("UNIT_NAME_STEPS", 0), "steps");
    EXPECT_EQ(platform::localizedPlural("UNIT_NAME_STEPS", 21), "steps");
    test::FixedEnvironment arabic("2020-03-31T20:00", "Africa/Cairo", "ar_EG");
    EXPECT_EQ(platform::localizedPlural("UNIT_NAME_STEPS", 2), QString::fromUtf8("خطوتان"));
    EXPECT_EQ(platform::localizedPlural("UNIT_NAME_STEPS", 5), QString::fromUtf8("خطوات"));
    EXPECT_EQ(platform::localizedPlural("UNIT_NAME_STEPS", 4711), QString::fromUtf8("خطوة"));
    test::FixedEnvironment hindi("2020-03-31T20:00", "Asia/Kolkata", "hi_IN");
    EXPECT_EQ(platform::localizedPlural("UNIT_NAME_FLOORS", 1), QString::fromUtf8("मंज़िल"));
    EXPECT_EQ(platform::localizedPlural("UNIT_NAME_FLOORS", 12), QString::fromUtf8("मंज़िलें"));
}

TEST(Localization, LoadingSetsDirectionAndTextIdsOfTheApplication) {
    {
        test::FixedEnvironment arabic("2020-03-31T20:00", "Africa/Cairo", "ar_EG");
        platform::loadTranslations();
        EXPECT_EQ(QGuiApplication::layoutDirection(), Qt::RightToLeft);
        EXPECT_EQ(qtTrId("DAY"), QString::fromUtf8("يوم"));
        EXPECT_EQ(qtTrId(englishOnlyKey), localized(englishOnlyKey));
        EXPECT_NE(qtTrId(englishOnlyKey), englishOnlyKey);
    }
    test::FixedEnvironment english;
    platform::loadTranslations();
    EXPECT_EQ(QGuiApplication::layoutDirection(), Qt::LeftToRight);
    EXPECT_EQ(qtTrId("DAY"), "Day");
}

struct Row {
    QStringList forms;
    QString place;
};

// Key to text, over all fragments of a language; conflicting lines fail.
std::map<QString, Row> fragments(const QString& language) {
    std::map<QString, Row> rows;
    QDirIterator files(QStringLiteral(QELVAR_SOURCE_DIR "/Resources/translations/") + language, {"*.tsv"},
                       QDir::Files);
    while (files.hasNext()) {
        QFile file(files.next());
        EXPECT_TRUE(file.open(QIODevice::ReadOnly));
        int number = 0;
        for (const QString& line : QString::fromUtf8(file.readAll()).split('\n')) {
            ++number;
            if (line.isEmpty() || line.startsWith('#')) continue;
            QStringList parts = line.split('\t');
            const QString key = parts.takeFirst();
            const Row row{parts, QStringLiteral("%1:%2").arg(file.fileName()).arg(number)};
            EXPECT_FALSE(parts.isEmpty()) << row.place.toStdString();
            const auto [position, added] = rows.emplace(key, row);
            EXPECT_TRUE(added || position->second.forms == row.forms)
                << row.place.toStdString() << ": " << key.toStdString() << " differs from "
                << position->second.place.toStdString();
        }
    }
    return rows;
}

QSet<QString> placeholders(const QStringList& forms) {
    QSet<QString> result;
    static const QRegularExpression expression(QStringLiteral("%[1-9]"));
    for (const QString& form : forms)
        for (auto match = expression.globalMatch(form); match.hasNext();)
            result.insert(match.next().captured());
    return result;
}

bool isLongText(const QString& key) {
    return key.endsWith("_SUMMARY") || key.endsWith("_KEYWORDS") || key.endsWith("_CAUTION");
}

// All but the long texts are in every language, with the placeholders of the English text.
TEST(Localization, EveryLanguageHasEveryText) {
    const auto english = fragments(QStringLiteral("en"));
    ASSERT_FALSE(english.empty());
    const QStringList languages = QDir(QStringLiteral(QELVAR_SOURCE_DIR "/Resources/translations"))
                                      .entryList(QDir::Dirs | QDir::NoDotAndDotDot);
    for (const char* language : {"ar", "de", "en", "hi"})
        EXPECT_TRUE(languages.contains(language)) << language;
    for (const QString& language : languages) {
        const auto own = fragments(language);
        for (const auto& [key, row] : english)
            EXPECT_TRUE(own.contains(key) || isLongText(key))
                << language.toStdString() << " has no text for " << key.toStdString();
        for (const auto& [key, row] : own) {
            const std::string place = row.place.toStdString();
            for (const QString& form : row.forms) EXPECT_FALSE(form.trimmed().isEmpty()) << place;
            const auto source = english.find(key);
            if (source == english.end()) {
                ADD_FAILURE() << place << ": " << key.toStdString() << " is no key of the English tables";
                continue;
            }
            EXPECT_EQ(placeholders(row.forms), placeholders(source->second.forms)) << place;
            EXPECT_EQ(row.forms.size() > 1, source->second.forms.size() > 1) << place;
        }
    }
}

}  // namespace
