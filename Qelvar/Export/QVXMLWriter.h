#pragma once

#include <libxml/xmlwriter.h>

#include <filesystem>
#include <memory>
#include <optional>
#include <span>
#include <string>

#include "Vessa/Base/VSError.h"

/// A file that is written: open for that by whoever made it, and its name for messages.
struct QVExportFile {
    std::filesystem::path path;
    int descriptor = -1;
};

/// A document written through libxml2's text writer into a file, indented by one blank. After a failure
/// nothing more is written and status() tells it. Texts are UTF-8; characters that XML does not have become
/// U+FFFD. Used by one thread at a time.
class QVXMLWriter {
 public:
    /// Writes into the file, which is empty; it may be closed meanwhile.
    explicit QVXMLWriter(const QVExportFile& file);
    ~QVXMLWriter();
    QVXMLWriter(const QVXMLWriter&) = delete;
    QVXMLWriter& operator=(const QVXMLWriter&) = delete;

    /// Null: the declaration does not say it.
    void startDocument(const char* version, const char* encoding);
    void documentType(const char* name, const char* internalSubset);
    void processingInstruction(const char* target, std::span<const std::string> contents);
    void startElement(const char* name);
    void endElement();
    void attribute(const char* name, const char* asciiText);
    void attribute(const char* name, const std::string& text);
    /// An element with a text and nothing else.
    void textElement(const char* name, const std::string& text);
    void text(const std::string& text);
    /// Ends the elements that are open and the document, and closes the file.
    VSStatus finish();
    VSStatus status() const;

 private:
    class File;
    void check(int result) { failed_ = failed_ || result < 0; }
    /// The text as XML can hold it; valid until the next call.
    const xmlChar* clean(const std::string& text);

    struct WriterFree {
        void operator()(xmlTextWriterPtr writer) const { xmlFreeTextWriter(writer); }
    };
    const std::unique_ptr<File> file_;
    std::unique_ptr<xmlTextWriter, WriterFree> writer_;  // null: could not be made, or has ended
    std::string cleaned_;
    bool failed_ = false;
};
