#pragma once

#include <QDBusVariant>
#include <QObject>
#include <optional>

namespace platform {

/// How large the person wants texts: a factor of the layout's sizes, from 1 to 2. Layouts know it as the
/// singleton `TextScale`. Main thread only; one object for the process.
class TextScale : public QObject {
    Q_OBJECT
    Q_PROPERTY(double factor READ factor NOTIFY factorChanged)
 public:
    static TextScale& shared();
    double factor() const { return factor_; }
    /// From now on this, whatever the desktop says.
    void set(double factor);
    /// Takes QELVAR_TEXT_SCALE when it is set, else what the desktop says, and follows that. Does nothing
    /// after set(). The desktop's answer may come after the first frame.
    void start();
    /// A factor as a person writes it: a number from 1 to 2.
    static std::optional<double> fromText(const QByteArray& text);

 signals:
    void factorChanged();

 private slots:
    void portalSettingChanged(const QString& group, const QString& key, const QDBusVariant& value);

 private:
    TextScale() = default;
    void take(double factor);

    double factor_ = 1;
    bool wasSet_ = false;
};

/// The factor at present.
double textScale();

}  // namespace platform
