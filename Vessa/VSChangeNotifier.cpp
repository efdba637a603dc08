#include "Vessa/VSChangeNotifier.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "Vessa/Base/VSLog.h"
#include "Vessa/VSStoreSchema.h"

namespace {

/// How often to look where the system gives no notices (too many watches, a network's file system).
constexpr int pollMilliseconds = 500;

void touch(const std::filesystem::path& file) {
    const int descriptor = ::open(file.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
    if (descriptor < 0 || ::futimens(descriptor, nullptr) != 0)
        VSLog(VSLogLevel::Error,
              "Other programs cannot be told of a change: " + file.string() + ": " + std::strerror(errno));
    if (descriptor >= 0) ::close(descriptor);
}

}  // namespace

VSChangeNotifier::VSChangeNotifier(std::filesystem::path folder, VSReaderPool& readers,
                                   std::string application, Handler handler)
    : folder_(std::move(folder)),
      readers_(readers),
      application_(std::move(application)),
      handler_(std::move(handler)) {
    wakeDescriptor_ = ::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
    watchDescriptor_ = ::inotify_init1(IN_CLOEXEC | IN_NONBLOCK);
    if (watchDescriptor_ >= 0 &&
        ::inotify_add_watch(watchDescriptor_, folder_.c_str(), IN_ATTRIB | IN_CREATE | IN_MOVED_TO) < 0) {
        ::close(watchDescriptor_);
        watchDescriptor_ = -1;
    }
}

VSChangeNotifier::~VSChangeNotifier() {
    if (wakeDescriptor_ >= 0) ::close(wakeDescriptor_);
    if (watchDescriptor_ >= 0) ::close(watchDescriptor_);
}

void VSChangeNotifier::start(std::shared_ptr<void> owner) {
    if (auto now = read()) known_ = std::move(*now);
    thread_ = std::thread([this, keep = std::move(owner)]() mutable {
        run();
        keep.reset();  // may end the life of this notifier
    });
}

void VSChangeNotifier::announce() {
    const uint64_t one = 1;
    // A full counter wakes as well, so a failed write loses nothing.
    if (::write(wakeDescriptor_, &one, sizeof one) < 0 && errno != EAGAIN)
        VSLog(VSLogLevel::Error,
              std::string("The store's notifier cannot be woken: ") + std::strerror(errno));
    touch(folder_ / VSStoreSchema::noticeFileName);
}

void VSChangeNotifier::finish() {
    finishing_ = true;
    const uint64_t one = 1;
    while (::write(wakeDescriptor_, &one, sizeof one) < 0 && errno == EINTR) {
    }
    if (!thread_.joinable()) return;
    if (thread_.get_id() == std::this_thread::get_id())
        thread_.detach();
    else
        thread_.join();
}

bool VSChangeNotifier::noticeTouched() {
    alignas(inotify_event) char buffer[4096];
    bool touched = false;
    for (;;) {
        const ssize_t size = ::read(watchDescriptor_, buffer, sizeof buffer);
        if (size <= 0) return touched;
        for (ssize_t at = 0; at < size;) {
            const auto* event = reinterpret_cast<const inotify_event*>(buffer + at);
            // Lost notices may have been ours.
            if ((event->mask & IN_Q_OVERFLOW) ||
                (event->len && std::strcmp(event->name, VSStoreSchema::noticeFileName) == 0))
                touched = true;
            at += static_cast<ssize_t>(sizeof(inotify_event) + event->len);
        }
    }
}

void VSChangeNotifier::run() {
    while (!finishing_) {
        pollfd descriptors[2] = {{wakeDescriptor_, POLLIN, 0}, {watchDescriptor_, POLLIN, 0}};
        const bool watching = watchDescriptor_ >= 0;
        const int ready = ::poll(descriptors, watching ? 2 : 1, watching ? -1 : pollMilliseconds);
        if (finishing_) return;
        bool shouldLook = ready == 0;
        if (ready > 0 && (descriptors[0].revents & POLLIN)) {
            uint64_t count;
            while (::read(wakeDescriptor_, &count, sizeof count) > 0) {
            }
            shouldLook = true;
        }
        if (ready > 0 && watching && (descriptors[1].revents & POLLIN) && noticeTouched()) shouldLook = true;
        if (shouldLook) look();
    }
}

VSResult<VSChangeNotifier::State> VSChangeNotifier::read() {
    return readers_.read([this](VSStoreReader& reader) {
        return State{reader.typeChanges(), watchesDefaults_ ? reader.defaultTexts(application_) : Defaults()};
    });
}

void VSChangeNotifier::look() {
    auto now = read();
    if (!now) {
        VSLog(vs_isDatabaseAccessibilityError(now.error()) ? VSLogLevel::Debug : VSLogLevel::Error,
              "The store's changes cannot be read: " + now.error().message);
        return;
    }
    Changes changes;
    for (const auto& [type, number] : now->types) {
        int64_t& known = known_.types[type];
        if (number > known) changes.types.push_back({type, number});
        known = number;
    }
    for (const auto& [key, text] : now->defaults) {
        const auto known = known_.defaults.find(key);
        if (known == known_.defaults.end() || known->second != text) changes.defaultKeys.push_back(key);
    }
    known_.defaults = std::move(now->defaults);
    handler_(changes);
}
