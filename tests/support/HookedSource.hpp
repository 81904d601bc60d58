#pragma once

#include <functional>
#include <map>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "configuration/sources/ConfigurationSource.hpp"

namespace velkor::testing {

/// A source that notes every call that it gets and runs, inside it, what the test has given.
/// No more thread-safe than other sources.
class HookedSource : public configuration::ConfigurationSource {
public:
    using Table = std::map<std::string, configuration::ConfigurationValue>;

    explicit HookedSource(Table initial = {}) : values(std::move(initial)) {}

    ~HookedSource() override {
        if (whenDestroyed) whenDestroyed();
    }

    configuration::ConfigurationValue get(const std::string& key) override {
        note("get " + key);
        if (whenGet) whenGet();
        return values.at(key);
    }

    configuration::ConfigurationValue set(const std::string& key,
                                          configuration::ConfigurationValue value) override {
        note("set " + key);
        if (whenSet) whenSet();
        const auto [entry, isNew] = values.emplace(key, value);
        auto answer = isNew ? value : std::exchange(entry->second, value);
        if (listener) listener(key);
        return answer;
    }

    bool has(const std::string& key) override {
        note("has " + key);
        if (whenHas) whenHas();
        return values.count(key) > 0;
    }

    void setChangeListener(configuration::ChangeListener newListener) override {
        note(newListener ? "attach" : "detach");
        listener.swap(newListener);
        if (!listener && whenDetached) whenDetached();
    }

    std::set<std::string> keys() override {
        note("keys");
        if (whenKeys) whenKeys();
        std::set<std::string> all;
        for (const auto& entry : values) all.insert(entry.first);
        return all;
    }

    std::function<void()> whenGet;
    std::function<void()> whenSet;
    std::function<void()> whenHas;
    std::function<void()> whenKeys;
    std::function<void()> whenDetached;
    std::function<void()> whenDestroyed;
    std::function<void(const std::string& call)> whenCalled;

    Table values;
    configuration::ChangeListener listener;
    std::vector<std::string> calls;

private:
    void note(const std::string& call) {
        calls.push_back(call);
        if (whenCalled) whenCalled(call);
    }
};

}  // namespace velkor::testing
