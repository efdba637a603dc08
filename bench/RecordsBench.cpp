#include "RecordsBench.h"

#include <archive.h>
#include <archive_entry.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <string>

#include "Qelvar/Import/QVRecordsImporter.h"
#include "StoreBenchData.h"

namespace fs = std::filesystem;

Cost costOf(const std::function<void()>& work) {
    const auto start = std::chrono::steady_clock::now();
    const pid_t child = fork();
    if (child == 0) {
        work();
        std::_Exit(0);
    }
    int status = 0;
    struct rusage used {};
    if (child < 0 || wait4(child, &status, 0, &used) != child || status != 0) benchStop("a part failed");
    const auto seconds = [](const timeval& time) {
        return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_usec) / 1e6;
    };
    return {std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count(),
            seconds(used.ru_utime) + seconds(used.ru_stime), static_cast<double>(used.ru_maxrss) / 1024};
}

void print(const char* what, const Cost& cost) {
    std::printf("%-22s %8.2f s %8.2f s %8.1f MB\n", what, cost.seconds, cost.processorSeconds,
                cost.megabytes);
    std::fflush(stdout);
}

void importRecords(const fs::path& file, const fs::path& folder) {
    auto store = VSHealthStore::open(folder);
    if (!store) benchStop(store.error().message.c_str());
    const auto report = QVRecordsImporter(*store).importFiles({file});
    if (!report) benchStop(report.error().message.c_str());
}

void makeRecordsArchive(const fs::path& file) {
    std::string text = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<HealthData locale=\"en_DK\">\n";
    const auto record = [&](const char* type, const char* unit, int64_t start, int64_t end,
                            const char* value) {
        char line[512];
        const auto time = [](int64_t seconds, char* buffer, size_t size) {
            const time_t moment = 1'500'000'000 + seconds;
            struct tm parts {};
            gmtime_r(&moment, &parts);
            strftime(buffer, size, "%Y-%m-%d %H:%M:%S +0000", &parts);
        };
        char from[32], to[32];
        time(start, from, sizeof from);
        time(end, to, sizeof to);
        text.append(line, static_cast<size_t>(std::snprintf(
                              line, sizeof line,
                              " <Record type=\"VSQuantityTypeIdentifier%s\" sourceName=\"Wrist tracker\" "
                              "sourceVersion=\"1.0\" device=\"name:Wrist tracker, hardware:1\" unit=\"%s\" "
                              "creationDate=\"%s\" startDate=\"%s\" endDate=\"%s\" value=\"%s\"/>\n",
                              type, unit, to, from, to, value)));
    };
    constexpr int64_t twoYears = 63'072'000;
    for (int64_t second = 0; second < twoYears; second += 72)
        record("HeartRate", "count/min", second, second,
               std::to_string(50 + second / 72 * 7919 % 100).c_str());
    for (const auto& [type, unit] :
         {std::pair("StepCount", "count"), std::pair("DistanceWalkingRunning", "km")}) {
        for (int64_t second = 0; second < twoYears; second += 300)
            record(type, unit, second, second + 300,
                   ("0." + std::to_string(1 + second / 300 * 31 % 900)).c_str());
    }
    text += "</HealthData>\n";
    archive* a = archive_write_new();
    archive_write_set_format_zip(a);
    archive_write_open_filename(a, file.c_str());
    archive_entry* entry = archive_entry_new();
    archive_entry_set_pathname(entry, "export.xml");
    archive_entry_set_filetype(entry, AE_IFREG);
    archive_entry_set_perm(entry, 0600);
    archive_entry_set_size(entry, static_cast<int64_t>(text.size()));
    if (archive_write_header(a, entry) != ARCHIVE_OK || archive_write_data(a, text.data(), text.size()) < 0)
        benchStop("the archive cannot be written");
    archive_entry_free(entry);
    archive_write_close(a);
    archive_write_free(a);
}
