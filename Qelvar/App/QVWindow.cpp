#include "Qelvar/App/QVWindow.h"

#include <QGuiApplication>
#include <QQmlEngine>
#include <QQuickItem>
#include <mutex>

#include "Platform/Announcement.h"
#include "Platform/IconItem.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"
#include "Qelvar/Dashboard/QVDraggingView.h"

namespace {

constexpr QSize kPhoneSize(375, 667);
constexpr QSize kSmallestSize(320, 320);

/// The classes that the layouts name.
void registerTypes() {
    static std::once_flag once;
    std::call_once(once, [] {
        qmlRegisterType<platform::IconItem>("Qelvar.Items", 1, 0, "Icon");
        qmlRegisterType<QVDashboardTableViewCell>("Qelvar.Items", 1, 0, "QVDashboardTableViewCell");
        qmlRegisterType<QVDraggingView>("Qelvar.Items", 1, 0, "QVDraggingView");
        qmlRegisterType<platform::AnnouncementItem>("Qelvar.Items", 1, 0, "Announcement");
        qmlRegisterUncreatableType<QVImportController>("Qelvar.Items", 1, 0, "QVImportController",
                                                       QStringLiteral("made by the application"));
        qmlRegisterUncreatableType<QVExportController>("Qelvar.Items", 1, 0, "QVExportController",
                                                       QStringLiteral("made by the application"));
    });
}

}  // namespace

bool QVWindow::event(QEvent* event) {
    if (event->type() == QEvent::Close && !app_.quitController()->mayQuit()) {
        event->ignore();
        return true;
    }
    return QQuickView::event(event);
}

QVWindow::QVWindow(QVAppDelegate& app, QSize size) : app_(app) {
    registerTypes();
    setTitle(QStringLiteral("Qelvar"));
    setIcon(QGuiApplication::windowIcon());
    setColor(Qt::white);
    setResizeMode(QQuickView::SizeRootObjectToView);
    setMinimumSize(kSmallestSize);
    resize(size.isValid() ? size : kPhoneSize);
    setInitialProperties({{QStringLiteral("app"), QVariant::fromValue(&app)}});
    connect(&app, &QVAppDelegate::localeChanged, engine(), &QQmlEngine::retranslate);
    connect(app.quitController(), &QVQuitController::quitRequested, qGuiApp, &QGuiApplication::quit);
    connect(engine(), &QQmlEngine::quit, qGuiApp, &QGuiApplication::quit);
    setSource(QUrl(QStringLiteral("qrc:/Qelvar/QVTabBarController.qml")));
}
