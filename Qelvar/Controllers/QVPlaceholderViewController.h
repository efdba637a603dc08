#pragma once

#include <QStringList>
#include <QVariantList>
#include <functional>
#include <memory>
#include <vector>

#include "Platform/Screen.h"

/// A screen whose rooms are not built yet: says what will be here, and offers what can be done already. Its
/// texts follow the user's language. Main thread only.
class QVPlaceholderViewController : public platform::Screen {
    Q_OBJECT
    Q_PROPERTY(QString icon READ icon CONSTANT)
    Q_PROPERTY(bool iconIsGlyph READ iconIsGlyph CONSTANT)
    Q_PROPERTY(QString message READ message NOTIFY textsChanged)
    Q_PROPERTY(QStringList actionTitles READ actionTitles NOTIFY textsChanged)
    Q_PROPERTY(QVariantList actionStates READ actionStates NOTIFY actionStatesChanged)
 public:
    struct Action {
        std::function<QString()> title;
        std::function<void()> run;
        /// Whether it is on, for what can be switched on and off; empty: it cannot.
        std::function<bool()> isOn = {};
    };
    using ActivityFactory = std::function<std::shared_ptr<const platform::UserActivity>()>;

    /// The icon is the name of one (platform::icon), or empty; `title` gives the title in the user's
    /// language.
    QVPlaceholderViewController(std::function<QString()> title, QString icon, const char* messageKey);

    QUrl view() const override;
    QString icon() const { return icon_; }
    /// A glyph is shown in grey, other icons in their own colours. Set before the screen is shown.
    bool iconIsGlyph() const { return iconIsGlyph_; }
    void setIconIsGlyph(bool isGlyph) { iconIsGlyph_ = isGlyph; }
    QString message() const;
    QStringList actionTitles() const;
    /// For each action true or false, or nothing where it is no switch.
    QVariantList actionStates() const;
    Q_INVOKABLE void runAction(int index);

    void setContent(const char* messageKey, std::vector<Action> actions);
    /// Makes the screen's user activity, now and whenever the language changes.
    void setActivityFactory(ActivityFactory factory);

 signals:
    void textsChanged();
    void actionStatesChanged();

 protected:
    /// What the user is at is another.
    void updateActivity();

 private:
    const QString icon_;
    bool iconIsGlyph_ = false;
    const char* messageKey_;
    std::vector<Action> actions_;
    ActivityFactory activityFactory_;
};
