#include "Qelvar/Dashboard/QVTableGeometry.h"

#include <algorithm>
#include <cmath>

namespace {

constexpr double kEdgeZone = 0.2;  // of the visible height, at each end
constexpr double kSpeedOverZone = 20;
constexpr double kGreatestSpeed = 15;

}  // namespace

std::optional<int> QVTableGeometry::rowAt(double y) const {
    if (rowHeight <= 0 || !(y >= headerHeight && y < contentHeight())) return std::nullopt;
    // A height a hair before the end may still divide to the number of rows.
    return std::min(static_cast<int>((y - headerHeight) / rowHeight), rowCount - 1);
}

QRectF QVTableGeometry::rectOfRow(int row) const {
    return {0, headerHeight + row * rowHeight, width, rowHeight};
}

double QVTableGeometry::autoScrollSpeed(double y) const {
    const double zone = kEdgeZone * visibleHeight;
    if (zone <= 0) return 0;
    const double lowerZoneStart = contentOffset + visibleHeight - zone;
    if (y > lowerZoneStart) return std::min((y - lowerZoneStart) / zone * kSpeedOverZone, kGreatestSpeed);
    const double upperZoneEnd = contentOffset + zone;
    if (y < upperZoneEnd) return std::max((y - upperZoneEnd) / zone * kSpeedOverZone, -kGreatestSpeed);
    return 0;
}

double QVTableGeometry::offsetScrolledBy(double points) const {
    const double offset = contentOffset + points;
    const double greatest = contentHeight() + bottomInset - visibleHeight;
    if (offset < -topInset) return -topInset;
    if (greatest < 0) return contentOffset;
    return std::min(offset, greatest);
}

double QVTableGeometry::restingOffset(double offset) const {
    const double greatest = std::max(-topInset, contentHeight() + bottomInset - visibleHeight);
    return std::isfinite(offset) ? std::clamp(offset, -topInset, greatest) : -topInset;
}
