#include "Qelvar/Controllers/QVUserActivityManager.h"

#include <QUrl>
#include <QUrlQuery>

namespace {

void require(platform::UserActivity& activity, const char* key, const QVariant& value) {
    activity.userInfo.insert(QString::fromLatin1(key), value);
    activity.requiredUserInfoKeys.append(QString::fromLatin1(key));
}

std::optional<int> integerItem(const QUrlQuery& query, const char* key) {
    bool isNumber = false;
    const int value = query.queryItemValue(QString::fromLatin1(key)).toInt(&isNumber);
    return isNumber ? std::optional(value) : std::nullopt;
}

// Desktops put what looks like a host in lower case.
QString tabOfAnyCase(const QString& name) {
    for (const char* tab : {QVUserActivityTab::Dashboard, QVUserActivityTab::HealthData,
                            QVUserActivityTab::Sources, QVUserActivityTab::MedicalID})
        if (name.compare(QLatin1String(tab), Qt::CaseInsensitive) == 0) return QString::fromLatin1(tab);
    return name;
}

}  // namespace

std::shared_ptr<const platform::UserActivity> QVUserActivityManager::activity(
    const QString& title, const QStringList& keywords, const char* tab, bool isCalendar,
    std::optional<int> category, std::optional<int> dataUnit) {
    auto activity = std::make_shared<platform::UserActivity>();
    activity->activityType = QString::fromLatin1(TabActivityType);
    activity->title = title;
    activity->keywords = keywords;
    activity->eligibleForSearch = true;
    require(*activity, QVUserActivityKey::MainTab, QString::fromLatin1(tab));
    if (category) require(*activity, QVUserActivityKey::DataCategory, *category);
    if (dataUnit) require(*activity, QVUserActivityKey::DataUnit, *dataUnit);
    if (isCalendar) require(*activity, QVUserActivityKey::Calendar, true);
    return activity;
}

std::optional<platform::UserActivity> QVUserActivityManager::activityFromLink(const QString& link) {
    // Not QUrl::host(), which is in lower case.
    static const QString kScheme = QStringLiteral("qelvar://");
    if (!link.startsWith(kScheme, Qt::CaseInsensitive)) return std::nullopt;
    const QString rest = link.mid(kScheme.size()).section(QLatin1Char('#'), 0, 0);
    const qsizetype question = rest.indexOf(QLatin1Char('?'));
    QString tab = question < 0 ? rest : rest.left(question);
    while (tab.endsWith(QLatin1Char('/'))) tab.chop(1);
    const QUrlQuery query(question < 0 ? QString() : rest.mid(question + 1));
    const bool isCalendar = integerItem(query, QVUserActivityKey::Calendar).value_or(0) == 1;
    return *activity({}, {}, tabOfAnyCase(tab).toUtf8().constData(), isCalendar,
                     integerItem(query, QVUserActivityKey::DataCategory),
                     integerItem(query, QVUserActivityKey::DataUnit));
}
