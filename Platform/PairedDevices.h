#pragma once

#include <QObject>

namespace platform {

/// The watches paired with this machine. Main thread only; one object for the process. Nothing on this
/// platform pairs a watch with the program yet: whoever does tells it here.
class PairedDevices : public QObject {
    Q_OBJECT
 public:
    static PairedDevices& shared();
    /// Whether a watch is paired now. False until one was told of: this platform has no pairing service yet.
    bool hasActivePairedDevice() const { return active_; }
    /// Tells that a watch was paired, or that the last one is gone (a pairing service, tests).
    void setActivePairedDevice(bool active);

 signals:
    /// A watch was paired.
    void deviceDidPair();

 private:
    bool active_ = false;
};

}  // namespace platform
