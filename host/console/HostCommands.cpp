#include "host/console/HostCommands.hpp"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <utility>

#include "host/console/OptionWords.hpp"
#include "host/console/PutCommand.hpp"
#include "host/console/SendCommand.hpp"
#include "host/console/SourceCommands.hpp"
#include "host/console/StateCommands.hpp"
#include "host/console/Table.hpp"
#include "host/console/ValueText.hpp"
#include "host/look/JsonAnswers.hpp"
#include "host/sources/SourceStates.hpp"
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

constexpr const char* sourcesUsage = "[--json]";
constexpr const char* explainUsage = "KEY [--json]";
constexpr const char* watchUsage = "KEY [--json]";

/// Adds a column, whose heading stands first, unless it is empty below that.
void addColumn(std::vector<std::vector<std::string>>& rows, const std::vector<std::string>& cells) {
    const bool isEmpty =
        std::all_of(cells.begin() + 1, cells.end(), [](const auto& cell) { return cell.empty(); });
    if (isEmpty) return;
    for (std::size_t i = 0; i < rows.size(); ++i) rows[i].push_back(cells[i]);
}

// The columns of those that are well and have nothing to tell are left out.
std::string showSources(const Context& context, const Arguments& arguments) {
    const OptionWords given("sources", sourcesUsage, 0, arguments);
    const auto sources = context.services.store->describeSources().get();
    if (given.has(jsonOption)) return sourcesJson(sources);
    std::vector<std::vector<std::string>> rows{{"NAME", "GROUP", "ORDER", "ACCESS"}};
    std::vector<std::string> standings{"STATE"};
    std::vector<std::string> problems{"PROBLEM"};
    for (const auto& source : sources) {
        rows.push_back({source.name, source.group.empty() ? "-" : source.group,
                        std::to_string(source.order), source.readOnly ? "read-only" : "writable"});
        standings.push_back(source.state ? standingText(*source.state) : "");
        problems.push_back(source.state ? problemText(*source.state) : "");
    }
    addColumn(rows, standings);
    addColumn(rows, problems);
    return formatTable(rows);
}

std::string explain(const Context& context, const Arguments& arguments) {
    const OptionWords given("explain", explainUsage, 1, arguments);
    const std::string& key = given.words().front().text;
    const auto options = context.services.store->explain(key).get();
    const bool isSecret = settings::secretKeys(context.services.store).count(key) != 0;
    if (given.has(jsonOption)) return layersJson(key, options, isSecret);
    if (options.empty()) return "No configuration option with key: " + key;
    std::vector<std::vector<std::string>> rows;
    rows.reserve(options.size());
    for (const auto& option : options) {
        rows.push_back({rows.empty() ? "effective" : "overridden", option.source,
                        valueText(option.value, isSecret)});
    }
    return formatTable(rows);
}

std::string watch(const Context& context, const Arguments& arguments) {
    const OptionWords given("watch", watchUsage, 1, arguments);
    const std::string& key = given.words().front().text;
    auto& watches = *context.services.watches;
    const bool isNew =
        given.has(jsonOption) ? watches.add(key, context.services.showJson) : watches.add(key);
    if (isNew) return "";
    throw CommandError("Watched already: " + key);
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

/// A command on nothing but the session's sources.
template <std::string (*run)(SessionSources&, const Arguments&)>
std::string onSources(const Context& context, const Arguments& arguments) {
    return run(*context.services.sources, arguments);
}

std::string helpFor(const Command& command) {
    std::string text = command.name() + ' ' + '(' + command.argumentText() + ")\n";
    if (command.shortName() != command.name()) {
        text += "Short: " + std::string(command.shortName()) + '\n';
    }
    return text + command.description() + '\n';
}

// Options would make every row of the table as long as theirs: `help COMMAND` shows them.
std::string withoutOptions(std::string argumentText) {
    const std::size_t options = argumentText.find(" [--");
    return options == std::string::npos ? argumentText
                                        : argumentText.substr(0, options) + " [OPTIONS]";
}

std::string help(const Context& context, const Arguments& arguments) {
    const auto registry = context.registry.lock();
    if (!registry) return "";
    if (!arguments.empty()) return helpFor(*registry->find(arguments.at(0)));
    std::vector<std::vector<std::string>> rows;
    for (const auto& command : registry->commands()) {
        rows.push_back(
            {command->name(), withoutOptions(command->argumentText()), command->description()});
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

// How the rest of a line becomes arguments.
enum class Reading : std::uint8_t { words, wordsAsTyped, rawRest };

struct HostCommand {
    const char* name;
    const char* argumentNames;
    const char* description;
    std::string (*run)(const Context&, const Arguments&);
    std::uint8_t minimumArguments;
    std::uint8_t maximumArguments;
    Reading reading = Reading::words;
    std::vector<std::string> (*suggest)(const Context&) = nullptr;
};

constexpr HostCommand commands[] = {
    {"sources", sourcesUsage, "List the sources in order of precedence.", showSources, 0, 255,
     Reading::wordsAsTyped},
    {"load", loadUsage, "Add a property file as a source.", onSources<loadFile>, 0, 255,
     Reading::wordsAsTyped},
    {"unload", unloadUsage, "Remove a source.", onSources<unloadSource>, 1, 1},
    {"explain", explainUsage, "Show every source that holds a key.", explain, 0, 255,
     Reading::wordsAsTyped},
    {"watch", watchUsage, "Show the value of a key now and whenever it changes.", watch, 0, 255,
     Reading::wordsAsTyped},
    {"unwatch", "WATCHED-KEY", "Stop showing the values of a key.", unwatch, 1, 1},
    {"put", putUsage, "Set a value as it was typed, or of a type, also for a time.",
     onStore<putValue>, 0, 255, Reading::wordsAsTyped},
    {"unset", unsetUsage, "Take back what was set for a key, and show what is effective then.",
     onStore<unsetKey>, 0, 255, Reading::wordsAsTyped},
    {"history", historyUsage, "Show what was set when and by whom, the newest first.",
     onStore<showHistory>, 0, 255, Reading::wordsAsTyped},
    {"undo", "[N]", "Take back change N of the history, or the newest one.", onStore<undoChange>, 0,
     1, Reading::words, suggestNothing},
    {"send", "[--raw] TYPE [JSON]", "Send a message to the service and show its reply.", send, 1, 2,
     Reading::rawRest, suggestRequests},
    {"help", "[COMMAND]", "List the commands, or describe one.", help, 0, 1, Reading::words,
     suggestCommands},
    {"?", "[COMMAND]", "The same as help.", help, 0, 1, Reading::words, suggestCommands},
    {"quit", "", "End the session.", quit, 0, 0},
    {"exit", "", "The same as quit.", quit, 0, 0},
};

CommandRegistry::CommandPtr makeCommand(const HostCommand& command,
                                        const std::shared_ptr<const Context>& context) {
    const auto handler = [run = command.run, context](Arguments&& arguments) {
        return run(*context, arguments);
    };
    CommandTraits traits{command.argumentNames, command.reading == Reading::rawRest};
    traits.takesWordsAsTyped = command.reading == Reading::wordsAsTyped;
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
