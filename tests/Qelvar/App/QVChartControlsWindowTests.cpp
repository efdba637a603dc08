#include <gtest/gtest.h>

#include <QAccessible>
#include <QQmlComponent>
#include <QQuickItem>
#include <QQuickView>
#include <QTest>
#include <mutex>

#include "PictureTestSupport.h"
#include "Platform/IconItem.h"
#include "Platform/Localization.h"
#include "Platform/TextScale.h"
#include "Platform/UserDefaults.h"
#include "Qelvar/Charts/QVTimeScopeControl.h"
#include "Qelvar/DataProviders/QVUserDefaults.h"
#include "Qelvar/InteractiveCharts/QVInteractiveChartCompareSheetViewController.h"
#include "QtTestSupport.h"
#include "TestSupport.h"
#include "WindowTexts.h"

namespace {

using Sheet = QVInteractiveChartCompareSheetViewController;
using Groups = Sheet::Groups;

// A screen as one that has a time scope control and opens a sheet.
constexpr const char* kHost = R"(
import QtQuick
FocusScope {
    id: root
    property var presentation: null
    property var control: null
    focus: true
    LayoutMirroring.enabled: Application.layoutDirection === Qt.RightToLeft
    LayoutMirroring.childrenInherit: true
    Rectangle { anchors.fill: parent; color: SystemStyle.groupedBackground }
    Loader {
        id: loader
        objectName: "control"
        width: parent.width
        focus: true
        Component.onCompleted: setSource(root.control.view, { control: root.control, focus: true })
    }
    SheetView { objectName: "sheet"; presentation: root.presentation }
})";

QStringList& complaints() {
    static QStringList lines;
    return lines;
}

struct Delegate : QVInteractiveChartCompareSheetViewControllerDelegate {
    void compareSheetViewControllerWillDismissWithSelectedGroups(Sheet&, const Groups& selectedGroups,
                                                                 bool) override {
        ++calls;
        selected = selectedGroups;
    }
    int calls = 0;
    Groups selected;
};

class ChartControlsWindowTest : public testing::Test {
 protected:
    ChartControlsWindowTest() {
        static std::once_flag once;
        std::call_once(once, [] {
            QQuickWindow::setGraphicsApi(QSGRendererInterface::Software);
            qmlRegisterType<platform::IconItem>("Qelvar.Items", 1, 0, "Icon");
        });
        complaints().clear();
        previousHandler_ =
            qInstallMessageHandler([](QtMsgType type, const QMessageLogContext&, const QString& line) {
                if (type != QtDebugMsg && type != QtInfoMsg && !line.contains("XDG_RUNTIME_DIR"))
                    complaints() << line;
            });
        platform::UserDefaults::setStandard(
            std::make_unique<platform::UserDefaults>(folder_.path() / "defaults.json"));
        store_ = *VSHealthStore::open(folder_.path() / "store");
        QVUserDefaults::sharedDefaults().setHealthStore(store_);
        manager_ = std::make_shared<QVControllerManager>(store_);
    }
    ~ChartControlsWindowTest() override {
        view_.reset();
        presentation_.dismiss(false);
        platform::TextScale::shared().set(1);
        QVUserDefaults::sharedDefaults().setHealthStore(nullptr);
        environment_->setLocale("en_US");
        platform::loadTranslations();
        qInstallMessageHandler(previousHandler_);
        EXPECT_TRUE(complaints().isEmpty()) << complaints().join('\n').toStdString();
    }

    void open(const char* locale, int style, QSize size = {375, 667}) {
        view_.reset();
        environment_->setLocale(locale);
        platform::loadTranslations();
        control_ = QVTimeScopeControl::controlWithStyle(
            style, {QVTimeScope::Day, QVTimeScope::Week, QVTimeScope::Month, QVTimeScope::Year});
        view_ = std::make_unique<QQuickView>();
        view_->setResizeMode(QQuickView::SizeRootObjectToView);
        view_->resize(size);
        QQmlComponent component(view_->engine());
        component.setData(kHost, QUrl("qrc:/Qelvar/Host.qml"));
        QObject* root =
            component.createWithInitialProperties({{"presentation", QVariant::fromValue(&presentation_)},
                                                   {"control", QVariant::fromValue(control_.get())}});
        ASSERT_TRUE(root) << component.errorString().toStdString();
        view_->setContent(QUrl("qrc:/Qelvar/Host.qml"), nullptr, root);
        view_->show();
        ASSERT_TRUE(test::waitUntil([this] { return view_->isActive(); }));
    }

    Sheet* present(const Groups& selected, const Groups& all, bool animated = true) {
        auto sheet = std::make_unique<Sheet>(selected, all, manager_);
        sheet->setDelegate(delegate_);
        Sheet* result = sheet.get();
        presentation_.present(std::move(sheet), animated);
        EXPECT_TRUE(test::waitUntil([this] { return sheetProperty("opened"); }));
        // Two frames: what the first laid out may bring new rows.
        int frames = 0;
        const auto connection =
            QObject::connect(view_.get(), &QQuickWindow::afterAnimating, view_.get(), [&] {
                ++frames;
                view_->update();
            });
        view_->update();
        EXPECT_TRUE(test::waitUntil([&] { return frames >= 3; }));
        QObject::disconnect(connection);
        return result;
    }
    bool sheetProperty(const char* name) {
        return view_->rootObject()->findChild<QObject*>("sheet")->property(name).toBool();
    }
    bool waitUntilGone() {
        return test::waitUntil([this] { return !sheetProperty("visible"); });
    }
    void press(Qt::Key key) { QTest::keyClick(view_.get(), key); }
    // What a screen reader says of the item that has the keyboard.
    QAccessibleInterface* focused() const {
        return QAccessible::queryAccessibleInterface(view_->activeFocusItem());
    }
    QString focusedName() const { return focused() ? focused()->text(QAccessible::Name) : QString(); }
    QString focusedDescription() const {
        return focused() ? focused()->text(QAccessible::Description) : QString();
    }
    bool focusedIsCheckBox() const { return focused() && focused()->role() == QAccessible::CheckBox; }
    bool focusedIsChecked() const { return focusedIsCheckBox() && focused()->state().checked; }
    QQuickItem* shownText(const QString& text) const {
        QList<std::pair<QQuickItem*, QRectF>> texts;
        test::collectTexts(view_->contentItem(), QRectF(QPointF(), QSizeF(view_->size())), texts);
        for (const auto& [item, rect] : texts)
            if (item->property("text").toString() == text) return item;
        ADD_FAILURE() << "not shown: " << text.toStdString();
        return nullptr;
    }
    static QRectF sceneRect(const QQuickItem* item) {
        if (!item) return {};
        return item->mapRectToScene(QRectF(0, 0, item->width(), item->height()));
    }
    static Groups groups(int from, int count) {
        const auto& all = VSDataUnitGroupController::shared().allDataUnitGroups();
        return {all.begin() + from, all.begin() + from + count};
    }

    test::FixedEnvironment environment_{"2020-03-31T20:00"};
    test::TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
    std::shared_ptr<QVControllerManager> manager_;
    platform::SheetPresentation presentation_;
    std::shared_ptr<Delegate> delegate_ = std::make_shared<Delegate>();
    std::unique_ptr<QVTimeScopeControl> control_;
    std::unique_ptr<QQuickView> view_;
    QtMessageHandler previousHandler_ = nullptr;
};

TEST_F(ChartControlsWindowTest, BothLooksOfTheTimeScopeControlArePickedByKeyAndTouch) {
    for (const int style : {0, 1}) {
        SCOPED_TRACE(style);
        open("en_US", style);
        EXPECT_EQ(focusedName(), "Time scope, Day");
        press(Qt::Key_Right);
        press(Qt::Key_Right);
        EXPECT_EQ(focusedName(), "Time scope, Month");
        press(Qt::Key_Left);
        press(Qt::Key_Left);
        press(Qt::Key_Left);
        EXPECT_EQ(control_->selectedTimeScope(), QVTimeScope::Day) << "no way round";
        const auto middle = [&](const char* text) { return sceneRect(shownText(text)).center().toPoint(); };
        QTest::mouseClick(view_.get(), Qt::LeftButton, {}, middle("Year"));
        EXPECT_EQ(control_->selectedTimeScope(), QVTimeScope::Year);
        EXPECT_EQ(shownText("Year")->property("color").value<QColor>(), QColor(Qt::white));
        EXPECT_NE(shownText("Week")->property("color").value<QColor>(), QColor(Qt::white));
        const auto isChecked = [&](const char* text) {
            auto* interface = QAccessible::queryAccessibleInterface(shownText(text)->parentItem());
            EXPECT_EQ(interface->role(), QAccessible::RadioButton);
            return interface->state().checked;
        };
        EXPECT_TRUE(isChecked("Year"));
        EXPECT_FALSE(isChecked("Week"));
        test::keepPicture(*view_, style == 1 ? "pills" : "bar");

        open("ar_EG", style);
        EXPECT_GT(sceneRect(shownText(QString::fromUtf8("يوم"))).x(),
                  sceneRect(shownText(QString::fromUtf8("سنة"))).x());
        press(Qt::Key_Left);
        EXPECT_EQ(control_->selectedTimeScope(), QVTimeScope::Week) << "the next lies to the left";
        test::keepPicture(*view_, style == 1 ? "pills-ar" : "bar-ar");
    }
}

TEST_F(ChartControlsWindowTest, TheCompareSheetIsUsedByKeyboardAlone) {
    open("en_US", 1);
    const Groups all = groups(0, 25);
    Sheet* sheet = present({all[1]}, all);
    EXPECT_EQ(focusedName(), all[0]->displayName());
    EXPECT_TRUE(focusedIsCheckBox());
    EXPECT_FALSE(focusedIsChecked());
    press(Qt::Key_Space);
    EXPECT_TRUE(focusedIsChecked());
    press(Qt::Key_Down);
    EXPECT_TRUE(focusedIsChecked());
    press(Qt::Key_Space);
    EXPECT_FALSE(focusedIsChecked());
    press(Qt::Key_End);
    EXPECT_EQ(focusedName(), all[24]->displayName());
    press(Qt::Key_Space);
    press(Qt::Key_Home);
    EXPECT_EQ(focusedName(), all[0]->displayName());

    // The Tab key stays inside, and reaches the buttons.
    QStringList reached;
    for (int i = 0; i < 6; ++i) {
        press(Qt::Key_Tab);
        reached << focusedName();
    }
    EXPECT_TRUE(reached.contains("Select All")) << reached.join('|').toStdString();
    EXPECT_TRUE(reached.contains("Done")) << reached.join('|').toStdString();
    EXPECT_FALSE(reached.filter("Time scope").size()) << "it is beneath the sheet";
    for (int i = 0; i < 6 && focusedName() != "Select All"; ++i) press(Qt::Key_Tab);
    press(Qt::Key_Return);
    EXPECT_EQ(sheet->title(), "20 Selected");
    for (int i = 0; i < 6 && !focusedIsCheckBox(); ++i) press(Qt::Key_Tab);
    press(Qt::Key_End);
    press(Qt::Key_Up);
    EXPECT_EQ(focusedName(), all[23]->displayName());
    press(Qt::Key_Space);
    EXPECT_FALSE(focusedIsChecked()) << "no more can be ticked";
    EXPECT_EQ(focusedDescription(), sheet->limitText());
    press(Qt::Key_Down);
    EXPECT_TRUE(focusedIsChecked());
    press(Qt::Key_Space);
    EXPECT_FALSE(focusedIsChecked());

    press(Qt::Key_Return);
    EXPECT_EQ(delegate_->calls, 1);
    EXPECT_EQ(delegate_->selected, Groups(all.begin(), all.begin() + 19));
    ASSERT_TRUE(waitUntilGone());
    EXPECT_EQ(focusedName(), "Time scope, Day") << "the keyboard is where it was";

    present({}, all);
    press(Qt::Key_Space);
    press(Qt::Key_Escape);
    ASSERT_TRUE(waitUntilGone());
    EXPECT_EQ(delegate_->calls, 1) << "left without a change";
    EXPECT_EQ(presentation_.screen(), nullptr);
}

TEST_F(ChartControlsWindowTest, TheCompareSheetIsUsedByTouch) {
    open("en_US", 0);
    const Groups all = groups(0, 4);
    Sheet* sheet = present({}, all);
    const auto tap = [&](const QString& text) {
        QTest::mouseClick(view_.get(), Qt::LeftButton, {}, sceneRect(shownText(text)).center().toPoint());
    };
    tap(all[2]->displayName());
    EXPECT_TRUE(sheet->selectionStatuses()[2].selected);
    EXPECT_EQ(sheet->title(), "1 Selected");
    tap("Select All");
    EXPECT_EQ(sheet->title(), "4 Selected");
    tap(all[0]->displayName());
    QTest::mouseClick(view_.get(), Qt::LeftButton, {}, {2, 300});
    EXPECT_EQ(delegate_->calls, 0) << "beside the sheet";
    EXPECT_TRUE(sheetProperty("opened"));
    tap("Done");
    EXPECT_EQ(delegate_->selected, (Groups{all[1], all[2], all[3]}));
    EXPECT_TRUE(waitUntilGone());
}

// At a small phone's width and at a phone's, also with larger texts: nothing is cut, nothing overlaps, all is
// inside the sheet.
TEST_F(ChartControlsWindowTest, TheCompareSheetFitsInEveryLanguage) {
    struct Window {
        QSize size;
        double textScale;
        std::vector<int> rows;
    };
    for (const char* locale : {"en_US", "de_DE", "ar_EG", "hi_IN"}) {
        for (const auto& [size, textScale, counts] :
             {Window{{320, 480}, 1, {0, 3, 25}}, Window{{375, 667}, 1, {25}}, Window{{900, 700}, 1, {25}},
              Window{{320, 568}, 2, {0, 25}}, Window{{375, 667}, 2, {3, 25}}}) {
            platform::TextScale::shared().set(textScale);
            open(locale, 0, size);
            if (HasFatalFailure()) return;
            for (const int rows : counts) {
                const QString name =
                    QString("compare-%1-%2-%3-%4").arg(locale).arg(size.width()).arg(textScale).arg(rows);
                SCOPED_TRACE(name.toStdString());
                // Results and nutrients have the longest names.
                const Groups all = groups(rows == 25 ? 22 : 0, rows);
                Sheet* sheet =
                    present(rows == 25 ? Groups(all.begin() + 2, all.begin() + 22) : all, all, false);
                EXPECT_EQ(sceneRect(shownText(sheet->selectAllTitle())).x() >
                              sceneRect(shownText(sheet->doneTitle())).x(),
                          platform::isRightToLeft());
                if (rows == 0) {
                    EXPECT_TRUE(
                        QRectF(QPointF(), QSizeF(size)).contains(sceneRect(shownText(sheet->emptyText()))));
                }
                auto* popup = view_->rootObject()->findChild<QObject*>("sheet");
                test::expectTextsFit(*view_, qvariant_cast<QQuickItem*>(popup->property("contentItem")),
                                     name);
                if (rows == 3 && QByteArray(locale) != "de_DE" && QByteArray(locale) != "hi_IN") {
                    EXPECT_TRUE(
                        test::matchesPicture(view_->grabWindow(), "sheets/" + name.toStdString(), 12, 0.01));
                }
                presentation_.dismiss(false);
            }
        }
    }
}

}  // namespace
