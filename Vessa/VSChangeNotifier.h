#pragma once

#include <filesystem>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "Vessa/VSReaderPool.h"

/// Learns of commits of this and of other processes and tells which types and default values they changed.
/// Other processes are heard of through a file in the folder that every commit touches.
class VSChangeNotifier {
 public:
    struct Change {
        int type;
        int64_t number;
    };
    struct Changes {
        std::vector<Change> types;
        std::vector<std::string> defaultKeys;  // of the application's default values
    };
    /// Called on the notifier's thread, one call at a time, after each look; there may be no changes.
    using Handler = std::function<void(const Changes&)>;

    VSChangeNotifier(std::filesystem::path folder, VSReaderPool& readers, std::string application,
                     Handler handler);
    ~VSChangeNotifier();
    VSChangeNotifier(const VSChangeNotifier&) = delete;
    VSChangeNotifier& operator=(const VSChangeNotifier&) = delete;

    /// Changes from now on are told. The thread holds `owner` until it ends.
    void start(std::shared_ptr<void> owner);
    /// After a commit of this process: look now, and let the others look. Any thread.
    void announce();
    /// From now on changes of default values are told too; at first all may count as changed. Any thread.
    void watchDefaults() { watchesDefaults_ = true; }
    /// Ends the thread; does not wait when called on it. Once.
    void finish();

 private:
    void run();
    void look();
    /// By key, as stored.
    using Defaults = std::map<std::string, std::string>;
    struct State {
        std::map<int, int64_t> types;
        Defaults defaults;
    };
    VSResult<State> read();
    bool noticeTouched();

    const std::filesystem::path folder_;
    VSReaderPool& readers_;
    const std::string application_;
    const Handler handler_;
    int wakeDescriptor_ = -1, watchDescriptor_ = -1;
    std::atomic<bool> finishing_ = false, watchesDefaults_ = false;
    State known_;         // of the thread
    std::thread thread_;  // of the thread that starts and finishes
};
