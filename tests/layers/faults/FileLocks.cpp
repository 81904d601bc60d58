#include "tests/layers/faults/FileLocks.hpp"

#include <algorithm>

namespace velkor::testing {

int FileLocks::lock(Owner owner, int level) {
    const std::lock_guard<std::mutex> guard(mutex);
    int& held = levels[owner];
    if (held >= level) return SQLITE_OK;
    const int others = highestOfOthers(owner);
    if (level == SQLITE_LOCK_SHARED && others >= SQLITE_LOCK_PENDING) return SQLITE_BUSY;
    if (level >= SQLITE_LOCK_RESERVED && others >= SQLITE_LOCK_RESERVED) return SQLITE_BUSY;
    if (level == SQLITE_LOCK_EXCLUSIVE && others >= SQLITE_LOCK_SHARED) {
        held = SQLITE_LOCK_PENDING;
        return SQLITE_BUSY;
    }
    held = level;
    return SQLITE_OK;
}

void FileLocks::unlock(Owner owner, int level) {
    const std::lock_guard<std::mutex> guard(mutex);
    if (level == SQLITE_LOCK_NONE) {
        levels.erase(owner);
        return;
    }
    int& held = levels[owner];
    held = std::min(held, level);
}

bool FileLocks::isReserved() const {
    const std::lock_guard<std::mutex> guard(mutex);
    return highestOfOthers(nullptr) >= SQLITE_LOCK_RESERVED;
}

int FileLocks::lockShared(Owner owner, int first, int count, int flags) {
    const std::lock_guard<std::mutex> guard(mutex);
    const auto begin = places.begin() + first;
    const auto end = begin + count;
    if ((flags & SQLITE_SHM_UNLOCK) != 0) {
        for (auto place = begin; place != end; ++place) {
            if (place->writer == owner) place->writer = nullptr;
            place->readers.erase(owner);
        }
        return SQLITE_OK;
    }
    const bool isExclusive = (flags & SQLITE_SHM_EXCLUSIVE) != 0;
    const auto isTaken = [&](const Place& place) {
        if (place.writer != nullptr && place.writer != owner) return true;
        return isExclusive && place.readers.size() > place.readers.count(owner);
    };
    if (std::any_of(begin, end, isTaken)) return SQLITE_BUSY;
    for (auto place = begin; place != end; ++place) {
        if (isExclusive) {
            place->writer = owner;
        } else {
            place->readers[owner] = true;
        }
    }
    return SQLITE_OK;
}

void* FileLocks::region(Owner owner, std::size_t index, std::size_t size, bool mayExtend) {
    const std::lock_guard<std::mutex> guard(mutex);
    users[owner] = true;
    if (index >= regions.size() && !mayExtend) return nullptr;
    while (regions.size() <= index) regions.push_back(std::make_unique<char[]>(size));
    return regions[index].get();
}

void FileLocks::leaveShared(Owner owner) {
    const std::lock_guard<std::mutex> guard(mutex);
    users.erase(owner);
    if (users.empty()) regions.clear();
}

void FileLocks::barrier() const {
    const std::lock_guard<std::mutex> guard(mutex);
}

int FileLocks::highestOfOthers(Owner owner) const {
    int highest = SQLITE_LOCK_NONE;
    for (const auto& [other, level] : levels) {
        if (other != owner) highest = std::max(highest, level);
    }
    return highest;
}

}  // namespace velkor::testing
