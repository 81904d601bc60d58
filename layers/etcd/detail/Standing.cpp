#include "layers/etcd/detail/Standing.hpp"

#include <utility>

namespace velkor::layers::etcd {

using common::MutexLock;
using configuration::SourceState;

Standing::Standing() {
    current.isWell = false;
}

SourceState Standing::state() const {
    const MutexLock lock(mutex);
    SourceState state = current;
    if (!endpoint.empty()) state.details.emplace_back("endpoint", endpoint);
    if (revision > 0) state.details.emplace_back("revision", std::to_string(revision));
    return state;
}

bool Standing::noteConnected(const std::string& newEndpoint) {
    const MutexLock lock(mutex);
    endpoint = newEndpoint;
    current.updated = std::chrono::system_clock::now();
    if (current.isWell) return false;
    current.isWell = true;
    current.since = current.updated;
    return true;
}

bool Standing::noteLost(const std::string& reason) {
    const MutexLock lock(mutex);
    const bool isNews = current.isWell || current.lastError.empty();
    endpoint.clear();
    if (current.isWell || !current.since) current.since = std::chrono::system_clock::now();
    current.isWell = false;
    current.lastError = reason;  // without memory that it is lost is known all the same
    return isNews;
}

void Standing::noteWriteError(std::string reason) noexcept {
    const MutexLock lock(mutex);
    current.lastError = std::move(reason);
}

void Standing::noteUpdated(SourceState::Time time) {
    const MutexLock lock(mutex);
    current.updated = time;
}

void Standing::noteRevision(std::int64_t newRevision) {
    const MutexLock lock(mutex);
    revision = newRevision;
}

}  // namespace velkor::layers::etcd
