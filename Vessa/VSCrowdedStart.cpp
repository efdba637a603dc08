#include "Vessa/VSCrowdedStart.h"

void VSCrowdedStart::add(uint64_t fingerprint, int64_t id) {
    const auto added = static_cast<uint32_t>(entries_.size());
    entries_.push_back({id, none});
    Chain& chain = chains_[fingerprint];
    if (chain.first == none)
        chain.first = added;
    else
        entries_[chain.last].next = added;
    chain.last = added;
}

int64_t VSCrowdedStart::find(const std::vector<uint64_t>& fingerprints,
                             const std::function<Verdict(int64_t id)>& judge) {
    int64_t least = 0;
    for (const uint64_t fingerprint : fingerprints) {
        const auto found = chains_.find(fingerprint);
        if (found == chains_.end()) continue;
        Chain& chain = found->second;
        uint32_t before = none;
        for (uint32_t at = chain.first; at != none;) {
            const Entry entry = entries_[at];
            if (least && entry.id >= least) break;
            const Verdict verdict = judge(entry.id);
            if (verdict == Verdict::Wanted) {
                least = entry.id;
                break;
            }
            if (verdict == Verdict::NeverAgain) {
                (before == none ? chain.first : entries_[before].next) = entry.next;
                if (chain.last == at) chain.last = before;
            } else {
                before = at;
            }
            at = entry.next;
        }
        if (chain.first == none) chains_.erase(found);
    }
    return least;
}
