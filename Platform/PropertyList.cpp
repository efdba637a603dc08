#include "Platform/PropertyList.h"

#include <libxml/SAX2.h>
#include <libxml/parser.h>
#include <libxml/parserInternals.h>

#include <charconv>
#include <cmath>
#include <cstring>
#include <memory>
#include <vector>

#include "Vessa/Base/VSCalendar.h"

namespace platform {

namespace {

constexpr size_t kDeepest = 64;

bool isBlank(std::string_view text) {
    return text.find_first_not_of(" \t\r\n") == std::string_view::npos;
}

std::string_view trimmed(std::string_view text) {
    const size_t first = text.find_first_not_of(" \t\r\n");
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(" \t\r\n") - first + 1);
}

template <typename Number>
std::optional<Number> number(std::string_view text) {
    text = trimmed(text);
    if (text.starts_with('+')) text.remove_prefix(1);
    Number value{};
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc() || end != text.data() + text.size()) return std::nullopt;
    if constexpr (std::is_floating_point_v<Number>)
        if (!std::isfinite(value)) return std::nullopt;
    return value;
}

std::optional<VSValue::Data> base64(std::string_view text) {
    VSValue::Data bytes;
    unsigned bits = 0;
    int count = 0;
    bool padded = false;
    for (const char c : text) {
        if (isBlank({&c, 1})) continue;
        if (c == '=') {
            padded = true;
            continue;
        }
        static constexpr std::string_view kDigits =
            "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
        const size_t digit = kDigits.find(c);
        if (digit == std::string_view::npos || padded) return std::nullopt;
        bits = bits << 6 | static_cast<unsigned>(digit);
        count += 6;
        if (count < 8) continue;
        count -= 8;
        bytes.push_back(static_cast<uint8_t>(bits >> count & 0xff));
    }
    return bytes;
}

/// Builds the values from the parser's events.
class Reader {
 public:
    explicit Reader(std::optional<std::string_view> stopAt) : stopAt_(stopAt) {}

    VSResult<VSValue> read(std::string_view document) {
        if (document.size() > size_t{1} << 30)
            return VSError{VSErrorCode::Invalid, "property list: too large"};
        std::unique_ptr<xmlParserCtxt, void (*)(xmlParserCtxtPtr)> context(
            xmlCreateMemoryParserCtxt(document.data(), static_cast<int>(document.size())), xmlFreeParserCtxt);
        if (!context) return VSError{VSErrorCode::Invalid, "property list: empty"};
        context_ = context.get();
        xmlSAXHandler handler{};
        handler.initialized = XML_SAX2_MAGIC;
        handler.startElementNs = [](void* self, const xmlChar* name, const xmlChar*, const xmlChar*, int,
                                    const xmlChar**, int, int,
                                    const xmlChar**) { reader(self).started(text(name)); };
        handler.endElementNs = [](void* self, const xmlChar* name, const xmlChar*, const xmlChar*) {
            reader(self).ended(text(name));
        };
        handler.characters = [](void* self, const xmlChar* characters, int length) {
            reader(self).characters({reinterpret_cast<const char*>(characters), static_cast<size_t>(length)});
        };
        handler.cdataBlock = handler.characters;
        handler.entityDecl = [](void* self, const xmlChar*, int, const xmlChar*, const xmlChar*, xmlChar*) {
            reader(self).fail("entities may not be declared");
        };
        handler.reference = [](void* self, const xmlChar* name) {
            reader(self).fail("the entity " + std::string(text(name)) + " is not known");
        };
        handler.serror = [](void* self, xmlErrorPtr error) {
            if (error->level >= XML_ERR_ERROR)
                reader(self).fail(trimmed(error->message ? error->message : "not well-formed"));
        };
        *context_->sax = handler;
        context_->userData = this;
        xmlCtxtUseOptions(context_, XML_PARSE_NONET | XML_PARSE_BIG_LINES);
        xmlParseDocument(context_);
        if (context_->myDoc) xmlFreeDoc(std::exchange(context_->myDoc, nullptr));
        if (error_) return *error_;
        if (!top_) return VSError{VSErrorCode::Invalid, "property list: no value"};
        return std::move(*top_);
    }

 private:
    /// A value that is being read: a container, or the text of a leaf.
    struct Frame {
        std::string element;
        VSValue::Dictionary dictionary;
        VSValue::Array array;
        std::optional<std::string> key;
        std::string characters;
    };

    static Reader& reader(void* self) { return *static_cast<Reader*>(self); }
    static std::string_view text(const xmlChar* characters) {
        return reinterpret_cast<const char*>(characters);
    }

    void fail(std::string_view reason) {
        if (error_ || stopped_) return;
        error_ = VSError{VSErrorCode::Invalid, "property list, line " +
                                                   std::to_string(xmlSAX2GetLineNumber(context_)) + ": " +
                                                   std::string(reason)};
        xmlStopParser(context_);
    }

    void started(std::string_view element) {
        if (error_ || stopped_) return;
        if (!inPlist_) {
            if (element != "plist") return fail("the top element is not plist");
            inPlist_ = true;
            return;
        }
        if (depth_ >= kDeepest) return fail("nested too deeply");
        if (depth_ == 0 && top_) return fail("more than one value");
        if (depth_ > 0) {
            Frame& parent = frames_[depth_ - 1];
            const bool isKey = element == "key";
            if (parent.element == "dict") {
                if (isKey == parent.key.has_value())
                    return fail(isKey ? "a key without a value" : "a value without a key");
            } else if (parent.element != "array" || isKey) {
                return fail("<" + std::string(element) + "> may not stand in <" + parent.element + ">");
            }
        } else if (element == "key") {
            return fail("a key outside a dict");
        }
        // Frames are used again and again: their strings keep their memory.
        if (frames_.size() == depth_) frames_.emplace_back();
        Frame& frame = frames_[depth_++];
        frame.element = element;
        frame.dictionary.clear();
        frame.array.clear();
        frame.key.reset();
        frame.characters.clear();
    }

    void characters(std::string_view characters) {
        if (error_ || stopped_) return;
        if (depth_ == 0 || frames_[depth_ - 1].element == "dict" || frames_[depth_ - 1].element == "array") {
            if (!isBlank(characters)) fail("text between elements");
            return;
        }
        frames_[depth_ - 1].characters += characters;
    }

    void ended(std::string_view element) {
        if (error_ || stopped_) return;
        if (depth_ == 0) return;  // </plist>
        Frame& frame = frames_[depth_ - 1];
        if (element == "key") {
            Frame& parent = frames_[depth_ - 2];
            if (parent.dictionary.contains(frame.characters))
                return fail("the key " + frame.characters + " is given twice");
            if (depth_ == 2 && stopAt_ && frame.characters == *stopAt_) {
                stopped_ = true;
                top_ = VSValue(std::move(parent.dictionary));
                xmlStopParser(context_);
                return;
            }
            parent.key = frame.characters;
            --depth_;
            return;
        }
        auto value = valueOf(frame);
        if (!value) return fail("not a valid " + frame.element);
        --depth_;
        if (depth_ == 0) {
            top_ = std::move(*value);
            return;
        }
        Frame& parent = frames_[depth_ - 1];
        if (parent.element == "array") {
            parent.array.push_back(std::move(*value));
        } else {
            parent.dictionary.emplace(std::move(*parent.key), std::move(*value));
            parent.key.reset();
        }
    }

    std::optional<VSValue> valueOf(Frame& frame) {
        const std::string& element = frame.element;
        if (element == "dict") {
            if (frame.key) return std::nullopt;
            return VSValue(std::move(frame.dictionary));
        }
        if (element == "array") return VSValue(std::move(frame.array));
        if (element == "string") return VSValue(frame.characters);
        if (element == "true" || element == "false") {
            if (!isBlank(frame.characters)) return std::nullopt;
            return VSValue(element == "true");
        }
        if (element == "integer") return wrapped(number<int64_t>(frame.characters));
        if (element == "real") return wrapped(number<double>(frame.characters));
        if (element == "date")
            return wrapped(VSDateFromISO8601(trimmed(frame.characters), VSCalendar("UTC", "en_US_POSIX")));
        if (element == "data") return wrapped(base64(frame.characters));
        return std::nullopt;
    }

    template <typename T>
    static std::optional<VSValue> wrapped(std::optional<T> value) {
        if (!value) return std::nullopt;
        return VSValue(std::move(*value));
    }

    const std::optional<std::string_view> stopAt_;
    xmlParserCtxtPtr context_ = nullptr;
    std::vector<Frame> frames_;
    size_t depth_ = 0;
    bool inPlist_ = false;
    bool stopped_ = false;
    std::optional<VSValue> top_;
    std::optional<VSError> error_;
};

}  // namespace

VSResult<VSValue> readPropertyList(std::string_view document) {
    return Reader(std::nullopt).read(document);
}

VSResult<VSValue::Dictionary> readPropertyListBefore(std::string_view document, std::string_view key) {
    auto value = Reader(key).read(document);
    if (!value) return value.error();
    if (!value->dictionary()) return VSError{VSErrorCode::Invalid, "property list: the top is not a dict"};
    return *value->dictionary();
}

}  // namespace platform
