#include "host/Program.hpp"

#include <unistd.h>

#include <cerrno>
#include <exception>
#include <iostream>
#include <memory>
#include <optional>
#include <system_error>
#include <utility>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "configuration/admin/TypedText.hpp"
#include "framework/common/DiagnosticLogger.hpp"
#include "host/LogSink.hpp"
#include "host/LoginName.hpp"
#include "host/Manual.hpp"
#include "host/MisplacedCommands.hpp"
#include "host/Options.hpp"
#include "host/SessionStore.hpp"
#include "host/console/Announcements.hpp"
#include "host/console/ArgumentWords.hpp"
#include "host/console/Colours.hpp"
#include "host/console/CommandRegistry.hpp"
#include "host/console/Completer.hpp"
#include "host/console/Console.hpp"
#include "host/console/DescriptorBuffer.hpp"
#include "host/console/GivenLines.hpp"
#include "host/console/HostCommands.hpp"
#include "host/console/LineEditor.hpp"
#include "host/console/LineHistory.hpp"
#include "host/console/LineReader.hpp"
#include "host/console/MaskingRegistry.hpp"
#include "host/console/Output.hpp"
#include "host/console/SecretLines.hpp"
#include "host/console/SettingsCommand.hpp"
#include "host/console/StoreCommandRegistry.hpp"
#include "host/console/ValueText.hpp"
#include "host/console/Watches.hpp"
#include "host/sources/SessionSources.hpp"
#include "host/state/StateLayer.hpp"
#include "messages/MessageService.hpp"
#include "settings/Describe.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

constexpr const char* greeting =
    "velkor-config " VELKOR_VERSION ": 'help' lists the commands, 'quit' ends the session.";

bool isTerminal(int descriptor) {
    return isatty(descriptor) == 1;
}

Output::Answers formOfAnswers() {
    if (!isTerminal(STDOUT_FILENO)) return Output::Answers::exact;
    return terminalHasColours() ? Output::Answers::coloured : Output::Answers::escaped;
}

/// Whether somebody types the commands.
bool isInteractive(const Options& options) {
    return options.lines.empty() && options.command.empty() && isTerminal(STDIN_FILENO) &&
           isTerminal(STDOUT_FILENO);
}

/// The store with everything that can be done to it on the console.
class Session {
public:
    Session(Output& sessionOutput, const SourceLimits& sourceLimits)
        : output(sessionOutput),
          announcements(std::make_shared<Announcements>(output)),
          store(std::make_shared<SessionStore>(sourceLimits)),
          sources(std::make_shared<SessionSources>(store, sourceLimits)),
          watches(std::make_shared<Watches>(store, showValue())),
          registry(std::make_shared<CommandRegistry>()),
          console(registry, output, [this] { store->acknowledge(); }),
          service(store),
          storeCommands(
              store,
              std::make_shared<MaskingRegistry>(
                  store, std::make_shared<StoreCommandRegistry>(
                             store, registry,
                             [this](std::string text) { console.remark(std::move(text)); }))),
          hostCommands(
              {store, watches, service.dispatcherFor(messages::allRequestTypes()),
               [this] { console.quit(); },
               [sources = sources](const auto& name) { return sources->problemOf(name); }, sources},
              registry) {}

    // Threads of sources may be about to announce something still.
    ~Session() { announcements->close(); }

    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    /// Lets writes last in the file at `path`; gives whether they can, or reports why not.
    bool keepStateIn(const std::string& path) {
        try {
            store->keepStateIn(openState(path, loginName()));
            return true;
        } catch (const std::exception& error) {
            output.message(error.what());
            return false;
        }
    }

    /// Adds the values of the command line as a source.
    void assign(const std::vector<Assignment>& assignments) {
        if (assignments.empty()) return;
        configuration::ValueMap values;
        for (const auto& [key, text] : assignments) values[key] = configuration::typedText(text);
        store->addInMemorySource("command-line", "", SourceRequest::commandLineOrder, true,
                                 std::move(values));
    }

    /// Gives whether all sources could be loaded; reports those that could not. Files are read
    /// again when they change if `watchesFiles`.
    bool load(const std::vector<SourceRequest>& requests, bool watchesFiles) {
        sources->watchFiles(watchesFiles);
        const auto failures = sources->begin(requests);
        for (const auto& failure : failures) output.message(failure);
        return failures.empty();
    }

    /// Declares settings, and lists them by a command if there are any.
    void declareSettings(const DeclareSettings& declare) {
        if (declare) declared = declare(store);
        if (!settings::describe(store).empty()) settingsCommand.emplace(store, registry);
    }

    /// The session's options and commands in a form of `manual`.
    std::string describe(const std::string& form) const {
        return manual(form, programUsage(), registry->commands());
    }

    /// Throws `UsageError` where a file was asked for that is none but has the name of a command.
    void refuseCommandsAmong(const std::vector<SourceRequest>& requests) const {
        refuseMisplacedCommands(requests, registry->names());
    }

    /// Carries out the given command or lines or, when there are none, those that are typed or
    /// read. Gives whether all could be carried out; what somebody typed is no matter.
    bool run(const Options& options) {
        if (!options.command.empty()) return console.run(options.command);
        const auto source = makeLineSource(options);
        return console.run(*source) || isInteractive(options);
    }

private:
    Watches::Show showValue() const {
        return [announcements = announcements, watched = std::weak_ptr(store)](const auto& key,
                                                                               const auto& value) {
            const auto open = watched.lock();
            const bool isSecret = open != nullptr && settings::secretKeys(open).count(key) != 0;
            announcements->announce(optionText(key, value, isSecret));
        };
    }

    std::unique_ptr<LineSource> makeLineSource(const Options& options) {
        if (!options.lines.empty()) return std::make_unique<GivenLines>(options.lines);
        if (!isInteractive(options)) return std::make_unique<LineReader>(std::cin);
        const Completer completer(
            registry, [words = ArgumentWords(store, watches, sources)](
                          const auto& name, const auto& typed) { return words.of(name, typed); });
        LineEditor::Memory memory;
        if (options.keepsHistory) memory = history();
        output.answer(greeting);
        return std::make_unique<LineEditor>(
            [completer](const std::string& line) { return completer.complete(line); },
            *announcements, std::move(memory));
    }

    // What is typed, without what may hold a secret; nothing where it can't be kept.
    LineEditor::Memory history() {
        const auto file = usualHistoryFile();
        if (!file) return {};
        try {
            const auto kept = std::make_shared<const LineHistory>(*file);
            return {kept->earlierLines(), [kept, store = store](const std::string& line) {
                        if (!mayHoldSecret(line, settings::secretKeys(store))) kept->add(line);
                    }};
        } catch (const std::runtime_error& error) {
            output.message(error.what());
            return {};
        }
    }

    Output& output;
    const std::shared_ptr<Announcements> announcements;
    std::shared_ptr<SessionStore> store;
    std::shared_ptr<SessionSources> sources;
    std::shared_ptr<Watches> watches;
    std::shared_ptr<CommandRegistry> registry;
    Console console;
    messages::MessageService service;
    configuration::ConfigurationCommandProvider storeCommands;
    HostCommands hostCommands;
    std::shared_ptr<const void> declared;
    std::optional<SettingsCommand> settingsCommand;
};

/// A reader that has gone away is no failure; a full disk is.
bool answersArrived(Output& output) {
    if (output.isOpen() || output.failure() == EPIPE) return true;
    output.message("Standard output can't be written: " +
                   std::system_category().message(output.failure()));
    return false;
}

ExitCode runSession(const Options& options, const DeclareSettings& declare, Output& output) {
    std::optional<LogSink> logSink;
    if (!options.logs.empty()) logSink.emplace(std::cerr);
    for (const auto& log : options.logs) {
        common::DiagnosticLogger::enable(log.channel, log.severities);
    }
    Session session(output, options.limits);
    session.refuseCommandsAmong(options.sources);
    // Without it a write would be lost that is meant to last.
    if (options.statePath && !session.keepStateIn(*options.statePath)) {
        return ExitCode::sourceNotLoaded;
    }
    session.assign(options.assignments);
    const bool watches = options.watchesFiles.value_or(isInteractive(options));
    const bool allLoaded = session.load(options.sources, watches);
    session.declareSettings(declare);
    const bool allCarriedOut = session.run(options);
    if (!allLoaded) return ExitCode::sourceNotLoaded;
    return allCarriedOut ? ExitCode::fine : ExitCode::commandFailed;
}

}  // namespace

ExitCode runProgram(const std::vector<std::string>& arguments, const DeclareSettings& declare) {
    DescriptorBuffer standardOutput(STDOUT_FILENO);
    std::ostream answers(&standardOutput);
    Output output(answers, formOfAnswers(), std::cerr);
    ExitCode exitCode = ExitCode::fine;
    try {
        const Options options = parseOptions(arguments);
        output.answer(options.information);
        if (!options.manualForm.empty()) {
            output.answer(Session(output, options.limits).describe(options.manualForm));
        } else if (options.information.empty()) {
            exitCode = runSession(options, declare, output);
        }
    } catch (const UsageError& error) {
        output.message(error.what());
        return ExitCode::badUsage;
    }
    if (answersArrived(output)) return exitCode;
    return exitCode == ExitCode::fine ? ExitCode::commandFailed : exitCode;
}

}  // namespace velkor::host
