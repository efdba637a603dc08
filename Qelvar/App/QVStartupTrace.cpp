#include "Qelvar/App/QVStartupTrace.h"

#include <time.h>
#include <unistd.h>

#include <QFile>
#include <QQuickItem>
#include <QQuickView>
#include <algorithm>
#include <cstdio>
#include <memory>

#include "Qelvar/App/QVScreenshots.h"
#include "Qelvar/Dashboard/QVDashboardTableViewCell.h"

namespace {

bool isEnabled() {
    static const bool enabled = qEnvironmentVariableIsSet("QELVAR_TRACE_STARTUP");
    return enabled;
}

/// When the kernel started the process, in milliseconds since the machine's start.
double processStart() {
    QFile file(QStringLiteral("/proc/self/stat"));
    if (!file.open(QIODevice::ReadOnly)) return 0;
    const QByteArray line = file.readAll();
    // The command's name, in parentheses, may hold blanks; the fields after it are numbered from 3.
    const QList<QByteArray> fields = line.mid(line.lastIndexOf(')') + 2).split(' ');
    constexpr int kStartTime = 22 - 3;
    return fields.size() > kStartTime
               ? fields[kStartTime].toDouble() * 1000.0 / static_cast<double>(sysconf(_SC_CLK_TCK))
               : 0;
}

double now() {
    timespec time{};
    clock_gettime(CLOCK_BOOTTIME, &time);
    return static_cast<double>(time.tv_sec) * 1e3 + static_cast<double>(time.tv_nsec) / 1e6;
}

bool cardsShowTheirData(QQuickView& window, bool settled) {
    const auto cards = QVCardsInScene(window.rootObject());
    return !cards.isEmpty() && std::all_of(cards.begin(), cards.end(), [settled](const auto* card) {
        return settled ? card->wasPaintedSettled() : card->wasPaintedWithData();
    });
}

}  // namespace

void QVStartupTrace::note(const char* what) {
    if (isEnabled()) std::fprintf(stderr, "startup: %6.0f ms: %s\n", now() - processStart(), what);
}

void QVStartupTrace::watch(QQuickView& window) {
    if (!isEnabled()) return;
    auto stage = std::make_shared<int>(0);
    QObject::connect(&window, &QQuickWindow::frameSwapped, &window, [&window, stage] {
        if (*stage == 0) {
            note("first frame");
            ++*stage;
        }
        if (*stage == 1 && cardsShowTheirData(window, false)) {
            note("all visible cards painted with their data");
            ++*stage;
        }
        if (*stage == 2 && cardsShowTheirData(window, true)) {
            note("all cross-fades finished");
            ++*stage;
        }
    });
}
