#include <benchmark/benchmark.h>
#include <time.h>

#include <QDeadlineTimer>
#include <QElapsedTimer>
#include <QFile>
#include <QGuiApplication>
#include <QProcess>
#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <utility>

#include "Platform/Localization.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/App/QVScreenshots.h"
#include "Qelvar/App/QVWindow.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "StoreBenchData.h"
#include "Vessa/Base/VSEnvironment.h"

// The dashboard of a real store: how long the program takes to start, how long the cards take to follow the
// time scope, how long the main thread is kept busy meanwhile, and what it all takes of memory. QELVAR_STORE
// names the folder of a store, which is copied; without it one is made with a year of heart rate and steps.
// The software renderer draws, at 2 pixels a point.

namespace {

namespace fs = std::filesystem;

constexpr const char* kNow = "2021-03-29T20:00";
constexpr QSize kPhone(375, 667);
constexpr int kGroupIDs[] = {
    VSGroupID::HeartRate,      VSGroupID::Steps, VSGroupID::WalkingRunningDistance, VSGroupID::ActiveEnergy,
    VSGroupID::FlightsClimbed, 4 /* weight */,   VSGroupID::BloodPressure,          VSGroupID::SleepAnalysis,
    VSGroupID::Workouts,       VSGroupID::Height};

bool waitUntil(const std::function<bool()>& condition) {
    const QDeadlineTimer deadline(60'000);
    while (!condition()) {
        if (deadline.hasExpired()) return false;
        QCoreApplication::processEvents(QEventLoop::AllEvents | QEventLoop::WaitForMoreEvents, 50);
    }
    return true;
}

void require(bool condition, const char* what) {
    if (!condition) benchStop(what);
}

/// The store with ten cards on its dashboard.
class Folder {
 public:
    Folder() {
        if (const char* given = std::getenv("QELVAR_STORE")) {
            fs::copy(given, store(), fs::copy_options::recursive);
        } else {
            auto made = VSHealthStore::open(store());
            require(static_cast<bool>(made), "no store can be made");
            for (const auto& samples :
                 {benchSamples(benchYear(2021)), benchSamples(benchStepsYear(2021, 0), VSCode::StepCount)})
                require(static_cast<bool>((*made)->saveObjectsAndWait(samples)),
                        "the samples cannot be saved");
        }
    }
    fs::path store() const { return folder_.path() / "store"; }

 private:
    BenchFolder folder_;
};

/// The application in a window, in this process.
class Session {
 public:
    explicit Session(const fs::path& folder) {
        auto opened = VSHealthStore::open(folder);
        require(static_cast<bool>(opened), "the store cannot be opened");
        store_ = std::move(*opened);
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder / "user-defaults.json"));
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
        app_ = std::make_unique<QVAppDelegate>(store_);
        app_->willFinishLaunching();
        auto& groups = app_->controllerManager()->dashboardDataUnitGroupsController();
        require(waitUntil([&groups] { return groups.hasLoadedDashboard(); }), "the dashboard does not load");
        QVDashboardViewController::Groups ten;
        for (const int id : kGroupIDs)
            ten.push_back(VSDataUnitGroupController::shared().dataUnitGroupWithID(id));
        groups.setDataUnitGroupsForDashboard(ten);
        window_ = std::make_unique<QVWindow>(*app_, kPhone);
        require(window_->isUsable(), "the window cannot be made");
        app_->didFinishLaunching();
        window_->show();
        require(waitUntil([this] { return allPainted(true); }), "the cards do not settle");
    }
    ~Session() {
        window_.reset();
        app_.reset();
        QVUserDefaults::sharedDefaults().setHealthStore(nullptr);
    }

    bool allPainted(bool settled) const {
        const auto cards = QVCardsInScene(window_->rootObject());
        return !cards.isEmpty() && std::all_of(cards.begin(), cards.end(), [settled](const auto* card) {
            return settled ? card->wasPaintedSettled() : card->wasPaintedWithData();
        });
    }
    QVTimeScopeControl& control() const { return *app_->dashboard()->timeScopeControl(); }

 private:
    std::shared_ptr<VSHealthStore> store_;
    std::unique_ptr<QVAppDelegate> app_;
    std::unique_ptr<QVWindow> window_;
};

/// Tells how long each event keeps the main thread: a frame of the window (layout, painting of the cards,
/// drawing of the scene), or what was loaded being taken over.
class Application : public QGuiApplication {
 public:
    using QGuiApplication::QGuiApplication;
    bool notify(QObject* receiver, QEvent* event) override {
        if (depth_++ == 0) start_ = threadTime();
        const bool result = QGuiApplication::notify(receiver, event);
        if (--depth_ == 0) times_.push_back(threadTime() - start_);
        return result;
    }
    std::vector<double> takeTimes() { return std::exchange(times_, {}); }

 private:
    static double threadTime() {
        timespec time{};
        clock_gettime(CLOCK_THREAD_CPUTIME_ID, &time);
        return static_cast<double>(time.tv_sec) * 1e3 + static_cast<double>(time.tv_nsec) / 1e6;
    }
    int depth_ = 0;
    double start_ = 0;
    std::vector<double> times_;
};

Application& application() {
    return static_cast<Application&>(*QCoreApplication::instance());
}

double median(std::vector<double> values) {
    std::nth_element(values.begin(), values.begin() + values.size() / 2, values.end());
    return values[values.size() / 2];
}

/// A number of kilobytes of this process, in megabytes.
double megabytes(const char* file, const char* key) {
    QFile status(QString::fromLatin1(file));
    require(status.open(QIODevice::ReadOnly), "no numbers of the process");
    for (const QByteArray& line : status.readAll().split('\n'))
        if (line.startsWith(key)) return line.simplified().split(' ').value(1).toDouble() / 1024;
    return 0;
}

/// The program itself, from its start in the kernel to the frame in which all cards show their data.
void ColdStart(benchmark::State& state) {
    const Folder folder;
    { const Session tenCards(folder.store()); }
    std::vector<double> times;
    for (auto _ : state) {
        QProcess program;
        QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
        environment.insert(QStringLiteral("QELVAR_TRACE_STARTUP"), QStringLiteral("1"));
        environment.insert(QStringLiteral("QT_QUICK_BACKEND"), QStringLiteral("software"));
        environment.insert(QStringLiteral("XDG_STATE_HOME"), QString::fromStdString(folder.store().string()));
        program.setProcessEnvironment(environment);
        program.setReadChannel(QProcess::StandardError);
        program.start(QStringLiteral(QELVAR_BINARY),
                      {QStringLiteral("--store"), QString::fromStdString(folder.store().string()),
                       QStringLiteral("--now"), QString::fromLatin1(kNow)});
        double painted = 0;
        while (painted == 0 && program.waitForReadyRead(60'000))
            while (program.canReadLine()) {
                const QByteArray line = program.readLine().simplified();
                if (line.contains("painted with their data")) painted = line.split(' ').value(1).toDouble();
            }
        program.kill();
        program.waitForFinished();
        require(painted > 0, "the program does not start");
        times.push_back(painted);
        state.SetIterationTime(painted / 1000);
    }
    state.counters["median_ms"] = median(times);
    state.counters["best_ms"] = *std::min_element(times.begin(), times.end());
}

/// Through all time scopes, each change until every card that can be seen shows it.
void ChangeOfTheTimeScope(benchmark::State& state) {
    const Folder folder;
    const Session session(folder.store());
    std::vector<double> times, longest, longestUntilPainted;
    const auto longestEvent = [] {
        const std::vector<double> events = application().takeTimes();
        return events.empty() ? 0 : *std::max_element(events.begin(), events.end());
    };
    int scope = session.control().selectedIndex();
    for (auto _ : state) {
        scope = (scope + 1) % 4;
        application().takeTimes();
        QElapsedTimer timer;
        timer.start();
        session.control().pick(scope);
        require(waitUntil([&] { return session.allPainted(false); }), "the cards do not follow");
        times.push_back(timer.nsecsElapsed() / 1e6);
        state.SetIterationTime(times.back() / 1000);
        longestUntilPainted.push_back(longestEvent());
        require(waitUntil([&] { return session.allPainted(true); }), "the cards do not settle");
        longest.push_back(std::max(longestUntilPainted.back(), longestEvent()));
    }
    state.counters["median_ms"] = median(times);
    state.counters["best_ms"] = *std::min_element(times.begin(), times.end());
    state.counters["worst_ms"] = *std::max_element(times.begin(), times.end());
    state.counters["longest_event_median_ms"] = median(longest);
    state.counters["longest_event_best_ms"] = *std::min_element(longest.begin(), longest.end());
    state.counters["longest_event_worst_ms"] = *std::max_element(longest.begin(), longest.end());
    state.counters["longest_until_painted_ms"] = median(longestUntilPainted);
    state.counters["resident_mb"] = megabytes("/proc/self/status", "VmRSS:");
    state.counters["proportional_mb"] = megabytes("/proc/self/smaps_rollup", "Pss:");
}

BENCHMARK(ColdStart)->UseManualTime()->Iterations(9)->Unit(benchmark::kMillisecond);
BENCHMARK(ChangeOfTheTimeScope)->UseManualTime()->Iterations(24)->Unit(benchmark::kMillisecond);

}  // namespace

int main(int argc, char** argv) {
    qputenv("QT_QPA_PLATFORM", "offscreen");
    qputenv("QT_SCALE_FACTOR", "2");
    qputenv("TZ", "Europe/Copenhagen");
    qputenv("LANG", "en_US.UTF-8");
    QQuickWindow::setGraphicsApi(QSGRendererInterface::Software);
    Application application(argc, argv);
    const auto now = VSDateFromISO8601(kNow, VSCalendar::current());
    require(now.has_value(), "no such date");
    VSEnvironment::install(std::make_shared<VSSystemEnvironment>(*now));
    platform::loadTranslations();
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
