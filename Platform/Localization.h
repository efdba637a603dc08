#pragma once

#include <QString>
#include <QStringList>

namespace platform {

/// The text of a key in the user's language: the key is the text's id in the tables of Resources/translations
/// (English is complete; a key missing elsewhere is shown in English; a key missing everywhere shows itself).
/// Placeholders of the texts are numbered %1, %2 ... and filled in that order. Any thread after start-up.
QString localized(const char* key);
QString localized(const QString& key);
QString localized(const char* key, const QStringList& arguments);
/// The plural form for the number: the text of the key with %n filled.
QString localizedPlural(const char* key, int number);

/// Loads the tables for VSEnvironment's locale (and again after a locale change). Main thread.
void loadTranslations();

/// Whether the user's language is written right to left.
bool isRightToLeft();

}  // namespace platform
