#include <sys/mman.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "Qelvar/Import/QVRecordsImporter.h"
#include "fuzz/Bodies/FuzzBodies.h"

namespace {

namespace fs = std::filesystem;

[[noreturn]] void fail(const std::string& message) {
    std::fprintf(stderr, "broken promise: %s\n", message.c_str());
    std::abort();
}

/// A store of this process, in the temporary folder.
class FuzzStore {
 public:
    FuzzStore() {
        std::string pattern = fs::temp_directory_path() / "qelvar-fuzz-XXXXXX";
        if (!mkdtemp(pattern.data())) fail("no folder for the store");
        folder_ = pattern;
        VSHealthStore::Options options;
        options.survivesPowerLoss = false;
        auto opened = VSHealthStore::open(folder_, options);
        if (!opened) fail(opened.error().message);
        store_ = *opened;
    }
    ~FuzzStore() {
        store_.reset();
        std::error_code ignored;
        fs::remove_all(folder_, ignored);
    }
    const std::shared_ptr<VSHealthStore>& store() const { return store_; }

 private:
    fs::path folder_;
    std::shared_ptr<VSHealthStore> store_;
};

/// The input as a file without a disk.
class MemoryFile {
 public:
    MemoryFile(const uint8_t* bytes, size_t size) : descriptor_(memfd_create("input", MFD_CLOEXEC)) {
        if (descriptor_ < 0 || write(descriptor_, bytes, size) != static_cast<ssize_t>(size))
            fail("no memory for the input");
    }
    ~MemoryFile() { close(descriptor_); }
    MemoryFile(const MemoryFile&) = delete;
    MemoryFile& operator=(const MemoryFile&) = delete;
    fs::path path() const { return "/proc/self/fd/" + std::to_string(descriptor_); }

 private:
    const int descriptor_;
};

void expectConsistent(const QVImportReport& report) {
    QVImportCount sum;
    for (const auto& [type, count] : report.byType) {
        if (count.read != count.added + count.alreadyHad + count.refused) fail(type + ": the counts differ");
        sum.read += count.read;
        sum.added += count.added;
        sum.alreadyHad += count.alreadyHad;
        sum.refused += count.refused;
    }
    if (!(sum == report.total)) fail("the types do not make the total");
    if (report.total.alreadyHad != 0) fail("an empty store had something already");
    int64_t refused = 0;
    for (const auto& [reason, count] : report.refusalsByReason) refused += count;
    if (refused != report.total.refused) fail("the reasons do not make the refused records");
}

}  // namespace

void QVFuzzImport(const uint8_t* bytes, size_t size) {
    static const FuzzStore store;
    const MemoryFile file(bytes, size);
    QVImportOptions options;
    options.dryRun = true;
    const auto report = QVRecordsImporter(store.store()).importFiles({file.path()}, options);
    if (report)
        expectConsistent(*report);
    else if (report.error().code != VSErrorCode::Invalid)
        fail(report.error().message);
    else if (report.error().message.empty())
        fail("an error says nothing");
}
