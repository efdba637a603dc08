#include "Vessa/Base/VSError.h"

bool vs_isDatabaseAccessibilityError(const VSError& error) {
    return error.code == VSErrorCode::NotAccessible;
}

const char* VSErrorCodeName(VSErrorCode code) {
    switch (code) {
        case VSErrorCode::NotFound:
            return "not found";
        case VSErrorCode::Invalid:
            return "invalid";
        case VSErrorCode::Refused:
            return "refused";
        case VSErrorCode::NotAccessible:
            return "not accessible";
        case VSErrorCode::Corrupt:
            return "corrupt";
        case VSErrorCode::DiskFull:
            return "disk full";
        case VSErrorCode::Cancelled:
            return "cancelled";
        case VSErrorCode::Failed:
            return "failed";
    }
    return "failed";
}
