#include <QSignalSpy>
#include <chrono>

#include "Platform/Announcement.h"
#include "Qelvar/Dashboard/QVDraggingView.h"
#include "WindowTest.h"

namespace {

using Groups = QVDashboardViewController::Groups;

constexpr int kTableTop = 44 + 39;  // below the bars
constexpr int kTableHeight = 667 - kTableTop - 49;

/// The middle of a row of the table that is not scrolled.
QPoint middleOfRow(int row, int x = 180) {
    return {x, kTableTop + 1 + row * 187 + 93};
}

class ReorderWindowTest : public test::WindowTest {
 protected:
    void openCards(size_t count) {
        const int ids[] = {
            VSGroupID::Steps,          VSGroupID::HeartRate,    VSGroupID::WalkingRunningDistance,
            VSGroupID::FlightsClimbed, VSGroupID::ActiveEnergy, VSGroupID::StandHours};
        Groups groups;
        for (size_t i = 0; i < count; ++i) groups.push_back(group(ids[i]));
        platform::loadTranslations();
        names_.clear();
        for (const auto* group : groups) names_ << group->displayName();
        {
            QVControllerManager manager(store_);
            auto& controller = manager.dashboardDataUnitGroupsController();
            ASSERT_TRUE(test::waitUntil([&controller] { return controller.hasLoadedDashboard(); }));
            controller.setDataUnitGroupsForDashboard(groups);
        }
        relaunch();
        ASSERT_TRUE(test::waitUntil([&] { return shown() == QString("012345").left(qsizetype(count)); }));
        ASSERT_TRUE(waitForCards(3));
    }
    QVDashboardViewController& dashboard() { return *app_->dashboard(); }
    /// The cards by their numbers at the start, as the screen has them, or as they are kept.
    QString letters(const Groups& groups) const {
        QString result;
        for (const auto* group : groups) result += QString::number(names_.indexOf(group->displayName()));
        return result;
    }
    QString shown() { return letters(dashboard().dashboardDataUnitGroups()); }
    QString kept() {
        return letters(
            app_->controllerManager()->dashboardDataUnitGroupsController().dataUnitGroupsForDashboard());
    }
    double offset() { return dashboard().tableGeometry().contentOffset; }
    /// The titles that the window shows, from the top, each with its place; a hidden one in brackets.
    QString onScreen() {
        auto cards = QVCardsInScene(window_->rootObject());
        const auto top = [](const QQuickItem* card) { return card->mapToScene({0, 0}).y(); };
        std::sort(cards.begin(), cards.end(),
                  [&top](const auto* a, const auto* b) { return top(a) < top(b); });
        QStringList result;
        for (const auto* card : cards)
            if (top(card) > kTableTop - 187 && top(card) < kTableTop + kTableHeight)
                result << QStringLiteral("%1%2@%3")
                              .arg(card->isContentHidden() ? "-" : "")
                              .arg(names_.indexOf(card->titleText()))
                              .arg(qRound(top(card) - kTableTop));
        return result.join(' ');
    }
    bool waitForScreen(const QString& expected) {
        const bool same = test::waitUntil([&] { return onScreen() == expected; });
        EXPECT_EQ(onScreen(), expected);
        return same;
    }
    const QVDraggingView* draggingView() const {
        return itemBelow<const QVDraggingView>(window_->rootObject());
    }
    template <typename Item>
    static Item* itemBelow(QQuickItem* item) {
        if (auto* found = qobject_cast<Item*>(item)) return found;
        for (QQuickItem* child : item->childItems())
            if (auto* found = itemBelow<Item>(child)) return found;
        return nullptr;
    }
    /// The notification that a screen reader finds; empty: none.
    QString said() const {
        auto* item = itemBelow<platform::AnnouncementItem>(window_->rootObject());
        if (!item || !item->isVisible()) return {};
        QAccessibleInterface* interface = QAccessible::queryAccessibleInterface(item);
        if (!interface || interface->role() != QAccessible::Notification || interface->state().invisible)
            return {};
        return interface->text(QAccessible::Name);
    }
    bool isStill() { return !dashboard().draggingView(); }

    void hold(QPoint at) {
        QTest::mousePress(window_.get(), Qt::LeftButton, {}, at);
        ASSERT_TRUE(test::waitUntil([this] { return dashboard().isDragging(); }));
    }
    void drag(QPoint from, QPoint to) {
        for (int y = from.y(); y != to.y(); y += std::clamp(to.y() - y, -20, 20))
            QTest::mouseMove(window_.get(), {to.x(), y});
        QTest::mouseMove(window_.get(), to);
    }
    void release(QPoint at) { QTest::mouseRelease(window_.get(), Qt::LeftButton, {}, at); }

    QStringList names_;
};

TEST_F(ReorderWindowTest, TheMouseDragsTheThirdCardToTheTop) {
    openCards(4);
    QVDashboardTableViewCell* third = QVCardsInScene(window_->rootObject())[2];
    hold(middleOfRow(2, 100));
    EXPECT_TRUE(third->isContentHidden());
    ASSERT_TRUE(draggingView());
    EXPECT_TRUE(draggingView()->isVisible());
    EXPECT_FALSE(dashboard().draggingView()->image.isNull());
    drag(middleOfRow(2), middleOfRow(1));
    EXPECT_EQ(shown(), "0213");
    drag(middleOfRow(1), middleOfRow(0));
    EXPECT_EQ(shown(), "2013");
    EXPECT_EQ(kept(), "0123") << "not before the button is released";
    ASSERT_TRUE(waitForScreen("-2@1 0@188 1@375"));
    EXPECT_EQ(QVCardsInScene(window_->rootObject()).count(third), 1) << "the cards themselves moved";
    ASSERT_TRUE(test::waitUntil([this] { return !dashboard().isMoving(); }));
    EXPECT_NEAR(draggingView()->opacity(), 0.8, 1e-9);
    EXPECT_NEAR(draggingView()->scale(), 1.05, 1e-9);
    const QPointF center = draggingView()->mapToScene(draggingView()->boundingRect().center());
    EXPECT_NEAR(center.x(), 187.5, 0.01) << "it keeps to the middle";
    EXPECT_NEAR(center.y(), middleOfRow(0).y(), 0.01);
    EXPECT_EQ(offset(), 0);

    release(middleOfRow(0));
    ASSERT_TRUE(test::waitUntil([this] { return isStill(); }));
    EXPECT_EQ(kept(), "2013");
    EXPECT_FALSE(draggingView()->isVisible());
    ASSERT_TRUE(waitForScreen("2@1 0@188 1@375"));
    auto* stack = app_->tabBarController()->selectedStack();
    EXPECT_EQ(stack->count(), 1) << "a drag opens nothing";
    QTest::mouseClick(window_.get(), Qt::LeftButton, {}, middleOfRow(1));
    EXPECT_EQ(stack->topScreen()->title(), names_[0]) << "and a click opens as before";
}

TEST_F(ReorderWindowTest, AFingerDragsToTheEndWhichScrollsAndFlicksWithoutHolding) {
    openCards(6);
    auto device = std::unique_ptr<QPointingDevice>(QTest::createTouchDevice());
    const auto touch = [&] { return QTest::touchEvent(window_.get(), device.get()); };
    touch().press(0, middleOfRow(0));
    ASSERT_TRUE(test::waitUntil([this] { return dashboard().isDragging(); }));
    for (int y = middleOfRow(0).y(); y < middleOfRow(1).y() + 60; y += 10) touch().move(0, {180, y});
    EXPECT_EQ(shown(), "102345");
    EXPECT_EQ(offset(), 0) << "the list does not flick";
    touch().move(0, {180, kTableTop + kTableHeight - 5});
    ASSERT_TRUE(test::waitUntil([this] { return dashboard().currentRow() == 5; }));
    const double end = 6 * 187 + 1 + 4 - kTableHeight;
    ASSERT_TRUE(test::waitUntil([this, end] { return offset() == end; }));
    EXPECT_EQ(kept(), "012345");
    touch().release(0, {180, kTableTop + kTableHeight - 5});
    ASSERT_TRUE(test::waitUntil([this] { return isStill(); }));
    EXPECT_EQ(kept(), "123450");
    ASSERT_TRUE(waitForScreen(QStringLiteral("4@%1 5@%2 0@%3")
                                  .arg(kTableHeight - 4 - 561)
                                  .arg(kTableHeight - 4 - 374)
                                  .arg(kTableHeight - 4 - 187)));
    EXPECT_EQ(app_->tabBarController()->selectedStack()->count(), 1);

    touch().press(0, {180, 300});
    for (int y = 300; y < 550; y += 10) touch().move(0, {180, y});
    // Moves of a finger are delivered with the next frame.
    ASSERT_TRUE(test::waitUntil([this, end] { return offset() < end - 100; }));
    EXPECT_FALSE(dashboard().isDragging());
    touch().release(0, {180, 550});
    EXPECT_EQ(app_->tabBarController()->selectedStack()->count(), 1);
    // A tap opens.
    ASSERT_TRUE(test::waitUntil([this] { return !window_->rootObject()->property("busy").toBool(); }));
    dashboard().restoreScrollOffset(0);
    touch().press(0, middleOfRow(1));
    touch().release(0, middleOfRow(1));
    EXPECT_EQ(app_->tabBarController()->selectedStack()->count(), 2);
}

TEST_F(ReorderWindowTest, TheKeyboardMovesTheCardAndSaysSo) {
    openCards(6);
    EXPECT_TRUE(focused().startsWith(names_[0])) << focused().toStdString();
    press(Qt::Key_Down, Qt::AltModifier);
    EXPECT_EQ(kept(), "102345");
    EXPECT_TRUE(focused().startsWith(names_[0])) << "the keyboard goes with it: " << focused().toStdString();
    EXPECT_EQ(said(), names_[0] + ", moved to 2 of 6");
    press(Qt::Key_Up, Qt::AltModifier);
    EXPECT_EQ(said(), names_[0] + ", moved to 1 of 6");
    press(Qt::Key_Up, Qt::AltModifier);
    EXPECT_EQ(kept(), "012345");
    EXPECT_EQ(said(), names_[0] + ", stays at 1 of 6");
    for (int i = 0; i < 5; ++i) press(Qt::Key_Down, Qt::AltModifier);
    EXPECT_EQ(kept(), "123450");
    // It is in sight, and the list is at its end.
    const QQuickItem* card = window_->activeFocusItem();
    ASSERT_TRUE(waitForScreen(QStringLiteral("4@%1 5@%2 0@%3")
                                  .arg(kTableHeight - 561)
                                  .arg(kTableHeight - 374)
                                  .arg(kTableHeight - 187)));
    EXPECT_TRUE(focused().startsWith(names_[0]));

    // A screen reader moves it without keys.
    QAccessibleInterface* interface = QAccessible::queryAccessibleInterface(window_->activeFocusItem());
    ASSERT_TRUE(interface && interface->actionInterface());
    EXPECT_TRUE(
        interface->actionInterface()->actionNames().contains(QAccessibleActionInterface::decreaseAction()));
    interface->actionInterface()->doAction(QAccessibleActionInterface::decreaseAction());
    EXPECT_EQ(kept(), "123405");
    interface->actionInterface()->doAction(QAccessibleActionInterface::increaseAction());
    EXPECT_EQ(kept(), "123450");
    EXPECT_EQ(window_->activeFocusItem(), card);

    press(Qt::Key_Home);
    EXPECT_TRUE(focused().startsWith(names_[1])) << focused().toStdString();
    EXPECT_EQ(offset(), 0);
    press(Qt::Key_PageDown);
    EXPECT_TRUE(focused().startsWith(names_[3])) << focused().toStdString();
    press(Qt::Key_End);
    EXPECT_TRUE(focused().startsWith(names_[0])) << focused().toStdString();
    press(Qt::Key_PageUp);
    press(Qt::Key_PageUp);
    press(Qt::Key_PageUp);
    EXPECT_TRUE(focused().startsWith(names_[1])) << focused().toStdString();
    press(Qt::Key_Return);
    EXPECT_EQ(app_->tabBarController()->selectedStack()->topScreen()->title(), names_[1]);
}

TEST_F(ReorderWindowTest, EscapeLeavingAndLosingTheWindowEndADrag) {
    openCards(4);
    hold(middleOfRow(1));
    drag(middleOfRow(1), middleOfRow(0));
    EXPECT_EQ(shown(), "1023");
    press(Qt::Key_Down);
    EXPECT_EQ(offset(), 0) << "keys do not move the list under it";
    press(Qt::Key_Escape);
    EXPECT_FALSE(dashboard().isDragging());
    EXPECT_EQ(shown(), "0123");
    drag(middleOfRow(0), middleOfRow(2));
    EXPECT_EQ(shown(), "0123");
    release(middleOfRow(2));
    ASSERT_TRUE(test::waitUntil([this] { return isStill(); }));
    EXPECT_EQ(kept(), "0123");
    EXPECT_EQ(app_->tabBarController()->selectedStack()->count(), 1);

    hold(middleOfRow(1));
    drag(middleOfRow(1), middleOfRow(0));
    press(Qt::Key_2, Qt::ControlModifier);
    EXPECT_TRUE(isStill());
    EXPECT_EQ(kept(), "1023");
    release(middleOfRow(0));
    press(Qt::Key_1, Qt::ControlModifier);
    ASSERT_TRUE(waitForScreen("1@1 0@188 2@375"));

    hold(middleOfRow(1));
    drag(middleOfRow(1), middleOfRow(2));
    QWindow other;
    other.show();
    other.requestActivate();
    ASSERT_TRUE(test::waitUntil([this] { return !window_->isActive(); }));
    EXPECT_TRUE(isStill());
    EXPECT_EQ(kept(), "1203");
    release(middleOfRow(2));
    window_->requestActivate();
    ASSERT_TRUE(test::waitUntil([this] { return window_->isActive(); }));

    // The window closes in the middle of a drag.
    hold(middleOfRow(0));
    drag(middleOfRow(0), middleOfRow(1));
    window_.reset();
    EXPECT_EQ(kept(), "2103");
}

TEST_F(ReorderWindowTest, TheListIsScrolledWhereItWasWhenItHasBeenRead) {
    openCards(6);
    relaunch([this] {
        dashboard().restoreTimeScope(QVTimeScope::Month);
        dashboard().restoreScrollOffset(250);
    });
    ASSERT_TRUE(test::waitUntil([this] { return shown() == "012345"; }));
    ASSERT_TRUE(waitForScreen("1@-62 2@125 3@312 4@499"));
    EXPECT_EQ(dashboard().scrollOffset(), 250);
    EXPECT_EQ(dashboard().selectedTimeScope(), QVTimeScope::Month);
    relaunch([this] { dashboard().restoreScrollOffset(90'000); });
    ASSERT_TRUE(test::waitUntil([this] { return shown() == "012345"; }));
    ASSERT_TRUE(waitForScreen(QStringLiteral("3@%1 4@%2 5@%3")
                                  .arg(kTableHeight - 565)
                                  .arg(kTableHeight - 378)
                                  .arg(kTableHeight - 191)));
}

/// Pictures of a drag; kept in the folder that QELVAR_TEST_PICTURES names, for who wants to look at them.
class DragPictures : public ReorderWindowTest, public testing::WithParamInterface<const char*> {};

TEST_P(DragPictures, TheCardHangsAtThePointerAboveTheTable) {
    environment_->setLocale(GetParam());
    std::vector<VSSamplePtr> samples;
    for (int day = 25; day <= 31; ++day) {
        const auto start = test::date("2020-03-" + std::to_string(day) + "T08:30");
        samples.push_back(std::make_shared<const VSQuantitySample>(
            VSObjectType::dataTypeWithCode(VSCode::StepCount),
            VSQuantity(VSUnit::fromString("count"), 900.0 * (day - 22)), start, start));
        samples.push_back(std::make_shared<const VSQuantitySample>(
            VSObjectType::dataTypeWithCode(VSCode::HeartRate),
            VSQuantity(VSUnit::fromString("count/min"), 40.0 + 2 * day), start, start));
    }
    ASSERT_TRUE(store_->saveObjectsAndWait(samples).ok());
    openCards(5);
    for (const QSize size : {QSize(375, 667), QSize(900, 700)}) {
        window_->resize(size);
        ASSERT_TRUE(test::waitUntil([&] { return dashboard().tableGeometry().width == size.width(); }));
        ASSERT_TRUE(waitForCards(3));
        const QPoint from = middleOfRow(1, size.width() / 4), to = from - QPoint(0, 130);
        hold(from);
        drag(from, to);
        ASSERT_TRUE(test::waitUntil([this] { return !dashboard().isMoving(); }));
        ASSERT_TRUE(waitForCards(3));
        const QImage picture = window_->grabWindow();
        if (const QByteArray folder = qgetenv("QELVAR_TEST_PICTURES"); !folder.isEmpty())
            picture.save(QString::fromLocal8Bit(folder) +
                         QStringLiteral("/drag-%1-%2.png").arg(GetParam()).arg(size.width()));
        const QRectF frame = draggingView()->mapRectToScene(draggingView()->boundingRect());
        // It is drawn there, and above it the table is as it was.
        EXPECT_EQ(picture.pixelColor(size.width() / 2, qRound(frame.top() - 2)), QColor(Qt::white));
        EXPECT_NE(picture.pixelColor(size.width() / 2, qRound(frame.top() + 8)), QColor(Qt::white));
        EXPECT_NEAR(frame.center().x(), size.width() / 2.0, 0.01);
        EXPECT_NEAR(frame.center().y(), to.y(), 0.01);
        EXPECT_NEAR(frame.height(), 187 * 1.05, 0.01);
        press(Qt::Key_Escape);
        release(to);
        ASSERT_TRUE(test::waitUntil([this] { return isStill(); }));
    }
}

INSTANTIATE_TEST_SUITE_P(LeftToRightAndRightToLeft, DragPictures, testing::Values("en_US", "ar_EG"));

}  // namespace
