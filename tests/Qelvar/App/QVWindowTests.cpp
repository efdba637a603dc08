#include <QDropEvent>
#include <QMimeData>
#include <QProcess>
#include <fstream>

#include "WindowTest.h"

namespace {

using test::date;

using test::WindowTest;

TEST_F(WindowTest, IsAPhonesAndShowsCardsThatCanBeReadAloud) {
    open({group(VSGroupID::Steps), group(VSGroupID::HeartRate)});
    EXPECT_EQ(window_->size(), QSize(375, 667));
    EXPECT_EQ(window_->title(), "Qelvar");
    const auto cards = QVCardsInScene(window_->rootObject());
    ASSERT_EQ(cards.size(), 2);
    EXPECT_EQ(cards[0]->size(), QSizeF(375, 187));
    QAccessibleInterface* card = QAccessible::queryAccessibleInterface(cards[0]->parentItem());
    ASSERT_TRUE(card);
    EXPECT_EQ(card->role(), QAccessible::Button);
    EXPECT_TRUE(card->text(QAccessible::Name).startsWith("Steps, No Data"))
        << card->text(QAccessible::Name).toStdString();
}

TEST_F(WindowTest, EverythingIsReachedByKeyboard) {
    open({group(VSGroupID::Steps), group(VSGroupID::HeartRate)});
    EXPECT_TRUE(focused().startsWith("Steps")) << focused().toStdString();
    press(Qt::Key_Down);
    EXPECT_TRUE(focused().startsWith("Heart Rate")) << focused().toStdString();
    QStringList reached;
    for (int i = 0; i < 12; ++i) {
        press(Qt::Key_Tab);
        reached << focused();
    }
    for (const char* name : {"Dashboard", "Health Data", "Sources", "Medical ID"})
        EXPECT_TRUE(reached.contains(name)) << reached.join("|").toStdString();

    // The time scope follows the arrows while its control has the keyboard.
    for (int i = 0; i < 12 && !focused().startsWith("Time scope"); ++i) press(Qt::Key_Tab);
    EXPECT_EQ(focused(), "Time scope, Week");
    press(Qt::Key_Right);
    EXPECT_EQ(focused(), "Time scope, Month");
    EXPECT_EQ(app_->controllerManager()->selectedTimeScopeController().selectedTimeScope(),
              QVTimeScope::Month);
    ASSERT_TRUE(waitForCards(2));

    press(Qt::Key_3, Qt::ControlModifier);
    EXPECT_EQ(app_->tabBarController()->selectedIndex(), 2);
    press(Qt::Key_1, Qt::ControlModifier);
    EXPECT_EQ(app_->tabBarController()->selectedIndex(), 0);
}

TEST_F(WindowTest, ACardOpensAndEscapeReturns) {
    open({group(VSGroupID::Steps), group(VSGroupID::HeartRate)});
    auto* stack = app_->tabBarController()->selectedStack();
    press(Qt::Key_Down);
    press(Qt::Key_Return);
    ASSERT_EQ(stack->count(), 2);
    EXPECT_EQ(stack->topScreen()->title(), "Heart Rate");
    const auto isStill = [this] { return !window_->rootObject()->property("busy").toBool(); };
    ASSERT_TRUE(test::waitUntil(isStill));
    press(Qt::Key_Escape);
    EXPECT_EQ(stack->count(), 1);
    ASSERT_TRUE(test::waitUntil(isStill));
    QTest::mouseClick(window_.get(), Qt::LeftButton, {}, QPoint(180, 200));
    EXPECT_EQ(stack->count(), 2);
    ASSERT_TRUE(test::waitUntil(isStill));
}

/// Not a test of its own: what the process does that the next test starts.
TEST(AnotherProcess, SavesAHeartRate) {
    if (!qEnvironmentVariableIsSet("QELVAR_TEST_STORE"))
        GTEST_SKIP() << "WhatAnotherProcessSavesReachesTheCard runs it";
    test::FixedEnvironment environment{"2020-03-31T20:00"};
    const auto store = *VSHealthStore::open(qgetenv("QELVAR_TEST_STORE").toStdString());
    const auto* type = VSObjectType::dataTypeWithCode(VSCode::HeartRate);
    const VSQuantity quantity(VSUnit::fromString("count/min"), 77);
    const auto sample = std::make_shared<const VSQuantitySample>(type, quantity, date("2020-03-31T10:00"),
                                                                 date("2020-03-31T10:00"));
    ASSERT_TRUE(store->saveObjectsAndWait({sample}).ok());
}

TEST_F(WindowTest, WhatAnotherProcessSavesReachesTheCard) {
    open({group(VSGroupID::HeartRate)});
    QProcess other;
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    environment.insert("QELVAR_TEST_STORE", QString::fromStdString((folder_.path() / "store").string()));
    other.setProcessEnvironment(environment);
    other.start(QCoreApplication::applicationFilePath(), {"--gtest_filter=AnotherProcess.*"});
    ASSERT_TRUE(test::waitUntil([&other] { return other.state() == QProcess::NotRunning; }));
    ASSERT_EQ(other.exitCode(), 0) << other.readAllStandardOutput().toStdString();
    EXPECT_TRUE(test::waitUntil([this] {
        const auto cards = QVCardsInScene(window_->rootObject());
        return !cards.isEmpty() && cards[0]->valueText().startsWith("77") && cards[0]->wasPaintedSettled();
    }));
}

/// Every card shows something at each moment, those that are only scrolled to afterwards included.
TEST_F(WindowTest, ANewUnitReachesEveryCardAtOnce) {
    const auto save = [this](VSTypeCode code, const char* unit, double value) {
        return std::make_shared<const VSQuantitySample>(VSObjectType::dataTypeWithCode(code),
                                                        VSQuantity(VSUnit::fromString(unit), value),
                                                        date("2020-03-31T10:00"), date("2020-03-31T10:00"));
    };
    ASSERT_TRUE(store_
                    ->saveObjectsAndWait({save(VSCode::Height, "cm", 178), save(VSCode::BodyMass, "kg", 70),
                                          save(VSCode::BloodPressureSystolic, "mmHg", 120),
                                          save(VSCode::BloodPressureDiastolic, "mmHg", 80),
                                          save(VSCode::StepCount, "count", 12)})
                    .ok());
    const auto& groups = VSDataUnitGroupController::shared();
    const auto ofType = [&groups](VSTypeCode code) {
        return groups.dataUnitGroupForType(VSObjectType::dataTypeWithCode(code));
    };
    const auto* mass = ofType(VSCode::BodyMass);
    const auto* height = ofType(VSCode::Height);
    open({height, group(VSGroupID::BloodPressure), group(VSGroupID::Steps), group(VSGroupID::HeartRate),
          group(VSGroupID::WalkingRunningDistance), mass});
    const auto shown = [this] {
        QStringList texts;
        for (const auto* card : QVCardsInScene(window_->rootObject())) {
            EXPECT_FALSE(card->valueText().isEmpty()) << card->titleText().toStdString();
            texts << card->titleText() + ": " + card->valueText() + ", " + card->secondaryText();
        }
        texts.sort();
        return texts.join('\n').toStdString();
    };
    const auto scroll = [this](Qt::Key key) {
        press(key);
        return settle();
    };
    // Where the list is, and where it is scrolled to, before and after.
    ASSERT_TRUE(scroll(Qt::Key_End));
    const std::string massInPounds = shown();
    EXPECT_NE(massInPounds.find("154.3"), std::string::npos) << massInPounds;
    ASSERT_TRUE(scroll(Qt::Key_Home));
    const std::string inFeet = shown();
    EXPECT_NE(inFeet.find("5 ft 10"), std::string::npos) << inFeet;
    EXPECT_NE(inFeet.find("120/80"), std::string::npos) << inFeet;

    VSUnitController& units = *app_->controllerManager()->unitController();
    const auto choose = [&](const char* unitOfHeight, const char* unitOfMass) {
        units.updatePreferredUnit(VSUnit::fromString(unitOfHeight), height->anyDataUnit());
        units.updatePreferredUnit(VSUnit::fromString(unitOfMass), mass->anyDataUnit());
    };
    choose("cm", "kg");
    const std::string atOnce = shown();
    EXPECT_NE(atOnce.find("178"), std::string::npos) << atOnce;
    EXPECT_EQ(atOnce.find("ft"), std::string::npos) << atOnce;
    EXPECT_NE(atOnce.find("120/80"), std::string::npos) << atOnce;
    ASSERT_TRUE(settle());
    EXPECT_EQ(shown(), atOnce) << "the store says the same";
    ASSERT_TRUE(scroll(Qt::Key_End));
    EXPECT_NE(shown().find("70"), std::string::npos) << shown();
    EXPECT_EQ(shown().find("154"), std::string::npos) << shown();
    choose("ft", "lb");
    EXPECT_EQ(shown(), massInPounds);
    ASSERT_TRUE(scroll(Qt::Key_Home));
    EXPECT_EQ(shown(), inFeet);
}

TEST_F(WindowTest, AnEmptyDashboardOffersToImport) {
    open({});
    EXPECT_TRUE(app_->dashboard()->showsEmptyState());
    EXPECT_TRUE(QVCardsInScene(window_->rootObject()).isEmpty());
    QStringList reached;
    for (int i = 0; i < 8; ++i) {
        press(Qt::Key_Tab);
        reached << focused();
    }
    EXPECT_TRUE(reached.contains(app_->dashboard()->importTitle())) << reached.join("|").toStdString();
    // The dialog's module is there, and it opens.
    emit app_->dashboard()->importRequested();
    const auto* dialog = window_->rootObject()->findChild<QObject*>("importFileDialog");
    ASSERT_TRUE(dialog);
    EXPECT_TRUE(dialog->property("visible").toBool());
    EXPECT_EQ(dialog->property("title").toString(), "Import Records");
}

TEST_F(WindowTest, ADroppedDocumentIsImportedAndTheSheetIsClosedByKeyboard) {
    open({group(VSGroupID::HeartRate)});
    const auto path = folder_.path() / "records.xml";
    std::ofstream(path) << "<?xml version=\"1.0\"?>\n<HealthData locale=\"en_US\"><Record "
                           "type=\"VSQuantityTypeIdentifierHeartRate\" "
                           "sourceName=\"Watch\" unit=\"count/min\" startDate=\"2020-03-31 10:00:00 +0200\" "
                           "endDate=\"2020-03-31 10:00:00 +0200\" creationDate=\"2020-03-31 10:00:00 +0200\" "
                           "value=\"66\"/></HealthData>";
    QMimeData data;
    data.setUrls({QUrl::fromLocalFile(QString::fromStdString(path.string()))});
    QDragEnterEvent enter({100, 300}, Qt::CopyAction, &data, Qt::LeftButton, {});
    QCoreApplication::sendEvent(window_.get(), &enter);
    QDropEvent drop({100, 300}, Qt::CopyAction, &data, Qt::LeftButton, {});
    QCoreApplication::sendEvent(window_.get(), &drop);
    QVImportController& controller = *app_->importController();
    ASSERT_TRUE(
        test::waitUntil([&controller] { return controller.state() == QVImportController::State::Finished; }));
    EXPECT_EQ(controller.rowValues().value(1), "1");
    EXPECT_TRUE(test::waitUntil([this] { return focused() == "Done"; })) << focused().toStdString();
    press(Qt::Key_Return);
    EXPECT_EQ(controller.state(), QVImportController::State::Idle);
    EXPECT_TRUE(test::waitUntil(
        [this] { return QVCardsInScene(window_->rootObject())[0]->valueText().startsWith("66"); }));
}

TEST_F(WindowTest, RightToLeftMirrorsTheTabs) {
    environment_->setLocale("ar_EG");
    open({group(VSGroupID::Steps)});
    QTest::mouseClick(window_.get(), Qt::LeftButton, {}, QPoint(20, 650));
    EXPECT_EQ(app_->tabBarController()->selectedIndex(), 3);
}

TEST_F(WindowTest, PicturesAreTakenOfEveryTabAndScope) {
    open({group(VSGroupID::Steps), group(VSGroupID::HeartRate), group(VSGroupID::FlightsClimbed),
          group(VSGroupID::ActiveEnergy)});
    const auto folder = folder_.path() / "pictures";
    const auto pictures = [&] { return std::move(*QVPictureFolder::open(folder, store_->folder())); };
    ASSERT_TRUE(QVScreenshots(*window_, *app_, pictures()).takeAll());
    for (const char* name : {"dashboard-day", "dashboard-week", "dashboard-month", "dashboard-year",
                             "display-type", "health-data", "sources", "medical-id"})
        EXPECT_TRUE(std::filesystem::exists(folder / (std::string(name) + ".png"))) << name;
    const QImage full(QString::fromStdString((folder / "dashboard-week-full.png").string()));
    EXPECT_EQ(full.width(), 375);
    EXPECT_GT(full.height(), 4 * 187 + 100) << "all cards";
    app_->controllerManager()->dashboardDataUnitGroupsController().setDataUnitGroupsForDashboard({});
    app_->tabBarController()->setSelectedIndex(0);
    ASSERT_TRUE(QVScreenshots(*window_, *app_, pictures()).takeAll());
    EXPECT_TRUE(std::filesystem::exists(folder / "dashboard-empty.png"));
}

}  // namespace
