#pragma once

#include <cstddef>
#include <optional>
#include <string_view>

#include "Vessa/Base/VSDate.h"
#include "Vessa/Base/VSError.h"
#include "Vessa/Base/VSValue.h"

class VSSample;
struct VSBirthDate;
struct VSMedicalIDData;

/// What a store takes. Saving and importing ask here and nowhere else, so that whatever was saved can be
/// exported and imported again. Nothing here depends on the clock: one that is wrong must not turn records
/// away. Values that are no finite numbers are never taken; negative ones are, since some trackers correct
/// an amount by one.
namespace VSLimits {

/// Dates of all kinds: the years 1 to 9999 in UTC.
inline constexpr VSDate earliestDate = VSDate::fromSeconds(-62'135'596'800);
inline constexpr VSDate latestDate = VSDate::fromMicroseconds(253'402'300'799'000'000);
/// Sums are exact as long as no value is so great; no measure of a person comes near it.
inline constexpr double absurdValue = 0x1p47;
/// Seconds from Greenwich.
inline constexpr int greatestTimeZoneOffset = 18 * 3600;
/// Bytes of a source's name, identifier or version, and of a field of a device. Empty ones are taken.
inline constexpr size_t longestText = 64 * 1024;
/// Bytes of the metadata of an object, and of a Medical ID without its picture, as VSValue::serialized()
/// writes them, and how deep their values may hold others.
inline constexpr size_t longestMetadata = 1024 * 1024;
inline constexpr int deepestMetadata = 60;
/// That one sample may belong to.
inline constexpr size_t mostWorkouts = 64;
inline constexpr size_t largestPicture = 16 * 1024 * 1024;

inline bool isDate(VSDate date) {
    return date >= earliestDate && date <= latestDate;
}

}  // namespace VSLimits

// Why something cannot be saved, an Invalid error; none: it can. Any thread.
std::optional<VSError> VSObjectionToSample(const VSSample& sample);
std::optional<VSError> VSObjectionToBirthDate(const VSBirthDate& date);
std::optional<VSError> VSObjectionToMedicalID(const VSMedicalIDData& data);
