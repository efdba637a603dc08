#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

#include "Vessa/Base/VSDate.h"

/// A property-list value: what metadata entries, default values and the demo file hold. Text is UTF-8.
class VSValue {
 public:
    using Array = std::vector<VSValue>;
    using Dictionary = std::map<std::string, VSValue, std::less<>>;
    using Data = std::vector<uint8_t>;

    VSValue() = default;  // an empty string
    VSValue(bool value) : content_(value) {}
    VSValue(int value) : content_(int64_t{value}) {}
    VSValue(int64_t value) : content_(value) {}
    VSValue(double value) : content_(value) {}
    VSValue(const char* value) : content_(std::string(value)) {}
    VSValue(std::string value) : content_(std::move(value)) {}
    VSValue(VSDate value) : content_(value) {}
    VSValue(Data value) : content_(std::move(value)) {}
    VSValue(Array value) : content_(std::move(value)) {}
    VSValue(Dictionary value) : content_(std::move(value)) {}

    /// Each gives the content when it is of that kind, else nothing. `number` takes integers and reals.
    std::optional<bool> boolean() const;
    std::optional<int64_t> integer() const;
    std::optional<double> number() const;
    std::optional<VSDate> date() const;
    const std::string* string() const { return std::get_if<std::string>(&content_); }
    const Data* data() const { return std::get_if<Data>(&content_); }
    const Array* array() const { return std::get_if<Array>(&content_); }
    const Dictionary* dictionary() const { return std::get_if<Dictionary>(&content_); }
    /// The entry of a dictionary, or null when this is none or has no such key.
    const VSValue* operator[](std::string_view key) const;

    /// The stable textual form: strings unchanged, "1"/"0" for booleans, shortest round-trip numbers,
    /// ISO 8601 UTC dates, hexadecimal data; arrays and dictionaries as their JSON text.
    std::string description() const;

    /// A lossless text of one line and back: JSON, with {"date": microseconds} and {"data": hex} for what
    /// JSON lacks and dictionaries as {"dict": {...}}. It is what the store keeps.
    std::string serialized() const;
    static std::optional<VSValue> fromSerialized(std::string_view text);

    friend bool operator==(const VSValue&, const VSValue&) = default;

 private:
    std::variant<std::string, bool, int64_t, double, VSDate, Data, Array, Dictionary> content_;
};
