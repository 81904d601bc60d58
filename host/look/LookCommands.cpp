#include "host/look/LookCommands.hpp"

#include <cstdint>
#include <iterator>
#include <utility>

#include "host/lint/CheckFiles.hpp"
#include "host/lint/Remarks.hpp"

namespace velkor::host {

namespace {

using Words = std::vector<std::string>;
using StorePtr = std::shared_ptr<SessionStore>;

constexpr std::uint8_t anyNumber = 255;

struct LookCommand {
    const char* name;
    const char* argumentNames;
    const char* description;
    void (*run)(const StorePtr&, const Words&, CommandOutput&);
    std::uint8_t minimumArguments;
    std::uint8_t maximumArguments;
    bool takesWordsAsTyped = false;
};

constexpr LookCommand commands[] = {
    {"show", showUsage, "Show values, with their sources, of all layers, as JSON, or bare.",
     showOptions, 0, anyNumber, true},
    {"diff", "[[A] B]", "Show what layer B changes of A, or of all behind it.", diffSources, 0, 2},
    {"export", exportUsage, "Write what is effective in a form that can be loaded.", exportOptions,
     0, anyNumber, true},
    {"import", importUsage, "Set everything that a file holds, or nothing.", importFile, 0,
     anyNumber, true},
    {"check", "FILE...", "Tell what is wrong with property files.", checkNamedFiles, 1, anyNumber},
};

CommandRegistry::CommandPtr makeCommand(const LookCommand& command, const StorePtr& store) {
    CommandTraits traits{command.argumentNames};
    traits.stream = [run = command.run, store](Words&& arguments, CommandOutput& output) {
        run(store, arguments, output);
    };
    traits.takesWordsAsTyped = command.takesWordsAsTyped;
    return std::make_shared<const Command>(
        administration::CommandDescriptor{command.name, command.description, nullptr,
                                          command.minimumArguments, command.maximumArguments},
        std::move(traits));
}

}  // namespace

void checkNamedFiles(const StorePtr& store, const Words& arguments, CommandOutput& output) {
    const auto checked = checkFiles(arguments, store->sourceLimits(), output);
    std::string text;
    if (checked.remarks != 0) text = remarksText(checked.remarks);
    if (checked.unreadable != 0) {
        text += (text.empty() ? "" : ", ") + std::to_string(checked.unreadable) +
                (checked.unreadable == 1 ? " file" : " files") + " not read";
    }
    if (!text.empty()) throw CommandError(text);
}

LookCommands::LookCommands(const StorePtr& store,
                           const std::shared_ptr<CommandRegistry>& registry) {
    registrations.reserve(std::size(commands));
    for (const LookCommand& command : commands) {
        registrations.emplace_back(registry, makeCommand(command, store));
    }
}

}  // namespace velkor::host
