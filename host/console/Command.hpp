#pragma once

#include <functional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "framework/administration/Administration.hpp"
#include "host/console/CommandLine.hpp"
#include "host/console/CommandUsage.hpp"

namespace velkor::host {

/// A command that can't be carried out as it was typed.
class CommandError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// What a command writes to as it goes. Used by the thread that carries out the command.
class CommandOutput {
public:
    virtual ~CommandOutput() = default;

    /// Writes `text` and a line feed to the answer, now or soon. Throws `Interrupted` when Ctrl-C
    /// was pressed, or nobody reads the answers any more.
    virtual void line(std::string_view text) = 0;

    /// Tells the operator something that is no part of the answer, behind what was written of it.
    virtual void note(std::string_view text) = 0;
};

/// Carries out a command that writes its answer as it goes, a little of it at a time.
using StreamingHandler =
    std::function<void(std::vector<std::string>&& arguments, CommandOutput& output)>;

/// What the console knows of a command beyond its descriptor.
struct CommandTraits {
    /// The names of the arguments as help shows them; empty: help shows how many there are.
    std::string arguments{};
    /// The last argument is the rest of the line as it was typed, quotes and blanks included.
    bool takesRawRest = false;
    /// What the first argument may be, for completion; empty: what its name says, and a key of the
    /// store where it has none.
    std::function<std::vector<std::string>()> suggestions{};
    /// Takes the place of the handler, for an answer that may be long; empty: the handler answers.
    StreamingHandler stream{};
    /// The arguments are words as they were typed, for `OptionWords`: what is quoted is told from
    /// what is not.
    bool takesWordsAsTyped = false;
};

/// One command of the console. Immutable; its handler may run on several threads at once.
class Command {
public:
    Command(administration::CommandDescriptor commandDescriptor, CommandTraits commandTraits)
        : descriptor(std::move(commandDescriptor)), traits(std::move(commandTraits)) {}

    const std::string& name() const noexcept { return descriptor.name; }
    const std::string& description() const noexcept { return descriptor.description; }

    /// What follows the last "." of the name; the whole name when there is none.
    std::string_view shortName() const noexcept;

    /// The arguments as help shows them: their names, or else how many there may be.
    std::string argumentText() const;

    /// What the first argument may be; not callable when that is a key.
    const std::function<std::vector<std::string>()>& suggestions() const noexcept {
        return traits.suggestions;
    }

    /// What there may be behind the name: a KEY where nobody says more of arguments but how many
    /// there may be, and nothing where there may be any number.
    CommandUsage usage() const;

    /// The arguments of this command on `line`, whose first word has been read already. Throws
    /// `CommandLineError`.
    std::vector<std::string> readArguments(CommandLine& line) const;

    /// The arguments of this command where the words after its name are known one by one, and
    /// quoted by nobody.
    std::vector<std::string> givenArguments(std::vector<std::string> words) const;

    /// Carries out the command: gives the handler's answer, or nothing when it writes to `output`
    /// as it goes. Throws `CommandError` with the name, " takes ", the limits, "; given: " and the
    /// number when that is outside the limits; what the handler throws passes on.
    std::string run(std::vector<std::string>&& arguments, CommandOutput& output) const;

    /// As above, with all of the answer as one text. What is noted is dropped.
    std::string run(std::vector<std::string>&& arguments) const;

private:
    std::string limits() const;

    const administration::CommandDescriptor descriptor;
    const CommandTraits traits;
};

}  // namespace velkor::host
