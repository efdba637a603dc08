#pragma once

#include <QMetaObject>
#include <QString>
#include <array>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Platform/Queue.h"
#include "Platform/StyledText.h"
#include "Qelvar/DataProviders/QVRunningQuery.h"
#include "Qelvar/Models/Data/QVChartPoint.h"
#include "Qelvar/Models/Data/QVTimeScope.h"
#include "Vessa/VSHealthStore.h"
#include "VessaUI/VSTimePeriods.h"
#include "VessaUI/VSUnitController.h"

/// How far a question to the store has come.
enum class QVDataState : int64_t {
    NotLoaded = 1,  // nothing asked, or the answer was declared old
    Failed = 2,     // the last answer was an error
    Loading = 3,
    Loaded = 4,
};

class QVDataProvider;

/// Told on the main thread.
class QVDataProviderDelegate {
 public:
    virtual ~QVDataProviderDelegate() = default;
    virtual void dataProviderDidUpdateHistoricalData(QVDataProvider& provider) = 0;
    virtual void dataProviderDidUpdateCurrentValueData(QVDataProvider& provider) = 0;
    virtual void dataProviderDidUpdateSecondaryData(QVDataProvider& provider) = 0;
    /// The points of the visible time scope were asked for again and are the same.
    virtual void dataProviderDidConfirmHistoricalData(QVDataProvider&) {}
};

/// Feeds the chart of one data unit: for each time scope the points of the visible span and the secondary
/// values (average, minimum, maximum), and one current value. The base keeps them with their states and tells
/// the delegate when they change; subclasses ask the store. All numbers are in the user's preferred unit, as
/// shown, but where a subclass says otherwise.
///
/// Main thread only; held by shared pointers. Handlers given to the store hold plain values and an Intake,
/// never the provider itself, so that a provider always ends on the main thread and its late answers go
/// nowhere.
class QVDataProvider : public std::enable_shared_from_this<QVDataProvider> {
 public:
    using Points = std::vector<QVChartPointPtr>;
    using Error = std::optional<VSError>;
    using Value = std::optional<double>;
    using Unit = std::optional<VSUnit>;
    /// The place of a question in the order of the provider's questions. An answer is dropped when one to a
    /// later question of the same kind (and time scope) has been taken, or when a later query of that kind
    /// was begun. 0 is always taken.
    using Ticket = uint64_t;

    /// REQUIRES: nothing is null; the charting rules live until the process ends.
    QVDataProvider(const VSDataUnit* dataUnit, const VSDataUnitGroupChartingRules& chartingRules,
                   std::shared_ptr<VSUnitController> unitController,
                   std::shared_ptr<VSHealthStore> healthStore);
    /// Ends all queries.
    virtual ~QVDataProvider();
    QVDataProvider(const QVDataProvider&) = delete;
    QVDataProvider& operator=(const QVDataProvider&) = delete;

    std::shared_ptr<QVDataProviderDelegate> delegate() const { return delegate_.lock(); }
    void setDelegate(std::weak_ptr<QVDataProviderDelegate> delegate) { delegate_ = std::move(delegate); }

    const std::shared_ptr<VSUnitController>& unitController() const { return unitController_; }
    const std::shared_ptr<VSHealthStore>& healthStore() const { return healthStore_; }
    const VSDataUnit* dataUnit() const { return dataUnit_; }
    const VSDataUnitGroupChartingRules& chartingRules() const { return chartingRules_; }

    /// Of the visible time scope.
    const Points& historicalData() const { return visible().historicalData; }
    QVDataState historicalDataState() const { return visible().historicalDataState; }
    Value averageValue() const { return visible().averageValue; }
    Value minValue() const { return visible().minValue; }
    Value maxValue() const { return visible().maxValue; }
    Value secondaryValue() const { return averageValue(); }
    QVDataState secondaryValueDataState() const { return visible().secondaryValueDataState; }
    /// Of all time scopes. The date belongs to the current value.
    Value currentValue() const { return currentValue_; }
    std::optional<VSDate> lastUpdatedDate() const { return lastUpdatedDate_; }
    QVDataState currentValueDataState() const { return currentValueDataState_; }

    bool hasLoadedHistoricalData() const { return historicalDataState() == QVDataState::Loaded; }
    bool hasLoadedCurrentValue() const { return currentValueDataState_ == QVDataState::Loaded; }
    /// Whether the current value may be shown: it is loaded, or it was and has been expressed in another unit
    /// since, while it is asked for again.
    bool holdsCurrentValue() const { return hasLoadedCurrentValue() || currentValueWasConverted_; }
    bool hasLoadedSecondaryValues() const { return secondaryValueDataState() == QVDataState::Loaded; }

    /// Whether the display type shows such values at all; what it does not show is never asked for.
    virtual bool showsCurrentValue() const { return true; }
    virtual bool showsSecondaryValues() const { return true; }
    /// Whether something that it shows has not been loaded.
    bool isWaiting() const {
        return !hasLoadedHistoricalData() || (showsCurrentValue() && !hasLoadedCurrentValue()) ||
               (showsSecondaryValues() && !hasLoadedSecondaryValues());
    }

    std::optional<VSDate> startDate() const { return startDate_; }
    std::optional<VSDate> endDate() const { return endDate_; }
    QVTimeScope timeScope() const { return timeScope_; }
    /// Sets the visible span and scope. Nothing is asked until restartQueries. REQUIRES: a time scope.
    void setStartDate(std::optional<VSDate> startDate, std::optional<VSDate> endDate, QVTimeScope timeScope);

    /// What stands under the chart: "daily average" (in the day scope "7-day average", since it is not of the
    /// day that is shown) and the average, or the text for no data.
    virtual platform::StyledText secondaryValueText() const;

    /// Asks (again) for what the visible span needs. Subclasses call the base first.
    virtual void restartQueries();
    virtual void stopQueries();
    /// Makes the next restartQueries ask for the current value again. What was loaded stays until replaced.
    void invalidateCachedData();
    /// Asks again when what was asked for concerned another day, or a day of another time zone. For a span
    /// that stays the same when the day turns.
    void restartQueriesOfAnotherDay();

    /// The class's name, for logs. Lives until the process ends.
    virtual const char* className() const = 0;

    /// Takes answers on any thread and hops with them to the main queue. Plain value; it does not keep the
    /// provider. `unit`: what the numbers are in, when the preferred unit may be another by the time that
    /// they arrive (they are converted then); none: they are as they are to be kept.
    class Intake {
     public:
        void updateHistoricalData(Points points, QVTimeScope timeScope, Error error, Unit unit = {},
                                  Ticket ticket = 0) const;
        void updateAverage(Value average, Value min, Value max, QVTimeScope timeScope, Error error,
                           Unit unit = {}, Ticket ticket = 0) const;
        /// One value, the average of all time scopes.
        void updateSecondaryValue(Value value, const Error& error, Ticket ticket = 0) const;
        void updateCurrentValue(Value value, std::optional<VSDate> date, Error error, Unit unit = {},
                                Ticket ticket = 0) const;
        /// Writes "<class>: <what>: <error>": as an error, or quietly when the store is merely locked.
        void logError(std::string_view what, const VSError& error) const;
        /// Writes it as an error whatever it is.
        void logErrorAlways(std::string_view what, const VSError& error) const;
        const char* className() const { return className_; }

     private:
        friend class QVDataProvider;
        Intake(std::weak_ptr<QVDataProvider> provider, const char* className)
            : provider_(std::move(provider)), className_(className) {}
        std::weak_ptr<QVDataProvider> provider_;
        const char* className_;
    };
    Intake intake() { return Intake(weak_from_this(), className()); }

 protected:
    enum class Answer { Historical, Secondary, CurrentValue };
    /// The ticket of a new query: answers to earlier ones of that kind and scope (none: all scopes) are no
    /// longer wanted.
    Ticket beginQuery(Answer answer, std::optional<QVTimeScope> timeScope = std::nullopt);
    /// Whether the query of the current value must be started: it is not running, has not answered, or was
    /// started on another day or in another time zone, when "today" meant something else.
    bool needsCurrentValueQuery(const QVRunningQuery& query) const;
    /// The same of a secondary value that does not depend on the visible span.
    bool needsSecondaryValueQuery(const QVRunningQuery& query) const;
    /// The ticket of a question that a running query raised.
    Ticket nextTicket() { return ++lastTicket_; }

    /// The bucket of the statistics of a time scope; none where it is not charted in buckets.
    std::optional<VSDateComponents> intervalComponentsForTimeScope(QVTimeScope timeScope) const;
    /// The preferred unit, for a quantity type.
    VSUnit preferredUnit() const { return unitController_->unitForDataUnit(dataUnit_); }
    /// The date of a current value that such a span tells: its last moment, but what has begun is so until
    /// now and not until a moment that is to come.
    static VSDate dateOfCurrentValue(const VSTimeSpan& span);
    /// The text of a value in a secondary text (not held in the display range), or that for no data.
    QString secondaryTextForValue(Value value) const;

    void execute(const std::shared_ptr<VSQuery>& query) { healthStore_->executeQuery(query); }

    /// A function for any thread that runs `block(provider, arguments...)` on the main thread, while the
    /// provider lives.
    template <typename Provider, typename Block>
    static auto onMainQueue(Provider* provider, Block block) {
        std::weak_ptr<Provider> weak = std::static_pointer_cast<Provider>(provider->shared_from_this());
        return [weak, block]<typename... Arguments>(Arguments... arguments) {
            platform::mainQueue().async([weak, block, arguments...] {
                if (auto self = weak.lock()) block(*self, arguments...);
            });
        };
    }

 private:
    struct CacheValue {
        Points historicalData;
        bool holdsHistoricalData = false;  // an array was stored, perhaps an empty one
        QVDataState historicalDataState = QVDataState::NotLoaded;
        Value averageValue, minValue, maxValue;
        QVDataState secondaryValueDataState = QVDataState::NotLoaded;
        Ticket historicalTicket = 0, secondaryTicket = 0;  // answers with earlier ones come too late
    };
    struct Today {
        VSDate start;
        std::string timeZone;
        static Today now();
        friend bool operator==(const Today&, const Today&) = default;
    };
    const CacheValue& visible() const { return cacheValues_[static_cast<size_t>(timeScope_)]; }
    CacheValue& cache(QVTimeScope timeScope) { return cacheValues_[static_cast<size_t>(timeScope)]; }
    void takeHistoricalData(Points points, QVTimeScope timeScope, const Error& error, const Unit& unit,
                            Ticket ticket);
    void takeAverage(Value average, Value min, Value max, QVTimeScope timeScope, const Error& error,
                     const Unit& unit, Ticket ticket);
    void takeCurrentValue(Value value, std::optional<VSDate> date, const Error& error, const Unit& unit,
                          Ticket ticket);

    void unitPreferencesDidChange(const QSet<const VSObjectType*>& changedTypes);
    /// Expresses everything kept in a new unit, so that no old number is ever shown with a new unit's name.
    void convertCachedValues(const VSUnit& from, const VSUnit& to);
    Value converted(Value value, const VSUnit& from, const VSUnit& to) const;
    Points converted(const Points& points, const VSUnit& from, const VSUnit& to) const;
    /// Whether numbers in the unit must be converted before they are kept.
    bool isForeign(const Unit& unit) const { return unit && keptUnit_ && *unit != *keptUnit_; }

    // Constant after construction
    const std::shared_ptr<VSUnitController> unitController_;
    const std::shared_ptr<VSHealthStore> healthStore_;
    const VSDataUnit* const dataUnit_;
    const VSDataUnitGroupChartingRules& chartingRules_;
    QMetaObject::Connection unitPreferences_;

    std::array<CacheValue, QVTimeScopeCount> cacheValues_;
    QVDataState currentValueDataState_ = QVDataState::NotLoaded;
    bool currentValueWasConverted_ = false;
    Value currentValue_;
    std::optional<VSDate> lastUpdatedDate_;
    std::weak_ptr<QVDataProviderDelegate> delegate_;
    std::optional<VSDate> startDate_, endDate_;
    QVTimeScope timeScope_{};
    std::optional<Today> currentValueAskedOn_, secondaryValueAskedOn_;
    Unit keptUnit_;  // of the numbers kept; none: not a quantity
    Ticket currentValueTicket_ = 0;
    Ticket lastTicket_ = 0;
};
