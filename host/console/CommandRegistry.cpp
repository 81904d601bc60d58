#include "host/console/CommandRegistry.hpp"

#include <algorithm>
#include <utility>

#include "host/TerminalText.hpp"
#include "host/console/NearestNames.hpp"

namespace velkor::host {

namespace {

using administration::CommandDescriptor;

// Names that nobody types by hand are not repeated in full.
constexpr std::size_t mostShownBytes = 80;

bool isWellFormed(const CommandDescriptor& command) {
    return !command.name.empty() && command.handler != nullptr &&
           command.minimumArguments <= command.maximumArguments;
}

auto isCalled(const std::string& name) {
    return [&name](const CommandRegistry::CommandPtr& command) { return command->name() == name; };
}

std::string unknownCommandText(const std::string& name, const std::vector<std::string>& known) {
    const auto near = nearestNames(name, known);
    return "Unknown command: " + abbreviated(name, mostShownBytes) +
           (near.empty() ? "" : " (did you mean: " + joinedNames(near) + "?)");
}

}  // namespace

Future<bool> CommandRegistry::registerCommand(CommandDescriptor command, CommandTraits traits) {
    if (!isWellFormed(command)) return makeReadyFuture(false);
    auto accepted = makeReadyFuture(true);  // beforehand, since making it may fail
    const bool isNew = add(std::make_shared<const Command>(std::move(command), std::move(traits)));
    return isNew ? std::move(accepted) : makeReadyFuture(false);
}

Future<bool> CommandRegistry::unregisterCommand(const std::string& name) {
    auto withdrawn = makeReadyFuture(true);  // beforehand, since making it may fail
    CommandPtr removed;
    const common::MutexLock lock(mutex);
    const auto found = std::find_if(registered.begin(), registered.end(), isCalled(name));
    if (found == registered.end()) return makeReadyFuture(false);
    removed = std::move(*found);
    registered.erase(found);
    return withdrawn;
}

bool CommandRegistry::add(CommandPtr command) {
    const common::MutexLock lock(mutex);
    const bool taken = std::any_of(registered.begin(), registered.end(), isCalled(command->name()));
    if (!taken) registered.push_back(std::move(command));
    return !taken;
}

// The caller's reference keeps the command alive until the mutex is released.
void CommandRegistry::remove(const CommandPtr& command) noexcept {
    const common::MutexLock lock(mutex);
    const auto found = std::find(registered.begin(), registered.end(), command);
    if (found != registered.end()) registered.erase(found);
}

CommandRegistry::CommandPtr CommandRegistry::find(const std::string& name) const {
    const auto all = commands();
    const auto exact = std::find_if(all.begin(), all.end(), isCalled(name));
    if (exact != all.end()) return *exact;
    std::vector<CommandPtr> candidates;
    std::copy_if(all.begin(), all.end(), std::back_inserter(candidates),
                 [&](const CommandPtr& command) { return command->shortName() == name; });
    if (candidates.empty()) throw CommandError(unknownCommandText(name, names()));
    if (candidates.size() == 1) return candidates.front();
    std::vector<std::string> names;
    names.reserve(candidates.size());
    for (const auto& command : candidates) names.push_back(command->name());
    throw CommandError("Ambiguous command: " + name + " (may be: " + joinedNames(names) + ")");
}

std::vector<CommandRegistry::CommandPtr> CommandRegistry::commands() const {
    const common::MutexLock lock(mutex);
    return registered;
}

std::vector<std::string> CommandRegistry::names() const {
    const auto all = commands();
    std::vector<std::string> names;
    names.reserve(2 * all.size());
    for (const auto& command : all) names.emplace_back(command->shortName());
    for (const auto& command : all) {
        if (command->name() != command->shortName()) names.push_back(command->name());
    }
    return names;
}

}  // namespace velkor::host
