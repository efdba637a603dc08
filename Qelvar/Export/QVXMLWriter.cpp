#include "Qelvar/Export/QVXMLWriter.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <vector>

#include "Qelvar/Import/QVXMLText.h"
#include "Vessa/VSDatabase.h"

namespace {

const xmlChar* xml(const char* text) {
    return reinterpret_cast<const xmlChar*>(text);
}

}  // namespace

/// Where the writer's bytes go: a file whose errors are not lost, as they would be with a buffered stream.
class QVXMLWriter::File {
 public:
    explicit File(const QVExportFile& file)
        : path_(file.path), descriptor_(fcntl(file.descriptor, F_DUPFD_CLOEXEC, 3)) {
        if (descriptor_ < 0) reason_ = errno;
        buffer_.reserve(kSize);
    }
    ~File() { close(); }
    File(const File&) = delete;
    File& operator=(const File&) = delete;

    void write(const char* bytes, size_t size) {
        if (reason_ != 0) return;
        buffer_.insert(buffer_.end(), bytes, bytes + size);
        if (buffer_.size() >= kSize) flush();
    }
    void flush() {
        for (size_t done = 0; reason_ == 0 && done < buffer_.size();) {
            const ssize_t count = ::write(descriptor_, buffer_.data() + done, buffer_.size() - done);
            if (count >= 0)
                done += static_cast<size_t>(count);
            else if (errno != EINTR)
                reason_ = errno;
        }
        buffer_.clear();
    }
    void close() {
        if (descriptor_ < 0) return;
        flush();
        if (::close(std::exchange(descriptor_, -1)) != 0 && reason_ == 0) reason_ = errno;
    }
    /// An errno; 0: all is well.
    int reason() const { return reason_; }
    const std::filesystem::path& path() const { return path_; }

 private:
    static constexpr size_t kSize = 128 * 1024;
    const std::filesystem::path path_;
    int descriptor_;
    int reason_ = 0;
    std::vector<char> buffer_;
};

QVXMLWriter::QVXMLWriter(const QVExportFile& file) : file_(std::make_unique<File>(file)) {
    const auto write = [](void* context, const char* bytes, int size) {
        static_cast<File*>(context)->write(bytes, static_cast<size_t>(size));
        return size;  // the file knows of its errors; libxml2 would print them
    };
    xmlOutputBufferPtr output = xmlOutputBufferCreateIO(write, nullptr, file_.get(), nullptr);
    if (!output) return;
    writer_.reset(xmlNewTextWriter(output));
    if (!writer_) {
        xmlOutputBufferClose(output);
        return;
    }
    check(xmlTextWriterSetIndent(writer_.get(), 1));
    check(xmlTextWriterSetIndentString(writer_.get(), xml(" ")));
}

QVXMLWriter::~QVXMLWriter() = default;

const xmlChar* QVXMLWriter::clean(const std::string& text) {
    if (QVIsXMLText(text)) return xml(text.c_str());
    cleaned_ = QVXMLText(text);
    return xml(cleaned_.c_str());
}

void QVXMLWriter::startDocument(const char* version, const char* encoding) {
    if (writer_) check(xmlTextWriterStartDocument(writer_.get(), version, encoding, nullptr));
}

void QVXMLWriter::documentType(const char* name, const char* internalSubset) {
    if (writer_)
        check(xmlTextWriterWriteDTD(writer_.get(), xml(name), nullptr, nullptr, xml(internalSubset)));
}

void QVXMLWriter::processingInstruction(const char* target, std::span<const std::string> contents) {
    if (!writer_) return;
    check(xmlTextWriterStartPI(writer_.get(), xml(target)));
    for (const std::string& content : contents)
        check(xmlTextWriterWriteString(writer_.get(), xml(content.c_str())));
    check(xmlTextWriterEndPI(writer_.get()));
}

void QVXMLWriter::startElement(const char* name) {
    if (writer_) check(xmlTextWriterStartElement(writer_.get(), xml(name)));
}

void QVXMLWriter::endElement() {
    if (writer_) check(xmlTextWriterEndElement(writer_.get()));
}

void QVXMLWriter::attribute(const char* name, const char* asciiText) {
    if (writer_) check(xmlTextWriterWriteAttribute(writer_.get(), xml(name), xml(asciiText)));
}

void QVXMLWriter::attribute(const char* name, const std::string& text) {
    if (writer_) check(xmlTextWriterWriteAttribute(writer_.get(), xml(name), clean(text)));
}

void QVXMLWriter::textElement(const char* name, const std::string& text) {
    if (writer_) check(xmlTextWriterWriteElement(writer_.get(), xml(name), clean(text)));
}

void QVXMLWriter::text(const std::string& text) {
    if (writer_) check(xmlTextWriterWriteString(writer_.get(), clean(text)));
}

VSStatus QVXMLWriter::finish() {
    if (writer_) {
        check(xmlTextWriterEndDocument(writer_.get()));
        writer_.reset();  // hands over what it still holds
        file_->close();
    } else {
        failed_ = true;
    }
    return status();
}

VSStatus QVXMLWriter::status() const {
    if (file_->reason() != 0) return VSErrorFromSystem(file_->reason(), file_->path().string());
    if (failed_)
        return VSError{VSErrorCode::Failed, file_->path().string() + ": the document cannot be written"};
    return {};
}
