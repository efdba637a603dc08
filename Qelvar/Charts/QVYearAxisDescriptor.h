#pragma once

#include "Qelvar/Charts/QVCachedAxisDescriptor.h"

/// The months of a year: every third one, counted backwards from the middle of the last month. The first
/// label and the first one in each new year name the year; the last is highlighted.
class QVYearAxisDescriptor : public QVCachedAxisDescriptor {
 protected:
    std::optional<std::vector<QVAxisLabel>> generateAxisLabels() const override;
};
