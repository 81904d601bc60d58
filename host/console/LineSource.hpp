#pragma once

#include <optional>
#include <stdexcept>
#include <string>

namespace velkor::host {

/// A line that can't be used; the next one can be read.
class LineError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// Where the console's command lines come from. Used by one thread.
class LineSource {
public:
    virtual ~LineSource() = default;

    /// The next line without its end, or nothing when there are no more. Throws `LineError`.
    virtual std::optional<std::string> nextLine() = 0;

    /// Where the last line stands, to be put in front of a message about it: "line 3: ", or nothing
    /// where people see that themselves.
    virtual std::string position() const { return ""; }
};

}  // namespace velkor::host
