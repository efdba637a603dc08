#include <gtest/gtest.h>

#include <fstream>

#include "RunProgram.h"
#include "TestSupport.h"

namespace {

namespace fs = std::filesystem;

TEST(SalvageCommand, MakesASoundStoreOfADamagedOneAndLeavesThatAlone) {
    const test::TemporaryFolder folder;
    const test::Program program{folder.path()};
    const fs::path store = folder.path() / "data" / "qelvar", saved = folder.path() / "saved";
    ASSERT_EQ(program.run({"import", fs::path(QELVAR_TEST_DATA) / "import" / "wrist-two-days" / "input.zip"})
                  .status,
              0);
    const auto before = program.run({"samples", "HeartRate"}).output;
    ASSERT_GT(test::rowsOf(before).size(), 2000U);
    {
        std::fstream file(store / "vessa.sqlite", std::ios::in | std::ios::out | std::ios::binary);
        file << std::string(4096, 'x');
    }
    for (const char* command : {"types", "check"}) {
        const auto outcome = program.run({command});
        EXPECT_EQ(outcome.status, 7);
        EXPECT_NE(outcome.errors.find(store.string()), std::string::npos) << outcome.errors;
        EXPECT_NE(outcome.errors.find("`qelvar salvage` may save"), std::string::npos) << outcome.errors;
    }
    EXPECT_EQ(program.run({"salvage"}).status, 2);
    EXPECT_EQ(program.run({"salvage", "--to", store}).status, 5);
    EXPECT_EQ(program.run({"salvage", "--to", store / "inside" / "it"}).status, 5);
    EXPECT_FALSE(std::filesystem::exists(store / "inside"));
    EXPECT_EQ(program.run({"salvage", "--to", saved, "--store", folder.path() / "nowhere"}).status, 3);
    const auto outcome = program.run({"salvage", "--to", saved});
    EXPECT_EQ(outcome.status, 0) << outcome.errors;
    EXPECT_EQ(test::rowsOf(outcome.output).at(0).at("lost"), "0");
    EXPECT_EQ(program.run({"check", "--store", saved}).status, 0);
    EXPECT_EQ(program.run({"samples", "HeartRate", "--store", saved}).output, before);
    EXPECT_EQ(program.run({"check"}).status, 7) << "the damaged store stays as it is";
}

}  // namespace
