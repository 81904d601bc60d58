#include "layers/sqlite/detail/DiskHealth.hpp"

#include <chrono>
#include <string>
#include <utility>

namespace velkor::layers::detail {

using common::MutexLock;

namespace {

std::string textOf(const std::exception_ptr& reason) noexcept {
    try {
        std::rethrow_exception(reason);
    } catch (const std::exception& error) {
        try {
            return error.what();
        } catch (...) {
            return {};
        }
    } catch (...) {
        return {};
    }
}

}  // namespace

configuration::SourceState DiskHealth::state() const {
    const MutexLock lock(mutex);
    return current;
}

void DiskHealth::noteRefusal(const std::exception_ptr& reason) noexcept {
    std::string text = textOf(reason);
    const MutexLock lock(mutex);
    if (current.isWell) current.since = std::chrono::system_clock::now();
    current.isWell = false;
    current.lastError.swap(text);
}

void DiskHealth::noteCommit() noexcept {
    const MutexLock lock(mutex);
    if (current.isWell) return;
    current.isWell = true;
    current.since = std::chrono::system_clock::now();
}

}  // namespace velkor::layers::detail
