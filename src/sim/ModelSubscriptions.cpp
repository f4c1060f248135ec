// Who subscribed to which events of which component, and whom one event reaches.
#include <algorithm>

#include "sim/Model.h"

namespace sim {

void Model::subscribe(const Address& component, Subscription s) {
    subs_[addressKey(component)].push_back(std::move(s));
}

void Model::cancel(const Address& component, const Address& owner, std::uint32_t trans,
                   const std::optional<std::uint32_t>& evtType) {
    auto it = subs_.find(addressKey(component));
    if (it == subs_.end()) {
        return;
    }
    auto& v = it->second;
    std::erase_if(v, [&](const Subscription& s) {
        return s.owner == owner && s.trans == trans && (!evtType || s.evtType == *evtType);
    });
    if (v.empty()) {
        subs_.erase(it);
    }
}

void Model::forget(const Address& host) {
    for (auto it = subs_.begin(); it != subs_.end();) {
        std::erase_if(it->second,
                      [&](const Subscription& s) { return s.owner == host || s.retAddr == host; });
        it = it->second.empty() ? subs_.erase(it) : std::next(it);
    }
}

void Model::subscribersOf(const Event& e, std::vector<const Subscription*>& out) const {
    out.clear();
    auto it = subs_.find(addressKey(e.source));
    if (it == subs_.end()) {
        return;
    }
    for (const Subscription& s : it->second) {
        if (s.evtType != e.type && s.evtType != e.group) {
            continue;
        }
        bool dup = std::any_of(out.begin(), out.end(), [&](const Subscription* o) {
            return o->retAddr == s.retAddr && o->trans == s.trans && o->group == s.group;
        });
        if (!dup) {
            out.push_back(&s);
        }
    }
}

std::size_t Model::subscriptionCount() const {
    std::size_t n = 0;
    for (const auto& [k, v] : subs_) {
        n += v.size();
    }
    return n;
}

}  // namespace sim
