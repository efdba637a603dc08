#pragma once

#include <compare>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>

/// A program or device that writes records. Two sources are the same when name and bundle identifier are.
struct VSSource {
    std::string name;
    std::string bundleIdentifier;  // of a document's source: "import." and its name
    friend auto operator<=>(const VSSource&, const VSSource&) = default;

    /// This application's own source: what a person enters by hand.
    static const VSSource& application();
    /// The source of a document's `sourceName`: the application's own when it has that name.
    static VSSource forImportedName(const std::string& name);
    bool isApplication() const { return *this == application(); }
    /// Whether it stands for a document's `sourceName`.
    bool isImported() const;
};

struct VSSourceRevision {
    VSSource source;
    std::string version;  // may be empty
    friend auto operator<=>(const VSSourceRevision&, const VSSourceRevision&) = default;
};

/// The hardware that took a reading. Every field may be absent.
struct VSDevice {
    std::optional<std::string> name, manufacturer, model, hardwareVersion, firmwareVersion, softwareVersion,
        localIdentifier, udiDeviceIdentifier;
    friend auto operator<=>(const VSDevice&, const VSDevice&) = default;

    /// "name:Wrist tracker, hardware:1": the present fields in the order above, as name, manufacturer, model,
    /// hardware, firmware, software, localIdentifier, UDI; a backslash precedes a comma, colon or backslash
    /// of a value.
    std::string description() const;
    /// The device of such a text. A text that is not of this form becomes the name of the device.
    static VSDevice fromDescription(const std::string& text);
};
