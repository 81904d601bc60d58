#include "host/messages/MessageDispatcher.hpp"

#include <cstring>
#include <exception>
#include <new>
#include <stdexcept>
#include <utility>

#include "framework/Future.hpp"
#include "framework/Message.hpp"
#include "framework/RoutingErrors.hpp"
#include "host/messages/JsonText.hpp"

namespace velkor::host {

namespace {

DispatchError failed(DispatchFailure failure, const std::exception& error) {
    return {failure, error.what()};
}

bool saysNotRunning(const std::exception& error) {
    return std::strcmp(error.what(), routing_errors::notRunning) == 0;
}

}  // namespace

MessageDispatcher::MessageDispatcher(std::shared_ptr<const JsonSerializerImpl> registry,
                                     std::shared_ptr<ServiceProvider> provider)
    : serializer(std::move(registry)), service(std::move(provider)) {}

DispatchResult MessageDispatcher::dispatch(const JsonMessage& request) const {
    try {
        return encodeReply(service->deliver(serializer->decode(request), Address(), nullptr));
    } catch (const std::bad_alloc&) {
        throw;
    } catch (const UnknownMessageType& error) {
        return failed(DispatchFailure::unknownType, error);
    } catch (const NoJsonObject& error) {
        return failed(DispatchFailure::noJsonObject, error);
    } catch (const std::exception& error) {
        return failed(DispatchFailure::service, error);
    } catch (...) {
        return DispatchError{DispatchFailure::service, "Unknown error"};
    }
}

// Routing errors are in the future, while the errors of handlers are thrown.
DispatchResult MessageDispatcher::encodeReply(Future<std::unique_ptr<Message>> future) const {
    std::unique_ptr<Message> reply;
    try {
        reply = future.get();
    } catch (const std::invalid_argument& error) {
        return failed(DispatchFailure::routing, error);
    } catch (const std::runtime_error& error) {
        if (!saysNotRunning(error)) throw;
        return failed(DispatchFailure::notRunning, error);
    }
    return serializer->encode(reply);
}

}  // namespace velkor::host
