#include <archive.h>
#include <archive_entry.h>
#include <libxml/parser.h>

#include <cstdio>
#include <cstdlib>
#include <functional>
#include <string>
#include <vector>

#include "RecordsBench.h"
#include "StoreBenchData.h"
#include "Vessa/VSStoreSchema.h"

// The import of an archive against what it cannot do without: unpacking, parsing and inserting, each bare.
// With QELVAR_RECORDS=FILE that archive, else one that is made up. Every part runs in a process of its own,
// so that its memory can be told.

namespace {

namespace fs = std::filesystem;

/// Calls block(bytes, size) with what the archive's documents hold.
void unpack(const fs::path& file, const std::function<void(const char*, size_t)>& block) {
    archive* a = archive_read_new();
    archive_read_support_format_zip_seekable(a);
    if (archive_read_open_filename(a, file.c_str(), 256 * 1024) != ARCHIVE_OK) benchStop("no such archive");
    std::vector<char> buffer(64 * 1024);
    archive_entry* entry = nullptr;
    while (archive_read_next_header(a, &entry) == ARCHIVE_OK) {
        la_ssize_t count = 0;
        while ((count = archive_read_data(a, buffer.data(), buffer.size())) > 0)
            block(buffer.data(), static_cast<size_t>(count));
    }
    archive_read_free(a);
}

void unpackAndParse(const fs::path& file) {
    static int64_t elements = 0;
    xmlSAXHandler handler{};
    handler.initialized = XML_SAX2_MAGIC;
    handler.startElementNs = [](void*, const xmlChar*, const xmlChar*, const xmlChar*, int, const xmlChar**,
                                int, int, const xmlChar**) { ++elements; };
    xmlParserCtxtPtr context = xmlCreatePushParserCtxt(&handler, nullptr, nullptr, 0, nullptr);
    unpack(file,
           [&](const char* bytes, size_t size) { xmlParseChunk(context, bytes, static_cast<int>(size), 0); });
    xmlParseChunk(context, nullptr, 0, 1);
    xmlFreeParserCtxt(context);
    if (elements == 0) benchStop("nothing was parsed");
}

struct Row {
    int64_t type, start, id, duration;
    double value;
    int64_t provenance, created;
};

/// The imported rows in the order of their insertion.
std::vector<Row> rowsOf(const fs::path& folder) {
    VSDatabase database(folder / VSStoreSchema::fileName, VSDatabase::Mode::Read, std::chrono::seconds(10));
    std::vector<Row> rows;
    auto statement =
        database.use("SELECT type, start, id, duration, value, provenance, created FROM samples ORDER BY id");
    while (statement.step())
        rows.push_back({statement.integer(0), statement.integer(1), statement.integer(2),
                        statement.integer(3), statement.real(4), statement.integer(5), statement.integer(6)});
    return rows;
}

void insertBare(const std::vector<Row>& rows, const fs::path& folder) {
    const BareDatabase tables(folder);
    VSDatabase database(folder / "bare.sqlite", VSDatabase::Mode::Write, std::chrono::seconds(10));
    database.execute("PRAGMA synchronous = FULL; PRAGMA cache_size = -32768");
    VSTransaction transaction(database, VSTransaction::Kind::Write);
    auto insert = database.use("INSERT INTO samples VALUES (?, ?, ?, ?, ?, ?, ?, NULL)");
    for (const Row& row : rows) {
        insert.bind(1, row.type).bind(2, row.start).bind(3, row.id).bind(4, row.duration);
        insert.bindNumber(5, row.value).bind(6, row.provenance).bind(7, row.created).run();
    }
    transaction.commit();
}

}  // namespace

int main() {
    const BenchFolder folder;
    const char* given = std::getenv("QELVAR_RECORDS");
    const fs::path file = given ? fs::path(given) : folder.path() / "made-up.zip";
    if (!given) costOf([&] { makeRecordsArchive(file); });
    std::printf("%-22s %10s %10s %11s\n", file.filename().c_str(), "time", "processor", "memory");
    const Cost ours = costOf([&] { importRecords(file, folder.path() / "store"); });
    print("import", ours);
    print("import of the same", costOf([&] { importRecords(file, folder.path() / "store"); }));
    const Cost unpacking = costOf([&] { unpack(file, [](const char*, size_t) {}); });
    print("bare unzip", unpacking);
    const Cost both = costOf([&] { unpackAndParse(file); });
    print("bare unzip and parse", both);
    std::vector<Row> rows = rowsOf(folder.path() / "store");
    const size_t count = rows.size();
    const Cost inserting = costOf([&] { insertBare(rows, folder.path()); });
    print("bare insert (and rows)", inserting);
    std::vector<Row>().swap(rows);  // a process begins with the memory of this one
    const auto undone = costOf([&] {
        auto store = VSHealthStore::open(folder.path() / "store");
        const auto batches = (*store)->batches();
        for (const VSBatch& batch : *batches) {
            const auto report = (*store)->undoBatch(batch.id);
            if (!report) benchStop(report.error().message.c_str());
        }
    });
    print("undo of both", undone);
    const double bare = both.seconds + inserting.seconds;
    const double bareProcessor = both.processorSeconds + inserting.processorSeconds;
    std::printf(
        "%zu records; import / bare: %.2f of the time (at most 2.5), %.2f of the processor; memory %.0f MB "
        "(less than 150)\n",
        count, ours.seconds / bare, ours.processorSeconds / bareProcessor, ours.megabytes);
    return ours.seconds <= 2.5 * bare && ours.megabytes < 150 ? 0 : 1;
}
