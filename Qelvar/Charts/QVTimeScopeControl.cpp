#include "Qelvar/Charts/QVTimeScopeControl.h"

#include <algorithm>
#include <cassert>

#include "Platform/Localization.h"

QVTimeScopeControl::QVTimeScopeControl(std::vector<QVTimeScope> timeScopes, Look look)
    : timeScopes_(std::move(timeScopes)), look_(look) {
    assert(!timeScopes_.empty());
}

std::unique_ptr<QVTimeScopeControl> QVTimeScopeControl::controlWithStyle(
    int style, std::vector<QVTimeScope> timeScopes) {
    return std::make_unique<QVTimeScopeControl>(std::move(timeScopes), style == 1 ? Look::Pill : Look::Bar);
}

QUrl QVTimeScopeControl::view() const {
    return QUrl(look_ == Look::Pill ? QStringLiteral("qrc:/Qelvar/QVTimeScopeControlPill.qml")
                                    : QStringLiteral("qrc:/Qelvar/QVTimeScopeControlBar.qml"));
}

QStringList QVTimeScopeControl::segments() const {
    QStringList titles;
    for (const QVTimeScope timeScope : timeScopes_) titles.append(QVTimeScopeDisplayName(timeScope));
    return titles;
}

QString QVTimeScopeControl::accessibleName() const {
    return platform::localized("TIME_SCOPE") + QStringLiteral(", ") +
           QVTimeScopeDisplayName(selectedTimeScope());
}

void QVTimeScopeControl::setSelectedTimeScope(QVTimeScope timeScope) {
    const auto found = std::find(timeScopes_.begin(), timeScopes_.end(), timeScope);
    select(found == timeScopes_.end() ? 0 : static_cast<int>(found - timeScopes_.begin()));
}

void QVTimeScopeControl::pick(int index) {
    if (index < 0 || index >= static_cast<int>(timeScopes_.size())) return;
    select(index);
    emit valueChanged();
}

void QVTimeScopeControl::select(int index) {
    if (index == selectedIndex_) return;
    selectedIndex_ = index;
    emit selectedIndexChanged();
    emit accessibleNameChanged();
}

void QVTimeScopeControl::updateTitles() {
    emit segmentsChanged();
    emit accessibleNameChanged();
}
