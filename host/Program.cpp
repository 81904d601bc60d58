#include "host/Program.hpp"

#include <unistd.h>

#include <cerrno>
#include <iostream>
#include <optional>
#include <system_error>

#include "framework/common/DiagnosticLogger.hpp"
#include "host/LogSink.hpp"
#include "host/Options.hpp"
#include "host/Session.hpp"
#include "host/console/Colours.hpp"
#include "host/console/DescriptorBuffer.hpp"
#include "host/console/Interruption.hpp"
#include "host/console/Output.hpp"
#include "host/console/StreamedAnswer.hpp"
#include "host/lint/CheckFiles.hpp"
#include "host/serving/DroppingBuffer.hpp"
#include "host/serving/Termination.hpp"

namespace velkor::host {

namespace {

Output::Answers formOfAnswers() {
    if (isatty(STDOUT_FILENO) != 1) return Output::Answers::exact;
    return terminalHasColours() ? Output::Answers::coloured : Output::Answers::escaped;
}

/// A reader that has gone away is no failure; a full disk is.
bool answersArrived(Output& output) {
    if (output.isOpen() || output.failure() == EPIPE) return true;
    output.message("Standard output can't be written: " +
                   std::system_category().message(output.failure()));
    return false;
}

/// Carries out what the command line gives of commands; gives whether all could be carried out.
bool runGiven(Session& session, const Options& options) {
    return options.command.empty() ? session.runLines(options.lines)
                                   : session.runCommand(options.command);
}

bool run(Session& session, const Options& options) {
    return options.givesCommands() ? runGiven(session, options)
                                   : session.converse(options.keepsHistory);
}

/// Carries out what the command line gives of commands, then serves until a signal or the console
/// ends it. Gives whether all could be carried out.
bool runServing(Session& session, const Options& options) {
    const bool allCarriedOut = runGiven(session, options);
    const Termination termination(options.serving->withConsole);
    const auto server = session.serve(options.serving->server);
    if (options.serving->withConsole) {
        return session.converse(options.keepsHistory) && allCarriedOut;
    }
    termination.await();
    return allCarriedOut;
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
    session.refuseCommandsAmong(options.sources);
    // Without it a write would be lost that is meant to last.
    if (options.statePath && !session.keepStateIn(*options.statePath)) {
        return ExitCode::sourceNotLoaded;
    }
    session.assign(options.assignments);
    const bool watches = options.watchesFiles.value_or(
        options.serving || (!options.givesCommands() && commandsAreTyped()));
    const bool allLoaded = session.load(options.sources, watches);
    session.declareSettings(declare);
    const bool allCarriedOut =
        options.serving ? runServing(session, options) : run(session, options);
    if (!allLoaded) return ExitCode::sourceNotLoaded;
    return allCarriedOut ? ExitCode::fine : ExitCode::commandFailed;
}

ExitCode runCheck(const Options& options, Output& output) {
    std::vector<std::string> paths;
    for (const auto& source : options.sources) {
        if (source.isFile()) paths.push_back(source.location);
    }
    CheckedFiles checked;
    StreamedAnswer answer(output);
    try {
        checked = checkFiles(paths, options.limits, answer);
        answer.flush();
    } catch (const Interrupted&) {
        return ExitCode::commandFailed;  // nobody reads the remarks any more
    }
    if (checked.unreadable != 0) return ExitCode::sourceNotLoaded;
    return checked.remarks == 0 ? ExitCode::fine : ExitCode::commandFailed;
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
        } else if (options.checksFiles) {
            exitCode = runCheck(options, output);
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
