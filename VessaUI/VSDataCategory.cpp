#include "VessaUI/VSDataCategory.h"

#include <QLinearGradient>
#include <QPainter>

#include "Platform/Appearance.h"
#include "Platform/Localization.h"

namespace {

constexpr double cornerRadius = 8;  // points

struct CategoryRow {
    int id;
    const char* nameKey;
    const char* icon;
    QRgb top, bottom, highContrast;
};

// What a card shows is made of the card's colour c (channels from 0 to 1): soft texts are c + 0.5, bars half
// c and half the overlay of white on c, which is min(2c, 1). Of the colours on which soft texts have a
// contrast of 4.5 (WCAG 2.1: relative luminances, see CardContrastTests) these are such that bars stand out
// the most that the hue allows, 1.8 to 2.0: at most half of full light in the main channels, since an overlay
// adds little beyond that. With high contrast cards have one colour, with a luminance of 0.055: white has 10
// on it, and a fill can be 3 from both.
constexpr CategoryRow categoryRows[] = {
    {VSCategoryID::BodyMeasurements, "DATA_CATEGORY_BODY_MEASUREMENTS", "category_body_measurements",
     0xFF805D04, 0xFF755E08, 0xFF543F04},
    {VSCategoryID::Fitness, "DATA_CATEGORY_FITNESS", "category_fitness", 0xFF844A16, 0xFF83411B, 0xFF663612},
    {VSCategoryID::Vitals, "DATA_CATEGORY_VITALS", "category_vitals", 0xFF833A48, 0xFF823854, 0xFF6B2F40},
    {VSCategoryID::Nutrition, "DATA_CATEGORY_NUTRITION", "category_nutrition", 0xFF3E6D10, 0xFF2A6B12,
     0xFF244B0C},
    {VSCategoryID::Results, "DATA_CATEGORY_RESULTS", "category_results", 0xFF6A4DA0, 0xFF744A9C, 0xFF4F3670},
    {VSCategoryID::Sleep, "DATA_CATEGORY_SLEEP", "category_sleep", 0xFF405B9E, 0xFF4A57A0, 0xFF314072},
    {VSCategoryID::ReproductiveHealth, "DATA_CATEGORY_REPRODUCTIVE_HEALTH", "category_reproductive_health",
     0xFF82367A, 0xFF82346C, 0xFF692B5D},
    {VSCategoryID::Me, "DATA_CATEGORY_ME", "category_me", 0xFF326A78, 0xFF3C6680, 0xFF254754},
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
    gradient.setColorAt(0, platform::highContrast() ? highContrast_ : top_);
    gradient.setColorAt(1, platform::highContrast() ? highContrast_ : bottom_);
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
        category.highContrast_ = QColor::fromRgb(row.highContrast);
        categories_.push_back(category);
    }
}

const VSDataCategory* VSDataCategoryController::categoryWithID(int id) const {
    for (const VSDataCategory& category : categories_)
        if (category.categoryID() == id) return &category;
    return nullptr;
}
