#pragma once

#include <initializer_list>
#include <optional>
#include <string>
#include <utility>

#include "layers/LiveSource.hpp"

namespace velkor::layers {

/// The text of a value of this source.
inline std::string textOf(const configuration::ConfigurationValue& value) {
    return boost::get<std::string>(value);
}

/// A source that a test changes as a source's own thread would.
class TickingSource final : public LiveSource {
public:
    struct Entry {
        std::string key;
        std::optional<std::string> text;  ///< Nothing: the key goes.
    };

    explicit TickingSource(configuration::ValueMap initial = {})
        : LiveSource(typeid(TickingSource), std::move(initial)) {}

    configuration::ConfigurationValue set(const std::string& key,
                                          configuration::ConfigurationValue value) override {
        configuration::ConfigurationValue answer = value;
        change([&](configuration::ValueTable& table) -> Keys {
            if (auto former = table.take(key)) answer = *former;
            table.insert(key, std::move(value));
            return {key};
        });
        return answer;
    }

    /// Changes all keys together.
    void tick(std::initializer_list<Entry> entries) {
        change([&](configuration::ValueTable& table) {
            Keys changed;
            for (const auto& entry : entries) {
                table.take(entry.key);
                if (entry.text) table.insert(entry.key, std::string(*entry.text));
                changed.push_back(entry.key);
            }
            return changed;
        });
    }

    /// A change that fails before it has changed anything.
    template <class Error>
    void failToTick(const Error& error) {
        change([&](configuration::ValueTable&) -> Keys { throw error; });
    }

    int startedCount = 0;
    int stoppedCount = 0;
    std::function<void()> whenStarted;

private:
    void started() override {
        ++startedCount;
        if (whenStarted) whenStarted();
    }
    void stopped() noexcept override { ++stoppedCount; }
};

}  // namespace velkor::layers
