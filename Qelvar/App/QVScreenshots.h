#pragma once

#include <QQuickView>
#include <functional>

#include "Qelvar/App/QVAppDelegate.h"
#include "Qelvar/App/QVPictureFolder.h"

/// Draws the window in every tab and time scope into PNG files: "dashboard-week.png",
/// "dashboard-week-full.png" (as high as all its cards), "dashboard-empty.png", "display-type.png",
/// "health-data.png", "sources.png", "medical-id.png". Each picture is taken when everything in it has its
/// data and stands still. Main thread only.
class QVScreenshots {
 public:
    QVScreenshots(QQuickView& window, QVAppDelegate& app, QVPictureFolder folder);
    /// Runs the event loop while it waits. False, with the reason on standard error, when a file cannot be
    /// written or something has not come to rest within a minute.
    bool takeAll();

 private:
    bool takeDashboard();
    bool takeTab(int index, const char* name);
    bool waitUntil(const std::function<bool()>& condition, const char* what);
    bool waitForCards();
    bool take(const QString& name);

    QQuickView& window_;
    QVAppDelegate& app_;
    const QVPictureFolder folder_;
};

/// The cards in the scene beneath an item.
QList<QVDashboardTableViewCell*> QVCardsInScene(QQuickItem* root);
