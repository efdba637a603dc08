#pragma once

#include <QColor>
#include <QImage>
#include <QSizeF>
#include <QString>
#include <vector>

/// Category IDs. Kept on disk in user activities; never reused.
namespace VSCategoryID {
inline constexpr int BodyMeasurements = 1, Fitness = 2, Vitals = 3, Nutrition = 4, Results = 5, Sleep = 6,
                     ReproductiveHealth = 7, Me = 8;
}

/// A group of display types with colours and an icon. Lives in the catalogue until the process ends.
class VSDataCategory {
 public:
    int categoryID() const { return id_; }
    QString displayName() const;
    bool isMe() const { return id_ == VSCategoryID::Me; }  // the category of characteristics
    QColor color() const { return bottom_; }
    QColor gradientTopColor() const { return top_; }
    QColor gradientBottomColor() const { return bottom_; }
    QString listIcon() const { return QString::fromLatin1(icon_); }
    /// A rectangle with rounded corners (radius 8 points) filled with the gradient, top to bottom;
    /// for a person who wants high contrast with one darker colour.
    QImage roundedGradient(QSizeF size, double scale) const;

 private:
    friend class VSDataCategoryController;
    int id_ = 0;
    const char* nameKey_ = "";
    const char* icon_ = "";
    QColor top_, bottom_, highContrast_;
};

class VSDataCategoryController {
 public:
    static const VSDataCategoryController& shared();
    const std::vector<VSDataCategory>& allDataCategories() const { return categories_; }
    const VSDataCategory* categoryWithID(int id) const;  // null: unknown

 private:
    VSDataCategoryController();
    std::vector<VSDataCategory> categories_;
};
