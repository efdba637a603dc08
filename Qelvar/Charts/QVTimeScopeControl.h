#pragma once

#include <QObject>
#include <QStringList>
#include <QUrl>
#include <memory>
#include <vector>

#include "Qelvar/Models/Data/QVTimeScope.h"

/// The control with which the user picks the time scope of charts, in one of two looks: a bar with a segment
/// for each scope, or a row of pills. Main thread only.
class QVTimeScopeControl : public QObject {
    Q_OBJECT
    Q_PROPERTY(QUrl view READ view CONSTANT)
    Q_PROPERTY(QStringList segments READ segments NOTIFY segmentsChanged)
    Q_PROPERTY(int selectedIndex READ selectedIndex NOTIFY selectedIndexChanged)
    Q_PROPERTY(QString accessibleName READ accessibleName NOTIFY accessibleNameChanged)
 public:
    enum class Look { Bar, Pill };
    /// REQUIRES: at least one scope.
    explicit QVTimeScopeControl(std::vector<QVTimeScope> timeScopes, Look look = Look::Bar);
    /// Style 1 is the pills' look; any other is the bar's.
    static std::unique_ptr<QVTimeScopeControl> controlWithStyle(int style,
                                                                std::vector<QVTimeScope> timeScopes);

    Look look() const { return look_; }
    /// The QML file of its look; what it lays out gets the control as its property `control`.
    QUrl view() const;
    const std::vector<QVTimeScope>& timeScopes() const { return timeScopes_; }
    /// The titles, in the order of the scopes, in the user's language.
    QStringList segments() const;
    QVTimeScope selectedTimeScope() const { return timeScopes_[static_cast<size_t>(selectedIndex_)]; }
    /// Moves the selection without an action. A scope that is not offered selects the first.
    void setSelectedTimeScope(QVTimeScope timeScope);
    int selectedIndex() const { return selectedIndex_; }
    /// What a screen reader says of it: what it is, and the selection.
    QString accessibleName() const;

    /// The user picked a segment: selects it and sends valueChanged().
    Q_INVOKABLE void pick(int index);
    /// The user's language changed.
    void updateTitles();

 signals:
    void valueChanged();
    void selectedIndexChanged();
    void segmentsChanged();
    void accessibleNameChanged();

 private:
    void select(int index);
    const std::vector<QVTimeScope> timeScopes_;
    const Look look_;
    int selectedIndex_ = 0;
};
