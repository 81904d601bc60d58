#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {

/// A registry that keeps the commands and notes what happens to them.
class RecordingAdministration : public administration::Administration {
public:
    Future<bool> registerCommand(administration::CommandDescriptor command) override {
        events.push_back("register " + command.name);
        commands.push_back(std::move(command));
        return makeReadyFuture(true);
    }

    Future<bool> unregisterCommand(const std::string& name) override {
        events.push_back("unregister " + name);
        return makeReadyFuture(true);
    }

    const administration::CommandDescriptor& command(const std::string& name) const {
        for (const auto& candidate : commands) {
            if (candidate.name == name) return candidate;
        }
        throw std::logic_error("no command " + name);
    }

    std::vector<std::string> events;
    std::vector<administration::CommandDescriptor> commands;
};

/// The commands over a store.
class CommandTest : public ::testing::Test {
protected:
    using Arguments = std::vector<std::string>;

    std::string run(const std::string& verb, Arguments arguments = {}) const {
        const auto handler = registry->command("velkor.configuration." + verb).handler;
        return handler(std::move(arguments));
    }

    /// What the store holds under "key" after the set command got `text`.
    std::string typed(const std::string& text) const {
        EXPECT_EQ(run("set", {"key", text}), "");
        return textOf(store->get("key").get());
    }

    /// What the get command shows of `value`.
    std::string shown(configuration::ConfigurationValue value) const {
        store->set("key", std::move(value));
        return run("get", {"key"});
    }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    std::shared_ptr<RecordingAdministration> registry = std::make_shared<RecordingAdministration>();
    std::unique_ptr<configuration::ConfigurationCommandProvider> provider =
        std::make_unique<configuration::ConfigurationCommandProvider>(store, registry);
};

}  // namespace velkor::testing
