#include "Vessa/VSSource.h"

#include <array>
#include <string_view>
#include <vector>

namespace {

const std::string kImportedPrefix = "import.";

struct DeviceField {
    std::string_view name;
    std::optional<std::string> VSDevice::*value;
};

// The names and their order are written into documents and never change.
constexpr std::array kDeviceFields{
    DeviceField{"name", &VSDevice::name},
    DeviceField{"manufacturer", &VSDevice::manufacturer},
    DeviceField{"model", &VSDevice::model},
    DeviceField{"hardware", &VSDevice::hardwareVersion},
    DeviceField{"firmware", &VSDevice::firmwareVersion},
    DeviceField{"software", &VSDevice::softwareVersion},
    DeviceField{"localIdentifier", &VSDevice::localIdentifier},
    DeviceField{"UDI", &VSDevice::udiDeviceIdentifier},
};

constexpr std::string_view kSpecialCharacters = "\\,:";

void appendEscaped(std::string& text, std::string_view value) {
    for (const char c : value) {
        if (kSpecialCharacters.find(c) != std::string_view::npos) text += '\\';
        text += c;
    }
}

/// The fields of the text between the commas, still escaped.
std::vector<std::string_view> splitAtCommas(std::string_view text) {
    std::vector<std::string_view> parts;
    size_t begin = 0;
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '\\')
            ++i;
        else if (text[i] == ',') {
            parts.push_back(text.substr(begin, i - begin));
            begin = i + 1;
        }
    }
    parts.push_back(text.substr(begin));
    return parts;
}

/// None when a character that needs a backslash has none, or a backslash stands before any other.
std::optional<std::string> unescaped(std::string_view text) {
    std::string value;
    for (size_t i = 0; i < text.size(); ++i) {
        const bool special = kSpecialCharacters.find(text[i]) != std::string_view::npos;
        if (special && text[i] != '\\') return std::nullopt;
        if (special && (++i == text.size() || kSpecialCharacters.find(text[i]) == std::string_view::npos))
            return std::nullopt;
        value += text[i];
    }
    return value;
}

std::optional<VSDevice> parseDevice(std::string_view text) {
    VSDevice device;
    size_t next = 0;  // fields stand in the order of the table
    bool first = true;
    for (std::string_view part : splitAtCommas(text)) {
        if (!first) {
            if (!part.starts_with(' ')) return std::nullopt;
            part.remove_prefix(1);
        }
        first = false;
        const size_t colon = part.find(':');
        if (colon == std::string_view::npos) return std::nullopt;
        while (next < kDeviceFields.size() && kDeviceFields[next].name != part.substr(0, colon)) ++next;
        auto value = unescaped(part.substr(colon + 1));
        if (next == kDeviceFields.size() || !value) return std::nullopt;
        device.*kDeviceFields[next++].value = std::move(*value);
    }
    return device;
}

}  // namespace

const VSSource& VSSource::application() {
    static const VSSource source{"Qelvar", "org.qelvar.Qelvar"};
    return source;
}

VSSource VSSource::forImportedName(const std::string& name) {
    return name == application().name ? application() : VSSource{name, kImportedPrefix + name};
}

bool VSSource::isImported() const {
    return bundleIdentifier == kImportedPrefix + name;
}

std::string VSDevice::description() const {
    std::string text;
    for (const DeviceField& field : kDeviceFields) {
        const auto& value = this->*field.value;
        if (!value) continue;
        if (!text.empty()) text += ", ";
        text += field.name;
        text += ':';
        appendEscaped(text, *value);
    }
    return text;
}

VSDevice VSDevice::fromDescription(const std::string& text) {
    VSDevice device;
    if (text.empty()) return device;
    if (auto parsed = parseDevice(text)) return *parsed;
    device.name = text;
    return device;
}
