#include "Qelvar/App/QVPlaceholderViewController.h"

#include "Platform/Localization.h"
#include "Platform/SystemEvents.h"

QVPlaceholderViewController::QVPlaceholderViewController(std::function<QString()> title, QString icon,
                                                         const char* messageKey, std::vector<Action> actions)
    : icon_(std::move(icon)), messageKey_(messageKey), actions_(std::move(actions)) {
    setTitle(title());
    connect(&platform::SystemEvents::shared(), &platform::SystemEvents::localeDidChange, this, [this, title] {
        setTitle(title());
        emit textsChanged();
    });
}

QUrl QVPlaceholderViewController::view() const {
    return QUrl(QStringLiteral("qrc:/Qelvar/QVPlaceholderViewController.qml"));
}

QString QVPlaceholderViewController::message() const {
    return platform::localized(messageKey_);
}

QStringList QVPlaceholderViewController::actionTitles() const {
    QStringList titles;
    for (const Action& action : actions_) titles.append(platform::localized(action.titleKey));
    return titles;
}

void QVPlaceholderViewController::runAction(int index) {
    if (index >= 0 && index < static_cast<int>(actions_.size())) actions_[static_cast<size_t>(index)].run();
}
