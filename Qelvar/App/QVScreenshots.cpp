#include "Qelvar/App/QVScreenshots.h"

#include <QCoreApplication>
#include <QDeadlineTimer>
#include <QQuickItem>
#include <algorithm>
#include <cstdio>

#include "Platform/TextScale.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"

namespace {

constexpr int kPatienceMilliseconds = 60'000;
constexpr double kAboveAndBelowCards = 44 + 39 + 1 + 4 + 50;  // bars, control, header, inset
constexpr double kGrowthOfBars = 80;                          // with texts twice as large

void collectCards(QQuickItem* item, QList<QVDashboardTableViewCell*>& cards) {
    if (auto* card = qobject_cast<QVDashboardTableViewCell*>(item)) cards.append(card);
    for (QQuickItem* child : item->childItems())
        if (child->isVisible()) collectCards(child, cards);
}

}  // namespace

QList<QVDashboardTableViewCell*> QVCardsInScene(QQuickItem* root) {
    QList<QVDashboardTableViewCell*> cards;
    if (root) collectCards(root, cards);
    return cards;
}

QVScreenshots::QVScreenshots(QQuickView& window, QVAppDelegate& app, QVPictureFolder folder)
    : window_(window), app_(app), folder_(std::move(folder)) {}

bool QVScreenshots::takeAll() {
    if (!takeDashboard()) return false;
    const char* const names[] = {"", "health-data", "sources", "medical-id"};
    for (int index = 1; index < app_.tabBarController()->count(); ++index)
        if (!takeTab(index, names[index])) return false;
    return true;
}

bool QVScreenshots::takeDashboard() {
    app_.tabBarController()->setSelectedIndex(0);  // a link may have led elsewhere
    auto& groups = app_.controllerManager()->dashboardDataUnitGroupsController();
    if (!waitUntil([&groups] { return groups.hasLoadedDashboard(); }, "the dashboard's selection"))
        return false;
    QVDashboardViewController& dashboard = *app_.dashboard();
    if (dashboard.showsEmptyState()) return waitForCards() && take(QStringLiteral("dashboard-empty"));

    const QSize size = window_.size();
    const int cards = static_cast<int>(dashboard.dashboardDataUnitGroups().size());
    const QSize full(size.width(),
                     static_cast<int>(kAboveAndBelowCards + (platform::textScale() - 1) * kGrowthOfBars +
                                      cards * QVDashboardTableViewCell::preferredCellHeight()));
    const char* const names[] = {"day", "week", "month", "year"};
    for (int index = 0; index < 4; ++index) {
        dashboard.timeScopeControl()->pick(index);
        const QString name = QStringLiteral("dashboard-") + QLatin1String(names[index]);
        if (!waitForCards() || !take(name)) return false;
        window_.resize(full);
        if (!waitForCards() || !take(name + QStringLiteral("-full"))) return false;
        window_.resize(size);
    }
    dashboard.timeScopeControl()->pick(1);
    dashboard.selectRow(0);
    if (!waitForCards() || !take(QStringLiteral("display-type"))) return false;
    dashboard.navigationStack()->popToRoot(false);
    return true;
}

bool QVScreenshots::takeTab(int index, const char* name) {
    app_.tabBarController()->setSelectedIndex(index);
    return waitForCards() && take(QString::fromLatin1(name));
}

bool QVScreenshots::waitUntil(const std::function<bool()>& condition, const char* what) {
    const QDeadlineTimer deadline(kPatienceMilliseconds);
    while (!condition()) {
        if (deadline.hasExpired()) {
            std::fprintf(stderr, "qelvar: gave up waiting for %s\n", what);
            return false;
        }
        QCoreApplication::processEvents(QEventLoop::AllEvents | QEventLoop::WaitForMoreEvents, 50);
    }
    return true;
}

bool QVScreenshots::waitForCards() {
    // Two frames after the change: the first lays out, which may bring new cards.
    auto frames = std::make_shared<int>(0);
    const auto connection =
        QObject::connect(&window_, &QQuickWindow::afterAnimating, &window_, [this, frames] {
            ++*frames;
            window_.update();
        });
    window_.update();
    const bool settled = waitUntil(
        [this, &frames] {
            if (*frames < 2 || window_.rootObject()->property("busy").toBool()) return false;
            const auto cards = QVCardsInScene(window_.rootObject());
            return std::all_of(cards.begin(), cards.end(),
                               [](const auto* card) { return card->wasPaintedSettled(); });
        },
        "the cards");
    QObject::disconnect(connection);
    return settled;
}

bool QVScreenshots::take(const QString& name) {
    const VSStatus saved = folder_.save(window_.grabWindow(), (name + QStringLiteral(".png")).toStdString());
    if (!saved) std::fprintf(stderr, "qelvar: %s\n", saved.error().message.c_str());
    return saved.ok();
}
