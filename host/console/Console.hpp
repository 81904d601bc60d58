#pragma once

#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "host/console/CommandRegistry.hpp"
#include "host/console/LineSource.hpp"
#include "host/console/Output.hpp"

namespace velkor::host {

/// Carries out command lines, one after the other, on the thread that calls it.
///
/// A line is a command and its arguments, split as `CommandLine` says. An empty line and a line
/// whose first byte that is no blank is # do nothing. What can't be carried out is reported as one
/// message, and the next line follows. So it does when Ctrl-C ends a command, see `Interruption`,
/// which then has not failed.
class Console {
public:
    /// Runs the commands of `registry` and writes to `output`, which must live as long.
    /// `acknowledge` is called after each command and before its answer is shown; what it throws
    /// counts as thrown by the command.
    Console(
        std::shared_ptr<const CommandRegistry> registry, Output& output,
        std::function<void()> acknowledge = [] {});

    /// Carries out `lines` until there are no more, `quit` is called or nobody reads the answers.
    /// Gives whether every line could be carried out.
    bool run(LineSource& lines);

    /// Carries out one command, the words of which are its name and its arguments. Gives whether it
    /// could be carried out.
    bool run(const std::vector<std::string>& words);

    /// Has one message shown beside the answer of the command that is being carried out, unless it
    /// fails. For a handler to call, on its thread.
    void remark(std::string text) { remarks.push_back(std::move(text)); }

    /// Ends `run` after the line that is being carried out. For a handler to call.
    void quit() noexcept { quitting = true; }

private:
    bool runNext(LineSource& lines);
    void execute(const std::string& line);
    void carryOut(const Command& command, std::vector<std::string>&& arguments);
    void showRemarks(const std::string& position);

    std::shared_ptr<const CommandRegistry> registry;
    Output& output;
    const std::function<void()> acknowledge;
    std::vector<std::string> remarks;  ///< Of the command that was carried out last.
    bool quitting = false;
};

}  // namespace velkor::host
