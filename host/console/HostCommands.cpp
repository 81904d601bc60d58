#include "host/console/HostCommands.hpp"

#include <cstdint>
#include <iterator>
#include <utility>

#include "host/console/SendCommand.hpp"
#include "host/console/StateCommands.hpp"
#include "host/console/Table.hpp"
#include "host/console/ValueText.hpp"
#include "host/look/JsonAnswers.hpp"
#include "host/look/WordOptions.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using Arguments = std::vector<std::string>;

/// What a handler works on. The registry is held weakly, since it holds the handlers.
struct Context {
    HostServices services;
    std::weak_ptr<CommandRegistry> registry;
};

constexpr const char* jsonOption = "--json";
constexpr const char* rawOption = "--raw";

/// The words of a command that knows no option but --json, and whether that is given.
struct JsonChoice {
    explicit JsonChoice(const Arguments& arguments) {
        auto options = parseOptionsAmong(arguments, {{jsonOption}});
        json = options.has(jsonOption);
        words = std::move(options.words);
    }

    /// Throws `CommandError` unless KEY is given and nothing else.
    const std::string& key() const {
        if (words.size() != 1) throw CommandError("One KEY is needed.");
        return words.front();
    }

    bool json;
    Arguments words;
};

std::string showSources(const Context& context, const Arguments& arguments) {
    const JsonChoice choice(arguments);
    if (!choice.words.empty()) throw CommandError("sources takes no argument but --json.");
    if (choice.json) {
        return sourcesJson(context.services.store->describeSources().get(),
                           context.services.problemOf);
    }
    std::vector<std::vector<std::string>> rows{{"NAME", "GROUP", "ORDER", "ACCESS", ""}};
    for (const auto& source : context.services.store->describeSources().get()) {
        rows.push_back({source.name, source.group.empty() ? "-" : source.group,
                        std::to_string(source.order), source.readOnly ? "read-only" : "writable",
                        context.services.problemOf(source.name)});
        if (!rows.back().back().empty()) rows.front().back() = "PROBLEM";
    }
    return formatTable(rows);
}

std::string explain(const Context& context, const Arguments& arguments) {
    const JsonChoice choice(arguments);
    const auto options = context.services.store->explain(choice.key()).get();
    const bool isSecret = settings::secretKeys(context.services.store).count(choice.key()) != 0;
    if (choice.json) return layersJson(choice.key(), options, isSecret);
    if (options.empty()) return "No configuration option with key: " + choice.key();
    std::vector<std::vector<std::string>> rows;
    rows.reserve(options.size());
    for (const auto& option : options) {
        rows.push_back({rows.empty() ? "effective" : "overridden", option.source,
                        valueText(option.value, isSecret)});
    }
    return formatTable(rows);
}

std::string watch(const Context& context, const Arguments& arguments) {
    const JsonChoice choice(arguments);
    auto& watches = *context.services.watches;
    const bool isNew = choice.json ? watches.add(choice.key(), context.services.showJson)
                                   : watches.add(choice.key());
    if (isNew) return "";
    throw CommandError("Watched already: " + choice.key());
}

std::string unwatch(const Context& context, const Arguments& arguments) {
    if (context.services.watches->remove(arguments.at(0))) return "";
    throw CommandError("Not watched: " + arguments.at(0));
}

/// A command on nothing but the session's store.
template <std::string (*run)(const std::shared_ptr<SessionStore>&, const Arguments&)>
std::string onStore(const Context& context, const Arguments& arguments) {
    return run(context.services.store, arguments);
}

std::string helpFor(const Command& command) {
    std::string text = command.name() + ' ' + '(' + command.argumentText() + ")\n";
    if (command.shortName() != command.name()) {
        text += "Short: " + std::string(command.shortName()) + '\n';
    }
    return text + command.description() + '\n';
}

std::string help(const Context& context, const Arguments& arguments) {
    const auto registry = context.registry.lock();
    if (!registry) return "";
    if (!arguments.empty()) return helpFor(*registry->find(arguments.at(0)));
    std::vector<std::vector<std::string>> rows;
    for (const auto& command : registry->commands()) {
        rows.push_back({command->name(), command->argumentText(), command->description()});
    }
    return formatTable(rows) + "A command may be called by the last word of its name.\n";
}

std::string quit(const Context& context, const Arguments&) {
    context.services.quit();
    return "";
}

/// The TYPE and JSON that follow --raw, which took the place of TYPE.
Arguments behindRaw(const Arguments& arguments) {
    if (arguments.size() == 1) throw CommandError("send --raw takes TYPE [JSON].");
    CommandLine rest(arguments[1]);
    Arguments typeAndJson{rest.nextWord().value_or("")};
    const std::string_view json = rest.takeRest();
    if (!json.empty()) typeAndJson.emplace_back(json);
    return typeAndJson;
}

std::string send(const Context& context, const Arguments& arguments) {
    auto& dispatcher = *context.services.dispatcher;
    if (arguments.at(0) != rawOption) return sendMessage(dispatcher, arguments);
    const std::string reply = sendMessage(dispatcher, behindRaw(arguments));
    return reply.substr(reply.find(' ') + 1);
}

std::vector<std::string> suggestCommands(const Context& context) {
    const auto registry = context.registry.lock();
    return registry ? registry->names() : std::vector<std::string>();
}

std::vector<std::string> suggestNothing(const Context&) {
    return {};
}

std::vector<std::string> suggestRequests(const Context&) {
    return requestTypes();
}

struct HostCommand {
    const char* name;
    const char* argumentNames;
    const char* description;
    std::string (*run)(const Context&, const Arguments&);
    std::uint8_t minimumArguments;
    std::uint8_t maximumArguments;
    bool takesRawRest = false;
    std::vector<std::string> (*suggest)(const Context&) = nullptr;
};

constexpr HostCommand commands[] = {
    {"sources", "[--json]", "List the sources in order of precedence.", showSources, 0, 1, false,
     suggestNothing},
    {"explain", "KEY [--json]", "Show every source that holds a key.", explain, 1, 2},
    {"watch", "KEY [--json]", "Show the value of a key now and whenever it changes.", watch, 1, 2},
    {"unwatch", "KEY", "Stop showing the values of a key.", unwatch, 1, 1},
    {"put", "KEY VALUE [--for TIME]", "Set a value, with --for until the time is over.",
     onStore<putValue>, 2, 4},
    {"unset", "KEY", "Take back what was set for a key, and show what is effective then.",
     onStore<unsetKey>, 1, 1},
    {"history", "[KEY] [--limit N]", "Show what was set when and by whom, the newest first.",
     onStore<showHistory>, 0, 3},
    {"undo", "[N]", "Take back change N of the history, or the newest one.", onStore<undoChange>, 0,
     1, false, suggestNothing},
    {"send", "[--raw] TYPE [JSON]", "Send a message to the service and show its reply.", send, 1, 2,
     true, suggestRequests},
    {"help", "[COMMAND]", "List the commands, or describe one.", help, 0, 1, false,
     suggestCommands},
    {"quit", "", "End the session.", quit, 0, 0},
};

CommandRegistry::CommandPtr makeCommand(const HostCommand& command,
                                        const std::shared_ptr<const Context>& context) {
    const auto handler = [run = command.run, context](Arguments&& arguments) {
        return run(*context, arguments);
    };
    CommandTraits traits{command.argumentNames, command.takesRawRest};
    if (command.suggest != nullptr) {
        traits.suggestions = [suggest = command.suggest, context] { return suggest(*context); };
    }
    return std::make_shared<const Command>(
        administration::CommandDescriptor{command.name, command.description, handler,
                                          command.minimumArguments, command.maximumArguments},
        std::move(traits));
}

}  // namespace

HostCommands::HostCommands(HostServices services,
                           const std::shared_ptr<CommandRegistry>& registry) {
    const auto context = std::make_shared<const Context>(Context{std::move(services), registry});
    registrations.reserve(std::size(commands));
    for (const HostCommand& command : commands) {
        registrations.emplace_back(registry, makeCommand(command, context));
    }
}

}  // namespace velkor::host
