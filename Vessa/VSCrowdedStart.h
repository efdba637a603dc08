#pragma once

#include <cstdint>
#include <functional>
#include <unordered_map>
#include <vector>

/// The rows of one type that share one start, by what they say, for a search that need not look at all of
/// them. A row may be found under several fingerprints. Plain memory, about 130 bytes a row.
class VSCrowdedStart {
 public:
    void add(uint64_t fingerprint, int64_t id);
    /// The least number under any of these fingerprints that is wanted; 0: none. What is refused for good is
    /// forgotten, so that the next search does not meet it again.
    enum class Verdict { Wanted, NotThis, NeverAgain };
    int64_t find(const std::vector<uint64_t>& fingerprints, const std::function<Verdict(int64_t id)>& judge);

 private:
    static constexpr uint32_t none = UINT32_MAX;
    struct Entry {
        int64_t id;
        uint32_t next;  // under the same fingerprint
    };
    struct Chain {
        uint32_t first = none, last = none;
    };
    std::vector<Entry> entries_;
    std::unordered_map<uint64_t, Chain> chains_;
};
