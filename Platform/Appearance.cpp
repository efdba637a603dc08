#include "Platform/Appearance.h"

#include <QCoreApplication>
#include <QQmlEngine>
#include <QTimer>
#include <algorithm>
#include <iterator>
#include <utility>

#include "Platform/DesktopSettings.h"

namespace platform {

namespace {

enum class Wish { Contrast, LessMotion };

/// A setting of the desktop, and the value with which it asks for something.
struct Setting {
    const char *group, *key;
    Wish wish;
    int asking;
};
// The first of each wish is the one on which desktops have agreed; some know only their own.
constexpr Setting kSettings[] = {
    {"org.freedesktop.appearance", "contrast", Wish::Contrast, 1},
    {"org.gnome.desktop.a11y.interface", "high-contrast", Wish::Contrast, true},
    {"org.freedesktop.appearance", "reduced-motion", Wish::LessMotion, 1},
    {"org.gnome.desktop.interface", "enable-animations", Wish::LessMotion, false},
};

constexpr const char* kSlot = "portalSettingChanged";

void registerForLayouts() {
    qmlRegisterSingletonType<Appearance>(
        "Qelvar.Items", 1, 0, "Appearance", [](QQmlEngine*, QJSEngine*) -> QObject* {
            auto* appearance = &Appearance::shared();
            QQmlEngine::setObjectOwnership(appearance, QQmlEngine::CppOwnership);
            return appearance;
        });
}

}  // namespace

Q_COREAPP_STARTUP_FUNCTION(registerForLayouts)

Appearance& Appearance::shared() {
    static Appearance* const appearance = new Appearance;
    return *appearance;
}

bool highContrast() {
    return Appearance::shared().highContrast();
}

bool reducedMotion() {
    return Appearance::shared().reducedMotion();
}

std::optional<bool> Appearance::highContrastFromText(const QByteArray& text) {
    if (text == "high") return true;
    if (text == "normal") return false;
    return std::nullopt;
}

void Appearance::setHighContrast(bool high) {
    setContrast_ = high;
    update();
}

void Appearance::start() {
    // The first screen need not wait for the bus.
    QTimer::singleShot(0, this, [this] {
        for (const Setting& setting : kSettings)
            listenToDesktopSetting(this, kSlot, QLatin1String(setting.group), QLatin1String(setting.key));
    });
}

void Appearance::listen(const QDBusConnection& bus) {
    for (const Setting& setting : kSettings)
        listenToDesktopSetting(bus, this, kSlot, QLatin1String(setting.group), QLatin1String(setting.key));
}

void Appearance::portalSettingChanged(const QString& group, const QString& key, const QDBusVariant& value) {
    const auto setting = std::find_if(std::begin(kSettings), std::end(kSettings), [&](const Setting& one) {
        return group == QLatin1String(one.group) && key == QLatin1String(one.key);
    });
    const QVariant unpacked = unpackedSetting(value.variant());
    // What is no number is no answer.
    if (setting == std::end(kSettings) || !unpacked.canConvert<int>()) return;
    wishes_[static_cast<size_t>(setting - kSettings)] = unpacked.toInt() == setting->asking;
    update();
}

void Appearance::update() {
    const auto wanted = [this](Wish wish) {
        for (size_t i = 0; i < wishes_.size(); ++i)
            if (kSettings[i].wish == wish && wishes_[i]) return true;
        return false;
    };
    const bool contrast = setContrast_.value_or(wanted(Wish::Contrast));
    const bool lessMotion = wanted(Wish::LessMotion);
    if (std::exchange(highContrast_, contrast) != contrast) emit contrastChanged();
    if (std::exchange(reducedMotion_, lessMotion) != lessMotion) emit motionChanged();
}

}  // namespace platform
