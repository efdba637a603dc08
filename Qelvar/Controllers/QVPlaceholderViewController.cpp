#include "Qelvar/Controllers/QVPlaceholderViewController.h"

#include "Platform/Localization.h"
#include "Platform/SystemEvents.h"

QVPlaceholderViewController::QVPlaceholderViewController(std::function<QString()> title, QString icon,
                                                         const char* messageKey)
    : icon_(std::move(icon)), messageKey_(messageKey) {
    setTitle(title());
    connect(&platform::SystemEvents::shared(), &platform::SystemEvents::localeDidChange, this, [this, title] {
        setTitle(title());
        updateActivity();
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
    for (const Action& action : actions_) titles.append(action.title());
    return titles;
}

QVariantList QVPlaceholderViewController::actionStates() const {
    QVariantList states;
    for (const Action& action : actions_) states.append(action.isOn ? QVariant(action.isOn()) : QVariant());
    return states;
}

void QVPlaceholderViewController::runAction(int index) {
    if (index < 0 || index >= static_cast<int>(actions_.size())) return;
    const auto run = actions_[static_cast<size_t>(index)].run;  // which may set other actions
    run();
    emit actionStatesChanged();
}

void QVPlaceholderViewController::setContent(const char* messageKey, std::vector<Action> actions) {
    messageKey_ = messageKey;
    actions_ = std::move(actions);
    emit textsChanged();
    emit actionStatesChanged();
}

void QVPlaceholderViewController::setActivityFactory(ActivityFactory factory) {
    activityFactory_ = std::move(factory);
    updateActivity();
}

void QVPlaceholderViewController::updateActivity() {
    if (activityFactory_) setUserActivity(activityFactory_());
}
