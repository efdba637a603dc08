#pragma once

#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

/// One value of a row as it stands on a page.
struct VSPageField {
    enum class Kind : uint8_t { Null, Integer, Real, Text, Blob } kind = Kind::Null;
    int64_t integer = 0;
    double real = 0;
    std::string_view bytes;  // of a text or blob; valid as long as its row

    bool isNull() const { return kind == Kind::Null; }
    bool isInteger() const { return kind == Kind::Integer; }
    bool isText() const { return kind == Kind::Text; }
};

/// A row of a table, or an entry of an index or of a table without row numbers.
struct VSPageRow {
    int64_t number = 0;  // the row number; 0 of an entry
    std::vector<VSPageField> fields;
    std::string overflow;  // the content where it stands on more than one page
};

/// Reads the pages of a database file one by one, trusting nothing: for files that SQLite refuses. Every
/// number is checked before it is followed. Used by one thread.
class VSPageReader {
 public:
    enum class Kind : uint8_t { None, TableLeaf, TableInner, IndexLeaf, IndexInner };

    /// The file must not change while this lives. `pageSize`: where the file's own head does not tell.
    /// Failed: it cannot be read (the message is in `error`).
    VSPageReader(const std::filesystem::path& file, uint32_t pageSize);
    ~VSPageReader();
    VSPageReader(const VSPageReader&) = delete;
    VSPageReader& operator=(const VSPageReader&) = delete;

    const std::optional<std::string>& error() const { return error_; }
    /// Whole pages; they count from 1.
    uint32_t pageCount() const { return pageCount_; }
    Kind kind(uint32_t page) const;

    /// Calls block(row) for each row of a page that can be read. False: some could not. The row is valid
    /// until the block returns.
    template <typename Block>
    bool forEachRow(uint32_t page, Block block) {
        bool whole = true;
        const uint32_t count = cellCount(page);
        if (count == 0 && !isEmpty(page)) return false;
        for (uint32_t index = 0; index < count; ++index) {
            if (readRow(page, index))
                block(static_cast<const VSPageRow&>(row_));
            else
                whole = false;
        }
        return whole;
    }
    /// The pages below an inner page, as far as they exist. False: some pointers lead nowhere.
    bool children(uint32_t page, std::vector<uint32_t>& pages) const;
    /// Whether a page is of the map that a file which can shrink has beside its trees.
    bool isPointerMap(uint32_t page) const;
    /// The pages that hold nothing, as the file's own list says; none where the list is damaged.
    std::vector<uint32_t> freePages() const;

 private:
    const uint8_t* at(uint32_t page) const { return bytes_ + size_t{page - 1} * pageSize_; }
    /// Where the page's own head begins.
    static uint32_t headOf(uint32_t page) { return page == 1 ? 100 : 0; }
    uint32_t cellCount(uint32_t page) const;
    bool isEmpty(uint32_t page) const;
    /// The offset of a cell; 0: there is none.
    uint32_t cell(uint32_t page, uint32_t index) const;
    bool readRow(uint32_t page, uint32_t index);
    bool readPayload(uint32_t page, uint32_t offset, uint64_t size, bool table, std::string_view& payload);
    bool parse(std::string_view payload);

    std::optional<std::string> error_;
    const uint8_t* bytes_ = nullptr;
    size_t size_ = 0;
    uint32_t pageSize_ = 0, usable_ = 0, pageCount_ = 0;
    VSPageRow row_;
};
