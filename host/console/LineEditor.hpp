#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "host/console/Announcements.hpp"
#include "host/console/Completer.hpp"
#include "host/console/LineSource.hpp"

namespace velkor::host {

/// Lines typed on the terminal at standard input, with editing, history and
/// completion by the Tab key. Ctrl-C drops the line, Ctrl-D on an empty line ends the input. While
/// no line is being read, Ctrl-C is an `Interruption`. The terminal is in its ordinary mode again
/// whenever no line is being read, and when a signal ends the program meanwhile. Reads the user's
/// own key bindings from ~/.editrc. What is announced while a line is edited is shown above it.
///
/// There may be one at a time. Needs the character type locale to be one of UTF-8.
class LineEditor final : public LineSource {
public:
    /// What may follow the given text before the cursor.
    using Complete = std::function<Completion(const std::string&)>;

    /// What outlasts the session.
    struct Memory {
        std::vector<std::string> earlierLines{};  ///< The oldest first.
        /// Is told of each line as it is entered; may be empty.
        std::function<void(const std::string& line)> remember{};
    };

    /// Takes over the terminal. `announcements` must live as long. The arrow keys reach `memory`
    /// and what was entered since, but for lines that begin with a blank. Throws
    /// `std::runtime_error` "The terminal can't be used for line editing.".
    LineEditor(Complete complete, Announcements& announcements, Memory memory);
    ~LineEditor() override;

    LineEditor(const LineEditor&) = delete;
    LineEditor& operator=(const LineEditor&) = delete;

    std::optional<std::string> nextLine() override;

private:
    class Session;
    std::unique_ptr<Session> session;
};

}  // namespace velkor::host
