#pragma once

#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace velkor::host {

/// A property file that the user wants to be a source.
struct SourceRequest {
    /// Behind "override" and before "default". Among sources of one order the one added last wins,
    /// so that files override those before them.
    static constexpr int defaultOrder = 1000;

    std::optional<std::string> name{};  ///< Nothing: one is made from the path.
    std::string path;
    std::string group{};
    int order = defaultOrder;
    bool writable = false;
};

/// A log channel and the mask of the severities that it shall write.
struct LogRequest {
    std::string channel;
    unsigned severities;
};

/// What the command line asks for.
struct Options {
    std::vector<SourceRequest> sources{};  ///< In the order of the command line.
    std::vector<std::string> lines{};      ///< Command lines; empty: they are read.
    std::vector<LogRequest> logs{};
    std::string information{};  ///< What --help or --version wants shown, instead of all else.
};

/// A command line that can't be understood. Its text is one line.
class UsageError : public std::invalid_argument {
public:
    using std::invalid_argument::invalid_argument;
};

/// Understands `arguments`, those after the program's name. Throws `UsageError`.
Options parseOptions(const std::vector<std::string>& arguments);

/// Understands NAME=PATH[,group=G][,order=N][,writable]. Throws `UsageError`.
SourceRequest parseSource(const std::string& text);

/// Understands CHANNEL=SEVERITIES, see `parseSeverities`. Throws `UsageError`.
LogRequest parseLog(const std::string& text);

}  // namespace velkor::host
