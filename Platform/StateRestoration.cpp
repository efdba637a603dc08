#include "Platform/StateRestoration.h"

#include <cassert>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <system_error>

#include "Platform/NavigationStack.h"
#include "Platform/ReplaceFile.h"
#include "Vessa/Base/VSLog.h"

namespace platform {

namespace {

namespace fs = std::filesystem;

constexpr std::chrono::seconds kStandsStill{1};
constexpr uintmax_t kLargestFile = 1 << 20;  // what is larger was not written by us

// In files; never changed.
constexpr int64_t kVersion = 1;
constexpr const char* kVersionKey = "Version";
constexpr const char* kStateKey = "State";
constexpr const char* kIdentifierKey = "Identifier";

// What cannot be read is not worth a word to the user: the session begins as the first one did.
std::optional<std::string> textOf(const fs::path& path) {
    std::error_code error;
    const uintmax_t size = fs::file_size(path, error);
    if (error || size > kLargestFile) return std::nullopt;
    std::ifstream file(path, std::ios::binary);
    std::string text(static_cast<size_t>(size), '\0');
    file.read(text.data(), static_cast<std::streamsize>(size));
    return file ? std::optional(std::move(text)) : std::nullopt;
}

const VSValue::Dictionary* dictionaryIn(const VSValue& value, const char* key) {
    const VSValue* found = value[key];
    return found ? found->dictionary() : nullptr;
}

}  // namespace

StateRestoration::StateRestoration(fs::path file)
    : file_(file.empty() ? std::move(file) : fs::absolute(file)) {
    idleTimer_.setSingleShot(true);
    idleTimer_.setInterval(kStandsStill);
    connect(&idleTimer_, &QTimer::timeout, this, &StateRestoration::save);
    const auto text = file_.empty() ? std::nullopt : textOf(file_);
    const auto saved = text ? VSValue::fromSerialized(*text) : std::nullopt;
    const VSValue* version = saved ? (*saved)[kVersionKey] : nullptr;
    if (!version || version->integer() != kVersion) return;
    if (const auto* state = dictionaryIn(*saved, kStateKey)) savedState_ = *state;
    written_ = *text;
}

StateRestoration::~StateRestoration() = default;

void StateRestoration::setScreenFactory(const QString& restorationIdentifier, ScreenFactory factory) {
    factories_[restorationIdentifier] = std::move(factory);
}

void StateRestoration::stateDidChange() {
    if (state_ && !file_.empty()) idleTimer_.start();
}

void StateRestoration::save() {
    idleTimer_.stop();
    if (!state_ || file_.empty()) return;
    const VSValue value(VSValue::Dictionary{{kVersionKey, kVersion}, {kStateKey, state_()}});
    std::string text = value.serialized();
    if (text == written_ && !*writingFailed_) return;
    written_ = std::move(text);
    if (!worker_) worker_ = makeSerialQueue("saved state");
    worker_->async([file = file_, content = written_, failed = writingFailed_] {
        *failed = !replaceFile(file, content, false);
        if (*failed)
            VSLog(VSLogLevel::Error, "What the next session is to begin with cannot be written to " +
                                         file.string() + ": " + std::strerror(errno));
    });
}

void StateRestoration::finish() {
    save();
    worker_.reset();
}

VSValue::Dictionary StateRestoration::encodeScreen(const Screen& screen) const {
    RestorableState state(objects_);
    screen.encodeRestorableState(state);
    return {{kIdentifierKey, screen.restorationIdentifier().toStdString()}, {kStateKey, state.values()}};
}

VSValue::Array StateRestoration::encodeStack(const NavigationStack& stack) const {
    VSValue::Array screens;
    for (int index = 0; index < stack.count(); ++index) {
        const Screen& screen = *stack.screenAt(index);
        if (screen.restorationIdentifier().isEmpty()) break;
        screens.emplace_back(encodeScreen(screen));
    }
    return screens;
}

void StateRestoration::decodeStack(NavigationStack& stack, const VSValue::Array& screens) const {
    assert(stack.count() == 1);
    for (size_t index = 0; index < screens.size(); ++index) {
        const VSValue* name = screens[index][kIdentifierKey];
        const auto* values = dictionaryIn(screens[index], kStateKey);
        if (!name || !name->string() || !values) return;
        const QString identifier = QString::fromStdString(*name->string());
        const RestorableState state(objects_, *values);
        if (index > 0) {
            const auto factory = factories_.find(identifier);
            auto screen = factory == factories_.end() ? nullptr : factory->second(state);
            if (!screen) return;
            stack.push(std::move(screen), false);
        } else if (stack.rootScreen()->restorationIdentifier() != identifier) {
            return;
        }
        stack.topScreen()->decodeRestorableState(state);
    }
}

}  // namespace platform
