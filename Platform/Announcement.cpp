#include "Platform/Announcement.h"

#include <chrono>

namespace platform {

namespace {

/// Long enough to be asked for by a screen reader that is busy; then it is no longer found by exploring.
constexpr std::chrono::seconds kShown(5);

}  // namespace

Announcements& Announcements::shared() {
    static Announcements announcements;
    return announcements;
}

void announce(const QString& text) {
    Announcements::shared().post(text);
}

AnnouncementItem::AnnouncementItem(QQuickItem* parent) : QQuickItem(parent) {
    setVisible(false);
    end_.setSingleShot(true);
    end_.setInterval(kShown);
    connect(&end_, &QTimer::timeout, this, [this] { setVisible(false); });
    connect(&Announcements::shared(), &Announcements::posted, this, &AnnouncementItem::show);
}

void AnnouncementItem::show(const QString& text) {
    // Hidden first: each showing is an event of its own, also of the same text.
    setVisible(false);
    if (text_ != text) {
        text_ = text;
        emit textChanged();
    }
    setVisible(true);
    end_.start();
}

}  // namespace platform
