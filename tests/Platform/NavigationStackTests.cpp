#include "Platform/NavigationStack.h"

#include <gtest/gtest.h>

#include <QSignalSpy>

#include "Platform/UserActivity.h"

namespace {

using platform::NavigationStack;

class LoggingScreen : public platform::Screen {
 public:
    LoggingScreen(QString name, QStringList& log) : name_(std::move(name)), log_(log) { setTitle(name_); }
    ~LoggingScreen() override { log_ << name_ + " gone"; }
    QUrl view() const override { return {}; }

 protected:
    void willAppear() override { log_ << name_ + " will appear"; }
    void didAppear() override { log_ << name_ + " appeared"; }
    void willDisappear() override { log_ << name_ + " will disappear"; }

 private:
    QString name_;
    QStringList& log_;
};

TEST(NavigationStack, TellsScreensWhenTheyComeAndGo) {
    QStringList log;
    const auto take = [&log] { return std::exchange(log, {}); };
    NavigationStack stack("stack", std::make_unique<LoggingScreen>("root", log));
    EXPECT_TRUE(log.isEmpty()) << "not on the display yet";
    stack.setVisible(true);
    EXPECT_EQ(take(), (QStringList{"root will appear", "root appeared"}));
    stack.setVisible(true);
    EXPECT_TRUE(log.isEmpty());

    stack.push(std::make_unique<LoggingScreen>("detail", log));
    EXPECT_EQ(take(), (QStringList{"root will disappear", "detail will appear", "detail appeared"}));
    EXPECT_EQ(stack.backTitle(), "root");
    QSignalSpy backTitle(&stack, &NavigationStack::backTitleChanged);
    stack.rootScreen()->setTitle("in another language");
    EXPECT_EQ(backTitle.size(), 1);
    EXPECT_EQ(stack.backTitle(), "in another language");
    EXPECT_EQ(stack.topScreen()->navigationStack(), &stack);

    stack.setVisible(false);
    EXPECT_EQ(take(), (QStringList{"detail will disappear"}));
    stack.popToRoot();
    EXPECT_TRUE(log.isEmpty()) << "another tab is shown";
    stack.setVisible(true);
    EXPECT_EQ(take(), (QStringList{"root will appear", "root appeared"}));
    EXPECT_FALSE(stack.canGoBack());
    stack.pop();
    EXPECT_EQ(stack.count(), 1) << "the root stays";
}

TEST(NavigationStack, ScreensThatSlideOutLiveUntilTheyAreGone) {
    QStringList log;
    NavigationStack stack("stack", std::make_unique<LoggingScreen>("root", log));
    stack.push(std::make_unique<LoggingScreen>("one", log));
    stack.push(std::make_unique<LoggingScreen>("two", log));
    QSignalSpy popped(&stack, &NavigationStack::popped);
    stack.popToRoot();
    ASSERT_EQ(popped.size(), 1);
    EXPECT_EQ(popped.front().at(0).toInt(), 2);
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    EXPECT_TRUE(log.isEmpty());
    stack.transitionFinished();
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    EXPECT_EQ(log.size(), 2);
}

TEST(NavigationStack, TheActivityOfTheScreenShownIsCurrent) {
    QStringList log;
    auto activity = std::make_shared<platform::UserActivity>();
    auto root = std::make_unique<LoggingScreen>("root", log);
    root->setUserActivity(activity);
    NavigationStack stack("stack", std::move(root));
    platform::UserActivity::makeCurrent(nullptr);
    stack.setVisible(true);
    EXPECT_EQ(platform::UserActivity::current(), activity);
    platform::UserActivity::makeCurrent(nullptr);
}

}  // namespace
