#include <gtest/gtest.h>

#include <QDeadlineTimer>
#include <QGuiApplication>

#include "QtTestSupport.h"

namespace test {

bool waitUntil(const std::function<bool()>& condition) {
    const QDeadlineTimer deadline(60'000);
    while (!condition()) {
        if (deadline.hasExpired()) return false;
        QCoreApplication::processEvents(QEventLoop::AllEvents | QEventLoop::WaitForMoreEvents, 50);
        // As an event loop does between events: what is to be deleted later would never be.
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    }
    return true;
}

}  // namespace test

int main(int argc, char** argv) {
    qputenv("QT_QPA_PLATFORM", "offscreen");
    testing::InitGoogleTest(&argc, argv);
    QGuiApplication application(argc, argv);
    return RUN_ALL_TESTS();
}
