#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "Qelvar/Import/QVRecordsImporter.h"
#include "RecordsText.h"
#include "TestSupport.h"

// Each folder of tests/data/import that holds an `expected` text is a case: an input, what an import of it
// tells and what is in the store afterwards, and a line `about` that says what it shows. With
// QELVAR_UPDATE_EXPECTED=1 the texts are written anew, to be read over before they are kept.

namespace {

namespace fs = std::filesystem;

const fs::path kFolder = fs::path(QELVAR_TEST_DATA) / "import";

std::vector<std::string> caseNames() {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(kFolder)) {
        if (fs::exists(entry.path() / "expected") || std::getenv("QELVAR_UPDATE_EXPECTED"))
            names.push_back(entry.path().filename().string());
    }
    std::erase(names, "wrist-two-days");  // its table is compared by the program's own tests
    std::sort(names.begin(), names.end());
    return names;
}

std::string contentOf(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

class ImportFolders : public testing::TestWithParam<std::string> {};

TEST_P(ImportFolders, TellsAndKeepsWhatIsExpected) {
    const test::FixedEnvironment environment("2020-04-02T12:00");
    const test::TemporaryFolder folder;
    const fs::path data = kFolder / GetParam();
    const fs::path input = fs::exists(data / "input.zip") ? data / "input.zip" : data / "input.xml";
    ASSERT_FALSE(contentOf(data / "about").empty());
    const auto store = VSHealthStore::open(folder.path() / "store");
    ASSERT_TRUE(store.ok()) << store.error().message;
    QVImportOptions options;
    options.listedRefusals = 100;

    const auto report = QVRecordsImporter(*store).importFiles({input}, options);
    const std::string kept = test::textOfStore(**store);
    const std::string actual = test::textOfReport(report) + kept;
    if (std::getenv("QELVAR_UPDATE_EXPECTED")) std::ofstream(data / "expected", std::ios::binary) << actual;
    EXPECT_EQ(actual, contentOf(data / "expected")) << contentOf(data / "about");

    // A second time nothing is new.
    const auto again = QVRecordsImporter(*store).importFiles({input}, options);
    ASSERT_EQ(again.ok(), report.ok());
    if (again) {
        EXPECT_EQ(again->total.added, 0);
        EXPECT_EQ(again->total.alreadyHad, report->total.added);
        EXPECT_EQ(again->characteristicsSet, 0);
    }
    EXPECT_EQ(test::textOfStore(**store), kept);
}

INSTANTIATE_TEST_SUITE_P(All, ImportFolders, testing::ValuesIn(caseNames()), [](const auto& param) {
    std::string name = param.param;
    std::replace(name.begin(), name.end(), '-', '_');
    return name;
});

}  // namespace
