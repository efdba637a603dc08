#include "Vessa/VSSalvageReader.h"

#include <algorithm>
#include <cmath>
#include <map>

#include "Vessa/VSLimits.h"
#include "Vessa/VSObjectType.h"
#include "Vessa/VSStoreSchema.h"

namespace {

using Table = VSSalvageTable;
using Kind = VSPageReader::Kind;

/// What the rows of a table look like, a letter a column: r the row's number (NULL on the page), c a type's
/// code, s a date, p a number from 1, d one from 0, i any, n a finite number, t a text, b a blob; a capital:
/// or NULL. Columns after the bar may be absent: they came with a later format.
struct Shape {
    const char* name;
    bool hasRowNumbers;
    const char* columns;
};
constexpr Shape shapes[] = {
    {"", false, ""},
    {"samples", false, "cspdnpiP"},
    {"samples_by_id", false, "cps"},
    {"members", false, "pdpcs"},
    {"workouts", true, "rdNN"},
    {"workout_events", false, "pdiS"},
    {"deleted", true, "rcp"},
    {"sources", true, "rtt"},
    {"devices", true, "rTTTTTTTT"},
    {"provenances", true, "rptPI"},
    {"metadata", true, "rtd"},
    {"type_sources", false, "cppss"},
    {"types", true, "rdd"},
    {"state", true, "rdd"},
    {"source_order", false, "cdp"},
    {"batches", true, "rtsii|ii"},
    {"sqlite_sequence", true, "ti"},
    {"batch_claims", false, "ppp"},
    {"batch_characteristics", false, "pcii"},
    {"authorizations", false, "tctiii"},
    {"defaults", false, "ttt"},
    {"characteristics", true, "ri"},
    {"medical_id", true, "rtB"},
};
static_assert(std::size(shapes) == static_cast<size_t>(Table::Count));

const Shape& shapeOf(Table table) {
    return shapes[static_cast<size_t>(table)];
}

bool isDate(const VSPageField& field) {
    return field.isInteger() && field.integer >= VSLimits::earliestDate.microseconds() &&
           field.integer <= VSLimits::latestDate.microseconds();
}

bool fitsColumn(char letter, const VSPageField& field) {
    if (letter >= 'A' && letter <= 'Z') {
        if (field.isNull()) return true;
        letter = static_cast<char>(letter - 'A' + 'a');
    }
    switch (letter) {
        case 'r':
            return field.isNull();
        case 'c':
            return field.isInteger() && VSObjectType::dataTypeWithCode(static_cast<int>(
                                            std::clamp<int64_t>(field.integer, -1, 1'000'000)));
        case 's':
            return isDate(field);
        case 'p':
            return field.isInteger() && field.integer >= 1;
        case 'd':
            return field.isInteger() && field.integer >= 0;
        case 'i':
            return field.isInteger();
        case 'n':
            return field.isInteger() || (field.kind == VSPageField::Kind::Real && std::isfinite(field.real));
        case 't':
            return field.isText();
        default:
            return field.kind == VSPageField::Kind::Blob;
    }
}

bool fitsShape(Table table, const VSPageRow& row) {
    size_t column = 0;
    bool mayEnd = false;
    for (const char* letter = shapeOf(table).columns; *letter; ++letter) {
        if (*letter == '|') {
            mayEnd = true;
            continue;
        }
        if (column == row.fields.size()) return mayEnd;
        if (!fitsColumn(*letter, row.fields[column++])) return false;
    }
    if (column != row.fields.size()) return false;
    if (table == Table::Samples) {
        const int64_t start = row.fields[1].integer, duration = row.fields[3].integer;
        return VSObjectType::dataTypeWithCode(static_cast<int>(row.fields[0].integer))->isSampleType() &&
               duration <= VSLimits::latestDate.microseconds() - start;
    }
    // What is deleted came before its deletion. It also tells this table from `types`.
    if (table == Table::Deleted) return row.fields[2].integer < row.number;
    return true;
}

/// Entries of several indexes are three numbers; only this one is needed, and dates are far from numbers.
bool looksLikeSamplesByID(const VSPageRow& row) {
    constexpr int64_t limit = int64_t{1} << 40;
    return fitsShape(Table::SamplesByID, row) && row.fields[1].integer < limit &&
           std::abs(row.fields[2].integer) >= limit;
}

}  // namespace

const char* VSSalvageTableName(VSSalvageTable table) {
    return shapeOf(table).name;
}

VSSalvageReader::VSSalvageReader(const std::filesystem::path& file, const std::filesystem::path& layout)
    : pages_(file, 4096) {
    if (pages_.error()) return;
    known_.resize(size_t{pages_.pageCount()} + 1);
    for (const uint32_t page : pages_.freePages()) known_[page] = true;
    for (uint32_t page = 2; page <= pages_.pageCount(); ++page)
        if (pages_.isPointerMap(page)) known_[page] = true;
    readSchema(layout);
    for (size_t table = 1; table < roots_.size(); ++table) {
        if (roots_[table]) walk(static_cast<Table>(table), roots_[table]);
    }
    adoptOrphans();
}

/// Where each table's tree begins: as the file's list of tables says, else as in a sound store, provided that
/// what is left of the list does not say otherwise.
void VSSalvageReader::readSchema(const std::filesystem::path& layout) {
    const auto rootsIn = [](VSPageReader& pages, std::vector<bool>* known, bool& whole) {
        std::map<std::string, uint32_t> roots;
        std::vector<uint32_t> open{1}, below;
        std::set<uint32_t> seen{1};
        whole = true;
        while (!open.empty()) {
            const uint32_t page = open.back();
            open.pop_back();
            const Kind kind = pages.kind(page);
            if (kind != Kind::TableLeaf && kind != Kind::TableInner) whole = false;
            if (kind != Kind::TableLeaf && kind != Kind::TableInner) continue;
            if (known) (*known)[page] = true;
            const bool read = pages.forEachRow(page, [&](const VSPageRow& row) {
                if (row.fields.size() == 5 && row.fields[1].isText() && row.fields[3].isInteger() &&
                    row.fields[3].integer > 1 && row.fields[3].integer <= pages.pageCount())
                    roots[std::string(row.fields[1].bytes)] = static_cast<uint32_t>(row.fields[3].integer);
            });
            if (!pages.children(page, below) || !read) whole = false;
            for (const uint32_t child : below) {
                if (seen.insert(child).second) open.push_back(child);
            }
        }
        return roots;
    };
    bool whole = true;
    const auto own = rootsIn(pages_, &known_, whole);
    std::map<std::string, uint32_t> usual;
    if (!whole) {
        bool ignored = true;
        VSPageReader sound(layout, 4096);
        if (!sound.error()) usual = rootsIn(sound, nullptr, ignored);
        for (const auto& [name, root] : own) {
            const auto same = usual.find(name);
            if (same == usual.end() || same->second != root) {
                usual.clear();
                break;
            }
        }
    }
    for (size_t table = 1; table < roots_.size(); ++table) {
        const char* name = shapeOf(static_cast<Table>(table)).name;
        if (const auto found = own.find(name); found != own.end())
            roots_[table] = found->second;
        else if (const auto guess = usual.find(name); guess != usual.end())
            roots_[table] = guess->second;
        // A table that is missing from a whole list is not lost: the format did not have it.
        if (!roots_[table] && !whole) damaged_.insert(static_cast<Table>(table));
    }
}

bool VSSalvageReader::fits(Table table, uint32_t page) {
    size_t fitting = 0, other = 0;
    const bool whole =
        pages_.forEachRow(page, [&](const VSPageRow& row) { fitsShape(table, row) ? ++fitting : ++other; });
    if (!whole || other) damaged_.insert(table);
    return fitting > 0 || (whole && !other);
}

void VSSalvageReader::walk(Table table, uint32_t root) {
    const bool numbered = shapeOf(table).hasRowNumbers;
    std::vector<uint32_t> open{root}, below;
    while (!open.empty()) {
        const uint32_t page = open.back();
        open.pop_back();
        const Kind kind = pages_.kind(page);
        const bool right = numbered ? kind == Kind::TableLeaf || kind == Kind::TableInner
                                    : kind == Kind::IndexLeaf || kind == Kind::IndexInner;
        if (!right || known_[page] || !fits(table, page)) {
            damaged_.insert(table);
            continue;
        }
        known_[page] = true;
        if (kind != Kind::TableInner) pagesOf_[index(table)].push_back(page);
        if (!pages_.children(page, below)) damaged_.insert(table);
        open.insert(open.end(), below.rbegin(), below.rend());
    }
    // A root lies in the pages of the file; a tree of pages beyond its end was cut off.
    if (root > pages_.pageCount()) damaged_.insert(table);
}

Table VSSalvageReader::tableOfOrphan(uint32_t page) {
    const Kind kind = pages_.kind(page);
    if (kind == Kind::None || kind == Kind::TableInner) return Table::None;
    const bool numbered = kind == Kind::TableLeaf;
    // Those whose shape no other table has.
    constexpr Table candidates[] = {
        Table::Samples,  Table::Members, Table::WorkoutEvents,   Table::Authorizations, Table::Defaults,
        Table::Sources,  Table::Devices, Table::Provenances,     Table::MedicalID,      Table::Metadata,
        Table::Workouts, Table::Batches, Table::Characteristics, Table::Deleted};
    std::array<int, static_cast<size_t>(Table::Count)> fitting{};
    int rows = 0, byID = 0;
    pages_.forEachRow(page, [&](const VSPageRow& row) {
        ++rows;
        byID += looksLikeSamplesByID(row);
        for (const Table table : candidates)
            if (shapeOf(table).hasRowNumbers == numbered && fitsShape(table, row)) ++fitting[index(table)];
    });
    if (!rows) return Table::None;
    for (const Table table : candidates) {
        // Of a page of samples each row is worth having; another table must be sure.
        if (fitting[index(table)] == rows || (table == Table::Samples && fitting[index(table)] > 0))
            return table;
    }
    return byID == rows && !numbered ? Table::SamplesByID : Table::None;
}

/// Pages that belong to no tree: their tree is broken above them. Only tables that are damaged get any.
void VSSalvageReader::adoptOrphans() {
    if (damaged_.empty()) return;
    for (uint32_t page = 2; page <= pages_.pageCount(); ++page) {
        if (known_[page]) continue;
        const Table table = tableOfOrphan(page);
        if (table == Table::None || !damaged_.contains(table)) continue;
        known_[page] = true;
        pagesOf_[index(table)].push_back(page);
    }
}

void VSSalvageReader::forEachRow(Table table, const std::function<void(const VSPageRow&)>& block) {
    for (const uint32_t page : pagesOf_[index(table)]) {
        pages_.forEachRow(page, [&](const VSPageRow& row) {
            if (fitsShape(table, row)) block(row);
        });
    }
}
