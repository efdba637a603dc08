#pragma once

#include <functional>
#include <memory>
#include <optional>

#include "Vessa/VSHealthStore.h"

// Questions that the application asks of a store again and again. All return at once, on any thread; unless
// said otherwise their completions run on the store's threads.

/// The sample of the type that ends last (of equal ones the one saved last), null when there is none. Samples
/// that start tomorrow or later, in the user's calendar, are never it. The predicate narrows the choice.
void mostRecentSampleOfType(VSHealthStore& store, const VSObjectType* type,
                            const std::optional<VSPredicate>& predicate,
                            std::function<void(const VSResult<VSSamplePtr>&)> completion);
/// The same, and those that ended before it, latest first; at most so many.
void mostRecentSamplesOfType(VSHealthStore& store, const VSObjectType* type,
                             const std::optional<VSPredicate>& predicate, int limit,
                             std::function<void(const VSResult<std::vector<VSSamplePtr>>&)> completion);

/// The same, typed. REQUIRES: a quantity type, respectively a category type.
void mostRecentQuantitySampleOfType(
    VSHealthStore& store, const VSObjectType* type, const std::optional<VSPredicate>& predicate,
    std::function<void(const VSResult<std::shared_ptr<const VSQuantitySample>>&)> completion);
void mostRecentCategorySampleOfType(
    VSHealthStore& store, const VSObjectType* type, const std::optional<VSPredicate>& predicate,
    std::function<void(const VSResult<std::shared_ptr<const VSCategorySample>>&)> completion);

/// The average over the samples of the type that the predicate takes, in the unit; none when there are none.
/// REQUIRES: a quantity type and a compatible unit.
void averageQuantityForType(VSHealthStore& store, const VSObjectType* type, const VSUnit& unit,
                            const VSPredicate& predicate,
                            std::function<void(const VSResult<std::optional<double>>&)> completion);

/// The body-mass index in kg/m² of the most recent height and body mass; none when one of them is missing,
/// not positive or could not be read. The completion runs once, on the main thread.
void calculateBMI(VSHealthStore& store, std::function<void(std::optional<double>)> completion);

/// Deletes the object from the store; a correlation takes its members with it, in the same transaction.
void deleteObjectWithHealthStore(const VSSamplePtr& object, VSHealthStore& store,
                                 VSHealthStore::Completion completion);
