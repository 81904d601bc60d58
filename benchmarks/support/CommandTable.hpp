#pragma once

#include <string>
#include <unordered_map>
#include <utility>

#include "framework/administration/Administration.hpp"

namespace velkor::benchmarks {

/// A registry that only keeps the handlers.
class CommandTable : public administration::Administration {
public:
    Future<bool> registerCommand(administration::CommandDescriptor command) override {
        handlers[command.name] = std::move(command.handler);
        return makeReadyFuture(true);
    }

    Future<bool> unregisterCommand(const std::string& name) override {
        return makeReadyFuture(handlers.erase(name) > 0);
    }

    /// What the command called `name` answers without arguments.
    std::string run(const std::string& name) { return handlers.at(name)({}); }

private:
    std::unordered_map<std::string, administration::CommandHandler> handlers;
};

}  // namespace velkor::benchmarks
