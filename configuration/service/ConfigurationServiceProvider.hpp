#pragma once

#include <memory>

#include "configuration/service/ConfigurationMessages.hpp"
#include "framework/Future.hpp"
#include "framework/Message.hpp"
#include "framework/ServiceProvider.hpp"
#include "framework/common/Export.hpp"

extern template class velkor::ServiceProviderAPI<
    velkor::configuration::ConfigurationServiceProvider>;

namespace velkor::configuration {

/// The service that answers configuration requests. Requests reach it through `deliver`; each
/// `handle` answers one kind, ignores where the request came from, and may keep the request or
/// leave it in the pointer. Owned by a `std::shared_ptr`.
class VELKOR_EXPORT ConfigurationServiceProvider
    : public ServiceProviderAPI<ConfigurationServiceProvider> {
public:
    ~ConfigurationServiceProvider() override;

    /// Gives a `ConfigurationOptionResponse`, without an option when there is no such key.
    virtual Future<std::unique_ptr<Message>> handle(std::unique_ptr<ConfigurationGet>&& request,
                                                    Address&& from,
                                                    std::shared_ptr<Context>&& context) = 0;

    /// Gives a `ConfigurationOptionResponse` with the requested key and source name, and the value
    /// that the store's `set` gave.
    virtual Future<std::unique_ptr<Message>> handle(std::unique_ptr<ConfigurationSet>&& request,
                                                    Address&& from,
                                                    std::shared_ptr<Context>&& context) = 0;

    /// Gives a `ConfigurationKeysResponse`.
    virtual Future<std::unique_ptr<Message>> handle(std::unique_ptr<ConfigurationKeys>&& request,
                                                    Address&& from,
                                                    std::shared_ptr<Context>&& context) = 0;

    /// Gives a plain `Message`.
    virtual Future<std::unique_ptr<Message>> handle(
        std::unique_ptr<AddPropertyFileSource>&& request, Address&& from,
        std::shared_ptr<Context>&& context) = 0;
};

}  // namespace velkor::configuration
