#pragma once

#include <memory>

#include "configuration/Configuration.hpp"
#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationServiceProvider.hpp"
#include "host/messages/JsonSerializerImpl.hpp"
#include "host/messages/MessageDispatcher.hpp"

namespace velkor::host {

/// The types of all requests that a `MessageService` answers.
MessageTypeNames allRequestTypes();

/// The service that answers messages about a store, and the ways to it. Safe for concurrent use as
/// far as the store is. Ends after its front ends: from then on their message types are unknown.
class MessageService {
public:
    /// Shares `store`, which is not null, with its other users.
    explicit MessageService(std::shared_ptr<configuration::Configuration> store);
    MessageService(const MessageService&) = delete;
    MessageService& operator=(const MessageService&) = delete;

    /// The way in for a front end that may send messages of the `allowed` types, and no others.
    std::shared_ptr<const MessageDispatcher> dispatcherFor(MessageTypeNames allowed) const;

private:
    std::shared_ptr<JsonSerializerImpl> serializer;
    configuration::ConfigurationJsonSerialization serialization;
    std::shared_ptr<configuration::ConfigurationServiceProvider> provider;
};

}  // namespace velkor::host
