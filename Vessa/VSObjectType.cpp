#include "Vessa/VSObjectType.h"

#include <algorithm>
#include <array>
#include <cassert>
#include <map>
#include <memory>

#include "Vessa/VSTypeTable.h"

namespace {

std::string_view prefixOf(VSTypeKind kind) {
    switch (kind) {
        case VSTypeKind::Quantity:
            return VSQuantityTypeIdentifierPrefix;
        case VSTypeKind::Category:
            return VSCategoryTypeIdentifierPrefix;
        case VSTypeKind::Correlation:
            return VSCorrelationTypeIdentifierPrefix;
        case VSTypeKind::Characteristic:
            return VSCharacteristicTypeIdentifierPrefix;
        case VSTypeKind::Workout:
            return {};
    }
    return {};
}

constexpr std::string_view kWorkoutName = "Workout";
constexpr int kCodeCount = 99;

/// The unit with every mole that names no substance read as moles of glucose.
std::string withGlucoseMoles(std::string_view text) {
    const std::string glucose = VSUnit::fromString("mol<180.1558>").unitString().substr(3);
    std::string result(text);
    for (size_t at = result.find("mol"); at != std::string::npos; at = result.find("mol", at + 3))
        if (at + 3 == result.size() || result[at + 3] != '<') result.insert(at + 3, glucose);
    return result;
}

}  // namespace

struct VSObjectType::Catalogue {
    std::vector<std::unique_ptr<const VSObjectType>> owned;
    std::vector<const VSObjectType*> all;
    std::array<const VSObjectType*, kCodeCount> byCode{};
    std::map<std::string_view, const VSObjectType*> byIdentifier;
    std::map<std::string_view, const VSObjectType*> byName;

    static const Catalogue& shared() {
        static const auto* catalogue = new Catalogue;  // never destroyed: types live until the process ends
        return *catalogue;
    }

    Catalogue() {
        for (const VSTypeRow& row : VSTypeRows()) {
            const VSObjectType* type = owned.emplace_back(make(row)).get();
            all.push_back(type);
            byCode[static_cast<size_t>(row.code)] = type;
            byIdentifier.emplace(type->identifier_, type);
            byName.emplace(row.name, type);
        }
    }

    const VSObjectType* find(std::string_view identifier, VSTypeKind kind) const {
        const auto entry = byIdentifier.find(identifier);
        return entry != byIdentifier.end() && entry->second->kind_ == kind ? entry->second : nullptr;
    }

    static std::unique_ptr<const VSObjectType> make(const VSTypeRow& row) {
        std::unique_ptr<VSObjectType> type(new VSObjectType);
        type->code_ = VSTypeCode{row.code};
        type->kind_ = row.kind;
        type->aggregation_ = row.aggregation;
        type->identifier_ = row.kind == VSTypeKind::Workout
                                ? std::string(VSWorkoutTypeIdentifier)
                                : std::string(prefixOf(row.kind)).append(row.name);
        if (row.kind == VSTypeKind::Quantity) type->canonicalUnit_ = VSUnit::fromString(row.canonicalUnit);
        for (const VSTypeValueRow& value : VSTypeValueRows())
            if (value.code == row.code) type->values_.emplace_back(value.value, value.identifier);
        return type;
    }
};

std::string_view VSObjectType::name() const {
    return kind_ == VSTypeKind::Workout ? kWorkoutName
                                        : std::string_view(identifier_).substr(prefixOf(kind_).size());
}

VSResult<VSUnit> VSObjectType::unitFromString(std::string_view text) const {
    assert(isQuantityType());
    auto unit = VSUnit::parse(text);
    if (!unit || unit->isCompatibleWith(*canonicalUnit_)) return unit;
    if (code_ == VSCode::BloodGlucose) {
        auto ofGlucose = VSUnit::parse(withGlucoseMoles(text));
        if (ofGlucose && ofGlucose->isCompatibleWith(*canonicalUnit_)) return ofGlucose;
    }
    return VSError{VSErrorCode::Invalid, "The unit \"" + unit->unitString() + "\" does not convert to \"" +
                                             canonicalUnit_->unitString() + "\", in which " +
                                             std::string(name()) + " is kept"};
}

const std::string* VSObjectType::identifierForValue(int value) const {
    for (const auto& [number, identifier] : values_)
        if (number == value) return &identifier;
    return nullptr;
}

std::optional<int> VSObjectType::valueForIdentifier(std::string_view identifier) const {
    for (const auto& [number, name] : values_)
        if (name == identifier) return number;
    return std::nullopt;
}

const VSObjectType* VSObjectType::dataTypeWithCode(VSTypeCode code) {
    const int number = VSTypeCodeValue(code);
    if (number < 0 || number >= kCodeCount) return nullptr;
    return Catalogue::shared().byCode[static_cast<size_t>(number)];
}

const VSObjectType* VSObjectType::quantityTypeForIdentifier(std::string_view identifier) {
    return Catalogue::shared().find(identifier, VSTypeKind::Quantity);
}

const VSObjectType* VSObjectType::categoryTypeForIdentifier(std::string_view identifier) {
    return Catalogue::shared().find(identifier, VSTypeKind::Category);
}

const VSObjectType* VSObjectType::correlationTypeForIdentifier(std::string_view identifier) {
    return Catalogue::shared().find(identifier, VSTypeKind::Correlation);
}

const VSObjectType* VSObjectType::characteristicTypeForIdentifier(std::string_view identifier) {
    return Catalogue::shared().find(identifier, VSTypeKind::Characteristic);
}

const VSObjectType* VSObjectType::workoutType() {
    return dataTypeWithCode(VSCode::Workout);
}

const VSObjectType* VSObjectType::typeForIdentifier(std::string_view identifier) {
    const Catalogue& catalogue = Catalogue::shared();
    if (const auto full = catalogue.byIdentifier.find(identifier); full != catalogue.byIdentifier.end())
        return full->second;
    const auto bare = catalogue.byName.find(identifier);
    return bare == catalogue.byName.end() ? nullptr : bare->second;
}

std::span<const VSObjectType* const> VSObjectType::allTypes() {
    return Catalogue::shared().all;
}

namespace {

constexpr std::string_view kActivityPrefix = "VSWorkoutActivityType";

const std::map<int, std::string>& activityIdentifiers() {
    static const auto* identifiers = [] {
        auto* map = new std::map<int, std::string>;
        int number = 0;
        for (const std::string_view name : VSWorkoutActivityNames())
            map->emplace(++number, std::string(kActivityPrefix).append(name));
        map->emplace(VSWorkoutActivityOther, std::string(kActivityPrefix).append("Other"));
        return map;
    }();
    return *identifiers;
}

}  // namespace

const std::string* VSWorkoutActivityTypeIdentifier(int activity) {
    const auto entry = activityIdentifiers().find(activity);
    return entry == activityIdentifiers().end() ? nullptr : &entry->second;
}

std::optional<int> VSWorkoutActivityTypeForIdentifier(std::string_view identifier) {
    for (const auto& [activity, name] : activityIdentifiers())
        if (name == identifier) return activity;
    return std::nullopt;
}
