#include "Platform/TextScale.h"

#include <QCoreApplication>
#include <QDBusConnection>
#include <QDBusMessage>
#include <QDBusPendingCallWatcher>
#include <QDBusPendingReply>
#include <QFont>
#include <QGuiApplication>
#include <QQmlEngine>
#include <algorithm>
#include <cmath>

namespace platform {

namespace {

constexpr double kSmallest = 1, kLargest = 3;
/// The size of the largest of the fonts that desktops come with, in points, and how far theirs are apart.
constexpr double kDesktopFontSize = 11, kNoticeable = 1.15;

const QString kPortal = QStringLiteral("org.freedesktop.portal.Desktop");
const QString kPortalPath = QStringLiteral("/org/freedesktop/portal/desktop");
const QString kPortalSettings = QStringLiteral("org.freedesktop.portal.Settings");
const QString kGroup = QStringLiteral("org.gnome.desktop.interface");
const QString kKey = QStringLiteral("text-scaling-factor");

/// A person who finds texts too small chooses a larger font where the desktop has no factor.
double factorOfFont(const QFont& font) {
    const double points = font.pointSizeF() > 0 ? font.pointSizeF() : font.pixelSize() * 0.75;
    const double factor = points / kDesktopFontSize;
    return factor < kNoticeable ? 1 : factor;
}

/// The number in a value that may be packed more than once.
std::optional<double> number(QVariant value) {
    while (value.metaType() == QMetaType::fromType<QDBusVariant>())
        value = value.value<QDBusVariant>().variant();
    bool isNumber = false;
    const double result = value.toDouble(&isNumber);
    return isNumber && std::isfinite(result) ? std::optional(result) : std::nullopt;
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
    // On the other platforms the factor is already in the size of the points.
    if (QGuiApplication::platformName().startsWith(QLatin1String("wayland"))) askPortal();
}

/// A desktop without the portal never answers, which is no error.
void TextScale::askPortal() {
    auto bus = QDBusConnection::sessionBus();
    if (!bus.isConnected()) return;
    bus.connect(kPortal, kPortalPath, kPortalSettings, QStringLiteral("SettingChanged"), this,
                SLOT(portalSettingChanged(QString, QString, QDBusVariant)));
    auto call = QDBusMessage::createMethodCall(kPortal, kPortalPath, kPortalSettings, QStringLiteral("Read"));
    call << kGroup << kKey;
    auto* watcher = new QDBusPendingCallWatcher(bus.asyncCall(call), this);
    connect(watcher, &QDBusPendingCallWatcher::finished, this, [this](QDBusPendingCallWatcher* finished) {
        const QDBusPendingReply<QDBusVariant> reply = *finished;
        if (reply.isValid()) portalSettingChanged(kGroup, kKey, reply.value());
        finished->deleteLater();
    });
}

void TextScale::portalSettingChanged(const QString& group, const QString& key, const QDBusVariant& value) {
    if (wasSet_ || group != kGroup || key != kKey) return;
    if (const auto factor = number(value.variant())) take(*factor);
}

}  // namespace platform
