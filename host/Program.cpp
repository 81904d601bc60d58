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
#include "host/Options.hpp"
#include "host/SessionStore.hpp"
#include "host/console/Announcements.hpp"
#include "host/console/CommandRegistry.hpp"
#include "host/console/Completer.hpp"
#include "host/console/Console.hpp"
#include "host/console/DescriptorBuffer.hpp"
#include "host/console/GivenLines.hpp"
#include "host/console/HostCommands.hpp"
#include "host/console/LineEditor.hpp"
#include "host/console/LineReader.hpp"
#include "host/console/MaskingRegistry.hpp"
#include "host/console/Output.hpp"
#include "host/console/SendCommand.hpp"
#include "host/console/SettingsCommand.hpp"
#include "host/console/TimeText.hpp"
#include "host/console/ValueText.hpp"
#include "host/console/Watches.hpp"
#include "host/serving/DroppingBuffer.hpp"
#include "host/serving/Serving.hpp"
#include "host/serving/Termination.hpp"
#include "host/sources/SourceLoader.hpp"
#include "host/state/StateLayer.hpp"
#include "messages/MessageService.hpp"
#include "settings/Describe.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

bool isTerminal(int descriptor) {
    return isatty(descriptor) == 1;
}

/// Whether somebody types the commands.
bool isInteractive(const std::vector<std::string>& lines) {
    return lines.empty() && isTerminal(STDIN_FILENO) && isTerminal(STDOUT_FILENO);
}

/// The store with everything that can be done to it on the console.
class Session {
public:
    Session(Output& sessionOutput, const SourceLimits& sourceLimits)
        : output(sessionOutput),
          announcements(std::make_shared<Announcements>(output)),
          limits(sourceLimits),
          store(std::make_shared<SessionStore>(limits)),
          registry(std::make_shared<CommandRegistry>()),
          console(registry, output, [this] { store->acknowledge(); }),
          service(store, {}, secretsOf(store)),
          storeCommands(store, std::make_shared<MaskingRegistry>(store, registry)),
          hostCommands(
              {store, std::make_shared<Watches>(store, showValue()),
               service.dispatcherFor(messages::allRequestTypes()), [this] { console.quit(); },
               [this](const auto& name) { return problemOf(name); }},
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

    /// Gives whether all sources could be loaded; reports those that could not.
    bool load(const std::vector<SourceRequest>& requests) {
        auto loaded = loadSources(*store, requests, limits);
        watchedFiles = std::move(loaded.watchedFiles);
        for (const auto& failure : loaded.failures) output.message(failure);
        return loaded.failures.empty();
    }

    /// Declares settings, and lists them by a command if there are any.
    void declareSettings(const DeclareSettings& declare) {
        if (declare) declared = declare(store);
        if (!settings::describe(store).empty()) settingsCommand.emplace(store, registry);
    }

    /// Serves the store until what this gives is destroyed, and shows where.
    std::shared_ptr<const void> serve(const http::ServerOptions& options) {
        return host::serve(store, options, [this](const auto& line) { output.answer(line); });
    }

    /// Carries out the given lines or, when there are none, those that are typed or read.
    bool run(const std::vector<std::string>& lines) {
        const auto source = makeLineSource(lines);
        return console.run(*source);
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

    std::string problemOf(const std::string& name) const {
        const auto file = watchedFiles.find(name);
        if (file == watchedFiles.end()) return "";
        const auto problem = file->second->status().problem;
        return problem ? "since " + timeText(problem->since) + ": " + problem->text : "";
    }

    std::unique_ptr<LineSource> makeLineSource(const std::vector<std::string>& lines) {
        if (!lines.empty()) return std::make_unique<GivenLines>(lines);
        if (!isInteractive(lines)) return std::make_unique<LineReader>(std::cin);
        const Completer completer(registry, [store = store] {
            const auto keys = store->keys().get();
            return std::vector<std::string>(keys.begin(), keys.end());
        });
        return std::make_unique<LineEditor>(
            [completer](const std::string& line) { return completer.complete(line); },
            *announcements);
    }

    Output& output;
    const std::shared_ptr<Announcements> announcements;
    const SourceLimits limits;
    LoadedSources::WatchedFiles watchedFiles;
    std::shared_ptr<SessionStore> store;
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

std::vector<SourceRequest> watched(std::vector<SourceRequest> sources, bool watches) {
    for (auto& source : sources) source.watched = watches;
    return sources;
}

/// Carries out the lines of the command line, then serves until a signal or the console ends it.
/// Gives whether every line could be carried out.
bool runServing(Session& session, const std::vector<std::string>& lines,
                const ListenRequest& serving) {
    const bool linesCarriedOut = lines.empty() || session.run(lines);
    const Termination termination(serving.withConsole);
    const auto server = session.serve(serving.server);
    if (serving.withConsole) return session.run({}) && linesCarriedOut;
    termination.await();
    return linesCarriedOut;
}

ExitCode runSession(const Options& options, const DeclareSettings& declare, Output& output) {
    // Clients must not wait for whoever reads the log.
    DroppingBuffer errors(STDERR_FILENO);
    std::ostream records(&errors);
    std::optional<LogSink> logSink;
    if (!options.logs.empty() || options.serving) {
        logSink.emplace(options.serving ? records : std::cerr);
    }
    for (const auto& log : options.logs) {
        common::DiagnosticLogger::enable(log.channel, log.severities);
    }
    Session session(output, options.limits);
    // Without it a write would be lost that is meant to last.
    if (options.statePath && !session.keepStateIn(*options.statePath)) {
        return ExitCode::sourceNotLoaded;
    }
    session.assign(options.assignments);
    const bool watches =
        options.watchesFiles.value_or(options.serving || isInteractive(options.lines));
    const bool allLoaded = session.load(watched(options.sources, watches));
    session.declareSettings(declare);
    const bool allCarriedOut = options.serving
                                   ? runServing(session, options.lines, *options.serving)
                                   : session.run(options.lines);
    if (!allLoaded) return ExitCode::sourceNotLoaded;
    return allCarriedOut ? ExitCode::fine : ExitCode::commandFailed;
}

}  // namespace

ExitCode runProgram(const std::vector<std::string>& arguments, const DeclareSettings& declare) {
    DescriptorBuffer standardOutput(STDOUT_FILENO);
    std::ostream answers(&standardOutput);
    Output output(answers,
                  isTerminal(STDOUT_FILENO) ? Output::Answers::escaped : Output::Answers::exact,
                  std::cerr);
    ExitCode exitCode = ExitCode::fine;
    try {
        const Options options = parseOptions(arguments);
        output.answer(options.information);
        if (options.information.empty()) exitCode = runSession(options, declare, output);
    } catch (const UsageError& error) {
        output.message(error.what());
        return ExitCode::badUsage;
    }
    if (answersArrived(output)) return exitCode;
    return exitCode == ExitCode::fine ? ExitCode::commandFailed : exitCode;
}

}  // namespace velkor::host
