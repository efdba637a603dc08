#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <sstream>

#include "Qelvar/Export/QVExportManager.h"
#include "TestSupport.h"

namespace test {

namespace fs = std::filesystem;

inline QVExportSetting exportSetting(std::shared_ptr<VSHealthStore> store, const fs::path& folder,
                                     QVExportUnits units = {}) {
    return {std::move(store), folder, {}, [units] { return units; }};
}

/// Runs an export to its end. After the start `meanwhile` is done.
inline VSResult<fs::path> exportAll(QVExportManager& manager, const std::function<void()>& meanwhile = {}) {
    auto ended = std::make_shared<Promise<VSResult<fs::path>>>();
    manager.createExportFile([ended](const VSResult<fs::path>& archive) { ended->set(archive); });
    if (meanwhile) meanwhile();
    auto archive = ended->wait();
    return archive ? *archive : VSError{VSErrorCode::Failed, "no completion came"};
}

inline std::string contentOf(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

/// Runs a program that none of us wrote.
inline void expectAccepted(const std::string& command) {
    const int status = std::system((command + " >/dev/null").c_str());
    EXPECT_EQ(status, 0) << command;
}

}  // namespace test
