#pragma once

/// Zoom levels of the graph view, from the longest span to the shortest.
enum class VSDateZoom : int { Year = 0, Month = 1, Week = 2, Day = 3, Hour = 4 };
inline constexpr int VSDateZoomCount = 5;
