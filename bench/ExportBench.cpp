#include <archive.h>
#include <archive_entry.h>
#include <fcntl.h>
#include <libxml/parser.h>
#include <libxml/xmlwriter.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <future>
#include <string>
#include <vector>

#include "Qelvar/Export/QVExportManager.h"
#include "RecordsBench.h"
#include "StoreBenchData.h"

// The export of a store against what it cannot do without: the same documents through libxml2's text writer
// and the same bytes through libarchive, each bare. With QELVAR_STORE=FOLDER of that store, with
// QELVAR_RECORDS=FILE of that archive's records, else of records that are made up. Every part runs in a
// process of its own.

namespace {

namespace fs = std::filesystem;

/// Leaves the documents in `folder`.
void exportStore(const fs::path& storeFolder, const fs::path& folder) {
    auto store = VSHealthStore::open(storeFolder);
    if (!store) benchStop(store.error().message.c_str());
    QVExportManager manager({*store, folder / "work", {}, {}});
    std::promise<VSResult<fs::path>> ended;
    manager.createExportFile([&](const VSResult<fs::path>& archive) { ended.set_value(archive); });
    const auto archive = ended.get_future().get();
    if (!archive) benchStop(archive.error().message.c_str());
    fs::rename(manager.paths().exportPath, folder / "documents");
}

// What is written, call by call: a letter for the call and the texts that it takes, each with its zero.
enum Call : char { Start = 'S', Attribute = 'A', Text = 'T', End = 'E' };

/// Writes down the calls that make a document.
class Recorder {
 public:
    Recorder(const fs::path& document, const fs::path& calls) : calls_(calls, std::ios::binary) {
        xmlSAXHandler handler{};
        handler.initialized = XML_SAX2_MAGIC;
        handler.startElementNs = [](void* self, const xmlChar* name, const xmlChar* prefix, const xmlChar*,
                                    int namespaces, const xmlChar** declared, int attributes, int,
                                    const xmlChar** values) {
            static_cast<Recorder*>(self)->start(qualified(prefix, name), namespaces, declared, attributes,
                                                values);
        };
        handler.endElementNs = [](void* self, const xmlChar*, const xmlChar*, const xmlChar*) {
            static_cast<Recorder*>(self)->flushText();
            static_cast<Recorder*>(self)->call(End);
        };
        handler.characters = [](void* self, const xmlChar* text, int size) {
            static_cast<Recorder*>(self)->text_.append(reinterpret_cast<const char*>(text),
                                                       static_cast<size_t>(size));
        };
        if (xmlSAXUserParseFile(&handler, this, document.c_str()) != 0 || !calls_)
            benchStop("no such document");
    }

 private:
    static std::string qualified(const xmlChar* prefix, const xmlChar* name) {
        const std::string local = reinterpret_cast<const char*>(name);
        return prefix ? reinterpret_cast<const char*>(prefix) + (":" + local) : local;
    }
    void start(const std::string& name, int namespaces, const xmlChar** declared, int attributes,
               const xmlChar** values) {
        text_.clear();  // the indentation
        call(Start);
        word(name);
        for (int i = 0; i < namespaces; ++i, declared += 2) {
            call(Attribute);
            word(declared[0] ? "xmlns:" + qualified(nullptr, declared[0]) : "xmlns");
            word(qualified(nullptr, declared[1]));
        }
        for (int i = 0; i < attributes; ++i, values += 5) {
            call(Attribute);
            word(qualified(values[1], values[0]));
            word(std::string(reinterpret_cast<const char*>(values[3]),
                             reinterpret_cast<const char*>(values[4])));
        }
    }
    void flushText() {
        if (text_.find_first_not_of(" \n") != std::string::npos) {
            call(Text);
            word(text_);
        }
        text_.clear();
    }
    void call(Call call) { calls_.put(call); }
    void word(const std::string& text) {
        calls_.write(text.c_str(), static_cast<std::streamsize>(text.size()) + 1);
    }

    std::ofstream calls_;
    std::string text_;
};

void writeBare(const fs::path& calls, const fs::path& document) {
    const int file = open(calls.c_str(), O_RDONLY);
    const auto size = static_cast<size_t>(fs::file_size(calls));
    void* mapped = mmap(nullptr, size, PROT_READ, MAP_PRIVATE, file, 0);
    if (mapped == MAP_FAILED) benchStop("the calls cannot be read");
    const char* at = static_cast<const char*>(mapped);
    const char* const end = at + size;
    const auto word = [&at] {
        const char* text = at;
        at += std::char_traits<char>::length(at) + 1;
        return reinterpret_cast<const xmlChar*>(text);
    };
    xmlTextWriterPtr writer = xmlNewTextWriterFilename(document.c_str(), 0);
    xmlTextWriterSetIndent(writer, 1);
    xmlTextWriterSetIndentString(writer, reinterpret_cast<const xmlChar*>(" "));
    xmlTextWriterStartDocument(writer, "1.0", "UTF-8", nullptr);
    while (at < end) {
        switch (*at++) {
            case Start:
                xmlTextWriterStartElement(writer, word());
                break;
            case Attribute: {
                const xmlChar* name = word();
                xmlTextWriterWriteAttribute(writer, name, word());
                break;
            }
            case Text:
                xmlTextWriterWriteString(writer, word());
                break;
            default:
                xmlTextWriterEndElement(writer);
        }
    }
    if (xmlTextWriterEndDocument(writer) < 0) benchStop("the document cannot be written");
    xmlFreeTextWriter(writer);
}

void zipBare(const std::vector<fs::path>& files, const fs::path& target) {
    archive* a = archive_write_new();
    archive_write_set_format_zip(a);
    if (archive_write_open_filename(a, target.c_str()) != ARCHIVE_OK)
        benchStop("the archive cannot be written");
    std::vector<char> buffer(8192);
    for (const fs::path& file : files) {
        archive_entry* entry = archive_entry_new();
        archive_entry_set_pathname(entry, file.filename().c_str());
        archive_entry_set_size(entry, static_cast<int64_t>(fs::file_size(file)));
        archive_entry_set_filetype(entry, AE_IFREG);
        archive_entry_set_perm(entry, 0644);
        archive_write_header(a, entry);
        const int source = open(file.c_str(), O_RDONLY);
        for (ssize_t count = 0; (count = read(source, buffer.data(), buffer.size())) > 0;)
            archive_write_data(a, buffer.data(), static_cast<size_t>(count));
        close(source);
        archive_entry_free(entry);
    }
    if (archive_write_close(a) != ARCHIVE_OK) benchStop("the archive cannot be written");
    archive_write_free(a);
}

}  // namespace

int main() {
    const BenchFolder folder;
    const char *givenStore = std::getenv("QELVAR_STORE"), *givenRecords = std::getenv("QELVAR_RECORDS");
    const fs::path store = givenStore ? fs::path(givenStore) : folder.path() / "store";
    if (!givenStore) {
        const fs::path records = givenRecords ? fs::path(givenRecords) : folder.path() / "made-up.zip";
        if (!givenRecords) costOf([&] { makeRecordsArchive(records); });
        costOf([&] { importRecords(records, store); });
    }
    std::printf("%-22s %10s %10s %11s\n", "", "time", "processor", "memory");
    const Cost ours = costOf([&] { exportStore(store, folder.path()); });
    print("export", ours);
    Cost bare;
    std::vector<fs::path> written;
    uintmax_t bytes = 0;
    for (const char* name : {"export.xml", "export_cda.xml"}) {
        const fs::path document = folder.path() / "documents" / name, calls = folder.path() / "calls";
        bytes += fs::file_size(document);
        costOf([&] { Recorder(document, calls); });
        fs::remove(document);
        written.push_back(folder.path() / name);
        const Cost writing = costOf([&] { writeBare(calls, written.back()); });
        fs::remove(calls);
        print((std::string("bare ") + name).c_str(), writing);
        bare.seconds += writing.seconds;
        bare.processorSeconds += writing.processorSeconds;
    }
    const Cost packing = costOf([&] { zipBare(written, folder.path() / "bare.zip"); });
    print("bare zip", packing);
    bare.seconds += packing.seconds;
    bare.processorSeconds += packing.processorSeconds;
    std::printf(
        "%.0f MB; export / bare: %.2f of the time (at most 2.0), %.2f of the processor; memory %.0f MB (less "
        "than 200)\n",
        static_cast<double>(bytes) / 1e6, ours.seconds / bare.seconds,
        ours.processorSeconds / bare.processorSeconds, ours.megabytes);
    return ours.seconds <= 2 * bare.seconds && ours.megabytes < 200 ? 0 : 1;
}
