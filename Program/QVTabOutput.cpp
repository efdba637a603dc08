#include "Program/QVTabOutput.h"

#include <cerrno>
#include <charconv>
#include <cstdio>
#include <cstring>

namespace {

constexpr size_t kFlushSize = 64 * 1024;

}  // namespace

void QVTabOutput::row(std::initializer_list<std::string_view> fields) {
    bool first = true;
    for (const std::string_view field : fields) append(field, std::exchange(first, false));
    endRow();
}

void QVTabOutput::row(const std::vector<std::string>& fields) {
    bool first = true;
    for (const std::string& field : fields) append(field, std::exchange(first, false));
    endRow();
}

void QVTabOutput::append(std::string_view field, bool first) {
    if (!first) buffer_ += '\t';
    for (const char c : field) {
        switch (c) {
            case '\\':
                buffer_ += "\\\\";
                break;
            case '\t':
                buffer_ += "\\t";
                break;
            case '\n':
                buffer_ += "\\n";
                break;
            case '\r':
                buffer_ += "\\r";
                break;
            default:
                buffer_ += c;
        }
    }
}

void QVTabOutput::endRow() {
    buffer_ += '\n';
    if (buffer_.size() < kFlushSize) return;
    failed_ = std::fwrite(buffer_.data(), 1, buffer_.size(), stdout) != buffer_.size() || failed_;
    buffer_.clear();
}

VSStatus QVTabOutput::finish() {
    failed_ = std::fwrite(buffer_.data(), 1, buffer_.size(), stdout) != buffer_.size() || failed_;
    buffer_.clear();
    failed_ = std::fflush(stdout) != 0 || failed_;
    if (failed_) return VSError{VSErrorCode::Failed, std::string("standard output: ") + std::strerror(errno)};
    return {};
}

std::string QVTabOutput::number(double value) {
    char buffer[32];
    const auto end = std::to_chars(buffer, buffer + sizeof buffer, value).ptr;
    return {buffer, end};
}
