#include "VessaUI/VSDataCategory.h"

#include <QLinearGradient>
#include <QPainter>

#include "Platform/Localization.h"

namespace {

constexpr double cornerRadius = 8;  // points

struct CategoryRow {
    int id;
    const char* nameKey;
    const char* icon;
    QRgb top, bottom;
};

// Cards are written on in white: on every gradient white has a contrast of at least 4.5:1 at its lighter
// end. The darker end stays near it: bars are overlaid on it, and an overlay lightens a dark colour little.
constexpr CategoryRow categoryRows[] = {
    {VSCategoryID::BodyMeasurements, "DATA_CATEGORY_BODY_MEASUREMENTS", "category_body_measurements",
     0xFF96650A, 0xFF855708},
    {VSCategoryID::Fitness, "DATA_CATEGORY_FITNESS", "category_fitness", 0xFFC4460D, 0xFFAE3C0C},
    {VSCategoryID::Vitals, "DATA_CATEGORY_VITALS", "category_vitals", 0xFFCB2149, 0xFFB31A41},
    {VSCategoryID::Nutrition, "DATA_CATEGORY_NUTRITION", "category_nutrition", 0xFF3B7F1D, 0xFF316F17},
    {VSCategoryID::Results, "DATA_CATEGORY_RESULTS", "category_results", 0xFF8A45C4, 0xFF763AAE},
    {VSCategoryID::Sleep, "DATA_CATEGORY_SLEEP", "category_sleep", 0xFF4A5BC8, 0xFF3D4BAF},
    {VSCategoryID::ReproductiveHealth, "DATA_CATEGORY_REPRODUCTIVE_HEALTH", "category_reproductive_health",
     0xFFB32D96, 0xFF9B2482},
    {VSCategoryID::Me, "DATA_CATEGORY_ME", "category_me", 0xFF4B7080, 0xFF3F606F},
};

}  // namespace

QString VSDataCategory::displayName() const {
    return platform::localized(nameKey_);
}

QImage VSDataCategory::roundedGradient(QSizeF size, double scale) const {
    QImage image((size * scale).toSize(), QImage::Format_ARGB32_Premultiplied);
    image.setDevicePixelRatio(scale);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    painter.setRenderHint(QPainter::Antialiasing);
    QLinearGradient gradient(0, 0, 0, size.height());
    gradient.setColorAt(0, top_);
    gradient.setColorAt(1, bottom_);
    painter.setPen(Qt::NoPen);
    painter.setBrush(gradient);
    painter.drawRoundedRect(QRectF(QPointF(0, 0), size), cornerRadius, cornerRadius);
    return image;
}

const VSDataCategoryController& VSDataCategoryController::shared() {
    static const VSDataCategoryController controller;
    return controller;
}

VSDataCategoryController::VSDataCategoryController() {
    for (const CategoryRow& row : categoryRows) {
        VSDataCategory category;
        category.id_ = row.id;
        category.nameKey_ = row.nameKey;
        category.icon_ = row.icon;
        category.top_ = QColor::fromRgb(row.top);
        category.bottom_ = QColor::fromRgb(row.bottom);
        categories_.push_back(category);
    }
}

const VSDataCategory* VSDataCategoryController::categoryWithID(int id) const {
    for (const VSDataCategory& category : categories_)
        if (category.categoryID() == id) return &category;
    return nullptr;
}
