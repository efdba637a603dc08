#include "Qelvar/Import/QVFileKind.h"

#include <algorithm>
#include <array>
#include <vector>

#include "Qelvar/Import/QVImportFile.h"
#include "Qelvar/Import/QVImportText.h"

namespace {

using namespace std::string_view_literals;
using enum QVFileKind;

constexpr size_t kSniffedBytes = 16 * 1024;  // of a document in an archive
constexpr const char* kExpected =
    "expected a records document (.xml whose root element is HealthData) or a .zip archive that holds one";

struct Magic {
    size_t offset;
    std::string_view bytes;
    QVFileKind kind;
    const char* detail = "";
};
constexpr Magic kMagics[] = {
    {0, "%PDF-"sv, PDF},
    {0, "\x89PNG"sv, Picture},
    {0, "\xFF\xD8\xFF"sv, Picture},
    {0, "GIF8"sv, Picture},
    {0, "II*\0"sv, Picture},
    {0, "MM\0*"sv, Picture},
    {8, "WEBP"sv, Picture},
    {4, "ftyphei"sv, Picture},
    {4, "ftypmif1"sv, Picture},
    {4, "ftypavif"sv, Picture},
    {4, "ftyp"sv, Media},
    {0, "RIFF"sv, Media},
    {0, "ID3"sv, Media},
    {0, "OggS"sv, Media},
    {0, "fLaC"sv, Media},
    {0, "\x1A\x45\xDF\xA3"sv, Media},
    {0,
     "\x7F"
     "ELF"sv,
     Program},
    {0, "#!"sv, Script},
    {0, "7z\xBC\xAF\x27\x1C"sv, OtherArchive, "7z"},
    {0, "\x1F\x8B"sv, OtherArchive, "gzip"},
    {0, "BZh"sv, OtherArchive, "bzip2"},
    {0,
     "\xFD"
     "7zXZ"sv,
     OtherArchive, "xz"},
    {0, "\x28\xB5\x2F\xFD"sv, OtherArchive, "zstd"},
    {0, "Rar!\x1A\x07"sv, OtherArchive, "rar"},
    {257, "ustar"sv, OtherArchive, "tar"},
    {0, "SQLite format 3\0"sv, Database},
    {0, "\xD0\xCF\x11\xE0\xA1\xB1\x1A\xE1"sv, OfficeDocument},
    {8, ".FIT"sv, Activity},
    {0, "PK\x03\x04"sv, MayHoldRecords},
    {0, "PK\x05\x06"sv, ArchiveWithoutRecords},  // an empty one
};

/// Without a byte order mark, and texts of 16 bits as those of 8.
std::string plainText(std::string_view bytes) {
    const bool marked = bytes.starts_with("\xFF\xFE"sv) || bytes.starts_with("\xFE\xFF"sv);
    const bool wide = marked || bytes.starts_with("<\0"sv) || bytes.starts_with("\0<"sv);
    if (marked) bytes.remove_prefix(2);
    if (bytes.starts_with("\xEF\xBB\xBF"sv)) bytes.remove_prefix(3);
    std::string text(bytes);
    if (wide) std::erase(text, '\0');
    return text;
}

bool isBlank(char c) {
    return c == ' ' || c == '\t' || c == '\r' || c == '\n';
}

std::string_view withoutBlanks(std::string_view text) {
    while (!text.empty() && isBlank(text.front())) text.remove_prefix(1);
    return text;
}

/// The name of the root element, or of the document type that stands before it; empty: not within these
/// bytes.
std::string rootName(std::string_view text) {
    const auto pass = [&text](std::string_view end) {
        const size_t found = text.find(end);
        text.remove_prefix(found == text.npos ? text.size() : found + end.size());
    };
    for (text = withoutBlanks(text); text.starts_with('<'); text = withoutBlanks(text)) {
        if (text.starts_with("<?"))
            pass("?>");
        else if (text.starts_with("<!--"))
            pass("-->");
        else
            break;
    }
    const auto isDocumentType = [](std::string_view begin) {
        return std::equal(begin.begin(), begin.end(), "<!doctype",
                          [](char a, char b) { return (a >= 'A' && a <= 'Z' ? a + 32 : a) == b; });
    };
    if (text.size() > 9 && isDocumentType(text.substr(0, 9)))
        text = withoutBlanks(text.substr(9));
    else if (text.starts_with('<'))
        text.remove_prefix(1);
    else
        return {};
    const size_t end = text.find_first_of(" \t\r\n/>[<");
    if (end == text.npos) return {};  // cut
    const std::string name(text.substr(0, end));
    return name.substr(name.rfind(':') + 1);
}

QVRecognisedFile recogniseMarkup(std::string_view text) {
    std::string root = rootName(text);
    if (root.empty() || root == "HealthData") return {};
    std::string lower = root;
    for (char& c : lower) c = c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c;
    if (lower == "html") return {WebPage, {}};
    if (lower == "svg") return {Picture, {}};
    if (root == "ClinicalDocument") return {ClinicalDocument, root};
    return {OtherXML, std::move(root)};
}

/// Whether the first lines have one number of fields, at least two.
bool isTable(std::string_view text) {
    for (const char separator : {',', ';', '\t'}) {
        std::vector<std::ptrdiff_t> counts;
        std::string_view rest = text;
        while (counts.size() < 3 && !rest.empty()) {
            const size_t end = rest.find('\n');
            if (end == rest.npos && !counts.empty()) break;  // cut
            counts.push_back(std::count(
                rest.begin(), rest.begin() + static_cast<std::ptrdiff_t>(std::min(end, rest.size())),
                separator));
            rest.remove_prefix(end == rest.npos ? rest.size() : end + 1);
        }
        if (!counts.empty() && counts[0] > 0 &&
            std::all_of(counts.begin(), counts.end(), [&](auto count) { return count == counts[0]; }))
            return true;
    }
    return false;
}

bool isText(std::string_view text) {
    return std::none_of(text.begin(), text.end(), [](char c) {
        return (static_cast<unsigned char>(c) < 0x20 && !isBlank(c) && c != '\f') || c == 0x7F;
    });
}

QVRecognisedFile recogniseArchive(QVImportFile& file) {
    bool isOffice = false;
    while (true) {
        const auto next = file.nextDocument();
        if (!next) return {UnreadableArchive, next.error().message};
        if (!*next) break;
        std::string beginning(kSniffedBytes, '\0');
        size_t length = 0;
        while (length < beginning.size()) {
            const auto count = file.read(beginning.data() + length, beginning.size() - length);
            if (!count) return {UnreadableArchive, count.error().message};
            if (*count == 0) break;
            length += *count;
        }
        beginning.resize(length);
        if (QVRecogniseBytes(beginning).mayHoldRecords()) return {};
        isOffice = isOffice || file.documentName().ends_with("[Content_Types].xml") ||
                   file.documentName().ends_with("META-INF/manifest.xml");
    }
    return {isOffice ? OfficeDocument : ArchiveWithoutRecords, {}};
}

/// "NAME: why" without the name.
std::string reason(const std::string& message, const std::filesystem::path& path) {
    const std::string prefix = path.filename().string() + ": ";
    return message.starts_with(prefix) ? message.substr(prefix.size()) : message;
}

std::string looks(const QVRecognisedFile& file) {
    switch (file.kind) {
        case MayHoldRecords:
            break;
        case Missing:
            return "there is no such file";
        case NotReadable:
            return "may not be read";
        case Folder:
            return "is a folder";
        case Empty:
            return "is empty";
        case PDF:
            return "looks like a PDF";
        case Picture:
            return "looks like a picture";
        case Media:
            return "looks like sound or video";
        case Program:
            return "looks like a program";
        case Script:
            return "looks like a script";
        case Table:
            return "looks like a table (CSV)";
        case JSON:
            return "looks like JSON";
        case WebPage:
            return "looks like a web page";
        case ClinicalDocument:
            return "looks like a clinical document, which holds a part of the records only";
        case OtherXML:
            return "looks like an XML document of another kind (its root element is " +
                   QVImportQuoted(file.detail) + ")";
        case ArchiveWithoutRecords:
            return "the archive holds no records document";
        case UnreadableArchive:
            return file.detail;
        case OfficeDocument:
            return "looks like an office document";
        case OtherArchive:
            return "looks like an archive of another kind (" + file.detail + "); unpack it first";
        case Database:
            return "looks like a database";
        case Activity:
            return "looks like the activity file of a sports watch (FIT)";
        case Text:
            return "looks like plain text";
        case Binary:
            return "looks like binary data";
    }
    return "may hold records";
}

}  // namespace

QVRecognisedFile QVRecogniseBytes(std::string_view beginning) {
    for (const Magic& magic : kMagics) {
        if (beginning.size() >= magic.offset && beginning.substr(magic.offset).starts_with(magic.bytes))
            return {magic.kind, magic.detail};
    }
    const std::string all = plainText(beginning);
    const std::string_view text = withoutBlanks(all);
    if (text.empty()) return {Empty, {}};
    if (text[0] == '<') return recogniseMarkup(text);
    if (!isText(text)) return {Binary, {}};
    if (text[0] == '{' || text[0] == '[') return {JSON, {}};
    return {isTable(text) ? Table : Text, {}};
}

QVRecognisedFile QVRecogniseFile(const std::filesystem::path& path) {
    std::error_code error;
    const auto status = std::filesystem::status(path, error);
    if (status.type() == std::filesystem::file_type::not_found) return {Missing, {}};
    if (error) return {NotReadable, {}};
    if (std::filesystem::is_directory(status)) return {Folder, {}};
    if (!std::filesystem::is_regular_file(status)) return {};
    QVRecognisedFile recognised;
    const auto file = QVImportFile::open(path, nullptr, &recognised);
    if (!recognised.mayHoldRecords()) return recognised;
    if (!file) {
        const VSErrorCode code = file.error().code;
        if (code == VSErrorCode::NotFound) return {Missing, {}};
        if (code != VSErrorCode::Invalid) return {NotReadable, {}};
        return {UnreadableArchive, reason(file.error().message, path)};
    }
    if (!(*file)->isArchive()) return {};
    recognised = recogniseArchive(**file);
    recognised.detail = reason(recognised.detail, path);
    return recognised;
}

VSError QVUnfitFileError(const std::string& name, const QVRecognisedFile& file) {
    const VSErrorCode code = file.kind == Missing       ? VSErrorCode::NotFound
                             : file.kind == NotReadable ? VSErrorCode::Refused
                                                        : VSErrorCode::Invalid;
    const bool isTold = file.kind == Missing || file.kind == NotReadable || file.kind == UnreadableArchive;
    return VSError{code, name + ": " + looks(file) + (isTold ? "" : std::string("; ") + kExpected)};
}
