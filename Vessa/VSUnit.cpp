#include "Vessa/VSUnit.h"

#include <array>
#include <cassert>
#include <map>
#include <memory>
#include <mutex>
#include <shared_mutex>

#include "Vessa/VSUnitParser.h"
#include "Vessa/VSUnitScale.h"

struct VSUnit::Definition {
    std::string text;
    VSUnitDimensions dimensions{};
    VSUnitRatio scale;
    VSUnitRatio offset;

    /// All units that were ever parsed, each once.
    class Table;
};

class VSUnit::Definition::Table {
 public:
    static Table& shared() {
        static auto* table =
            new Table;  // never destroyed: units are compared by the address of their definition
        return *table;
    }

    const Definition* spelled(std::string_view spelling) const {
        std::shared_lock lock(mutex_);
        const auto known = spellings_.find(spelling);
        return known == spellings_.end() ? nullptr : known->second;
    }

    /// Null when the table is full: only a hostile document has so many units.
    const Definition* intern(std::string_view spelling, const VSUnitParser::Unit& unit) {
        std::string canonical = VSUnitParser::canonicalText(unit);
        std::lock_guard lock(mutex_);
        auto& definition = definitions_[canonical];
        if (!definition) {
            if (definitions_.size() > kMostUnits) {
                definitions_.erase(canonical);
                return nullptr;
            }
            definition = std::make_unique<Definition>(make(std::move(canonical), unit));
        }
        if (spellings_.size() < 2 * kMostUnits) spellings_.emplace(spelling, definition.get());
        return definition.get();
    }

 private:
    static constexpr size_t kMostUnits = 20'000;

    static Definition make(std::string text, const VSUnitParser::Unit& unit) {
        Definition definition{std::move(text), {}, {}, VSUnitRatio::of(0)};
        for (const auto& [name, factor] : unit) {
            for (size_t i = 0; i < definition.dimensions.size(); ++i)
                definition.dimensions[i] += factor.symbol.dimensions[i] * factor.exponent;
            definition.scale = definition.scale * factor.symbol.scale.power(factor.exponent);
        }
        // In "degC/min" a degree is a difference of temperatures and has no zero.
        if (unit.size() == 1 && unit.begin()->second.exponent == 1)
            definition.offset = unit.begin()->second.symbol.offset;
        return definition;
    }

    mutable std::shared_mutex mutex_;
    // guarded by mutex_
    std::map<std::string, std::unique_ptr<const Definition>, std::less<>> definitions_;  // by canonical text
    std::map<std::string, const Definition*, std::less<>> spellings_;                    // by any text
};

namespace {

/// From one unit to another: value * scale + offset.
struct Conversion {
    VSUnitRatio scale;
    long double offset = 0;

    double apply(double value) const { return static_cast<double>(scale.applyTo(value) + offset); }

    static Conversion make(const VSUnit::Definition& from, const VSUnit::Definition& to) {
        // The difference of the zeros is made as a ratio too, so that 0 degC is 32 degF and not nearly so.
        const VSUnitRatio perUnit = to.scale.inverse();
        return {from.scale * perUnit, ((from.offset - to.offset) * perUnit).applyTo(1)};
    }

    /// Each thread keeps those that it made last: an import converts millions of values between a few units.
    static const Conversion& between(const VSUnit::Definition& from, const VSUnit::Definition& to) {
        struct Entry {
            const VSUnit::Definition *from = nullptr, *to = nullptr;
            Conversion conversion;
        };
        thread_local std::array<Entry, 64> entries;
        const auto hash = std::hash<const void*>()(&from) / alignof(VSUnit::Definition) * 31 +
                          std::hash<const void*>()(&to) / alignof(VSUnit::Definition);
        Entry& entry = entries[hash % entries.size()];
        if (entry.from != &from || entry.to != &to) entry = {&from, &to, make(from, to)};
        return entry.conversion;
    }
};

}  // namespace

VSResult<VSUnit> VSUnit::parse(std::string_view text) {
    auto& table = Definition::Table::shared();
    if (const Definition* known = table.spelled(text)) return VSUnit(known);
    const auto unit = VSUnitParser(text).parse();
    if (!unit) return unit.error();
    const Definition* definition = table.intern(text, *unit);
    if (!definition) return VSError{VSErrorCode::Invalid, "Too many different units"};
    return VSUnit(definition);
}

VSUnit VSUnit::fromString(std::string_view text) {
    const auto unit = parse(text);
    assert(unit.ok());
    return *unit;
}

VSUnit VSUnit::countUnit() {
    return fromString("count");
}
VSUnit VSUnit::footUnit() {
    return fromString("ft");
}
VSUnit VSUnit::inchUnit() {
    return fromString("in");
}
VSUnit VSUnit::minuteUnit() {
    return fromString("min");
}
VSUnit VSUnit::secondUnit() {
    return fromString("s");
}
VSUnit VSUnit::hourUnit() {
    return fromString("hr");
}
VSUnit VSUnit::kilocalorieUnit() {
    return fromString("kcal");
}
VSUnit VSUnit::mileUnit() {
    return fromString("mi");
}
VSUnit VSUnit::percentUnit() {
    return fromString("%");
}

double VSUnit::glucoseMolarMass() {
    return 180.1558;
}

const std::string& VSUnit::unitString() const {
    return definition_->text;
}

bool VSUnit::isCompatibleWith(const VSUnit& other) const {
    return definition_->dimensions == other.definition_->dimensions;
}

std::optional<double> VSUnit::convert(double value, const VSUnit& to) const {
    if (definition_ == to.definition_) return value;
    if (!isCompatibleWith(to)) return std::nullopt;
    return Conversion::between(*definition_, *to.definition_).apply(value);
}
