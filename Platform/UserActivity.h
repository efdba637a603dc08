#pragma once

#include <QString>
#include <QStringList>
#include <QVariantMap>
#include <memory>

namespace platform {

/// What the user is looking at, in a form that can be searched for and opened again. Main thread only.
/// Nothing on this platform lists them yet: a link on the command line opens them.
struct UserActivity {
    QString activityType;
    QString title;
    QStringList keywords;
    bool eligibleForHandoff = false;
    bool eligibleForSearch = false;
    bool eligibleForPublicIndexing = false;
    /// Strings, integers and booleans by name.
    QVariantMap userInfo;
    /// The names in userInfo without which the activity cannot be opened, in the order of adding.
    QStringList requiredUserInfoKeys;

    /// The activity that the user is at now; null: none.
    static std::shared_ptr<const UserActivity> current();
    static void makeCurrent(std::shared_ptr<const UserActivity> activity);
};

}  // namespace platform
