#pragma once

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "host/serving/ListenOptions.hpp"
#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// A log channel and the mask of the severities that it shall write.
struct LogRequest {
    std::string channel;
    unsigned severities;
};

/// A key with the text of its value.
struct Assignment {
    std::string key;
    std::string text;
};

/// What the command line asks for.
struct Options {
    /// Whether the command line itself says what to carry out.
    bool givesCommands() const { return !lines.empty() || !command.empty(); }

    /// Files in the order of the command line, then the environment.
    std::vector<SourceRequest> sources{};
    SourceLimits limits{};
    std::vector<Assignment> assignments{};
    std::optional<std::string> statePath{};
    bool checksFiles = false;            ///< The files are checked, and nothing else is done.
    std::optional<bool> watchesFiles{};  ///< Nothing: as fits the session.
    std::vector<std::string> lines{};    ///< Command lines; empty: they are read.
    bool keepsHistory = true;            ///< What is typed outlasts the session.
    std::vector<std::string> command{};  ///< A command with its arguments, carried out by itself.
    std::vector<LogRequest> logs{};
    std::optional<ListenRequest> serving{};  ///< Nothing: nobody is served.
    std::string manualForm{};   ///< What `manual` shall give, instead of all else; empty: nothing.
    std::string information{};  ///< What --help or --version wants shown, instead of all else.
};

/// A command line that can't be understood. Its text is one line.
class UsageError : public std::invalid_argument {
public:
    using std::invalid_argument::invalid_argument;
};

/// What --help tells, in parts.
struct ProgramUsage {
    struct Option {
        std::vector<std::string> names{};  ///< Each with its dashes; without: an argument.
        std::string valueName{};           ///< Empty: it has no value.
        std::string help{};
    };

    std::string description{};
    std::string notes{};
    std::vector<Option> options{};
};

/// What the command line may hold.
ProgramUsage programUsage();

/// Understands `arguments`, those after the program's name. Throws `UsageError`.
Options parseOptions(const std::vector<std::string>& arguments);

/// Understands NAME=PATH[,group=G][,order=N][,writable]. Throws `UsageError`.
SourceRequest parseSource(const std::string& text);

/// Understands KEY=VALUE; the key has one character at least and no "=". Throws `UsageError`.
Assignment parseAssignment(const std::string& text);

/// Understands a number of bytes with KiB, MiB, GiB or nothing behind it. Throws `UsageError`.
std::uintmax_t parseFileSize(const std::string& text);

/// Understands CHANNEL=SEVERITIES, see `parseSeverities`. Throws `UsageError`.
LogRequest parseLog(const std::string& text);

}  // namespace velkor::host
