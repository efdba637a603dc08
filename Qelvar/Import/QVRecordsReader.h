#pragma once

#include <atomic>
#include <functional>
#include <optional>
#include <string>

#include "Qelvar/Import/QVImportFile.h"
#include "Qelvar/Import/QVRecordsBuilder.h"
#include "Vessa/Base/VSError.h"

/// Reads one document as a stream of elements and gives them to a builder. It trusts nothing: entities,
/// external declarations, attributes with default values and deep nesting end the reading, and the parser
/// reaches neither network nor files.
class QVRecordsReader {
 public:
    enum class Outcome { Read, OtherDocument };

    /// REQUIRES: file and builder outlive the reader. `cancel` may be null.
    QVRecordsReader(QVImportFile& file, QVRecordsBuilder& builder, const std::atomic<bool>* cancel)
        : file_(file), builder_(builder), cancel_(cancel) {}

    /// Called now and then while reading.
    void setProgress(std::function<void()> progress) { progress_ = std::move(progress); }

    /// Reads the file's current document to its end. OtherDocument: it is XML, and its root element is not
    /// that of a records document; otherRoot() names it. Invalid: not well-formed or refused, with name, line
    /// and reason.
    VSResult<Outcome> read();
    const std::string& otherRoot() const { return otherRoot_; }

 private:
    class Parser;

    QVImportFile& file_;
    QVRecordsBuilder& builder_;
    const std::atomic<bool>* const cancel_;
    std::function<void()> progress_;
    std::string otherRoot_;
};
