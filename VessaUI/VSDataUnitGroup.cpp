#include "VessaUI/VSDataUnitGroup.h"

#include "Platform/Localization.h"
#include "VessaUI/VSDataUnitGroupCatalogue.h"

namespace {

QString textOfKey(const char* key) {
    return *key ? platform::localized(key) : QString();
}

}  // namespace

int VSDataUnitGroup::dataUnitGroupID() const {
    return row_->id;
}
int VSDataUnitGroup::categoryID() const {
    return row_->category;
}
QString VSDataUnitGroup::displayName() const {
    return textOfKey(row_->nameKey);
}

QString VSDataUnitGroup::summary() const {
    return platform::localized(QString::fromLatin1(row_->nameKey) + QStringLiteral("_SUMMARY"));
}

QStringList VSDataUnitGroup::keywords() const {
    const QString text =
        platform::localized(QString::fromLatin1(row_->nameKey) + QStringLiteral("_KEYWORDS"));
    QStringList words = text.split(QLatin1Char(','), Qt::SkipEmptyParts);
    for (QString& word : words) word = word.trimmed();
    return words;
}

QString VSDataUnitGroup::joinString() const {
    return textOfKey(row_->joinKey);
}
bool VSDataUnitGroup::isCharacteristic() const {
    return anyDataUnit()->dataType()->kind() == VSTypeKind::Characteristic;
}
bool VSDataUnitGroup::isNikeFuel() const {
    return anyDataUnit()->dataType()->code() == VSCode::NikeFuel;
}
bool VSDataUnitGroup::allowsManualEntry() const {
    return row_->manualEntry;
}
bool VSDataUnitGroup::showAllDataHierarchically() const {
    return row_->hierarchical;
}
bool VSDataUnitGroup::shouldDisplayUnitStringOnYAxis() const {
    return row_->unitOnYAxis;
}
bool VSDataUnitGroup::unitPreferencesRequireChangeConfirmation() const {
    return row_->confirmUnitChange;
}

QString VSDataUnitGroup::unitChangeCautionaryText() const {
    return row_->confirmUnitChange ? platform::localized(QString::fromLatin1(row_->nameKey) +
                                                         QStringLiteral("_UNIT_CHANGE_CAUTION"))
                                   : QString();
}

QString VSDataUnitGroup::unitIcon() const {
    return QString::fromLatin1(row_->unitIcon);
}
QString VSDataUnitGroup::groupIcon() const {
    return QString::fromLatin1(row_->groupIcon);
}

QString VSDataUnitGroup::listIcon() const {
    const VSDataCategory* category = VSDataCategoryController::shared().categoryWithID(row_->category);
    return category ? category->listIcon() : QString();
}

const VSDataUnitGroupController& VSDataUnitGroupController::shared() {
    static const VSDataUnitGroupController controller;
    return controller;
}

const std::vector<const VSDataUnitGroup*>& VSDataUnitGroupController::allDataUnitGroups() const {
    return VSDataUnitGroupCatalogue::shared().groups;
}

const VSDataUnitGroup* VSDataUnitGroupController::dataUnitGroupWithID(int id) const {
    const auto& byID = VSDataUnitGroupCatalogue::shared().byID;
    const auto found = byID.find(id);
    return found == byID.end() ? nullptr : found->second;
}

const VSDataUnitGroup* VSDataUnitGroupController::dataUnitGroupForType(const VSObjectType* type) const {
    const auto& byType = VSDataUnitGroupCatalogue::shared().byType;
    const auto found = byType.find(type);
    return found == byType.end() ? nullptr : found->second;
}

std::vector<const VSDataUnitGroup*> VSDataUnitGroupController::dataUnitGroupsInCategory(
    int categoryID) const {
    std::vector<const VSDataUnitGroup*> groups;
    for (const VSDataUnitGroup* group : allDataUnitGroups())
        if (group->categoryID() == categoryID) groups.push_back(group);
    return groups;
}

// 5.3:1 on white, so that it serves as the colour of text.
QColor VSDataUnitGroupController::keyColor() const {
    return {0x0A, 0x76, 0x82};
}
