#pragma once

#include <QObject>
#include <QQuickItem>
#include <QTimer>

namespace platform {

/// What is said aloud by a screen reader where something happened that no focus and no text on the screen
/// tells. Main thread only; one object for the process.
class Announcements : public QObject {
    Q_OBJECT
 public:
    static Announcements& shared();
    void post(const QString& text) { emit posted(text); }

 signals:
    void posted(const QString& text);
};

/// Says the text once, to those who listen.
void announce(const QString& text);

/// The announcement in the scene of a window: a notification of which nothing is seen. Screen readers say a
/// notification when it is shown, which is also understood by those that know no announcements. Its layout
/// gives it a size, the role of a notification, and `text` as its accessible name.
class AnnouncementItem : public QQuickItem {
    Q_OBJECT
    Q_PROPERTY(QString text READ text NOTIFY textChanged)
 public:
    explicit AnnouncementItem(QQuickItem* parent = nullptr);
    QString text() const { return text_; }

 signals:
    void textChanged();

 private:
    void show(const QString& text);

    QString text_;
    QTimer end_;
};

}  // namespace platform
