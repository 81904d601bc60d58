#include "framework/detail/Routing.hpp"

#include <exception>
#include <stdexcept>

#include "framework/RoutingErrors.hpp"

namespace velkor::detail {

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
