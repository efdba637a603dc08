#include "Vessa/VSPageReader.h"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <bit>
#include <cerrno>
#include <cstring>

namespace {

constexpr uint64_t largestRow = 64 << 20;

uint32_t number(const uint8_t* bytes, int size) {
    uint32_t value = 0;
    for (int i = 0; i < size; ++i) value = value << 8 | bytes[i];
    return value;
}

/// Seven bits a byte, the highest says that more come; the ninth byte counts whole. False: it runs out.
bool readVarint(const uint8_t*& next, const uint8_t* end, uint64_t& value) {
    value = 0;
    for (int i = 0; i < 9; ++i) {
        if (next >= end) return false;
        const uint8_t byte = *next++;
        if (i == 8) {
            value = value << 8 | byte;
            return true;
        }
        value = value << 7 | (byte & 0x7f);
        if (!(byte & 0x80)) return true;
    }
    return true;
}

uint64_t sizeOfSerial(uint64_t serial) {
    constexpr uint64_t small[] = {0, 1, 2, 3, 4, 6, 8, 8, 0, 0};
    return serial < 10 ? small[serial] : (serial - 12) / 2;
}

VSPageField fieldOf(uint64_t serial, const uint8_t* bytes) {
    VSPageField field;
    const uint64_t size = sizeOfSerial(serial);
    if (serial >= 12) {
        field.kind = serial % 2 ? VSPageField::Kind::Text : VSPageField::Kind::Blob;
        field.bytes = {reinterpret_cast<const char*>(bytes), size};
        return field;
    }
    if (serial == 0) return field;
    uint64_t bits = size && bytes[0] & 0x80 ? ~uint64_t{0} : 0;
    for (uint64_t i = 0; i < size; ++i) bits = bits << 8 | bytes[i];
    if (serial == 7) {
        field.kind = VSPageField::Kind::Real;
        field.real = std::bit_cast<double>(bits);
        return field;
    }
    field.kind = VSPageField::Kind::Integer;
    field.integer = serial >= 8 ? static_cast<int64_t>(serial - 8) : static_cast<int64_t>(bits);
    return field;
}

bool isPageSize(uint32_t size) {
    return size >= 512 && size <= 65536 && std::has_single_bit(size);
}

}  // namespace

VSPageReader::VSPageReader(const std::filesystem::path& file, uint32_t pageSize) : pageSize_(pageSize) {
    const int descriptor = ::open(file.c_str(), O_RDONLY | O_CLOEXEC);
    struct stat status {};
    if (descriptor < 0 || ::fstat(descriptor, &status) != 0) {
        error_ = file.string() + ": " + std::strerror(errno);
    } else if (status.st_size > 0) {
        size_ = static_cast<size_t>(status.st_size);
        void* memory = ::mmap(nullptr, size_, PROT_READ, MAP_PRIVATE, descriptor, 0);
        if (memory == MAP_FAILED)
            error_ = file.string() + ": " + std::strerror(errno);
        else
            bytes_ = static_cast<const uint8_t*>(memory);
    }
    if (descriptor >= 0) ::close(descriptor);
    if (!bytes_) return;
    uint32_t reserved = 0;
    if (size_ >= 100 && std::memcmp(bytes_, "SQLite format 3", 16) == 0) {
        const uint32_t told = number(bytes_ + 16, 2);
        if (isPageSize(told == 1 ? 65536 : told)) {
            pageSize_ = told == 1 ? 65536 : told;
            reserved = bytes_[20];
        }
    }
    usable_ = pageSize_ - std::min(reserved, pageSize_ - 480);
    pageCount_ = static_cast<uint32_t>(std::min<size_t>(size_ / pageSize_, UINT32_MAX - 1));
}

VSPageReader::~VSPageReader() {
    if (bytes_) ::munmap(const_cast<uint8_t*>(bytes_), size_);
}

VSPageReader::Kind VSPageReader::kind(uint32_t page) const {
    if (page < 1 || page > pageCount_) return Kind::None;
    switch (at(page)[headOf(page)]) {
        case 0x02:
            return Kind::IndexInner;
        case 0x05:
            return Kind::TableInner;
        case 0x0a:
            return Kind::IndexLeaf;
        case 0x0d:
            return Kind::TableLeaf;
        default:
            return Kind::None;
    }
}

bool VSPageReader::isPointerMap(uint32_t page) const {
    constexpr uint32_t entrySize = 5, kinds = 5;
    if (page < 2 || page > pageCount_) return false;
    // The file's head says whether there is such a map; without it the map's first page, of which each entry
    // begins with the kind of a page.
    const auto looksLikeMap = [this] {
        const uint8_t* first = at(2);
        for (uint32_t entry = 0; entry < std::min(usable_ / entrySize, pageCount_ - 2); ++entry)
            if (first[entry * entrySize] < 1 || first[entry * entrySize] > kinds) return false;
        return pageCount_ > 2;
    };
    const bool hasHead = std::memcmp(bytes_, "SQLite format 3", 16) == 0;
    if (hasHead ? number(bytes_ + 52, 4) == 0 : !looksLikeMap()) return false;
    constexpr uint32_t lockBytes = 1 << 30;
    const uint32_t place = page - (page - 2) % (usable_ / entrySize + 1);
    return page == (place == lockBytes / pageSize_ + 1 ? place + 1 : place);
}

uint32_t VSPageReader::cellCount(uint32_t page) const {
    const Kind k = kind(page);
    if (k == Kind::None || k == Kind::TableInner) return 0;
    const uint32_t count = number(at(page) + headOf(page) + 3, 2);
    return count <= usable_ / 4 ? count : 0;
}

bool VSPageReader::isEmpty(uint32_t page) const {
    const Kind k = kind(page);
    return k == Kind::TableInner || (k != Kind::None && number(at(page) + headOf(page) + 3, 2) == 0);
}

uint32_t VSPageReader::cell(uint32_t page, uint32_t index) const {
    const Kind k = kind(page);
    const uint32_t head = headOf(page) + (k == Kind::TableInner || k == Kind::IndexInner ? 12 : 8);
    const uint32_t place = head + index * 2;
    if (place + 2 > usable_) return 0;
    const uint32_t offset = number(at(page) + place, 2);
    return offset >= place + 2 && offset + 4 <= usable_ ? offset : 0;
}

bool VSPageReader::children(uint32_t page, std::vector<uint32_t>& pages) const {
    pages.clear();
    const Kind k = kind(page);
    if (k != Kind::TableInner && k != Kind::IndexInner) return true;
    bool whole = true;
    const auto add = [&](const uint8_t* place) {
        const uint32_t child = number(place, 4);
        if (child > 1 && child <= pageCount_)
            pages.push_back(child);
        else
            whole = false;
    };
    const uint32_t count = number(at(page) + headOf(page) + 3, 2);
    if (count > usable_ / 4) whole = false;
    for (uint32_t index = 0; index < std::min(count, usable_ / 4); ++index) {
        if (const uint32_t offset = cell(page, index))
            add(at(page) + offset);
        else
            whole = false;
    }
    add(at(page) + headOf(page) + 8);
    return whole;
}

bool VSPageReader::readRow(uint32_t page, uint32_t index) {
    const Kind k = kind(page);
    uint32_t offset = cell(page, index);
    if (!offset) return false;
    if (k == Kind::IndexInner) offset += 4;
    const uint8_t* next = at(page) + offset;
    const uint8_t* const end = at(page) + usable_;
    uint64_t size = 0, rowNumber = 0;
    if (!readVarint(next, end, size) || size < 1 || size > largestRow) return false;
    if (k == Kind::TableLeaf && !readVarint(next, end, rowNumber)) return false;
    row_.number = static_cast<int64_t>(rowNumber);
    std::string_view payload;
    return readPayload(page, static_cast<uint32_t>(next - at(page)), size, k == Kind::TableLeaf, payload) &&
           parse(payload);
}

/// A long row keeps its beginning on its page and goes on in a chain of others.
bool VSPageReader::readPayload(uint32_t page, uint32_t offset, uint64_t size, bool table,
                               std::string_view& payload) {
    const uint64_t most = table ? usable_ - 35 : (usable_ - 12) * 64 / 255 - 23;
    const auto* start = reinterpret_cast<const char*>(at(page) + offset);
    if (size <= most) {
        if (offset + size > usable_) return false;
        payload = {start, size};
        return true;
    }
    const uint64_t least = (usable_ - 12) * 32 / 255 - 23;
    const uint64_t wanted = least + (size - least) % (usable_ - 4);
    const uint64_t local = wanted <= most ? wanted : least;
    if (offset + local + 4 > usable_) return false;
    row_.overflow.assign(start, local);
    uint32_t following = number(at(page) + offset + local, 4);
    while (row_.overflow.size() < size) {
        if (following < 2 || following > pageCount_) return false;
        const uint64_t part = std::min<uint64_t>(usable_ - 4, size - row_.overflow.size());
        row_.overflow.append(reinterpret_cast<const char*>(at(following) + 4), part);
        following = number(at(following), 4);
    }
    if (following != 0) return false;
    payload = row_.overflow;
    return true;
}

bool VSPageReader::parse(std::string_view payload) {
    row_.fields.clear();
    const auto* const start = reinterpret_cast<const uint8_t*>(payload.data());
    const uint8_t* const end = start + payload.size();
    const uint8_t* next = start;
    uint64_t headSize = 0;
    if (!readVarint(next, end, headSize) || headSize > payload.size() ||
        headSize < static_cast<uint64_t>(next - start))
        return false;
    const uint8_t* const headEnd = start + headSize;
    const uint8_t* content = headEnd;
    while (next < headEnd) {
        uint64_t serial = 0;
        if (!readVarint(next, headEnd, serial) || serial == 10 || serial == 11) return false;
        const uint64_t size = sizeOfSerial(serial);
        if (size > static_cast<uint64_t>(end - content)) return false;
        row_.fields.push_back(fieldOf(serial, content));
        content += size;
    }
    return content == end && !row_.fields.empty();
}

std::vector<uint32_t> VSPageReader::freePages() const {
    std::vector<uint32_t> pages;
    if (pageCount_ < 1 || std::memcmp(bytes_, "SQLite format 3", 16) != 0) return pages;
    std::vector<bool> seen(size_t{pageCount_} + 1);  // no page stands twice in a sound list
    const auto take = [&](uint32_t page) {
        if (page < 2 || page > pageCount_ || seen[page]) return false;
        seen[page] = true;
        pages.push_back(page);
        return true;
    };
    for (uint32_t trunk = number(bytes_ + 32, 4); trunk != 0; trunk = number(at(trunk), 4)) {
        if (!take(trunk)) return {};
        const uint32_t leaves = number(at(trunk) + 4, 4);
        if (leaves > usable_ / 4 - 2) return {};
        for (uint32_t i = 0; i < leaves; ++i) {
            if (!take(number(at(trunk) + 8 + size_t{i} * 4, 4))) return {};
        }
    }
    return pages.size() == number(bytes_ + 36, 4) ? pages : std::vector<uint32_t>();
}
