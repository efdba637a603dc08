#include "Qelvar/Charts/QVChartDescriptor.h"

#include "Qelvar/Charts/QVLineSeries.h"

namespace {

constexpr double kDefaultPointRadius = 4;

}  // namespace

std::unique_ptr<QVChartSeries> QVChartDescriptor::generateChartSeries() const {
    const auto type = contents_.find("type");
    if (type == contents_.end() || !type->second.string() || *type->second.string() != "lineSeries")
        return nullptr;
    auto series = std::make_unique<QVLineSeries>();
    series->setWaveForm(QVLineSeries::WaveForm::SawTooth);
    const auto radius = contents_.find("pointRadius");
    const std::optional<double> number = radius == contents_.end() ? std::nullopt : radius->second.number();
    series->setPointRadius(static_cast<float>(number.value_or(kDefaultPointRadius)));
    return series;
}
