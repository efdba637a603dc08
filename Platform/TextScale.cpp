#include "Platform/TextScale.h"

#include <QCoreApplication>
#include <QFont>
#include <QGuiApplication>
#include <QQmlEngine>
#include <QTimer>
#include <algorithm>
#include <cmath>

#include "Platform/DesktopSettings.h"

namespace platform {

namespace {

constexpr double kSmallest = 1, kLargest = 2;
/// The size of the largest of the fonts that desktops come with, in points, and how far theirs are apart.
constexpr double kDesktopFontSize = 11, kNoticeable = 1.15;

const QString kGroup = QStringLiteral("org.gnome.desktop.interface");
const QString kKey = QStringLiteral("text-scaling-factor");

/// A person who finds texts too small chooses a larger font where the desktop has no factor.
double factorOfFont(const QFont& font) {
    const double points = font.pointSizeF() > 0 ? font.pointSizeF() : font.pixelSize() * 0.75;
    const double factor = points / kDesktopFontSize;
    return factor < kNoticeable ? 1 : factor;
}

void registerForLayouts() {
    qmlRegisterSingletonType<TextScale>("Qelvar.Items", 1, 0, "TextScale",
                                        [](QQmlEngine*, QJSEngine*) -> QObject* {
                                            auto* scale = &TextScale::shared();
                                            QQmlEngine::setObjectOwnership(scale, QQmlEngine::CppOwnership);
                                            return scale;
                                        });
}

}  // namespace

Q_COREAPP_STARTUP_FUNCTION(registerForLayouts)

TextScale& TextScale::shared() {
    static TextScale* const scale = new TextScale;
    return *scale;
}

double textScale() {
    return TextScale::shared().factor();
}

std::optional<double> TextScale::fromText(const QByteArray& text) {
    bool isNumber = false;
    const double factor = text.toDouble(&isNumber);
    if (!isNumber || !(factor >= kSmallest && factor <= kLargest)) return std::nullopt;
    return factor;
}

void TextScale::set(double factor) {
    wasSet_ = true;
    take(factor);
}

void TextScale::take(double factor) {
    const double held = std::clamp(factor, kSmallest, kLargest);
    if (held == factor_) return;
    factor_ = held;
    emit factorChanged();
}

void TextScale::start() {
    if (wasSet_) return;
    if (const auto factor = fromText(qgetenv("QELVAR_TEXT_SCALE"))) return set(*factor);
    take(factorOfFont(QGuiApplication::font()));
    // On the other platforms the factor is already in the size of the points. The first screen need not wait
    // for the bus.
    if (QGuiApplication::platformName().startsWith(QLatin1String("wayland")))
        QTimer::singleShot(0, this,
                           [this] { listenToDesktopSetting(this, "portalSettingChanged", kGroup, kKey); });
}

void TextScale::portalSettingChanged(const QString& group, const QString& key, const QDBusVariant& value) {
    if (wasSet_ || group != kGroup || key != kKey) return;
    bool isNumber = false;
    const double factor = unpackedSetting(value.variant()).toDouble(&isNumber);
    // The portal says 1 to somebody who has chosen a larger font in its place.
    if (isNumber && std::isfinite(factor)) take(std::max(factor, factorOfFont(QGuiApplication::font())));
}

}  // namespace platform
