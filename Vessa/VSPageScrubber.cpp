#include "Vessa/VSPageScrubber.h"

#include <array>
#include <cstdint>
#include <cstring>
#include <type_traits>

namespace {

constexpr int largestPage = 65536;
constexpr sqlite3_int64 fileHead = 100;
/// In larger files the first byte of an overflow page, of the number of the next one, could look like that of
/// a page of rows.
constexpr sqlite3_int64 largestFile = sqlite3_int64{1} << 35;

int number(const uint8_t* bytes) {
    return bytes[0] << 8 | bytes[1];
}

/// Whether the page would be one of the pointer map, in a file with such a map.
bool mayBePointerMap(sqlite3_int64 page, int pageSize) {
    return page >= 2 && (page - 2) % (pageSize / 5 + 1) <= 1;  // the one behind where the lock bytes lie
}

struct Gap {
    int begin = 0, end = 0;
};

/// Between the pointers to the rows of a page and the rows themselves. Empty where the page is of another
/// kind.
Gap unusedMiddle(const uint8_t* page, int size, int head) {
    const uint8_t kind = page[head];
    const bool inner = kind == 0x02 || kind == 0x05, leaf = kind == 0x0a || kind == 0x0d;
    if (!inner && !leaf) return {};
    const int begin = head + (inner ? 12 : 8) + 2 * number(page + head + 3);
    const int content = number(page + head + 5);
    const int end = content ? content : largestPage;
    return begin < end && end <= size ? Gap{begin, end} : Gap{};
}

}  // namespace

VSPageScrubber::VSPageScrubber(sqlite3* connection) {
    static_assert(std::is_standard_layout_v<VSPageScrubber>);
    sqlite3_file* file = nullptr;
    sqlite3_file_control(connection, "main", SQLITE_FCNTL_FILE_POINTER, &file);
    if (!file || !file->pMethods) return;
    real_ = file->pMethods;
    methods_ = *real_;
    methods_.xWrite = write;
    file->pMethods = &methods_;
}

int VSPageScrubber::write(sqlite3_file* file, const void* bytes, int size, sqlite3_int64 offset) {
    const auto* real = reinterpret_cast<const VSPageScrubber*>(file->pMethods)->real_;
    const auto asItIs = [&] { return real->xWrite(file, bytes, size, offset); };
    if (size < 512 || size > largestPage || offset % size != 0 || offset >= largestFile) return asItIs();
    const sqlite3_int64 page = offset / size + 1;
    if (mayBePointerMap(page, size)) return asItIs();
    const Gap gap = unusedMiddle(static_cast<const uint8_t*>(bytes), size, page == 1 ? fileHead : 0);
    if (gap.begin == gap.end) return asItIs();
    std::array<uint8_t, largestPage> clean;
    std::memcpy(clean.data(), bytes, static_cast<size_t>(size));
    std::memset(clean.data() + gap.begin, 0, static_cast<size_t>(gap.end - gap.begin));
    return real->xWrite(file, clean.data(), size, offset);
}
