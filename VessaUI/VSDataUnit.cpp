#include "VessaUI/VSDataUnit.h"

#include "Platform/Localization.h"
#include "VessaUI/VSDataUnitGroupCatalogue.h"

QString VSDataUnit::labelDisplayName() const {
    return *row_->labelKey ? platform::localized(row_->labelKey) : QString();
}

std::optional<VSPredicate> VSDataUnit::chartingPredicateForTimeScope(VSTimeScopeIndex timeScope) const {
    const bool known = timeScope >= 0 && timeScope < static_cast<int>(row_->chartedValue.size());
    const int value = row_->chartedValue[known ? static_cast<size_t>(timeScope) : 0];
    if (value == VSDataUnitRow::allValues) return std::nullopt;
    return VSPredicate::withCategoryValue(value);
}
