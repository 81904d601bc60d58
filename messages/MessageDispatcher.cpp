#include "messages/MessageDispatcher.hpp"

#include <exception>
#include <new>
#include <stdexcept>
#include <utility>

#include "configuration/StoreErrors.hpp"
#include "framework/Future.hpp"
#include "messages/JsonText.hpp"

namespace velkor::messages {

namespace {

using configuration::Refusal;

class ForbiddenMessageType : public std::invalid_argument {
public:
    using std::invalid_argument::invalid_argument;
};

DispatchFailure failureOf(Refusal refusal) {
    switch (refusal) {
        case Refusal::missingOption:
            return DispatchFailure::missingOption;
        case Refusal::notWritable:
            return DispatchFailure::notWritable;
        case Refusal::duplicateSource:
            return DispatchFailure::duplicateSource;
        case Refusal::fileNotOpened:
            return DispatchFailure::fileNotOpened;
        case Refusal::fileNotAllowed:
            return DispatchFailure::fileNotAllowed;
        case Refusal::notRunning:
            return DispatchFailure::notRunning;
        case Refusal::misrouted:
            return DispatchFailure::misrouted;
        case Refusal::other:
            break;
    }
    return DispatchFailure::other;
}

DispatchError failed(DispatchFailure failure, const std::exception& error) {
    return {failure, error.what()};
}

}  // namespace

MessageDispatcher::MessageDispatcher(std::shared_ptr<const JsonSerializerImpl> registry,
                                     std::shared_ptr<ServiceProvider> provider,
                                     MessageTypeNames allowed)
    : serializer(std::move(registry)),
      service(std::move(provider)),
      allowedTypes(std::move(allowed)) {}

// Routing errors are in the future, while the errors of handlers are thrown.
DispatchResult MessageDispatcher::dispatch(const JsonMessage& request) const {
    try {
        requireAllowed(request.type);
        return serializer->encode(
            service->deliver(serializer->decode(request), Address(), nullptr).get());
    } catch (const std::bad_alloc&) {
        throw;
    } catch (const UnknownMessageType& error) {
        return failed(DispatchFailure::unknownType, error);
    } catch (const ForbiddenMessageType& error) {
        return failed(DispatchFailure::forbiddenType, error);
    } catch (const NoJsonObject& error) {
        return failed(DispatchFailure::noJsonObject, error);
    } catch (const std::exception& error) {
        return failed(failureOf(configuration::refusalOf(error)), error);
    } catch (...) {
        return DispatchError{DispatchFailure::other, "Unknown error"};
    }
}

void MessageDispatcher::requireAllowed(const std::string& type) const {
    if (allowedTypes.count(type) != 0) return;
    serializer->requireKnown(type);
    throw ForbiddenMessageType("Message type not allowed: " + type);
}

}  // namespace velkor::messages
