#include "host/console/CommandRegistration.hpp"

#include <utility>

namespace velkor::host {

CommandRegistration::CommandRegistration(std::shared_ptr<CommandRegistry> commandRegistry,
                                         CommandRegistry::CommandPtr newCommand)
    : registry(std::move(commandRegistry)), command(std::move(newCommand)) {
    registry->add(command);
}

CommandRegistration::~CommandRegistration() {
    if (registry) registry->remove(command);
}

}  // namespace velkor::host
