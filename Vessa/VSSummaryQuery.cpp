#include "Vessa/VSSummaryQuery.h"

#include <algorithm>
#include <cmath>
#include <set>

#include "Vessa/VSQueryAnswerer.h"
#include "Vessa/VSStatisticsEngine.h"

namespace {

using Value = std::optional<VSSummaryValue>;

constexpr int kAsleep = 1, kStood = 0;

/// The value of one type over a range, from one snapshot.
class Summary {
 public:
    Summary(VSStoreReader& reader, const VSSummaryQuery& query, const VSObjectType* type)
        : reader_(reader),
          predicate_(query.predicate()),
          type_(type),
          start_(query.startDate.microseconds()),
          end_(query.endDate.microseconds()) {}

    Value value() {
        if (type_->isQuantityType()) return quantity();
        if (type_->kind() == VSTypeKind::Workout) return workouts();
        if (!type_->isCategoryType()) return std::nullopt;
        if (type_->code() == VSCode::SleepAnalysis) return sleep();
        if (type_->code() == VSCode::ZentroStandHour) return hoursStood();
        if (type_->code() == VSCode::SexualActivity) return startingSamples();
        return latest();
    }

 private:
    void forEach(const std::function<void(const VSSampleRow&)>& block) {
        reader_.scan(type_, predicate_, true, [&](const VSSampleRow& row) {
            block(row);
            return true;
        });
    }

    Value quantity() {
        const bool sum = type_->isCumulative();
        const auto statistics =
            VSStatisticsEngine(reader_, type_, predicate_,
                               sum ? VSStatisticsOptionCumulativeSum : VSStatisticsOptionDiscreteAverage)
                .statistics();
        const auto found = sum ? statistics.sumQuantity() : statistics.averageQuantity();
        if (!found) return std::nullopt;
        return *found;
    }

    Value sleep() {
        bool asleep = false, any = false;
        std::optional<VSDuration> durations[2];
        int64_t reached[2] = {INT64_MIN, INT64_MIN};  // the end of the time that was counted
        forEach([&](const VSSampleRow& row) {
            const bool sleeping = static_cast<int>(row.value) == kAsleep;
            any = true;
            asleep = asleep || sleeping;
            const int64_t from = std::max({row.start, start_, reached[sleeping]}),
                          to = std::min(row.end(), end_);
            auto& total = durations[sleeping];
            total = total.value_or(VSDuration(0)) + VSDuration(std::max<int64_t>(0, to - from));
            reached[sleeping] = std::max(reached[sleeping], to);
        });
        if (!any) return std::nullopt;
        return *durations[asleep];
    }

    Value hoursStood() {
        std::set<int64_t> starts;
        bool any = false;
        forEach([&](const VSSampleRow& row) {
            if (row.start < start_) return;
            any = true;
            if (static_cast<int>(row.value) == kStood) starts.insert(row.start);
        });
        if (!any) return std::nullopt;
        return VSSampleCount{static_cast<int64_t>(starts.size())};
    }

    Value startingSamples() {
        int64_t count = 0;
        forEach([&](const VSSampleRow& row) { count += row.start >= start_; });
        if (!count) return std::nullopt;
        return VSSampleCount{count};
    }

    Value workouts() {
        std::optional<VSDuration> total;
        forEach([&](const VSSampleRow& row) {
            const auto workout = std::dynamic_pointer_cast<const VSWorkout>(reader_.object(type_, row));
            double share = 1;
            if (row.duration > 0)
                share = static_cast<double>(std::min(row.end(), end_) - std::max(row.start, start_)) /
                        static_cast<double>(row.duration);
            const auto counted = static_cast<double>(workout->duration().count()) * share;
            total = total.value_or(VSDuration(0)) + VSDuration(std::llround(counted));
        });
        if (!total) return std::nullopt;
        return *total;
    }

    Value latest() {
        std::optional<VSSampleRow> latest;
        forEach([&](const VSSampleRow& row) {
            if (!latest || std::pair(row.end(), row.id) > std::pair(latest->end(), latest->id)) latest = row;
        });
        if (!latest) return std::nullopt;
        if (type_->code() == VSCode::IntermenstrualBleeding) return VSDate::fromMicroseconds(latest->start);
        return VSCategoryValue{static_cast<int>(latest->value)};
    }

    VSStoreReader& reader_;
    const VSPredicate& predicate_;
    const VSObjectType* const type_;
    const int64_t start_, end_;
};

bool same(const Value& a, const Value& b) {
    if (!a || !b || a->index() != b->index()) return !a && !b;
    // Both are in the type's canonical unit.
    if (const auto* quantity = std::get_if<VSQuantity>(&*a))
        return quantity->value() == std::get<VSQuantity>(*b).value();
    return std::visit(
        [&](const auto& value) {
            using T = std::decay_t<decltype(value)>;
            if constexpr (std::is_same_v<T, VSQuantity>)
                return false;  // above
            else
                return value == std::get<T>(*b);
        },
        *a);
}

class Summaries final : public VSQueryAnswerer {
 public:
    explicit Summaries(const VSSummaryQuery& query) : query_(query) {}
    bool isLive() const override { return static_cast<bool>(query_.updateHandler); }

    Delivery answer(VSQueryLook& look) override {
        Values told = told_;
        std::map<int, int64_t> changes;
        auto result = look.read(query_, [&](VSStoreReader& reader) {
            changes = reader.typeChanges();
            return changed(reader, look, changes, told);
        });
        if (result) {
            told_ = std::move(told);
            seen_ = std::move(changes);
        }
        const bool first = std::exchange(first_, false);
        if (!first && result && result->empty()) return {};
        return VSDeliver(first ? query_.completionHandler : query_.updateHandler, std::move(result));
    }

 private:
    using Values = VSSummaryQuery::Values;

    /// What is new against `told`, of the types that changed since the last answer.
    Values changed(VSStoreReader& reader, VSQueryLook& look, const std::map<int, int64_t>& changes,
                   Values& told) const {
        Values news;
        for (const auto& [code, change] : changes) {
            const auto seen = seen_.find(code);
            if (seen != seen_.end() && seen->second == change) continue;
            const VSObjectType* type = VSObjectType::dataTypeWithCode(code);
            if (!type || !type->isSampleType()) continue;
            Value value;
            if (query_.startDate < query_.endDate && look.mayRead(reader, type))
                value = Summary(reader, query_, type).value();
            Value& before = told[type];
            if (!same(before, value)) news[type] = before = value;
        }
        return news;
    }

    const VSSummaryQuery& query_;
    bool first_ = true;
    Values told_;
    std::map<int, int64_t> seen_;  // the last change of each type
};

}  // namespace

std::unique_ptr<VSQueryAnswerer> VSSummaryQuery::answerer() const {
    return std::make_unique<Summaries>(*this);
}
