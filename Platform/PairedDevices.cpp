#include "Platform/PairedDevices.h"

namespace platform {

PairedDevices& PairedDevices::shared() {
    static PairedDevices instance;
    return instance;
}

void PairedDevices::setActivePairedDevice(bool active) {
    const bool paired = active && !active_;
    active_ = active;
    if (paired) emit deviceDidPair();
}

}  // namespace platform
