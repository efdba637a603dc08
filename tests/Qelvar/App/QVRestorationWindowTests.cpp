#include <fstream>

#include "Platform/SystemEvents.h"
#include "Qelvar/Import/QVRecordsImporter.h"
#include "WindowTest.h"

namespace {

using Groups = QVDashboardViewController::Groups;

/// Cards with and without records, of two sources, up to the day after the test's.
class RecordsWindowTest : public test::WindowTest {
 protected:
    RecordsWindowTest() {
        const auto path = folder_.path() / "records.xml";
        std::ofstream file(path);
        file << "<?xml version=\"1.0\"?>\n<HealthData locale=\"en_US\">\n";
        for (int day = 1; day <= 32; ++day)
            for (const char* source : {"Watch", "Phone"}) {
                record(file, "StepCount", "count", source, day, 700.0 + 31 * day);
                record(file, "HeartRate", "count/min", source, day, 60 + day);
                record(file, "BodyMass", "kg", source, day, 70 + 0.1 * day);
            }
        file << "</HealthData>\n";
        file.close();
        const auto report = QVRecordsImporter(store_).importFiles({path});
        EXPECT_TRUE(report.ok()) << report.error().message;
        EXPECT_TRUE(report->refusals.empty()) << report->refusals.front().description();
    }
    static void record(std::ostream& file, const char* type, const char* unit, const char* source, int day,
                       double value) {
        char date[40];
        std::snprintf(date, sizeof date, "2020-%02d-%02d %02d:30:00 +0200", day > 31 ? 4 : 3,
                      day > 31 ? day - 31 : day, *source == 'W' ? 7 : 9);
        file << "<Record type=\"VSQuantityTypeIdentifier" << type << "\" sourceName=\"" << source
             << "\" unit=\"" << unit << "\" startDate=\"" << date << "\" endDate=\"" << date
             << "\" creationDate=\"" << date << "\" value=\"" << value << "\"/>\n";
    }
    Groups someGroups() const {
        return {group(VSGroupID::Steps), group(VSGroupID::HeartRate), group(bodyMassID()),
                group(VSGroupID::BloodPressure), group(VSGroupID::StandHours)};
    }
    static int bodyMassID() {
        const auto* type = VSObjectType::dataTypeWithCode(VSCode::BodyMass);
        return VSDataUnitGroupController::shared().dataUnitGroupForType(type)->dataUnitGroupID();
    }
    QVDashboardViewController& dashboard() { return *app_->dashboard(); }
    QVTabBarController& tabs() { return *app_->tabBarController(); }
    QString place() {
        QStringList titles;
        for (int i = 0; i < tabs().selectedStack()->count(); ++i)
            titles << tabs().selectedStack()->screenAt(i)->title();
        return titles.join(" > ");
    }
    /// The sources of steps, most preferred first.
    std::vector<VSSource> order() {
        test::Promise<std::vector<VSSource>> answer;
        app_->controllerManager()->dataProviderOrderController().orderedDataProviderSourcesForDataType(
            VSObjectType::dataTypeWithCode(VSCode::StepCount),
            [&answer](const auto& sources, const auto*) { answer.set(sources.value()); });
        return answer.wait().value();
    }
    QImage picture() {
        EXPECT_TRUE(settle());
        return window_->grabWindow().convertToFormat(QImage::Format_RGB32);
    }
    /// Comes to look like that; else both pictures are kept.
    testing::AssertionResult comesToLookLike(const QImage& expected, const std::string& name) {
        QImage actual;
        if (test::waitUntil([&] { return (actual = picture()) == expected; }))
            return testing::AssertionSuccess();
        const auto folder = std::filesystem::temp_directory_path() / "qelvar-pictures";
        std::filesystem::create_directories(folder);
        expected.save(QString::fromStdString((folder / (name + "-expected.png")).string()));
        actual.save(QString::fromStdString((folder / (name + "-actual.png")).string()));
        return testing::AssertionFailure() << name << " looks different: see " << folder;
    }
};

TEST_F(RecordsWindowTest, TheNextSessionBeginsWhereThisOneEnded) {
    open(someGroups());
    Groups groups = someGroups();
    std::swap(groups[0], groups[2]);
    app_->controllerManager()->dashboardDataUnitGroupsController().setDataUnitGroupsForDashboard(groups);
    auto sources = order();
    ASSERT_EQ(sources.size(), 2u);
    std::swap(sources[0], sources[1]);
    app_->controllerManager()->dataProviderOrderController().setOrderedDataProviderSources(
        sources, VSObjectType::dataTypeWithCode(VSCode::StepCount));
    dashboard().timeScopeControl()->pick(2);
    ASSERT_TRUE(settle());
    dashboard().restoreScrollOffset(250);
    ASSERT_TRUE(settle());
    const QImage scrolled = picture();
    dashboard().selectRow(1);
    app_->openLink("qelvar://HealthDataTab?DataCategory=2&DataUnit=59");
    const QImage deep = picture();

    relaunch();
    EXPECT_EQ(place(), "Health Data > Fitness > Steps");
    EXPECT_TRUE(comesToLookLike(deep, "deep"));
    EXPECT_FALSE(dashboard().isVisible());
    press(Qt::Key_Escape);
    ASSERT_TRUE(settle());
    EXPECT_EQ(place(), "Health Data > Fitness");
    tabs().tap(0);
    EXPECT_EQ(place(), "Dashboard > Heart Rate");
    ASSERT_TRUE(settle());
    tabs().tap(0);
    EXPECT_TRUE(comesToLookLike(scrolled, "scrolled"));
    EXPECT_EQ(dashboard().dashboardDataUnitGroups(), groups);
    EXPECT_EQ(dashboard().selectedTimeScope(), QVTimeScope::Month);
    EXPECT_EQ(order(), sources);

    // Where nobody came since, it stays.
    relaunch();
    tabs().tap(2);
    relaunch();
    EXPECT_EQ(place(), "Sources");
    tabs().tap(0);
    EXPECT_TRUE(comesToLookLike(scrolled, "scrolled"));
    app_->controllerManager()->dashboardDataUnitGroupsController().setDataUnitGroupsForDashboard({groups[0]});
    relaunch();
    ASSERT_TRUE(settle());
    EXPECT_EQ(dashboard().scrollOffset(), 0) << "one card is not scrolled";
}

TEST_F(RecordsWindowTest, WhatASavedStateDoesNotSayIsAsAtFirst) {
    open(someGroups());
    const QImage first = picture();
    app_->openLink("qelvar://HealthDataTab?DataCategory=2&DataUnit=59");
    quit();
    std::ifstream file(stateFile_);
    const std::string saved((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    const struct {
        const char *from, *to, *place;
    } changes[] = {
        {"\"Time Scope\":2", "\"Time Scope\":99", "Health Data > Fitness > Steps"},
        {"\"Offset\":0.0", "\"Offset\":-99000.5", "Health Data > Fitness > Steps"},
        {"Detail View Controller Category\":2", "Detail View Controller Category\":2000", "Health Data"},
        {"Data Unit Group\":59", "Data Unit Group\":4294967355", "Health Data > Fitness"},
        {"\"Controller Manager\":\"Controller Manager\",\"Data Unit Group", "\"Data Unit Group",
         "Health Data > Fitness"},
        {"\"Selected Stack\":\"Health", "\"Selected Stack\":\"Wealth", "Dashboard"},
        {"{", "[", "Dashboard"},
    };
    for (const auto& change : changes) {
        SCOPED_TRACE(change.to);
        std::string text = saved;
        ASSERT_NE(text.find(change.from), std::string::npos) << text;
        text.replace(text.find(change.from), strlen(change.from), change.to);
        std::ofstream(stateFile_) << text;
        // The session before is not to write over it.
        const auto kept = folder_.path() / "kept.json";
        std::filesystem::copy_file(stateFile_, kept, std::filesystem::copy_options::overwrite_existing);
        quit();
        std::filesystem::rename(kept, stateFile_);
        relaunch();
        EXPECT_EQ(place(), change.place);
        tabs().setSelectedIndex(0);
        EXPECT_TRUE(comesToLookLike(first, "first"));
    }
}

// The oracle of both: what a change makes of the window is what a start after it shows.

TEST_F(RecordsWindowTest, AnotherLocaleIsShownAsIfItHadAlwaysBeen) {
    open(someGroups());
    const std::vector<std::string> locales{"en_US", "ar_EG", "de_DE", "en_US@hours=h23", "hi_IN", "en_US"};
    std::map<std::string, QImage> fresh;
    QSet<QString> titles;
    for (const std::string& locale : locales) {
        environment_->setLocale(locale);
        relaunch();
        for (const double offset : {0.0, 9000.0}) {
            dashboard().restoreScrollOffset(offset);
            fresh[locale + (offset > 0 ? "-bottom" : "-top")] = picture();
        }
        titles << QVCardsInScene(window_->rootObject())[0]->titleText();
    }
    EXPECT_EQ(titles.size(), 4) << "a language each";
    EXPECT_NE(fresh["en_US-top"], fresh["en_US@hours=h23-top"]);
    for (const std::string& locale : locales) {
        environment_->setLocale(locale);
        platform::SystemEvents::shared().postLocaleChange();
        for (const double offset : {0.0, 9000.0}) {
            dashboard().restoreScrollOffset(offset);
            const std::string name = locale + (offset > 0 ? "-bottom" : "-top");
            EXPECT_TRUE(comesToLookLike(fresh[name], name));
        }
    }
}

TEST_F(RecordsWindowTest, AnotherDayIsShownAsIfItHadBegunWithIt) {
    open(someGroups());
    const auto today = test::date("2020-03-31T23:59:50"), tomorrow = test::date("2020-04-01T00:00:01");
    const auto move = [this](VSDate now, const char* zone) {
        environment_->setTimeZone(zone);
        environment_->setNow(now);
        platform::SystemEvents::shared().postSignificantTimeChange();
    };
    for (int scope = 0; scope < 4; ++scope) {
        SCOPED_TRACE(scope);
        move(tomorrow, "Europe/Copenhagen");
        relaunch([this, scope] { dashboard().timeScopeControl()->pick(scope); });
        const QImage afterMidnight = picture();
        environment_->setTimeZone("America/New_York");
        relaunch();
        const QImage elsewhere = picture();
        EXPECT_NE(afterMidnight, elsewhere);
        environment_->setTimeZone("Europe/Copenhagen");
        environment_->setNow(today);
        relaunch();
        const QImage before = picture();
        EXPECT_NE(afterMidnight, before);

        move(tomorrow, "Europe/Copenhagen");
        EXPECT_TRUE(comesToLookLike(afterMidnight, "midnight"));
        move(tomorrow, "America/New_York");
        EXPECT_TRUE(comesToLookLike(elsewhere, "zone"));
        // While something else is shown, and while it is still loading.
        move(today, "Europe/Copenhagen");
        dashboard().selectRow(0);
        ASSERT_TRUE(settle());
        move(tomorrow, "Europe/Copenhagen");
        ASSERT_TRUE(settle());
        tabs().tap(0);
        EXPECT_TRUE(comesToLookLike(afterMidnight, "pushed"));
        tabs().tap(2);
        move(today, "Europe/Copenhagen");
        tabs().tap(0);
        EXPECT_TRUE(comesToLookLike(before, "hidden"));
    }
}

}  // namespace
