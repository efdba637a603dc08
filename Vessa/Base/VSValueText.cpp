#include "Vessa/Base/VSValueText.h"

#include <array>
#include <charconv>
#include <cmath>
#include <cstdlib>

namespace valuetext {

namespace {

constexpr int kDeepest = 64;
constexpr std::string_view kDigits = "0123456789abcdef";

void appendString(std::string& text, std::string_view content) {
    text += '"';
    for (const char c : content) {
        const auto byte = static_cast<unsigned char>(c);
        if (c == '"' || c == '\\') {
            text += '\\';
            text += c;
        } else if (byte < 0x20) {
            text += "\\u00";
            text += kDigits[byte >> 4];
            text += kDigits[byte & 15];
        } else {
            text += c;
        }
    }
    text += '"';
}

void appendReal(std::string& text, double number) {
    if (std::isfinite(number)) {
        const std::string digits = shortest(number);
        text += digits;
        if (digits.find_first_of(".e") == std::string::npos)
            text += ".0";  // else it would read back as an integer
    } else {
        text += std::isnan(number) ? R"({"real":"nan"})"
                : number > 0       ? R"({"real":"inf"})"
                                   : R"({"real":"-inf"})";
    }
}

void appendDictionary(std::string& text, const VSValue::Dictionary& dictionary) {
    text += R"({"dict":{)";
    bool first = true;
    for (const auto& [key, value] : dictionary) {
        if (!first) text += ',';
        first = false;
        appendString(text, key);
        text += ':';
        append(text, value);
    }
    text += "}}";
}

void appendArray(std::string& text, const VSValue::Array& array) {
    text += '[';
    for (size_t i = 0; i < array.size(); ++i) {
        if (i > 0) text += ',';
        append(text, array[i]);
    }
    text += ']';
}

/// A reader of the form above by recursive descent; every step gives none when the text is not of it.
class Parser {
 public:
    explicit Parser(std::string_view text) : text_(text) {}

    std::optional<VSValue> whole() {
        auto value = parseValue(0);
        skipSpace();
        if (!value || at_ != text_.size()) return std::nullopt;
        return value;
    }

 private:
    void skipSpace() {
        while (at_ < text_.size() && std::string_view(" \t\r\n").find(text_[at_]) != std::string_view::npos)
            ++at_;
    }
    bool take(char c) {
        skipSpace();
        if (at_ == text_.size() || text_[at_] != c) return false;
        ++at_;
        return true;
    }
    bool takeWord(std::string_view word) {
        if (!text_.substr(at_).starts_with(word)) return false;
        at_ += word.size();
        return true;
    }

    std::optional<VSValue> parseValue(int depth) {
        if (depth > kDeepest) return std::nullopt;
        skipSpace();
        if (at_ == text_.size()) return std::nullopt;
        switch (text_[at_]) {
            case '"': {
                auto string = parseString();
                return string ? std::optional<VSValue>(std::move(*string)) : std::nullopt;
            }
            case '[':
                return parseArray(depth);
            case '{':
                return parseObject(depth);
            case 't':
                return takeWord("true") ? std::optional<VSValue>(true) : std::nullopt;
            case 'f':
                return takeWord("false") ? std::optional<VSValue>(false) : std::nullopt;
            default:
                return parseNumber();
        }
    }

    std::optional<VSValue> parseNumber() {
        const size_t end = std::min(text_.find_first_not_of("+-.0123456789eE", at_), text_.size());
        const char* const first = text_.data() + at_;
        const char* const last = text_.data() + end;
        at_ = end;
        if (std::string_view(first, last).find_first_of(".eE") == std::string_view::npos) {
            int64_t integer = 0;
            const auto [stop, error] = std::from_chars(first, last, integer);
            if (error != std::errc() || stop != last) return std::nullopt;
            return VSValue(integer);
        }
        double real = 0;
        const auto [stop, error] = std::from_chars(first, last, real);
        if (error != std::errc() || stop != last) return std::nullopt;
        return VSValue(real);
    }

    std::optional<VSValue> parseArray(int depth) {
        take('[');
        VSValue::Array array;
        if (take(']')) return VSValue(std::move(array));
        do {
            auto element = parseValue(depth + 1);
            if (!element) return std::nullopt;
            array.push_back(std::move(*element));
        } while (take(','));
        if (!take(']')) return std::nullopt;
        return VSValue(std::move(array));
    }

    std::optional<VSValue> parseObject(int depth) {
        take('{');
        skipSpace();
        const auto kind = parseString();
        if (!kind || !take(':')) return std::nullopt;
        skipSpace();
        auto value = *kind == "dict" ? parseDictionary(depth) : parseSpecial(*kind);
        if (!value || !take('}')) return std::nullopt;
        return value;
    }

    std::optional<VSValue> parseSpecial(const std::string& kind) {
        if (kind == "date") {
            const auto number = parseNumber();
            if (!number || !number->integer()) return std::nullopt;
            return VSValue(VSDate::fromMicroseconds(*number->integer()));
        }
        const auto text = parseString();
        if (!text) return std::nullopt;
        if (kind == "data") return parseData(*text);
        if (kind == "real" && *text == "nan") return VSValue(std::nan(""));
        if (kind == "real" && *text == "inf") return VSValue(HUGE_VAL);
        if (kind == "real" && *text == "-inf") return VSValue(-HUGE_VAL);
        return std::nullopt;
    }

    std::optional<VSValue> parseDictionary(int depth) {
        if (!take('{')) return std::nullopt;
        VSValue::Dictionary dictionary;
        if (take('}')) return VSValue(std::move(dictionary));
        do {
            skipSpace();
            auto key = parseString();
            if (!key || !take(':')) return std::nullopt;
            auto value = parseValue(depth + 1);
            if (!value) return std::nullopt;
            if (!dictionary.emplace(std::move(*key), std::move(*value)).second)
                return std::nullopt;  // named twice
        } while (take(','));
        if (!take('}')) return std::nullopt;
        return VSValue(std::move(dictionary));
    }

    static std::optional<VSValue> parseData(std::string_view hex) {
        if (hex.size() % 2 != 0) return std::nullopt;
        VSValue::Data data(hex.size() / 2);
        for (size_t i = 0; i < data.size(); ++i) {
            const char* const digits = hex.data() + 2 * i;
            const auto [stop, error] = std::from_chars(digits, digits + 2, data[i], 16);
            if (error != std::errc() || stop != digits + 2) return std::nullopt;
        }
        return VSValue(std::move(data));
    }

    std::optional<std::string> parseString() {
        if (at_ == text_.size() || text_[at_] != '"') return std::nullopt;
        ++at_;
        std::string result;
        while (at_ < text_.size()) {
            const char c = text_[at_++];
            if (c == '"') return result;
            if (static_cast<unsigned char>(c) < 0x20) return std::nullopt;
            if (c != '\\')
                result += c;
            else if (!appendEscape(result))
                return std::nullopt;
        }
        return std::nullopt;
    }

    bool appendEscape(std::string& result) {
        if (at_ == text_.size()) return false;
        constexpr std::string_view kNames = "\"\\/bfnrt", kMeanings = "\"\\/\b\f\n\r\t";
        const char c = text_[at_++];
        if (const size_t simple = kNames.find(c); simple != std::string_view::npos) {
            result += kMeanings[simple];
            return true;
        }
        uint32_t point = 0;
        if (c != 'u' || !takeHex4(point)) return false;
        if (point >= 0xDC00 && point < 0xE000) return false;
        if (point >= 0xD800 && point < 0xDC00) {
            uint32_t low = 0;
            if (!takeWord("\\u") || !takeHex4(low) || low < 0xDC00 || low >= 0xE000) return false;
            point = 0x10000 + ((point - 0xD800) << 10) + (low - 0xDC00);
        }
        appendUTF8(result, point);
        return true;
    }

    bool takeHex4(uint32_t& value) {
        if (text_.size() - at_ < 4) return false;
        const char* const first = text_.data() + at_;
        const auto [stop, error] = std::from_chars(first, first + 4, value, 16);
        at_ += 4;
        return error == std::errc() && stop == first + 4;
    }

    static void appendUTF8(std::string& text, uint32_t point) {
        const auto byte = [&text](uint32_t value) { text += static_cast<char>(value); };
        if (point < 0x80) {
            byte(point);
        } else if (point < 0x800) {
            byte(0xC0 | point >> 6);
            byte(0x80 | (point & 0x3F));
        } else if (point < 0x10000) {
            byte(0xE0 | point >> 12);
            byte(0x80 | (point >> 6 & 0x3F));
            byte(0x80 | (point & 0x3F));
        } else {
            byte(0xF0 | point >> 18);
            byte(0x80 | (point >> 12 & 0x3F));
            byte(0x80 | (point >> 6 & 0x3F));
            byte(0x80 | (point & 0x3F));
        }
    }

    std::string_view text_;
    size_t at_ = 0;
};

}  // namespace

std::string shortest(double number) {
    std::array<char, 32> digits{};
    const auto result = std::to_chars(digits.data(), digits.data() + digits.size(), number);
    return {digits.data(), result.ptr};
}

std::string hexadecimal(const VSValue::Data& data) {
    std::string text;
    text.reserve(data.size() * 2);
    for (const uint8_t byte : data) {
        text += kDigits[byte >> 4];
        text += kDigits[byte & 15];
    }
    return text;
}

void append(std::string& text, const VSValue& value) {
    if (const auto* string = value.string())
        appendString(text, *string);
    else if (const auto flag = value.boolean())
        text += *flag ? "true" : "false";
    else if (const auto integer = value.integer())
        text += std::to_string(*integer);
    else if (const auto real = value.number())
        appendReal(text, *real);
    else if (const auto date = value.date())
        text += R"({"date":)" + std::to_string(date->microseconds()) + '}';
    else if (const auto* data = value.data())
        text += R"({"data":")" + hexadecimal(*data) + R"("})";
    else if (const auto* array = value.array())
        appendArray(text, *array);
    else if (const auto* dictionary = value.dictionary())
        appendDictionary(text, *dictionary);
}

std::optional<VSValue> parse(std::string_view text) {
    return Parser(text).whole();
}

}  // namespace valuetext
