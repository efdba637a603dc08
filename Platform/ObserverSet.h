#pragma once

#include <algorithm>
#include <memory>
#include <vector>

namespace platform {

/// Weakly held observers: one that goes away drops out. Main thread only. Observers may add and remove
/// themselves while they are told; the order of telling is that of adding.
template <typename T>
class ObserverSet {
 public:
    void add(const std::shared_ptr<T>& observer) {
        prune();
        if (!contains(observer.get())) observers_.push_back(observer);
    }
    void remove(const T* observer) {
        std::erase_if(observers_, [observer](const std::weak_ptr<T>& weak) {
            auto strong = weak.lock();
            return !strong || strong.get() == observer;
        });
    }
    /// Calls `tell` with each living observer, over a copy of the set.
    template <typename Function>
    void tell(Function&& function) {
        const auto copy = observers_;
        for (const auto& weak : copy)
            if (auto observer = weak.lock()) function(*observer);
        prune();
    }
    bool empty() {
        prune();
        return observers_.empty();
    }

 private:
    bool contains(const T* observer) const {
        return std::any_of(observers_.begin(), observers_.end(),
                           [observer](const auto& weak) { return weak.lock().get() == observer; });
    }
    void prune() {
        std::erase_if(observers_, [](const auto& weak) { return weak.expired(); });
    }
    std::vector<std::weak_ptr<T>> observers_;
};

}  // namespace platform
