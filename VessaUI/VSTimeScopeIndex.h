#pragma once

/// A time scope by its number (0 hour, 1 day, 2 week, 3 month, 4 year), as the catalogue's charting rules
/// take it. The application's QVTimeScope has the same numbers.
using VSTimeScopeIndex = int;
