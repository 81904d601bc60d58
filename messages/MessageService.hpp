#pragma once

#include <memory>

#include "configuration/Configuration.hpp"
#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationServiceProvider.hpp"
#include "framework/common/Export.hpp"
#include "messages/JsonSerializerImpl.hpp"
#include "messages/MessageDispatcher.hpp"
#include "messages/Secrets.hpp"

namespace velkor::messages {

/// The types of all requests that a `MessageService` answers.
VELKOR_EXPORT MessageTypeNames allRequestTypes();

/// The service that answers messages about a store, and the ways to it. Safe for concurrent use as
/// far as the store is. Ends after its front ends: from then on their message types are unknown.
class VELKOR_EXPORT MessageService {
public:
    /// Shares `store`, which is not null, with its other users. Requests beyond `limits` are
    /// refused; replies show the mark in the place of a secret value, whose type stays.
    explicit MessageService(std::shared_ptr<configuration::Configuration> store,
                            const JsonLimits& limits = {}, Secrets secrets = {});
    MessageService(const MessageService&) = delete;
    MessageService& operator=(const MessageService&) = delete;

    /// The way in for a front end that may send messages of the `allowed` types, and no others.
    std::shared_ptr<const MessageDispatcher> dispatcherFor(MessageTypeNames allowed) const;

private:
    std::shared_ptr<JsonSerializerImpl> serializer;
    configuration::ConfigurationJsonSerialization serialization;
    std::shared_ptr<configuration::ConfigurationServiceProvider> provider;
};

}  // namespace velkor::messages
