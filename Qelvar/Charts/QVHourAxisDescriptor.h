#pragma once

#include "Qelvar/Charts/QVCachedAxisDescriptor.h"

/// The hours of a day: its start, its middle and its end.
class QVHourAxisDescriptor : public QVCachedAxisDescriptor {
 protected:
    std::optional<std::vector<QVAxisLabel>> generateAxisLabels() const override;
};
