#pragma once

#include <QStringList>
#include <memory>
#include <optional>

#include "Platform/UserActivity.h"

/// The tab strings of user activities. Kept in links and in the system's search index; never reused.
namespace QVUserActivityTab {
inline constexpr const char* Dashboard = "DashboardTab";
inline constexpr const char* HealthData = "HealthDataTab";
inline constexpr const char* Sources = "SourcesTab";
inline constexpr const char* MedicalID = "MedicalIDTab";
}  // namespace QVUserActivityTab

/// The names of an activity's user info.
namespace QVUserActivityKey {
inline constexpr const char* MainTab = "MainTab";
inline constexpr const char* DataCategory = "DataCategory";
inline constexpr const char* DataUnit = "DataUnit";
inline constexpr const char* Calendar = "Calendar";
}  // namespace QVUserActivityKey

/// Makes the records through which a tab, a category or a display type can be found and opened again.
class QVUserActivityManager {
 public:
    static constexpr const char* TabActivityType = "org.qelvar.Qelvar.tab";

    /// `category` is the ID of a display category, `dataUnit` that of a display type; searchable, not handed
    /// off.
    static std::shared_ptr<const platform::UserActivity> activity(const QString& title,
                                                                  const QStringList& keywords,
                                                                  const char* tab, bool isCalendar = false,
                                                                  std::optional<int> category = {},
                                                                  std::optional<int> dataUnit = {});

    /// The activity that a link names: "qelvar://HealthDataTab", with "?DataCategory=2&DataUnit=59" or
    /// "?Calendar=1". None when it is no link of the application. The case of the tab does not matter (those
    /// who hand links on may change it); an unknown tab is kept as it is.
    static std::optional<platform::UserActivity> activityFromLink(const QString& link);
};
