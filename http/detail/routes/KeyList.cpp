#include "http/detail/routes/KeyList.hpp"

#include <set>
#include <utility>

namespace velkor::http::detail {

std::shared_ptr<const KeyList::Keys> KeyList::of(configuration::ConfigurationImpl& store) {
    // Before the keys: what changes meanwhile makes the version grow afterwards.
    const std::uint64_t now = store.read({}).get().version;
    {
        const common::MutexLock lock(mutex);
        if (known != nullptr && version == now) return known;
    }
    std::set<std::string> sorted = store.keys().get();
    auto listed = std::make_shared<Keys>();
    listed->reserve(sorted.size());
    while (!sorted.empty()) listed->push_back(std::move(sorted.extract(sorted.begin()).value()));
    std::shared_ptr<const Keys> replaced = listed;  // destroyed with the mutex released
    const common::MutexLock lock(mutex);
    known.swap(replaced);
    version = now;
    return listed;
}

}  // namespace velkor::http::detail
