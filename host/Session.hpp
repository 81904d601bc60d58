#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "host/Options.hpp"
#include "host/Program.hpp"
#include "host/SessionStore.hpp"
#include "host/console/Announcements.hpp"
#include "host/console/CommandRegistry.hpp"
#include "host/console/Console.hpp"
#include "host/console/HostCommands.hpp"
#include "host/console/LineEditor.hpp"
#include "host/console/LineSource.hpp"
#include "host/console/Output.hpp"
#include "host/console/SettingsCommand.hpp"
#include "host/console/ValueText.hpp"
#include "host/console/Watches.hpp"
#include "host/look/LookCommands.hpp"
#include "host/sources/SessionSources.hpp"
#include "messages/MessageService.hpp"

namespace velkor::host {

/// Whether commands that nobody has given beforehand are typed: standard input and standard output
/// are a terminal.
bool commandsAreTyped();

/// The store with everything that can be done to it on the console. Used by the thread that made
/// it; clients that are served reach the store on threads of their own.
class Session {
public:
    /// Writes to `output`, which must live as long. What a source may cost is said by
    /// `sourceLimits`.
    Session(Output& output, const SourceLimits& sourceLimits);

    ~Session();
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    /// Lets writes last in the file at `path`; gives whether they can, or reports why not.
    bool keepStateIn(const std::string& path);

    /// Adds the values of the command line as a source.
    void assign(const std::vector<Assignment>& assignments);

    /// Gives whether all sources could be loaded; reports those that could not, and what was
    /// noticed of the others. Files are read again when they change if `watchesFiles`.
    bool load(const std::vector<SourceRequest>& requests, bool watchesFiles);

    /// Declares settings, and lists them by a command if there are any.
    void declareSettings(const DeclareSettings& declare);

    /// Serves the store until what this gives is destroyed, and shows where. Throws what
    /// `host::serve` throws.
    std::shared_ptr<const void> serve(const http::ServerOptions& options);

    /// The session's options and commands in a form of `manual`.
    std::string describe(const std::string& form) const;

    /// Throws `UsageError` where a file was asked for that is none but has the name of a command.
    void refuseCommandsAmong(const std::vector<SourceRequest>& requests) const;

    /// Carries out one command, the words of which are its name and its arguments. Gives whether it
    /// could be carried out.
    bool runCommand(const std::vector<std::string>& words) { return console.run(words); }

    /// Carries out the given lines. Gives whether all could be carried out.
    bool runLines(const std::vector<std::string>& lines);

    /// Carries out what is typed, see `commandsAreTyped`, or read from standard input. Gives
    /// whether all could be carried out; what somebody typed is no matter. What is typed outlasts
    /// the session if `keepsHistory`; where it can't, that is reported.
    bool converse(bool keepsHistory);

private:
    /// Announces values as the lines that `line` makes of them.
    Watches::Show showValue(decltype(&optionText) line) const;

    /// What the commands of the host work on.
    HostServices services();

    std::unique_ptr<LineSource> lineEditor(bool keepsHistory);

    /// What was typed earlier; nothing where it can't be kept.
    LineEditor::Memory history();

    Output& output;
    const std::shared_ptr<Announcements> announcements;
    std::shared_ptr<SessionStore> store;
    std::shared_ptr<SessionSources> sources;
    std::shared_ptr<Watches> watches;
    std::shared_ptr<CommandRegistry> registry;
    Console console;
    messages::MessageService service;
    configuration::ConfigurationCommandProvider storeCommands;
    LookCommands lookCommands;
    HostCommands hostCommands;
    std::shared_ptr<const void> declared;
    std::optional<SettingsCommand> settingsCommand;
};

}  // namespace velkor::host
