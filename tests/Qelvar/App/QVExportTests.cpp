#include <fstream>

#include "Platform/SystemEvents.h"
#include "Platform/TextScale.h"
#include "Qelvar/App/QVExportController.h"
#include "Qelvar/App/QVPictureFolder.h"
#include "WindowTest.h"

namespace {

namespace fs = std::filesystem;
using State = QVExportController::State;

/// A desktop that does what it is told.
class Desktop final : public platform::ShareServices {
 public:
    void chooseSaveFile(const QString&, const QString&, SaveHandler handler) override {
        handler(choice, file);
    }
    bool canShowInFolder() const override { return isRich; }
    void showInFolder(const fs::path& shown) override { told = "show " + shown.filename().string(); }
    bool canSendMail() const override { return isRich; }
    void sendMail(const QString& subject, const fs::path& sent) override {
        told =
            "mail " + subject.toStdString() + " " + (fs::exists(sent) ? sent.filename().string() : "nothing");
    }

    bool isRich = true;
    Choice choice = Choice::Chosen;
    fs::path file;
    std::string told;
};

class ExportTest : public test::WindowTest {
 protected:
    ExportTest() {
        platform::loadTranslations();
        qputenv("DBUS_SESSION_BUS_ADDRESS", "unix:path=/nowhere");  // no dialogs of this machine's desktop
    }
    ~ExportTest() override { platform::TextScale::shared().set(1); }
    void saveReadings(int count) {
        std::vector<VSSamplePtr> samples;
        const auto* type = VSObjectType::dataTypeWithCode(VSCode::HeartRate);
        for (int i = 0; i < count; ++i) {
            const VSDate date = test::date("2020-01-01") + std::chrono::minutes(i);
            samples.push_back(
                std::make_shared<VSQuantitySample>(type, VSQuantity(type->canonicalUnit(), 70), date, date));
        }
        ASSERT_TRUE(store_->saveObjectsAndWait(std::move(samples)).ok());
    }
    static bool waitFor(const QVExportController& controller, State state) {
        return test::waitUntil([&] { return controller.state() == state; });
    }
    const fs::path documents_ = folder_.path() / "store" / "documents";
};

TEST_F(ExportTest, OffersWhatTheDesktopCanDoAndCleansUp) {
    saveReadings(2000);
    Desktop desktop;
    desktop.file = folder_.path() / "mine.zip";
    QVExportController controller(std::make_shared<QVControllerManager>(store_), desktop);
    controller.verifyExport();
    EXPECT_EQ(controller.buttonTitles(), (QStringList{"Export", "Cancel"}));
    controller.pressButton(1);
    EXPECT_EQ(controller.state(), State::Idle);

    controller.verifyExport();
    controller.pressButton(0);
    EXPECT_EQ(controller.state(), State::Preparing);
    controller.verifyExport();
    EXPECT_EQ(controller.state(), State::Preparing) << "one at a time";
    controller.leave();
    EXPECT_TRUE(controller.isAside() && controller.isWorking()) << "the window can be used meanwhile";
    QString progress;
    ASSERT_TRUE(test::waitUntil([&] {
        if (controller.fraction() > 0) progress = controller.message();
        return controller.state() == State::Sharing;
    }));
    EXPECT_TRUE(progress.contains("2,000 records") || progress.contains("MB")) << progress.toStdString();
    EXPECT_TRUE(controller.isAside()) << "what is done does not get in the way";
    controller.verifyExport();
    EXPECT_TRUE(controller.isShown());
    EXPECT_EQ(controller.buttonTitles(), (QStringList{"Save As…", "Send by Mail…", "Open Folder", "Done"}));
    controller.leave();
    EXPECT_TRUE(controller.isAside()) << "an archive that was not saved is not thrown away by Escape";
    controller.show();
    controller.pressButton(1);
    EXPECT_EQ(desktop.told, "mail Health data export.zip");
    controller.pressButton(0);
    ASSERT_TRUE(waitFor(controller, State::Sharing));
    EXPECT_EQ(fs::file_size(desktop.file), fs::file_size(documents_ / "export.zip"));
    EXPECT_TRUE(controller.message().contains("mine.zip"));
    controller.pressButton(2);
    EXPECT_EQ(desktop.told, "show mine.zip");
    desktop.file = folder_.path() / "no" / "folder.zip";
    controller.pressButton(0);
    ASSERT_TRUE(waitFor(controller, State::Sharing));
    EXPECT_TRUE(controller.message().startsWith("It could not be saved."));
    desktop.isRich = false;
    EXPECT_EQ(controller.buttonTitles(), (QStringList{"Save As…", "Done"}));
    controller.pressButton(1);
    EXPECT_EQ(controller.state(), State::Idle);
    EXPECT_TRUE(fs::is_empty(documents_));
}

TEST_F(ExportTest, CancelledItSaysNothingMoreFailedItSaysSo) {
    saveReadings(20'000);
    Desktop desktop;
    {
        QVExportController controller(std::make_shared<QVControllerManager>(store_), desktop);
        controller.verifyExport();
        controller.pressButton(0);
        controller.pressButton(1);
        EXPECT_EQ(controller.title(), "Canceling Export…");
        EXPECT_TRUE(controller.message().isEmpty() && controller.buttonTitles().isEmpty());
        ASSERT_TRUE(waitFor(controller, State::Idle));
        EXPECT_TRUE(fs::is_empty(documents_));
        controller.verifyExport();
        controller.pressButton(0);  // and the window is closed
    }
    EXPECT_TRUE(fs::is_empty(documents_));
    fs::remove_all(documents_);
    std::ofstream(documents_) << "in the way";
    QVExportController controller(std::make_shared<QVControllerManager>(store_), desktop);
    controller.verifyExport();
    controller.pressButton(0);
    ASSERT_TRUE(waitFor(controller, State::Failed));
    EXPECT_EQ(controller.message(), "Your records could not be exported.");
    EXPECT_EQ(controller.buttonTitles(), QStringList{"OK"});
    controller.pressButton(0);
    EXPECT_EQ(controller.state(), State::Idle);
}

TEST_F(ExportTest, AsksBeforeAnythingIsLostAndKeepsOutOfTheStore) {
    saveReadings(10);
    Desktop desktop;
    QVExportController controller(std::make_shared<QVControllerManager>(store_), desktop);
    controller.verifyExport();
    controller.pressButton(0);
    ASSERT_TRUE(waitFor(controller, State::Sharing));
    desktop.file = folder_.path() / "foo.txt";
    std::ofstream(desktop.file) << "precious";
    controller.pressButton(0);
    EXPECT_EQ(controller.buttonTitles(), (QStringList{"Add “.zip”", "Keep This Name", "Cancel"}));
    controller.pressButton(1);
    ASSERT_TRUE(waitFor(controller, State::Asking)) << "for the file is there";
    EXPECT_EQ(controller.buttonTitles(), (QStringList{"Cancel", "Replace"}));
    controller.pressButton(0);
    ASSERT_EQ(controller.state(), State::Sharing);
    EXPECT_EQ(fs::file_size(desktop.file), 8U);
    controller.pressButton(0);
    controller.pressButton(0);
    ASSERT_TRUE(waitFor(controller, State::Sharing));
    EXPECT_TRUE(fs::exists(folder_.path() / "foo.txt.zip"));
    desktop.file = documents_ / "mine.zip";
    controller.pressButton(0);
    ASSERT_TRUE(waitFor(controller, State::Sharing));
    EXPECT_TRUE(controller.message().contains("keeps records in this place"))
        << controller.message().toStdString();
    EXPECT_FALSE(fs::exists(desktop.file));
}

TEST_F(ExportTest, PicturesAreNotDrawnIntoAStore) {
    const fs::path folder = folder_.path() / "pictures", store = folder_.path() / "store";
    QImage picture(1, 1, QImage::Format_RGB32);
    EXPECT_FALSE(QVPictureFolder::open(documents_ / "new", store).ok());
    const auto pictures = QVPictureFolder::open(folder, store);
    ASSERT_TRUE(pictures.ok());
    EXPECT_TRUE(pictures->save(picture, "day.png").ok());
    EXPECT_TRUE(pictures->save(picture, "day.png").ok()) << "in the place of the older one";
    fs::create_symlink(store / "vessa.sqlite", folder / "week.png");
    fs::create_hard_link(store / "vessa.sqlite", folder / "month.png");
    for (const char* name : {"week.png", "month.png"}) {
        const VSStatus status = pictures->save(picture, name);
        ASSERT_FALSE(status.ok());
        EXPECT_EQ(status.error().code, VSErrorCode::Refused);
    }
    EXPECT_EQ(std::distance(fs::directory_iterator(folder), {}), 3);
}

/// From the tab to the saved file with the keyboard alone, in a window where all of it fits.
TEST_F(ExportTest, NeedsNoPointer) {
    saveReadings(100);
    qputenv("HOME", folder_.path().c_str());
    qputenv("PATH", "");
    for (const auto& [locale, scale] : {std::pair("en_US", 1.0), std::pair("ar_EG", 2.0)}) {
        environment_->setLocale(locale);
        platform::TextScale::shared().set(scale);
        relaunch([] {}, QSize(320, 568));
        app_->openLink("qelvar://HealthDataTab");
        ASSERT_TRUE(settle());
        for (int i = 0; i < 20 && focused() != platform::localized("EXPORT_ACTION"); ++i) press(Qt::Key_Tab);
        press(Qt::Key_Return);
        QVExportController& controller = *app_->exportController();
        ASSERT_EQ(controller.state(), State::Verifying);
        const auto waitForFocus = [&](const char* key) {
            return test::waitUntil([&] { return focused() == platform::localized(key); });
        };
        ASSERT_TRUE(waitForFocus("EXPORT_YES")) << focused().toStdString();
        press(Qt::Key_Return);
        ASSERT_TRUE(waitFor(controller, State::Sharing));
        ASSERT_TRUE(waitForFocus("EXPORT_SAVE_AS")) << focused().toStdString();
        press(Qt::Key_Return);
        ASSERT_TRUE(waitForFocus("EXPORT_FILE_NAME")) << focused().toStdString();
        const std::string name = std::string("all-") + locale + ".zip";
        press(Qt::Key_A, Qt::ControlModifier);
        for (const char c : name) QTest::keyClick(window_.get(), c);
        press(Qt::Key_Return);
        ASSERT_TRUE(test::waitUntil([&] { return fs::exists(folder_.path() / name); }));
        ASSERT_TRUE(waitFor(controller, State::Sharing));
        ASSERT_TRUE(waitForFocus("EXPORT_SAVE_AS")) << focused().toStdString();
        press(Qt::Key_Escape);
        EXPECT_EQ(controller.state(), State::Idle);
        EXPECT_TRUE(fs::is_empty(documents_));
    }
}

}  // namespace
