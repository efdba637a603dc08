#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "Vessa/VSObject.h"
#include "Vessa/VSObjectType.h"

// A document says the same few names millions of times: each is understood once and shared. Used by one
// thread.

struct QVTextHash {
    using is_transparent = void;
    size_t operator()(std::string_view text) const noexcept { return std::hash<std::string_view>()(text); }
};

/// Shared values by their text; `make` is asked once for each text.
template <typename T>
class QVInterned {
 public:
    template <typename Make>
    const std::shared_ptr<const T>& get(std::string_view text, Make make) {
        if (last_ && text == last_->first) return last_->second;
        auto found = values_.find(text);
        if (found == values_.end()) {
            // A document with ever new names must not fill the memory; forgetting costs only time.
            if (values_.size() >= kGreatestSize || (bytes_ += text.size()) > kMostBytes) {
                values_.clear();
                bytes_ = text.size();
            }
            found = values_.emplace(std::string(text), std::make_shared<const T>(make())).first;
        }
        last_ = &*found;
        return found->second;
    }

 private:
    static constexpr size_t kGreatestSize = 20'000, kMostBytes = 16'000'000;
    using Map = std::unordered_map<std::string, std::shared_ptr<const T>, QVTextHash, std::equal_to<>>;
    Map values_;
    size_t bytes_ = 0;
    const typename Map::value_type* last_ = nullptr;
};

/// All types by their full identifier.
class QVTypeIndex {
 public:
    QVTypeIndex() {
        for (const VSObjectType* type : VSObjectType::allTypes()) types_.emplace(type->identifier(), type);
    }
    /// Null when there is none.
    const VSObjectType* find(std::string_view identifier) const {
        const auto found = types_.find(identifier);
        return found == types_.end() ? nullptr : found->second;
    }

 private:
    std::unordered_map<std::string_view, const VSObjectType*> types_;
};

/// The units that documents give for the values of quantity types.
class QVUnitIndex {
 public:
    struct Entry {
        std::string text;
        std::optional<VSUnit> unit;  // none: refused, see problem
        bool isCanonical = false;
        std::string problem;
    };
    /// Valid until the next call. REQUIRES: a quantity type.
    const Entry& find(const VSObjectType* type, std::string_view text) {
        const auto code = static_cast<size_t>(VSTypeCodeValue(type->code()));
        if (code >= entries_.size()) entries_.resize(code + 1);
        std::vector<Entry>& known = entries_[code];
        for (const Entry& entry : known) {
            if (entry.text == text) return entry;
        }
        if (known.size() >= kGreatestSize) known.clear();
        return known.emplace_back(make(type, text));
    }

 private:
    static constexpr size_t kGreatestSize = 50;
    static constexpr size_t kLongestUnit = 100;

    static Entry make(const VSObjectType* type, std::string_view text) {
        Entry entry{std::string(text), std::nullopt, false, {}};
        if (text.size() > kLongestUnit) {
            entry.problem = "longer than " + std::to_string(kLongestUnit) + " characters";
            return entry;
        }
        if (const VSResult<VSUnit> unit = type->unitFromString(text); unit.ok()) {
            entry.unit = *unit;
            entry.isCanonical = *unit == type->canonicalUnit();
        } else {
            entry.problem = unit.error().message;
        }
        return entry;
    }

    std::vector<std::vector<Entry>> entries_;  // by type code
};
