#pragma once

#include <algorithm>
#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "framework/common/Mutex.hpp"
#include "settings/detail/Cell.hpp"
#include "settings/detail/SettingState.hpp"

namespace velkor::settings::detail {

/// Logs what a callback of the setting called `name` has thrown.
VELKOR_EXPORT void reportCallback(const std::string& name, const char* text);

/// A state with its value, published in a `Cell`, and the callbacks that are told of it.
template <class T, class Cell>
class ValueState : public SettingState {
public:
    using Callback = std::function<void(const T& before, const T& now)>;
    using SettingState::SettingState;

    /// Tells `callback` of each change from now on; gives its number.
    std::uint64_t addCallback(Callback callback) VELKOR_EXCLUDES(listMutex) {
        const auto added = std::make_shared<const Callback>(std::move(callback));
        const common::MutexLock lock(listMutex);
        callbacks.push_back({++lastId, added});
        return lastId;
    }

    Cell cell;

protected:
    /// Keeps what `judge` has found.
    void propose(std::optional<T> value) VELKOR_REQUIRES(gate) { candidate = std::move(value); }

private:
    struct Entry {
        std::uint64_t id;
        std::shared_ptr<const Callback> callback;
    };

    void publish(bool tell) override VELKOR_REQUIRES(gate) {
        const auto told = tell ? listed() : std::vector<Entry>();
        const auto before = cell.held();
        cell.store(std::move(*candidate));
        candidate.reset();
        if (told.empty()) return;
        const auto now = cell.held();
        for (const Entry& entry : told) {
            if (isListed(entry.id)) call(*entry.callback, *before, *now);
        }
    }

    void call(const Callback& callback, const T& before, const T& now) const {
        try {
            callback(before, now);
        } catch (const std::exception& error) {
            reportCallback(name(), error.what());
        } catch (...) {
            reportCallback(name(), "no std::exception");
        }
    }

    std::vector<Entry> listed() const VELKOR_EXCLUDES(listMutex) {
        const common::MutexLock lock(listMutex);
        return callbacks;
    }

    bool isListed(std::uint64_t id) const VELKOR_EXCLUDES(listMutex) {
        const common::MutexLock lock(listMutex);
        return std::any_of(callbacks.begin(), callbacks.end(),
                           [id](const Entry& entry) { return entry.id == id; });
    }

    void removeCallback(std::uint64_t id) override VELKOR_REQUIRES(gate) {
        std::shared_ptr<const Callback> removed;  // destroyed without the mutex
        const common::MutexLock lock(listMutex);
        for (auto entry = callbacks.begin(); entry != callbacks.end(); ++entry) {
            if (entry->id != id) continue;
            removed.swap(entry->callback);
            callbacks.erase(entry);
            return;
        }
    }

    void removeCallbacks() override VELKOR_REQUIRES(gate) {
        std::vector<Entry> removed;  // destroyed without the mutex
        const common::MutexLock lock(listMutex);
        removed.swap(callbacks);
    }

    std::optional<T> candidate VELKOR_GUARDED_BY(gate);
    mutable common::Mutex listMutex;
    std::vector<Entry> callbacks VELKOR_GUARDED_BY(listMutex);
    std::uint64_t lastId VELKOR_GUARDED_BY(listMutex) = 0;
};

}  // namespace velkor::settings::detail
