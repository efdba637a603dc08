#pragma once

#include <QObject>
#include <QString>
#include <QTimer>
#include <atomic>
#include <filesystem>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>

#include "Platform/Queue.h"
#include "Platform/RestorableState.h"
#include "Vessa/Base/VSValue.h"

namespace platform {

class NavigationStack;
class Screen;

/// Keeps what the user was at, so that the next session begins there: one small file, replaced as a whole.
/// Not worth a wait for the disk: the file is written on a worker, a moment after the last change, and a
/// process that is killed keeps what was written before. A file that cannot be read, or that another version
/// wrote, counts as none. Main thread only.
class StateRestoration : public QObject {
    Q_OBJECT
 public:
    /// Makes a screen of a saved state, or null when what it showed is no more.
    using ScreenFactory = std::function<std::unique_ptr<Screen>(const RestorableState&)>;

    /// An empty path keeps nothing and restores nothing.
    explicit StateRestoration(std::filesystem::path file);
    ~StateRestoration() override;

    RestorableObjects& objects() { return objects_; }
    void setScreenFactory(const QString& restorationIdentifier, ScreenFactory factory);

    /// What the session before left: none when there was none.
    const std::optional<VSValue::Dictionary>& savedState() const { return savedState_; }
    /// What is saved is `state()` from now on, asked for at each save.
    void setState(std::function<VSValue::Dictionary()> state) { state_ = std::move(state); }
    /// The state may have changed: it is saved when it stands still for a moment.
    void stateDidChange();
    /// Saves what has changed, on the worker.
    void save();
    /// Saves what has changed and waits until it is written: at the end of the session.
    void finish();

    /// The screens of a stack: their names and states, from the root to the last that has a name.
    VSValue::Array encodeStack(const NavigationStack& stack) const;
    /// Gives the stack's root its state and puts the saved screens above it, as far as they can be made.
    /// REQUIRES: the stack has only its root.
    void decodeStack(NavigationStack& stack, const VSValue::Array& screens) const;

 private:
    VSValue::Dictionary encodeScreen(const Screen& screen) const;
    const std::filesystem::path file_;
    RestorableObjects objects_;
    std::map<QString, ScreenFactory> factories_;
    std::optional<VSValue::Dictionary> savedState_;
    std::function<VSValue::Dictionary()> state_;
    std::string written_;  // what the file holds, or will when the worker is through
    // Set by the worker; then it is not what the file holds.
    std::shared_ptr<std::atomic<bool>> writingFailed_ = std::make_shared<std::atomic<bool>>(false);
    QTimer idleTimer_;
    std::shared_ptr<Queue> worker_;
};

}  // namespace platform
