#pragma once

#include <QStringList>
#include <functional>
#include <vector>

#include "Platform/Screen.h"

/// A screen whose rooms are not built yet: says what will be here, and offers what can be done already.
class QVPlaceholderViewController : public platform::Screen {
    Q_OBJECT
    Q_PROPERTY(QString icon READ icon CONSTANT)
    Q_PROPERTY(bool iconIsGlyph READ iconIsGlyph CONSTANT)
    Q_PROPERTY(QString message READ message NOTIFY textsChanged)
    Q_PROPERTY(QStringList actionTitles READ actionTitles NOTIFY textsChanged)
 public:
    struct Action {
        const char* titleKey;
        std::function<void()> run;
    };
    /// The icon is the name of one (platform::icon), or empty; `title`
    /// gives the title in the user's language.
    QVPlaceholderViewController(std::function<QString()> title, QString icon, const char* messageKey,
                                std::vector<Action> actions = {});

    QUrl view() const override;
    QString icon() const { return icon_; }
    /// A glyph is shown in grey, other icons in their own colours. Set before the screen is shown.
    bool iconIsGlyph() const { return iconIsGlyph_; }
    void setIconIsGlyph(bool isGlyph) { iconIsGlyph_ = isGlyph; }
    QString message() const;
    QStringList actionTitles() const;
    Q_INVOKABLE void runAction(int index);

 signals:
    void textsChanged();

 private:
    const QString icon_;
    bool iconIsGlyph_ = false;
    const char* const messageKey_;
    const std::vector<Action> actions_;
};
