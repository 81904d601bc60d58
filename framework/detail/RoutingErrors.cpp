#include "framework/detail/RoutingErrors.hpp"

#include <exception>
#include <stdexcept>

namespace velkor::detail {

std::string typeName(const std::type_info& type) {
    const char* name = type.name();
    return *name == '*' ? name + 1 : name;
}

const std::type_info& typeOf(const Message* message) {
    return typeid(*message);
}

Future<std::unique_ptr<Message>> failNotRunning() {
    return makeFailedFuture<std::unique_ptr<Message>>(
        std::make_exception_ptr(std::runtime_error(routing_errors::notRunning)));
}

Future<std::unique_ptr<Message>> failMismatch(const char* prefix, const std::type_info& expected,
                                              const std::type_info& found) {
    return makeFailedFuture<std::unique_ptr<Message>>(std::make_exception_ptr(std::invalid_argument(
        prefix + typeName(expected) + routing_errors::butFound + typeName(found))));
}

}  // namespace velkor::detail
