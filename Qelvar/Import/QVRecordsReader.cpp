#include "Qelvar/Import/QVRecordsReader.h"

#include <libxml/parser.h>
#include <libxml/parserInternals.h>

#include <algorithm>
#include <array>
#include <memory>
#include <utility>
#include <vector>

#include "Qelvar/Import/QVExactInstructions.h"
#include "Qelvar/Import/QVImportText.h"

namespace {

constexpr size_t kDeepestNesting = 16;
constexpr size_t kBufferSize = 64 * 1024;

std::string_view text(const xmlChar* chars) {
    return chars ? std::string_view(reinterpret_cast<const char*>(chars)) : std::string_view();
}

/// The parser's own way of telling errors, which are told otherwise here.
void saySilently(void*, const char*, ...) {}

/// Where an element may stand.
bool isAllowed(QVElementName element, QVElementName parent) {
    using enum QVElementName;
    switch (element) {
        case ExportDate:
        case Me:
        case Correlation:
        case Workout:
            return parent == HealthData;
        case Record:
            return parent == HealthData || parent == Correlation;
        case MetadataEntry:
            return parent == Record || parent == Correlation || parent == Workout;
        case WorkoutEvent:
            return parent == Workout;
        default:
            return false;
    }
}

struct ContextCloser {
    void operator()(xmlParserCtxtPtr context) const {
        if (context->myDoc) xmlFreeDoc(context->myDoc);
        xmlFreeParserCtxt(context);
    }
};

}  // namespace

/// The parser's callbacks for one document.
class QVRecordsReader::Parser {
 public:
    explicit Parser(QVRecordsReader& reader) : reader_(reader) {}

    VSResult<Outcome> parse() {
        xmlSetGenericErrorFunc(nullptr, saySilently);  // of this thread
        makeContext();
        if (!context_) return VSError{VSErrorCode::Failed, "the XML parser could not be made"};
        while (!stopped_) {
            const auto count = reader_.file_.read(buffer_.data(), buffer_.size());
            if (!count) return count.error();
            if (reader_.cancel_ && reader_.cancel_->load(std::memory_order_relaxed))
                return VSError{VSErrorCode::Cancelled, "cancelled"};
            const int result =
                xmlParseChunk(context_.get(), buffer_.data(), static_cast<int>(*count), *count == 0);
            if (stopped_) break;
            if (result != XML_ERR_OK && !problem_) stop(parserMessage());
            if (reader_.progress_) reader_.progress_();
            if (*count == 0) break;
        }
        if (problem_) return *problem_;
        if (!reader_.otherRoot_.empty()) return Outcome::OtherDocument;
        if (!context_->wellFormed || !rootClosed_) return stop(parserMessage());
        return Outcome::Read;
    }

 private:
    using Context = std::unique_ptr<xmlParserCtxt, ContextCloser>;

    static Parser& self(void* context) { return *static_cast<Parser*>(context); }

    void makeContext() {
        xmlSAXHandler handler{};
        handler.initialized = XML_SAX2_MAGIC;
        handler.startElementNs = [](void* context, const xmlChar* name, const xmlChar*, const xmlChar* uri,
                                    int, const xmlChar**, int count, int, const xmlChar** attributes) {
            self(context).startElement(name, uri, count, attributes);
        };
        handler.endElementNs = [](void* context, const xmlChar*, const xmlChar*, const xmlChar*) {
            self(context).endElement();
        };
        handler.processingInstruction = [](void* context, const xmlChar* target, const xmlChar* data) {
            if (text(target) == kQVExactTarget) self(context).instruction(text(data));
        };
        handler.internalSubset = [](void* context, const xmlChar* name, const xmlChar* publicId,
                                    const xmlChar* systemId) {
            self(context).documentType(name, publicId, systemId);
        };
        handler.entityDecl = [](void* context, const xmlChar* name, int, const xmlChar*, const xmlChar*,
                                xmlChar*) { self(context).entity("declares", name); };
        handler.unparsedEntityDecl = [](void* context, const xmlChar* name, const xmlChar*, const xmlChar*,
                                        const xmlChar*) { self(context).entity("declares", name); };
        handler.getEntity = [](void* context, const xmlChar* name) -> xmlEntityPtr {
            return self(context).entity("uses", name), nullptr;
        };
        handler.getParameterEntity = [](void* context, const xmlChar* name) -> xmlEntityPtr {
            return self(context).entity("uses", name), nullptr;
        };
        handler.attributeDecl = [](void* context, const xmlChar* element, const xmlChar* name, int, int,
                                   const xmlChar* value, xmlEnumerationPtr values) {
            xmlFreeEnumeration(values);
            self(context).attributeDeclaration(element, name, value);
        };
        handler.serror = [](void* context, xmlErrorPtr error) { self(context).parserError(*error); };
        context_.reset(xmlCreatePushParserCtxt(&handler, this, nullptr, 0, nullptr));
        if (!context_) return;
        // References to the five predefined entities and to characters only: any other entity ends the
        // reading before it is replaced.
        xmlCtxtUseOptions(context_.get(), XML_PARSE_NOENT | XML_PARSE_NONET | XML_PARSE_COMPACT);
        for (size_t i = 0; i < kQVElementNames.size(); ++i) elementNames_[i] = intern(kQVElementNames[i]);
        for (size_t i = 0; i < kQVAttributeNames.size(); ++i)
            attributeNames_[i] = intern(kQVAttributeNames[i]);
    }

    const xmlChar* intern(const char* name) {
        return xmlDictLookup(context_->dict, reinterpret_cast<const xmlChar*>(name), -1);
    }

    int64_t line() const { return context_ && context_->input ? context_->input->line : 0; }

    /// Ends the reading and says why; the first reason counts.
    VSError stop(const std::string& why, int64_t atLine = 0) {
        if (!problem_) {
            problem_ =
                VSError{VSErrorCode::Invalid, reader_.file_.documentName() + ":" +
                                                  std::to_string(atLine > 0 ? atLine : line()) + ": " + why};
        }
        stopParser();
        return *problem_;
    }
    void stopParser() {
        stopped_ = true;
        xmlStopParser(context_.get());
    }

    std::string parserMessage() const {
        const xmlError* error = context_ ? xmlCtxtGetLastError(context_.get()) : nullptr;
        return error && error->message ? errorMessage(*error)
                                       : "not a complete XML document in a known encoding";
    }

    static std::string errorMessage(const xmlError& error) {
        // The parser's limit of 10 MB for what it must see at once: a comment, a name, a processing
        // instruction.
        if (error.code == XML_ERR_INTERNAL_ERROR) return "a part of it is longer than 10 MB";
        std::string message = error.message ? error.message : "error";
        std::replace(message.begin(), message.end(), '\n', ' ');
        while (!message.empty() && message.back() == ' ') message.pop_back();
        return "not a well-formed XML document: " + message;
    }

    void parserError(const xmlError& error) {
        if (error.level < XML_ERR_ERROR || problem_ || stopped_) return;
        stop(errorMessage(error), error.line);
    }

    void documentType(const xmlChar* name, const xmlChar* publicId, const xmlChar* systemId) {
        if (text(name) != kQVElementNames[0]) return otherRoot(text(name));
        if (publicId || systemId)
            stop("refers to an external declaration " + QVImportQuoted(text(systemId ? systemId : publicId)));
    }

    void entity(const char* what, const xmlChar* name) {
        stop(std::string(what) + " the entity " + QVImportQuoted(text(name)) +
             "; records documents have none");
    }

    void attributeDeclaration(const xmlChar* element, const xmlChar* name, const xmlChar* value) {
        if (value) {
            stop("declares a value by default for the attribute " + QVImportQuoted(text(name)) + " of " +
                 QVImportQuoted(text(element)) + "; records documents have none");
        }
    }

    void otherRoot(std::string_view name) {
        reader_.otherRoot_ = name.empty() ? "?" : std::string(name);
        stopParser();
    }

    void startElement(const xmlChar* name, const xmlChar* uri, int count, const xmlChar** attributes) {
        if (stopped_) return;
        element_.name = uri ? QVElementName::Unknown : elementName(name);
        element_.givenName = text(name);
        element_.line = line();
        if (open_.empty() && element_.name != QVElementName::HealthData) return otherRoot(element_.givenName);
        if (open_.size() + passedOver_ >= kDeepestNesting) {
            stop("elements are nested more than " + std::to_string(kDeepestNesting) + " deep");
            return;
        }
        if (open_.empty()) return open_.push_back(QVElementName::HealthData);
        if (passedOver_ > 0) {
            ++passedOver_;
            return;
        }
        readAttributes(count, attributes);
        const QVExactFacts exact = reader_.builder_.instructions().takeFacts();
        applyExactTexts(exact);
        const QVElementName parent = open_.back();
        if (!isAllowed(element_.name, parent)) {
            ++passedOver_;
            return reader_.builder_.unexpectedElement(element_);
        }
        open_.push_back(element_.name);
        reader_.builder_.start(element_, parent);
    }

    void endElement() {
        if (stopped_) return;
        reader_.builder_.instructions().forgetFacts();
        if (passedOver_ > 0) {
            --passedOver_;
            return;
        }
        const QVElementName name = open_.back();
        open_.pop_back();
        if (open_.empty())
            rootClosed_ = true;
        else
            reader_.builder_.end(name, open_.back());
        if (reader_.builder_.isStopped()) stopParser();
    }

    void instruction(std::string_view content) {
        if (!open_.empty() && passedOver_ == 0) reader_.builder_.instructions().read(content);
    }

    void applyExactTexts(const QVExactFacts& exact) {
        element_.exact = exact.isEmpty() ? nullptr : &exact;
        for (const auto& [attribute, value] : exact.attributes) {
            const auto index = static_cast<size_t>(attribute);
            if (element_.has(attribute) && value.string() &&
                QVExactAgrees(*value.string(), element_.values[index]))
                element_.values[index] = *value.string();
        }
    }

    /// The names come from the parser's dictionary, so their addresses tell them apart.
    QVElementName elementName(const xmlChar* name) const {
        for (size_t i = 0; i < elementNames_.size(); ++i) {
            if (elementNames_[i] == name) return static_cast<QVElementName>(i);
        }
        return QVElementName::Unknown;
    }

    size_t attributeIndex(const xmlChar* name, size_t position) {
        // Records repeat the order of the attributes of the one before.
        if (position < order_.size() && attributeNames_[order_[position]] == name) return order_[position];
        for (size_t i = 0; i < attributeNames_.size(); ++i) {
            if (attributeNames_[i] != name) continue;
            if (position < order_.size()) order_[position] = static_cast<uint8_t>(i);
            return i;
        }
        return kQVAttributeCount;
    }

    void readAttributes(int count, const xmlChar** attributes) {
        element_.present = 0;
        for (int i = 0; i < count; ++i, attributes += 5) {  // name, prefix, URI, begin and end of the value
            if (attributes[2]) continue;
            const size_t index = attributeIndex(attributes[0], static_cast<size_t>(i));
            if (index == kQVAttributeCount) continue;
            element_.present |= 1U << index;
            element_.values[index] = std::string_view(reinterpret_cast<const char*>(attributes[3]),
                                                      static_cast<size_t>(attributes[4] - attributes[3]));
        }
    }

    QVRecordsReader& reader_;
    Context context_;
    std::vector<char> buffer_ = std::vector<char>(kBufferSize);
    std::array<const xmlChar*, kQVElementNames.size()> elementNames_{};
    std::array<const xmlChar*, kQVAttributeCount> attributeNames_{};
    std::array<uint8_t, 16> order_{};
    QVElement element_;
    std::vector<QVElementName> open_;  // from the root
    size_t passedOver_ = 0;            // elements open in one that has no place
    bool rootClosed_ = false;
    bool stopped_ = false;
    std::optional<VSError> problem_;
};

VSResult<QVRecordsReader::Outcome> QVRecordsReader::read() {
    otherRoot_.clear();
    return Parser(*this).parse();
}
