#include "Vessa/Base/VSValue.h"

#include <array>
#include <charconv>
#include <cmath>

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/Base/VSValueText.h"

std::optional<bool> VSValue::boolean() const {
    const auto* value = std::get_if<bool>(&content_);
    return value ? std::optional(*value) : std::nullopt;
}

std::optional<int64_t> VSValue::integer() const {
    const auto* value = std::get_if<int64_t>(&content_);
    return value ? std::optional(*value) : std::nullopt;
}

std::optional<double> VSValue::number() const {
    if (const auto* value = std::get_if<double>(&content_)) return *value;
    if (const auto* value = std::get_if<int64_t>(&content_)) return static_cast<double>(*value);
    return std::nullopt;
}

std::optional<VSDate> VSValue::date() const {
    const auto* value = std::get_if<VSDate>(&content_);
    return value ? std::optional(*value) : std::nullopt;
}

const VSValue* VSValue::operator[](std::string_view key) const {
    const Dictionary* entries = dictionary();
    if (!entries) return nullptr;
    const auto entry = entries->find(key);
    return entry == entries->end() ? nullptr : &entry->second;
}

std::string VSValue::description() const {
    if (const auto* text = string()) return *text;
    if (const auto flag = boolean()) return *flag ? "1" : "0";
    if (const auto whole = integer()) return std::to_string(*whole);
    if (const auto real = number()) return valuetext::shortest(*real);
    if (const auto moment = date()) return VSISO8601FromDate(*moment, VSCalendar("Etc/UTC", "en_US"));
    if (const auto* bytes = data()) return valuetext::hexadecimal(*bytes);
    return serialized();
}

std::string VSValue::serialized() const {
    std::string text;
    valuetext::append(text, *this);
    return text;
}

std::optional<VSValue> VSValue::fromSerialized(std::string_view text) {
    return valuetext::parse(text);
}
