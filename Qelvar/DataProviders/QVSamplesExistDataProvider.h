#pragma once

#include <QString>
#include <optional>
#include <vector>

#include "Qelvar/DataProviders/QVDataProvider.h"

/// For records that say that something was so and not how much: the chart shows stretches of days that have
/// samples (pairs of points with y 0) and accents on notable ones (points with y 1); the current value is the
/// latest sample's category value; the secondary value is the end of the latest notable sample (in its
/// last day: VSLastMomentOfSample), in seconds since the reference date, for all time scopes.
class QVSamplesExistDataProvider : public QVDataProvider {
 public:
    using QVDataProvider::QVDataProvider;

    void restartQueries() override;
    void stopQueries() override;
    bool showsCurrentValue() const override { return shouldDisplayPrimaryValue(); }
    bool showsSecondaryValues() const override { return shouldDisplaySecondaryValue(); }
    /// Empty when there is nothing to show.
    platform::StyledText secondaryValueText() const override;
    const char* className() const override { return "QVSamplesExistDataProvider"; }

    /// The points of stretches of samples, which are in ascending order of their starts; a day left out ends
    /// a stretch (VSContinuesSection). Any thread.
    static Points sectionPointsFromSamples(const std::vector<VSSamplePtr>& samples);

 protected:
    // What the subclasses change.
    virtual QString secondaryTextForDate(const QString& date) const { return date; }
    virtual VSPredicate predicateForSecondaryValue() const { return {}; }
    virtual bool shouldDisplayPrimaryValue() const { return true; }
    virtual bool shouldDisplaySecondaryValue() const { return false; }
    virtual bool shouldPrefixSecondaryValueWithDot() const { return true; }
    /// Whether a sample gets an accent. Called on the store's threads.
    using Accent = bool (*)(const VSSample& sample);
    virtual Accent accent() const {
        return [](const VSSample&) { return false; };
    }

 private:
    void restartCurrentValueQuery();
    void updateMostRecentObject(const Error& error);
    void restartSecondaryValueQuery();
    void updateSecondaryValue(const Error& error);
    void restartHistoricalDataQuery();
    void updateHistoricalData(const VSPredicate& predicate, QVTimeScope timeScope, const Error& error);

    QVRunningQuery currentValueQuery_;
    QVRunningQuery historicalDataQuery_;
    QVRunningQuery secondaryValueQuery_;
};

/// Menstrual flow: the starts of cycles are notable.
class QVMenstruationDataProvider final : public QVSamplesExistDataProvider {
 public:
    using QVSamplesExistDataProvider::QVSamplesExistDataProvider;
    const char* className() const override { return "QVMenstruationDataProvider"; }

 protected:
    QString secondaryTextForDate(const QString& date) const override;
    VSPredicate predicateForSecondaryValue() const override;
    bool shouldDisplaySecondaryValue() const override { return true; }
    Accent accent() const override;
};

/// Ovulation tests: the positive ones are notable.
class QVOvulationDataProvider final : public QVSamplesExistDataProvider {
 public:
    using QVSamplesExistDataProvider::QVSamplesExistDataProvider;
    const char* className() const override { return "QVOvulationDataProvider"; }

 protected:
    QString secondaryTextForDate(const QString& date) const override;
    VSPredicate predicateForSecondaryValue() const override;
    bool shouldDisplaySecondaryValue() const override { return true; }
    Accent accent() const override;
};

/// Spotting: no value, only when it was last recorded.
class QVSpottingDataProvider final : public QVSamplesExistDataProvider {
 public:
    using QVSamplesExistDataProvider::QVSamplesExistDataProvider;
    const char* className() const override { return "QVSpottingDataProvider"; }

 protected:
    QString secondaryTextForDate(const QString& date) const override;
    bool shouldDisplayPrimaryValue() const override { return false; }
    bool shouldDisplaySecondaryValue() const override { return true; }
    bool shouldPrefixSecondaryValueWithDot() const override { return false; }
};
