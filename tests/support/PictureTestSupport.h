#pragma once

#include <gtest/gtest.h>

#include <QImage>
#include <QRect>
#include <string>
#include <vector>

namespace test {

/// Compares with tests/data/<name>.png: a pixel differs when a channel is off by more than
/// `channelTolerance`; at most `share` of the pixels may, and at most `regionShare` of those of each region
/// (a short text is little of a picture, yet much of its own place). On failure the actual image and the
/// difference are written to pictures/ beside the test program. `QELVAR_UPDATE_GOLDEN=1` writes the files
/// anew.
testing::AssertionResult matchesPicture(const QImage& image, const std::string& name,
                                        int channelTolerance = 12, double share = 0.002,
                                        const std::vector<QRect>& regions = {}, double regionShare = 0.06);

}  // namespace test
