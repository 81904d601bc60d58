#pragma once

#include <algorithm>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "configuration/sources/ConfigurationSource.hpp"
#include "configuration/sources/ForgettingSource.hpp"

namespace velkor::layers {

/// A source that does everything right by itself. Each wrong one differs from it in one thing.
class RightSource : public configuration::ConfigurationSource,
                    public configuration::ForgettingSource {
public:
    using Value = configuration::ConfigurationValue;

    explicit RightSource(configuration::ValueMap initial) : values(std::move(initial)) {}

    Value get(const std::string& key) override {
        const Lock lock(mutex);
        return values.at(key);
    }

    bool has(const std::string& key) override {
        const Lock lock(mutex);
        return values.count(key) > 0;
    }

    std::set<std::string> keys() override {
        const Lock lock(mutex);
        std::set<std::string> all;
        for (const auto& entry : values) all.insert(entry.first);
        return all;
    }

    Value set(const std::string& key, Value value) override {
        Value answer = value;
        {
            const Lock lock(mutex);
            const auto [entry, isNew] = values.emplace(key, value);
            if (!isNew) answer = std::exchange(entry->second, std::move(value));
        }
        tell(key);
        return answer;
    }

    std::optional<Value> unset(const std::string& key) override {
        std::optional<Value> former = take(key);
        if (former) tell(key);
        return former;
    }

    void setChangeListener(configuration::ChangeListener newListener) override {
        ListenerPtr former =
            std::make_shared<configuration::ChangeListener>(std::move(newListener));
        Lock lock(mutex);
        listener.swap(former);
        callEnded.wait(lock, [this] { return mayReturn(); });
    }

protected:
    using Lock = std::unique_lock<std::recursive_mutex>;
    using ListenerPtr = std::shared_ptr<const configuration::ChangeListener>;

    std::optional<Value> take(const std::string& key) {
        const Lock lock(mutex);
        auto entry = values.extract(key);
        if (entry.empty()) return std::nullopt;
        return std::move(entry.mapped());
    }

    virtual void tell(const std::string& key) {
        const auto self = std::this_thread::get_id();
        Lock lock(mutex);
        const auto called = listener;
        callers.push_back(self);
        lock.unlock();
        if (*called) (*called)(key);
        lock.lock();
        callers.erase(std::find(callers.begin(), callers.end(), self));
        callEnded.notify_all();
    }

    /// Whether whoever replaces the listener may go on: no other thread is in a call.
    virtual bool mayReturn() const {
        const auto self = std::this_thread::get_id();
        return std::all_of(callers.begin(), callers.end(),
                           [self](const auto& caller) { return caller == self; });
    }

    std::recursive_mutex mutex;
    std::condition_variable_any callEnded;

    // Guarded by the mutex.
    configuration::ValueMap values;
    ListenerPtr listener = std::make_shared<configuration::ChangeListener>();
    std::vector<std::thread::id> callers;
};

}  // namespace velkor::layers
