#pragma once

#include <QQuickView>

#include "Qelvar/App/QVAppDelegate.h"

/// The application's window: a phone's size unless another is given, with the screens of an application that
/// has finished launching. Main thread only.
class QVWindow : public QQuickView {
    Q_OBJECT
 public:
    /// REQUIRES: `app` outlives the window.
    QVWindow(QVAppDelegate& app, QSize size);
    /// The screens could be loaded.
    bool isUsable() const { return rootObject() != nullptr; }

 protected:
    /// Long work under way is not given up without a question. (A signal ends the application without one.)
    bool event(QEvent* event) override;

 private:
    QVAppDelegate& app_;
};
