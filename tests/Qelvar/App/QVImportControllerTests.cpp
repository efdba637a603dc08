#include "Qelvar/App/QVImportController.h"

#include <gtest/gtest.h>

#include <QSignalSpy>
#include <fstream>

#include "Platform/Localization.h"
#include "Qelvar/App/QVQuitController.h"
#include "QtTestSupport.h"
#include "TestSupport.h"

namespace {

namespace fs = std::filesystem;
using State = QVImportController::State;

class ImportControllerTest : public testing::Test {
 protected:
    ImportControllerTest() {
        platform::loadTranslations();
        store_ = *VSHealthStore::open(folder_.path() / "store");
    }

    /// A document of so many heart rates, the first `bad` of them with a value that is no number.
    std::filesystem::path document(const char* name, int records, int bad = 0) {
        const std::filesystem::path path = folder_.path() / name;
        std::ofstream file(path);
        file << "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<HealthData locale=\"en_US\">\n";
        for (int i = 0; i < records; ++i) {
            char date[32];
            std::snprintf(date, sizeof date, "2020-03-%02d %02d:%02d:00 +0100", 1 + i / 1440 % 28,
                          i / 60 % 24, i % 60);
            file << "<Record type=\"VSQuantityTypeIdentifierHeartRate\" sourceName=\"Watch\" "
                    "unit=\"count/min\" creationDate=\""
                 << date << "\" startDate=\"" << date << "\" endDate=\"" << date << "\" value=\""
                 << (i < bad ? "fast" : std::to_string(60 + i % 40)) << "\"/>\n";
        }
        file << "</HealthData>\n";
        return path;
    }
    static bool waitForEnd(QVImportController& controller) {
        return test::waitUntil([&controller] { return controller.state() == State::Finished; });
    }
    size_t count() const {
        return store_->samples(VSObjectType::dataTypeWithCode(VSCode::HeartRate), VSPredicate(), 0, {})
            ->size();
    }

    test::FixedEnvironment environment_{"2020-03-31T20:00"};
    test::TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
};

TEST_F(ImportControllerTest, SaysWhatItReadAddedHadAndRefused) {
    QVImportController controller(store_);
    EXPECT_EQ(controller.state(), State::Idle);
    const auto file = document("records.xml", 50, 3);
    controller.importUrls({QUrl::fromLocalFile(QString::fromStdString(file.string()))});
    EXPECT_EQ(controller.state(), State::Running);
    EXPECT_EQ(controller.buttonTitles(), (QStringList{"Continue in Background", "Cancel"}));
    ASSERT_TRUE(waitForEnd(controller));
    EXPECT_EQ(controller.title(), "Records Imported");
    EXPECT_EQ(controller.rowTitles(), (QStringList{"Records read", "Added", "Already here", "Refused"}));
    EXPECT_EQ(controller.rowValues(), (QStringList{"50", "47", "0", "3"}));
    ASSERT_EQ(controller.refusals().size(), 3);
    EXPECT_TRUE(controller.refusals()[0].contains("records.xml:3")) << controller.refusals()[0].toStdString();
    EXPECT_EQ(controller.fraction(), 1);
    EXPECT_EQ(count(), 47u);

    controller.pressButton(0);
    EXPECT_EQ(controller.state(), State::Idle);
    EXPECT_TRUE(controller.rowTitles().isEmpty());
    controller.importFiles({file});
    ASSERT_TRUE(waitForEnd(controller));
    EXPECT_EQ(controller.title(), "Nothing New to Import");
    EXPECT_EQ(controller.rowValues(), (QStringList{"50", "0", "47", "3"}));
    EXPECT_EQ(count(), 47u);
}

TEST_F(ImportControllerTest, ManyRefusalsAreCounted) {
    QVImportController controller(store_);
    controller.importFiles({document("bad.xml", 1200, 1200)});
    ASSERT_TRUE(waitForEnd(controller));
    EXPECT_EQ(controller.rowValues(), (QStringList{"1,200", "0", "0", "1,200"}));
    EXPECT_GT(controller.refusals().size(), 1);
    EXPECT_LT(controller.refusals().size(), 100);
    EXPECT_TRUE(controller.refusals().last().contains("more"));
}

TEST_F(ImportControllerTest, CancelLeavesNoTrace) {
    QVImportController controller(store_);
    controller.importFiles({document("records.xml", 40'000)});
    controller.pressButton(1);
    EXPECT_EQ(controller.state(), State::Cancelling);
    controller.importFiles({document("other.xml", 1)});
    EXPECT_EQ(controller.state(), State::Cancelling) << "one at a time";
    ASSERT_TRUE(waitForEnd(controller));
    EXPECT_EQ(controller.title(), "Import Canceled");
    EXPECT_FALSE(controller.message().isEmpty());
    EXPECT_EQ(count(), 0u);
    {
        QVImportController closed(store_);
        closed.importFiles({document("records.xml", 40'000)});
    }
    EXPECT_EQ(count(), 0u) << "closing the window cancels too";
}

TEST_F(ImportControllerTest, ProgressIsToldWhileItRuns) {
    QVImportController controller(store_);
    QSignalSpy changed(&controller, &QVImportController::changed);
    controller.importFiles({document("records.xml", 2'000)});
    QString message;
    ASSERT_TRUE(test::waitUntil([&] {
        if (controller.isRunning() && controller.fraction() >= 0) message = controller.message();
        return controller.state() == State::Finished;
    }));
    EXPECT_GE(changed.size(), 3) << "started, progressed, ended";
    EXPECT_TRUE(message.contains("MB") && message.contains("records")) << message.toStdString();
}

TEST_F(ImportControllerTest, AFileThatIsRefusedSaysWhy) {
    QVImportController controller(store_);
    const auto path = folder_.path() / "broken.xml";
    std::ofstream(path) << "<?xml version=\"1.0\"?><HealthData><Record";
    controller.importFiles({path});
    ASSERT_TRUE(waitForEnd(controller));
    EXPECT_EQ(controller.title(), "Import Failed");
    EXPECT_TRUE(controller.message().contains("broken.xml")) << controller.message().toStdString();
    controller.importFiles({folder_.path() / "missing.xml"});
    ASSERT_TRUE(waitForEnd(controller));
    EXPECT_TRUE(controller.fileLines().value(0).contains("missing.xml"));
    EXPECT_EQ(count(), 0u);
}

TEST_F(ImportControllerTest, EachFileThatWasDroppedIsMentioned) {
    const auto table = folder_.path() / "table.xml";  // whatever it is called
    std::ofstream(table) << "type,start,value\nHeartRate,2020-03-01,72\n";
    const auto good = document("records.xml", 5);
    const auto url = [](const fs::path& path) { return QUrl::fromLocalFile(QString::fromStdString(path)); };
    QVImportController controller(store_);
    controller.importUrls(
        {url(good), url(table), url(folder_.path()), QUrl("https://example.org/export.xml")});
    ASSERT_TRUE(waitForEnd(controller));
    EXPECT_EQ(controller.title(), "Not All Files Were Imported");
    EXPECT_EQ(count(), 5u);
    const QString lines = controller.details().join('\n');
    for (const char* line : {"records.xml: imported", "table.xml: not imported; it looks like a table (CSV)",
                             "because it is a folder", "export.xml: not imported, because it is not on this"})
        EXPECT_TRUE(lines.contains(line)) << lines.toStdString();
    controller.importUrls({url(table)});
    ASSERT_TRUE(waitForEnd(controller));
    EXPECT_EQ(controller.title(), "Import Failed");
    EXPECT_TRUE(controller.message().contains(".zip")) << "what was expected";
    EXPECT_EQ(controller.details().size(), 1);
}

TEST_F(ImportControllerTest, ItSaysForWhomItWaitsAndCanBePutAsideAndCancelledMeanwhile) {
    auto held = store_->beginImport("others.zip");
    ASSERT_TRUE(held.ok());
    QVImportController controller(store_);
    QVQuitController quit({&controller});
    EXPECT_TRUE(quit.mayQuit());
    controller.importFiles({document("records.xml", 5)});
    ASSERT_TRUE(test::waitUntil([&] { return controller.title() == "Waiting to Import"; }));
    EXPECT_TRUE(controller.message().contains("others.zip")) << controller.message().toStdString();
    EXPECT_EQ(controller.fraction(), -1);
    controller.leave();
    EXPECT_TRUE(controller.isAside() && !controller.isShown() && controller.isWorking());
    EXPECT_FALSE(quit.mayQuit());
    EXPECT_TRUE(quit.isShown());
    controller.importUrls({QUrl("file:///late.xml")});
    EXPECT_TRUE(controller.isShown() && controller.message().contains("late.xml"));
    controller.cancel();
    ASSERT_TRUE(waitForEnd(controller)) << "while the other still holds the store";
    EXPECT_FALSE(quit.isShown()) << "nothing is left to give up";
    controller.importFiles({document("records.xml", 5)});
    ASSERT_TRUE(test::waitUntil([&] { return controller.title() == "Waiting to Import"; }));
    *held = nullptr;
    ASSERT_TRUE(waitForEnd(controller));
    EXPECT_EQ(count(), 5u);
}

}  // namespace
