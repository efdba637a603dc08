#pragma once

#include <unistd.h>

#include <atomic>
#include <filesystem>
#include <utility>

#include "Vessa/Base/VSError.h"

/// An open file, closed with its owner.
class QVImportFileDescriptor {
 public:
    explicit QVImportFileDescriptor(int descriptor) : descriptor_(descriptor) {}
    QVImportFileDescriptor(QVImportFileDescriptor&& other) noexcept
        : descriptor_(std::exchange(other.descriptor_, -1)) {}
    QVImportFileDescriptor& operator=(QVImportFileDescriptor&&) = delete;
    ~QVImportFileDescriptor() {
        if (descriptor_ >= 0) close(descriptor_);
    }
    int get() const { return descriptor_; }

 private:
    int descriptor_;
};

/// Reads what is there, waiting for it as long as `cancel` (may be null) is not set; 0 at the end.
VSResult<size_t> QVReadWaiting(const QVImportFileDescriptor& file, const std::filesystem::path& path,
                               char* buffer, size_t size, const std::atomic<bool>* cancel);
