#include "ExportTestSupport.h"
#include "Qelvar/Import/QVRecordsImporter.h"

// Each folder of tests/data/export is a case: records, the name of the Medical ID, the two documents that an
// export makes of them, and a line `about`. With QELVAR_UPDATE_EXPECTED=1 the documents are written anew, to
// be read over before they are kept.

namespace {

namespace fs = std::filesystem;
const fs::path kFolder = fs::path(QELVAR_TEST_DATA) / "export";

std::vector<std::string> caseNames() {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(kFolder))
        names.push_back(entry.path().filename().string());
    return names;
}

class ExportFolders : public testing::TestWithParam<std::string> {};

TEST_P(ExportFolders, WritesTheDocuments) {
    const fs::path data = kFolder / GetParam();
    const test::FixedEnvironment environment("2020-04-02T12:00");
    const test::TemporaryFolder folder;
    const auto store = VSHealthStore::open(folder.path() / "store");
    ASSERT_TRUE(store.ok());
    ASSERT_TRUE(QVRecordsImporter(*store).importFiles({data / "input.xml"}).ok());
    VSMedicalIDData medicalID;
    medicalID.name = test::contentOf(data / "name");
    test::Promise<bool> saved;
    if (!medicalID.name->empty()) {
        (*store)->updateMedicalIDData(medicalID, [&](const VSStatus& status) { saved.set(status.ok()); });
        ASSERT_TRUE(*saved.wait());
    }
    QVExportManager manager(test::exportSetting(*store, folder.path() / "documents"));
    ASSERT_TRUE(test::exportAll(manager).ok());
    for (const auto& [actual, name] : {std::pair(manager.paths().filePath, "export.xml"),
                                       std::pair(manager.paths().CDAFilePath, "export_cda.xml")}) {
        if (std::getenv("QELVAR_UPDATE_EXPECTED"))
            fs::copy_file(actual, data / name, fs::copy_options::overwrite_existing);
        EXPECT_EQ(test::contentOf(actual), test::contentOf(data / name)) << test::contentOf(data / "about");
    }
}

INSTANTIATE_TEST_SUITE_P(, ExportFolders, testing::ValuesIn(caseNames()), [](const auto& name) {
    std::string identifier = name.param;
    std::replace(identifier.begin(), identifier.end(), '-', '_');
    return identifier;
});

}  // namespace
