#include "Qelvar/App/QVApplication.h"

#include <QEventLoop>
#include <QGuiApplication>
#include <QIcon>
#include <QQmlEngine>
#include <QQuickView>
#include <QTimer>
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <optional>
#include <thread>

#include "Platform/Appearance.h"
#include "Platform/Icons.h"
#include "Platform/Localization.h"
#include "Platform/SystemEvents.h"
#include "Platform/TextScale.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/App/QVAppDelegate.h"
#include "Qelvar/App/QVScreenshots.h"
#include "Qelvar/App/QVStartupTrace.h"
#include "Qelvar/App/QVTerminationSignals.h"
#include "Qelvar/App/QVWindow.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "Vessa/VSStoreHolder.h"

namespace {

bool hasDisplay() {
    return qEnvironmentVariableIsSet("WAYLAND_DISPLAY") || qEnvironmentVariableIsSet("DISPLAY") ||
           qEnvironmentVariableIsSet("QT_QPA_PLATFORM");
}

/// Settings that must stand before the QGuiApplication is made.
void chooseGraphics(const QVApplicationOptions& options) {
    if (options.scale > 0) qputenv("QT_SCALE_FACTOR", QByteArray::number(options.scale));
    if (!options.screenshots) return;
    if (!qEnvironmentVariableIsSet("QT_QPA_PLATFORM")) qputenv("QT_QPA_PLATFORM", "offscreen");
    QQuickWindow::setGraphicsApi(QSGRendererInterface::Software);
}

/// A window in place of the application's.
std::unique_ptr<QQuickView> messageWindow(const QVApplicationOptions& options, const QString& title,
                                          const QString& message, const QString& buttonTitle) {
    auto window = std::make_unique<QQuickView>();
    window->setTitle(QStringLiteral("Qelvar"));
    window->setResizeMode(QQuickView::SizeRootObjectToView);
    window->resize(options.size.isValid() ? options.size : QSize(375, 667));
    window->setInitialProperties({{QStringLiteral("title"), title},
                                  {QStringLiteral("message"), message},
                                  {QStringLiteral("buttonTitle"), buttonTitle}});
    window->setSource(QUrl(QStringLiteral("qrc:/Qelvar/QVStartMessage.qml")));
    window->show();
    return window;
}

/// Opens the store on a thread of its own: it may have to wait for other programs, or bring an older store up
/// to date. When that takes a while a window says so.
VSResult<std::shared_ptr<VSHealthStore>> openWaiting(const std::filesystem::path& folder,
                                                     const QVApplicationOptions& options) {
    std::optional<VSResult<std::shared_ptr<VSHealthStore>>> answer;
    QEventLoop loop;
    std::thread opener([&] {
        auto opened = VSHealthStore::open(folder);
        QMetaObject::invokeMethod(
            &loop,
            [&answer, &loop, opened = std::move(opened)] {
                answer = opened;
                loop.quit();
            },
            Qt::QueuedConnection);
    });
    std::unique_ptr<QQuickView> window;
    QGuiApplication::setQuitOnLastWindowClosed(false);
    QTimer::singleShot(std::chrono::milliseconds(400), &loop, [&] {
        if (options.screenshots) return;
        window = messageWindow(options, platform::localized("START_WAITING_TITLE"),
                               platform::localized("START_WAITING_TEXT"), {});
        QObject::connect(window.get(), &QWindow::visibleChanged, &loop, [&loop](bool visible) {
            if (!visible) loop.quit();
        });
    });
    loop.exec();
    // The person closed the window: what the opening was doing is left as after a kill, which hurts nothing.
    if (!answer) std::_Exit(1);
    opener.join();
    window.reset();
    QGuiApplication::setQuitOnLastWindowClosed(true);
    return std::move(*answer);
}

/// The store of the folder; an error names the place.
VSResult<std::shared_ptr<VSHealthStore>> openStore(const std::filesystem::path& folder,
                                                   const QVApplicationOptions& options) {
    VSStoreHolder::setProgram(VSStoreHolder::Program::Window);
    std::error_code error;
    const std::filesystem::path parent = std::filesystem::absolute(folder).parent_path();
    std::filesystem::create_directories(parent, error);
    if (error) return VSError{VSErrorCode::NotAccessible, parent.string() + ": " + error.message()};
    auto store = openWaiting(folder, options);
    if (!store) return store;
    platform::UserDefaults::setStandard(
        std::make_unique<platform::UserDefaults>(folder / "user-defaults.json"));
    auto& defaults = platform::UserDefaults::standard();
    if (options.demo && !defaults.boolean("UseDemoData")) {
        // The demonstration replaces all records, so it never begins where a person's may be.
        const auto types = (*store)->typeSummaries();
        if (!types) return types.error();
        if (!types->empty())
            return VSError{
                VSErrorCode::Refused,
                folder.string() +
                    ": it holds records, which the demonstration would replace; name another folder"};
        defaults.setValue("UseDemoData", true);
    }
    QVUserDefaults::sharedDefaults().setHealthStore(*store);
    return store;
}

/// Waits until the demonstration's records are those of today, so that no picture shows half of them.
void finishDemoData(QVAppDelegate& app) {
    app.didBecomeActive();
    while (app.isResettingDemoData())
        QCoreApplication::processEvents(QEventLoop::AllEvents | QEventLoop::WaitForMoreEvents, 50);
}

bool takePictures(QQuickView& window, QVAppDelegate& app, const QVApplicationOptions& options) {
    auto folder =
        QVPictureFolder::open(*options.screenshots, app.controllerManager()->healthStore()->folder());
    if (folder) return QVScreenshots(window, app, std::move(*folder)).takeAll();
    std::fprintf(stderr, "qelvar: %s\n", folder.error().message.c_str());
    return false;
}

int runWindow(QGuiApplication& application, QVAppDelegate& app, const QVApplicationOptions& options) {
    app.willFinishLaunching();
    QVStartupTrace::note("controllers");
    // Before the screens are laid out and ask for their records: a link leads elsewhere than the session
    // before.
    if (!options.openLink.isEmpty() && !app.openLink(options.openLink))
        std::fprintf(stderr, "qelvar: not a link of the application: %s\n", qPrintable(options.openLink));
    // The pictures are of the finished demonstration; a person sees it grow.
    if (options.screenshots) finishDemoData(app);
    QVWindow window(app, options.size);
    if (!window.isUsable()) return 1;
    QVStartupTrace::note("screens laid out");
    app.didFinishLaunching();
    window.show();
    QVStartupTrace::watch(window);
    if (options.screenshots) return takePictures(window, app, options) ? 0 : 1;

    QObject::connect(&application, &QGuiApplication::applicationStateChanged, &app,
                     [&app](Qt::ApplicationState state) {
                         if (state == Qt::ApplicationActive)
                             app.didBecomeActive();
                         else
                             app.didEnterBackground();
                     });
    QMetaObject::invokeMethod(&app, &QVAppDelegate::didBecomeActive, Qt::QueuedConnection);
    const QVTerminationSignals terminationSignals;
    const int status = QGuiApplication::exec();
    app.willTerminate();
    return status;
}

/// What the session before left. The demonstration and its pictures begin where they always do, and leave
/// nothing.
std::filesystem::path stateFile(const std::filesystem::path& folder, const QVApplicationOptions& options) {
    return options.demo || options.screenshots ? std::filesystem::path() : folder / "state.json";
}

/// Says in a window what keeps the application from starting, for those who did not start it from a terminal;
/// or in a picture.
void showStartFailure(const QString& message, const QVApplicationOptions& options,
                      const std::filesystem::path& store) {
    const auto window = messageWindow(options, platform::localized("START_FAILED_TITLE"), message,
                                      platform::localized("CLOSE"));
    QObject::connect(window->engine(), &QQmlEngine::quit, &QGuiApplication::quit);
    if (!options.screenshots) {
        QGuiApplication::exec();
        return;
    }
    const auto folder = QVPictureFolder::open(*options.screenshots, store);
    const VSStatus saved =
        folder ? folder->save(window->grabWindow(), "start-failure.png") : VSStatus(folder.error());
    if (!saved) std::fprintf(stderr, "qelvar: %s\n", saved.error().message.c_str());
}

}  // namespace

std::filesystem::path QVStoreFolder(bool demo) {
    const char* name = demo ? "qelvar-demo" : "qelvar";
    // A relative path there is to be ignored.
    if (const char* data = std::getenv("XDG_DATA_HOME"); data && data[0] == '/')
        return std::filesystem::path(data) / name;
    const char* home = std::getenv("HOME");
    return std::filesystem::path(home ? home : "/") / ".local/share" / name;
}

int QVRunApplication(int argc, char** argv, const QVApplicationOptions& options) {
    if (!options.screenshots && !hasDisplay()) {
        std::fprintf(stderr, "qelvar: there is no display (neither WAYLAND_DISPLAY nor DISPLAY is set)\n");
        return 1;
    }
    chooseGraphics(options);
    QGuiApplication application(argc, argv);
    QGuiApplication::setApplicationName(QStringLiteral("qelvar"));
    QGuiApplication::setApplicationDisplayName(QStringLiteral("Qelvar"));
    QGuiApplication::setDesktopFileName(QStringLiteral("org.qelvar.Qelvar"));
    QGuiApplication::setWindowIcon(
        QIcon(QPixmap::fromImage(platform::icon(QStringLiteral("qelvar"), {128, 128}, 1))));
    QVStartupTrace::note("application object");
    platform::loadTranslations();
    // Pictures show what the command line says, not what the desktop does meanwhile.
    if (!options.screenshots) platform::SystemEvents::shared().start();
    if (options.highContrast) platform::Appearance::shared().setHighContrast(*options.highContrast);
    if (!options.screenshots) platform::Appearance::shared().start();
    if (options.textScale > 0) platform::TextScale::shared().set(options.textScale);
    platform::TextScale::shared().start();

    const std::filesystem::path folder = options.store.empty() ? QVStoreFolder(options.demo) : options.store;
    auto store = openStore(folder, options);
    if (!store) {
        std::fprintf(stderr, "qelvar: the store cannot be opened: %s\n", store.error().message.c_str());
        std::string message = store.error().message;
        if (store.error().code == VSErrorCode::Corrupt)
            message += "\n\n`qelvar salvage` in a terminal may save what can be read.";
        showStartFailure(QString::fromStdString(message), options, folder);
        return 1;
    }
    QVStartupTrace::note("store open");
    QVAppDelegate app(std::move(*store), stateFile(folder, options));
    const int status = runWindow(application, app, options);
    QVUserDefaults::sharedDefaults().setHealthStore(nullptr);
    return status;
}
