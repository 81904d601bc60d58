#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "framework/Future.hpp"
#include "framework/common/Export.hpp"

namespace velkor::administration {

/// Runs one command: receives the arguments typed after its name, returns the text to show.
using CommandHandler = std::function<std::string(std::vector<std::string>&&)>;

/// One command of the administration console.
struct CommandDescriptor {
    std::string name;
    std::string description;  ///< The one-line help text.
    CommandHandler handler;
    std::uint8_t minimumArguments;
    std::uint8_t maximumArguments;
};

/// The registry of the administration console. Implementations enforce the argument limits, may
/// call handlers on threads of their own, and are safe for concurrent use.
class VELKOR_EXPORT Administration {
public:
    virtual ~Administration();

    /// Offers `command`. Settles with whether it was accepted.
    virtual Future<bool> registerCommand(CommandDescriptor command) = 0;

    /// Withdraws the command called `name`. Settles with whether there was one.
    virtual Future<bool> unregisterCommand(const std::string& name) = 0;
};

}  // namespace velkor::administration
