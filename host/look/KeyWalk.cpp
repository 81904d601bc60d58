#include "host/look/KeyWalk.hpp"

#include <algorithm>
#include <cstddef>

#include "host/console/Interruption.hpp"

namespace velkor::host {

void walkKeys(configuration::ConfigurationImpl& store, const std::string& first,
              const std::function<bool(const std::string& key)>& visit) {
    // Each page goes through all keys, so they grow; the largest costs some megabytes.
    constexpr std::size_t smallestPage = 256;
    constexpr std::size_t largestPage = std::size_t{1} << 16U;
    std::string next = first;
    for (std::size_t size = smallestPage;; size = std::min(4 * size, largestPage)) {
        const auto page = store.keysFrom(next, size).get();
        if (page.empty()) return;
        for (const auto& key : page) {
            if (Interruption::isRequested()) throw Interrupted();
            if (!visit(key)) return;
        }
        next = page.back() + '\0';
    }
}

}  // namespace velkor::host
