#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "fuzz/Bodies/FuzzBodies.h"

// What the fuzz targets found once, and what they start from, goes through the same functions again. A broken
// promise ends the process and says which one.

namespace {

namespace fs = std::filesystem;

int replay(const fs::path& folder, void (*body)(const uint8_t*, size_t)) {
    int count = 0;
    if (!fs::exists(folder)) return count;
    for (const auto& entry : fs::recursive_directory_iterator(folder)) {
        if (!entry.is_regular_file()) continue;
        SCOPED_TRACE(entry.path().string());
        std::ifstream file(entry.path(), std::ios::binary);
        const std::string bytes((std::istreambuf_iterator<char>(file)), {});
        body(reinterpret_cast<const uint8_t*>(bytes.data()), bytes.size());
        ++count;
    }
    return count;
}

const fs::path kSource = QELVAR_SOURCE_DIR;

TEST(FuzzFindings, DocumentsKeepTheirPromises) {
    EXPECT_GT(replay(kSource / "tests/data/fuzz/import", QVFuzzImport), 0);
    EXPECT_GT(replay(kSource / "tests/data/import", QVFuzzImport), 0);
}

TEST(FuzzFindings, UnitsKeepTheirPromises) {
    replay(kSource / "tests/data/fuzz/unit", VSFuzzUnit);  // nothing was found yet
    EXPECT_GT(replay(kSource / "fuzz/seeds/unit", VSFuzzUnit), 0);
}

}  // namespace
