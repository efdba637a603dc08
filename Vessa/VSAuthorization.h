#pragma once

#include <vector>

#include "Vessa/VSObjectType.h"
#include "Vessa/VSSource.h"

/// What one application may do with the samples of one type (or with a characteristic). Sharing: write them
/// into the store; reading: see those of others. The numbers are kept on disk and never change.
enum class VSAuthorizationStatus : int {
    Undetermined = 100,  // asked for, not answered yet: neither
    SharingAndReading = 101,
    SharingOnly = 102,
    ReadingOnly = 103,
    Neither = 104,
};

constexpr bool VSAuthorizationStatusAllowsSharing(VSAuthorizationStatus status) {
    return status == VSAuthorizationStatus::SharingAndReading || status == VSAuthorizationStatus::SharingOnly;
}
constexpr bool VSAuthorizationStatusAllowsReading(VSAuthorizationStatus status) {
    return status == VSAuthorizationStatus::SharingAndReading || status == VSAuthorizationStatus::ReadingOnly;
}
constexpr VSAuthorizationStatus VSInternalAuthorizationStatusMake(bool sharing, bool reading) {
    if (sharing)
        return reading ? VSAuthorizationStatus::SharingAndReading : VSAuthorizationStatus::SharingOnly;
    return reading ? VSAuthorizationStatus::ReadingOnly : VSAuthorizationStatus::Neither;
}

/// What an application asked for, and was granted, for one type. Plain value.
struct VSAuthorizationRecord {
    const VSObjectType* type = nullptr;
    VSSource source;  // the application
    VSAuthorizationStatus status = VSAuthorizationStatus::Undetermined;
    bool requestedReading = false, requestedSharing = false;
};

/// Whether a source reads and writes by permission: every program but this one. Devices and documents, whose
/// records a person brought in, need none.
bool vs_requiresAuthorization(const VSSource& source);
/// Those that take part in authorization, in their order.
std::vector<VSSource> vs_sourcesForAuthorization(const std::vector<VSSource>& sources);
/// Those that wrote without needing permission, in their order.
std::vector<VSSource> vs_sourcesForDevices(const std::vector<VSSource>& sources);
