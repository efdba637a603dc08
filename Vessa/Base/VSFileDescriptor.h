#pragma once

#include <unistd.h>

#include <utility>

/// An open file or folder, closed with its owner. -1: none.
class VSFileDescriptor {
 public:
    VSFileDescriptor() = default;
    explicit VSFileDescriptor(int descriptor) : descriptor_(descriptor) {}
    VSFileDescriptor(VSFileDescriptor&& other) noexcept : descriptor_(std::exchange(other.descriptor_, -1)) {}
    VSFileDescriptor& operator=(VSFileDescriptor&& other) noexcept {
        std::swap(descriptor_, other.descriptor_);
        return *this;
    }
    ~VSFileDescriptor() {
        if (descriptor_ >= 0) close(descriptor_);
    }
    int get() const { return descriptor_; }
    bool isOpen() const { return descriptor_ >= 0; }

 private:
    int descriptor_ = -1;
};
