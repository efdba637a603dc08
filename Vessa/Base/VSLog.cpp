#include "Vessa/Base/VSLog.h"

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <mutex>

namespace {

struct LogState {
    std::mutex mutex;
    std::shared_ptr<const VSLogSink> sink;  // guarded by mutex; null: standard error
};

LogState& state() {
    static auto* instance = new LogState;  // never destroyed: threads may log while the process ends
    return *instance;
}

std::shared_ptr<const VSLogSink> currentSink() {
    std::lock_guard lock(state().mutex);
    return state().sink;
}

bool debugWanted() {
    static const bool wanted = [] {
        const char* value = std::getenv("QELVAR_LOG");
        return value && std::string_view(value) == "debug";
    }();
    return wanted;
}

void writeToStandardError(std::string_view line) {
    // One call, so that lines of several threads do not mix.
    std::string text(line);
    text += '\n';
    std::fwrite(text.data(), 1, text.size(), stderr);
}

}  // namespace

bool VSLogIsEnabled(VSLogLevel level) {
    return level == VSLogLevel::Error || debugWanted() || currentSink() != nullptr;
}

void VSLog(VSLogLevel level, std::string_view line) {
    // The sink is called without the lock: it may log, or change the sink.
    if (const auto sink = currentSink())
        (*sink)(level, line);
    else if (VSLogIsEnabled(level))
        writeToStandardError(line);
}

VSLogSink VSSetLogSink(VSLogSink sink) {
    auto next = sink ? std::make_shared<const VSLogSink>(std::move(sink)) : nullptr;
    std::lock_guard lock(state().mutex);
    state().sink.swap(next);
    return next ? *next : VSLogSink();
}
