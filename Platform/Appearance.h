#pragma once

#include <QDBusConnection>
#include <QDBusVariant>
#include <QObject>
#include <array>
#include <optional>

namespace platform {

/// What the person wants of all that is shown: more contrast, less motion. Layouts know it as the singleton
/// `Appearance`. Main thread only; one object for the process.
class Appearance : public QObject {
    Q_OBJECT
    Q_PROPERTY(bool highContrast READ highContrast NOTIFY contrastChanged)
    Q_PROPERTY(bool reducedMotion READ reducedMotion NOTIFY motionChanged)
 public:
    static Appearance& shared();
    bool highContrast() const { return highContrast_; }
    /// Nothing slides, grows or fades: what changes is there at once.
    bool reducedMotion() const { return reducedMotion_; }
    /// From now on this, whatever the desktop says.
    void setHighContrast(bool high);
    /// Takes what the desktop says, and follows it: its portal's appearance, or its own settings. The answer
    /// may come after the first frame; without one nothing special is wanted.
    void start();
    /// The same with the desktop on that bus, at once.
    void listen(const QDBusConnection& bus);
    /// "high" or "normal".
    static std::optional<bool> highContrastFromText(const QByteArray& text);

 signals:
    void contrastChanged();
    void motionChanged();

 private slots:
    void portalSettingChanged(const QString& group, const QString& key, const QDBusVariant& value);

 private:
    Appearance() = default;
    void update();

    bool highContrast_ = false, reducedMotion_ = false;
    std::optional<bool> setContrast_;
    std::array<bool, 4> wishes_{};  // what each of the desktop's settings says
};

/// The wishes at present.
bool highContrast();
bool reducedMotion();

}  // namespace platform
