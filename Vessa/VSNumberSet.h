#pragma once

#include <cstdint>
#include <unordered_set>
#include <vector>

/// Numbers from 1 that were seen, mostly small and dense: a bit each.
class VSNumberSet {
 public:
    /// False: it was there.
    bool insert(int64_t number) {
        if (number >= dense) return others_.insert(number).second;
        const auto place = static_cast<size_t>(number);
        if (place >= bits_.size()) bits_.resize(place + 1 + place / 8);
        if (bits_[place]) return false;
        bits_[place] = true;
        return true;
    }
    bool contains(int64_t number) const {
        if (number >= dense) return others_.contains(number);
        return static_cast<size_t>(number) < bits_.size() && bits_[static_cast<size_t>(number)];
    }

 private:
    static constexpr int64_t dense = int64_t{1} << 30;
    std::vector<bool> bits_;
    std::unordered_set<int64_t> others_;
};
