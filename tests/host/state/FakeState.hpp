#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "configuration/sources/InMemorySource.hpp"
#include "host/console/ValueText.hpp"
#include "host/state/StateLayer.hpp"

namespace velkor::host {

/// A layer that lasts no longer than the test, which says when what was written is on disk.
class FakeState final : public StateLayer {
public:
    std::shared_ptr<configuration::ConfigurationSource> source() const override { return values; }

    void setFor(const std::string& key, configuration::ConfigurationValue value,
                std::chrono::milliseconds lifetime) override {
        calls.push_back("setFor " + optionText(key, value) + ' ' +
                        std::to_string(lifetime.count()));
        values->set(key, std::move(value));
    }

    Future<bool> committed() override {
        calls.emplace_back("committed");
        return commit();
    }

    std::vector<configuration::RecordedChange> history(const std::string& keyOrPrefix,
                                                       std::size_t limit) override {
        calls.push_back("history '" + keyOrPrefix + "' " + std::to_string(limit));
        return changes;
    }

    configuration::RecordedChange undo(std::optional<std::int64_t> number) override {
        calls.push_back("undo " + (number ? std::to_string(*number) : "the newest"));
        return changes.at(0);
    }

    const std::shared_ptr<configuration::InMemorySource> values =
        std::make_shared<configuration::InMemorySource>(configuration::ValueMap());
    std::vector<configuration::RecordedChange> changes;
    std::vector<std::string> calls;
    std::function<Future<bool>()> commit = [] { return makeReadyFuture(true); };
};

}  // namespace velkor::host
