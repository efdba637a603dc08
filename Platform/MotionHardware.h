#pragma once

#include <memory>

namespace platform {

/// What the machine can count of a person's movement. Any thread.
class MotionHardware {
 public:
    virtual ~MotionHardware() = default;
    virtual bool canCountSteps() const = 0;
    virtual bool canMeasureDistance() const = 0;
    virtual bool canCountFloors() const = 0;

    /// The machine's. Never null. On this platform movement is counted by the wearables and programs whose
    /// records reach the store, and not by a sensor of the machine itself, so everything counts as present.
    static std::shared_ptr<const MotionHardware> current();
    /// Installs another one (tests) and returns the one before. A null pointer restores the machine's.
    static std::shared_ptr<const MotionHardware> install(std::shared_ptr<const MotionHardware> hardware);
};

}  // namespace platform
