#pragma once

#include <memory>

#include "Vessa/Base/VSValue.h"

class QVChartSeries;

/// Makes a series from a dictionary of settings: "type" ("lineSeries") and "pointRadius" (a number).
class QVChartDescriptor {
 public:
    explicit QVChartDescriptor(VSValue::Dictionary contents) : contents_(std::move(contents)) {}
    const VSValue::Dictionary& contents() const { return contents_; }
    /// Null when the contents name no known type.
    std::unique_ptr<QVChartSeries> generateChartSeries() const;

 private:
    VSValue::Dictionary contents_;
};
