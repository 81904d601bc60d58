#include "messages/MessageService.hpp"

#include <utility>

#include "configuration/service/ConfigurationServiceProviderImpl.hpp"
#include "configuration/service/MessageTypes.hpp"
#include "messages/detail/MaskingSerializer.hpp"

namespace velkor::messages {

MessageTypeNames allRequestTypes() {
    MessageTypeNames names;
    configuration::forEachRequestType([&](const auto& type) { names.insert(type.name()); });
    return names;
}

MessageService::MessageService(std::shared_ptr<configuration::Configuration> store,
                               const JsonLimits& limits, Secrets secrets)
    : serializer(std::make_shared<JsonSerializerImpl>(limits)),
      serialization(std::make_shared<detail::MaskingSerializer>(serializer, std::move(secrets))),
      provider(
          std::make_shared<configuration::ConfigurationServiceProviderImpl>(std::move(store))) {
    provider->setRunning(true);
}

std::shared_ptr<const MessageDispatcher> MessageService::dispatcherFor(
    MessageTypeNames allowed) const {
    return std::make_shared<MessageDispatcher>(serializer, provider, std::move(allowed));
}

}  // namespace velkor::messages
