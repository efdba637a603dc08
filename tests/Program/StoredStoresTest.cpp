#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>

#include "RunProgram.h"
#include "TestSupport.h"
#include "Vessa/VSHealthStore.h"

// Stores that programs of each format wrote, kept under tests/data/stores with what those programs answered:
// today's program brings a copy of each up to date and must answer the same.

namespace {

namespace fs = std::filesystem;

/// But for the last bits of numbers, which another way of adding may change.
bool sameField(const std::string& a, const std::string& b) {
    if (a == b) return true;
    char* end = nullptr;
    const double x = std::strtod(a.c_str(), &end);
    if (a.empty() || *end) return false;
    const double y = std::strtod(b.c_str(), &end);
    return !b.empty() && !*end && std::abs(x - y) <= 1e-14 * std::abs(x);
}

void compareRows(const std::string& expected, const std::string& actual) {
    const auto wanted = test::rowsOf(expected), found = test::rowsOf(actual);
    ASSERT_FALSE(wanted.empty());
    ASSERT_EQ(wanted.size(), found.size()) << actual;
    for (size_t row = 0; row < wanted.size(); ++row) {
        for (const auto& [column, value] : wanted[row]) {
            const auto field = found[row].find(column);
            ASSERT_NE(field, found[row].end()) << column;
            // They also added up what is only measured.
            const auto* type = VSObjectType::typeForIdentifier(wanted[row].at("type"));
            if (column == "sum" && type && !type->isCumulative() && field->second.empty()) continue;
            EXPECT_TRUE(sameField(value, field->second))
                << "row " << row + 1 << " " << column << ": " << value << " and not " << field->second;
        }
    }
}

void compareStore(const test::Program& program, const fs::path& store, const fs::path& expected) {
    const auto ask = [&](std::vector<std::string> command) {
        command.insert(command.end(), {"--store", store.string()});
        const auto outcome = program.run(command);
        EXPECT_EQ(outcome.status, 0) << command[0] << ": " << outcome.errors;
        EXPECT_EQ(outcome.errors, "") << command[0];
        return outcome.output;
    };
    ask({"check"});
    for (const auto& entry : fs::directory_iterator(expected)) {
        const std::string name = entry.path().stem().string();
        SCOPED_TRACE(name);
        if (name == "statistics")
            compareRows(test::contentOf(entry.path()),
                        ask({"statistics", "all", "--every", "day", "--by-source", "--options",
                             "sum,average,minimum,maximum"}));
        else
            EXPECT_EQ(test::contentOf(entry.path()), ask({"samples", name}));
    }
}

TEST(StoredStores, OfEachFormatAnswerAsTheyDid) {
    int stores = 0;
    for (const auto& entry : fs::directory_iterator(fs::path(QELVAR_TEST_DATA) / "stores")) {
        if (!entry.is_directory()) continue;
        SCOPED_TRACE(entry.path().filename().string());
        const test::TemporaryFolder folder;
        const test::Program program(folder.path());
        const fs::path store = folder.path() / "store";
        fs::create_directory(store);
        fs::copy_file(entry.path() / "vessa.sqlite", store / "vessa.sqlite");
        const auto opened = VSHealthStore::open(store);
        ASSERT_TRUE(opened.ok()) << opened.error().message;
        compareStore(program, store, entry.path() / "expected");
        ++stores;
    }
    EXPECT_GT(stores, 1);
}

}  // namespace
