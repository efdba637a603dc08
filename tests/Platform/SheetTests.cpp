#include "Platform/Sheet.h"

#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QEvent>
#include <QPointer>

namespace {

using platform::SheetPresentation;
using platform::SheetScreen;

struct TestSheet : SheetScreen {
    explicit TestSheet(QStringList& log) : log_(log) {}
    QUrl view() const override { return {}; }
    void willAppear() override { log_ << "appear"; }
    void willDisappear() override { log_ << "disappear"; }
    QStringList& log_;
};

TEST(SheetPresentation, ASheetClosesItselfAndLivesUntilItHasLeftTheDisplay) {
    QStringList log;
    SheetPresentation presentation;
    presentation.dismiss();
    presentation.transitionFinished();
    auto sheet = std::make_unique<TestSheet>(log);
    QPointer<TestSheet> screen = sheet.get();
    presentation.present(std::move(sheet));
    EXPECT_EQ(presentation.screen(), screen);
    EXPECT_TRUE(screen->isVisible());
    screen->cancel();
    EXPECT_EQ(presentation.screen(), nullptr);
    EXPECT_TRUE(presentation.isAnimated());
    ASSERT_TRUE(screen) << "its layout fades";
    screen->cancel();
    presentation.transitionFinished();
    ASSERT_TRUE(screen) << "the caller may be one of its actions";
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    EXPECT_FALSE(screen);
    EXPECT_EQ(log, (QStringList{"appear", "disappear"}));
}

TEST(SheetPresentation, ANewSheetTakesTheOldOnesPlace) {
    QStringList log;
    QPointer<TestSheet> first, second;
    {
        SheetPresentation presentation;
        auto sheet = std::make_unique<TestSheet>(log);
        first = sheet.get();
        presentation.present(std::move(sheet));
        sheet = std::make_unique<TestSheet>(log);
        second = sheet.get();
        presentation.present(std::move(sheet), false);
        EXPECT_EQ(presentation.screen(), second);
        EXPECT_FALSE(first->isVisible());
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        EXPECT_FALSE(first);
    }
    EXPECT_FALSE(second);
}

}  // namespace
