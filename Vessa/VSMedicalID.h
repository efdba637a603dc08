#pragma once

#include "Vessa/VSHealthStore.h"

/// The Medical ID as a dictionary without its picture, whose keys the store and exports keep; and back. What
/// is of another kind than its key says counts as not there.
VSValue::Dictionary VSMedicalIDContent(const VSMedicalIDData& data);
VSMedicalIDData VSMedicalIDFromContent(const VSValue::Dictionary& content);

/// A birth date as one number: year * 10000 + month * 100 + day.
int64_t VSStoredBirthDate(const VSBirthDate& date);
VSBirthDate VSBirthDateFromStored(int64_t value);
