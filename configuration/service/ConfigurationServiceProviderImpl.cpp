#include "configuration/service/ConfigurationServiceProviderImpl.hpp"

#include <utility>

#include "configuration/Option.hpp"

namespace velkor::configuration {

namespace {

template <class Reply, class... Content>
Future<std::unique_ptr<Message>> replyWith(Content&&... content) {
    return makeReadyFuture<std::unique_ptr<Message>>(
        std::make_unique<Reply>(std::forward<Content>(content)...));
}

}  // namespace

ConfigurationServiceProviderImpl::ConfigurationServiceProviderImpl(
    std::shared_ptr<Configuration> store)
    : configuration(std::move(store)) {}

Future<std::unique_ptr<Message>> ConfigurationServiceProviderImpl::handle(
    std::unique_ptr<ConfigurationGet>&& request, Address&&, std::shared_ptr<Context>&&) {
    if (!configuration->has(request->key).get()) return replyWith<ConfigurationOptionResponse>();
    return replyWith<ConfigurationOptionResponse>(
        std::make_unique<Option>(configuration->getOption(request->key).get()));
}

Future<std::unique_ptr<Message>> ConfigurationServiceProviderImpl::handle(
    std::unique_ptr<ConfigurationSet>&& request, Address&&, std::shared_ptr<Context>&&) {
    ConfigurationValue written = write(*request);
    return replyWith<ConfigurationOptionResponse>(
        std::make_unique<Option>(request->key, request->source, std::move(written)));
}

Future<std::unique_ptr<Message>> ConfigurationServiceProviderImpl::handle(
    std::unique_ptr<ConfigurationKeys>&&, Address&&, std::shared_ptr<Context>&&) {
    return replyWith<ConfigurationKeysResponse>(configuration->keys().get());
}

Future<std::unique_ptr<Message>> ConfigurationServiceProviderImpl::handle(
    std::unique_ptr<AddPropertyFileSource>&& request, Address&&, std::shared_ptr<Context>&&) {
    configuration
        ->addPropertyFileSource(request->name, request->group, request->order, request->readOnly,
                                request->path)
        .get();
    return replyWith<Message>();
}

ConfigurationValue ConfigurationServiceProviderImpl::write(const ConfigurationSet& request) {
    return request.source.empty()
               ? configuration->set(request.key, request.value).get()
               : configuration->set(request.key, request.value, request.source).get();
}

}  // namespace velkor::configuration
