// The interfaces of this project as another program has them: declared once more, from what is
// promised of them. No header of this project that declares one is included here, so that a slot
// that moves, there or here, shows.

#include <Poco/JSON/Object.h>

#include <atomic>
#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <typeinfo>
#include <utility>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/Option.hpp"
#include "framework/Future.hpp"
#include "tests/loading/SlotOrder.hpp"

namespace velkor::reactive_streams {

class Subscription {
public:
    virtual ~Subscription();
    virtual void request(std::uint64_t n) = 0;
    virtual void cancel() = 0;
};

template <class T>
class Subscriber {
public:
    virtual ~Subscriber() = default;
    virtual void onSubscribe(std::weak_ptr<Subscription> subscription) = 0;
    virtual void onComplete() = 0;
    virtual void onNext(const T& value) { onNext(T(value)); }
    virtual void onNext(T&& value) = 0;
    virtual void onError(const std::exception_ptr& error) = 0;
};

class Publisher {
public:
    virtual ~Publisher();
    virtual Future<bool> getCompletionFuture() = 0;
};

template <class T>
class PublisherAPI : public Publisher {
public:
    virtual void subscribe(std::shared_ptr<Subscriber<T>> subscriber) = 0;
};

}  // namespace velkor::reactive_streams

namespace velkor {

class Message {
public:
    virtual ~Message();
};

struct Address {
    std::string value;
};

class Context;

template <class P>
class ServiceMessage : public Message {
public:
    virtual Future<std::unique_ptr<Message>> dispatch(std::shared_ptr<P> provider,
                                                      std::unique_ptr<Message>&& self,
                                                      Address&& from,
                                                      std::shared_ptr<Context>&& context) = 0;
};

class Lifecycle {
public:
    virtual ~Lifecycle();

private:
    std::atomic<bool> running{false};
};

class ServiceProvider : public Lifecycle, public std::enable_shared_from_this<ServiceProvider> {
public:
    ~ServiceProvider() override;
    virtual void onStart() = 0;
    virtual void onStop() = 0;
    virtual Future<std::unique_ptr<Message>> deliver(std::unique_ptr<Message>&& message,
                                                     Address&& from,
                                                     std::shared_ptr<Context>&& context) = 0;
};

template <class P>
class ServiceProviderAPI : public ServiceProvider {};

class DeferredService {
public:
    virtual ~DeferredService();
};

}  // namespace velkor

namespace velkor::json {

class JsonSerializer {
public:
    using Serialise = std::function<Poco::JSON::Object::Ptr(const std::unique_ptr<Message>&)>;
    using Deserialise = std::function<std::unique_ptr<Message>(const Poco::JSON::Object::Ptr&)>;

    virtual ~JsonSerializer();
    virtual void registerMessage(const std::string& name, const std::type_info& type,
                                 Serialise serialise, Deserialise deserialise) = 0;
    virtual void unregisterMessage(const std::type_info& type) = 0;
};

}  // namespace velkor::json

namespace velkor::administration {

struct CommandDescriptor {
    std::string name;
    std::string description;
    std::function<std::string(std::vector<std::string>&&)> handler;
    std::uint8_t minimumArguments;
    std::uint8_t maximumArguments;
};

class Administration {
public:
    virtual ~Administration();
    virtual Future<bool> registerCommand(CommandDescriptor command) = 0;
    virtual Future<bool> unregisterCommand(const std::string& name) = 0;
};

class CommandProvider {
public:
    virtual ~CommandProvider();
};

}  // namespace velkor::administration

namespace velkor::configuration {

class ConfigurationSource {
public:
    virtual ~ConfigurationSource() = 0;
    virtual ConfigurationValue get(const std::string& key) = 0;
    virtual ConfigurationValue set(const std::string& key, ConfigurationValue value) = 0;
    virtual bool has(const std::string& key) = 0;
    virtual void setChangeListener(std::function<void(const std::string&)> listener) = 0;
    virtual std::set<std::string> keys() = 0;
};

class Configuration {
public:
    virtual ~Configuration();
    virtual Future<ConfigurationValue> get(const std::string& key) = 0;
    virtual Future<Option> getOption(const std::string& key) = 0;
    virtual Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value) = 0;
    virtual Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value,
                                           const std::string& sourceName) = 0;
    virtual Future<bool> has(const std::string& key) = 0;
    virtual Future<std::set<std::string>> keys() = 0;
    virtual std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> watchOption(
        const std::string& key) = 0;
    virtual Future<bool> addPropertyFileSource(const std::string& name, const std::string& group,
                                               int order, bool readOnly,
                                               const std::u16string& path) = 0;
    virtual Future<bool> addInMemorySource(const std::string& name, const std::string& group,
                                           int order, bool readOnly, ValueMap&& values) = 0;
    virtual Future<bool> addEnvironmentSource(const std::string& name, const std::string& group,
                                              int order) = 0;
    virtual Future<bool> removeSource(const std::string& name) = 0;
    virtual std::shared_ptr<Configuration> getPtr() = 0;
};

class ConfigurationGet;
class ConfigurationSet;
class ConfigurationKeys;
class AddPropertyFileSource;

class ConfigurationServiceProvider : public ServiceProviderAPI<ConfigurationServiceProvider> {
public:
    ~ConfigurationServiceProvider() override;

    using Answer = Future<std::unique_ptr<Message>>;

    virtual Answer handle(std::unique_ptr<ConfigurationGet>&& request, Address&& from,
                          std::shared_ptr<Context>&& context) = 0;
    virtual Answer handle(std::unique_ptr<ConfigurationSet>&& request, Address&& from,
                          std::shared_ptr<Context>&& context) = 0;
    virtual Answer handle(std::unique_ptr<ConfigurationKeys>&& request, Address&& from,
                          std::shared_ptr<Context>&& context) = 0;
    virtual Answer handle(std::unique_ptr<AddPropertyFileSource>&& request, Address&& from,
                          std::shared_ptr<Context>&& context) = 0;
};

}  // namespace velkor::configuration

namespace velkor::testing {

namespace {

// The object is known to its maker only: there is nothing here to get it from but its address.
template <class Interface>
Interface& seenAs(void* object) {
    return *static_cast<Interface*>(object);
}

template <class Interface>
Names destroy(Interface& object, Names called) {
    delete &object;
    called.push_back("destroyed");
    return called;
}

template <class Request>
void handle(configuration::ConfigurationServiceProvider& provider) {
    // Nothing that is not declared here is destroyed here.
    Request* const none = nullptr;
    auto& request = reinterpret_cast<std::unique_ptr<Request>&>(const_cast<Request*&>(none));
    provider.handle(std::move(request), Address(), std::shared_ptr<Context>());
}

}  // namespace

Names callSubscription(void* object) {
    auto& subscription = seenAs<reactive_streams::Subscription>(object);
    subscription.request(1);
    subscription.cancel();
    return destroy(subscription, {"request", "cancel"});
}

Names callSubscriber(void* object) {
    auto& subscriber = seenAs<reactive_streams::Subscriber<int>>(object);
    const int kept = 1;
    subscriber.onSubscribe({});
    subscriber.onComplete();
    subscriber.onNext(kept);
    subscriber.onNext(2);
    subscriber.onError(nullptr);
    return destroy(subscriber,
                   {"onSubscribe", "onComplete", "onNext kept", "onNext given", "onError"});
}

Names callPublisher(void* object) {
    auto& publisher = seenAs<reactive_streams::PublisherAPI<int>>(object);
    publisher.getCompletionFuture();
    publisher.subscribe(nullptr);
    return destroy(publisher, {"getCompletionFuture", "subscribe"});
}

Names callServiceMessage(void* object) {
    auto& message = seenAs<ServiceMessage<int>>(object);
    message.dispatch(nullptr, nullptr, {}, nullptr);
    return destroy(message, {"dispatch"});
}

Names callServiceProvider(void* object) {
    auto& provider = seenAs<ServiceProvider>(object);
    provider.onStart();
    provider.onStop();
    provider.deliver(nullptr, {}, nullptr);
    return destroy(provider, {"onStart", "onStop", "deliver"});
}

Names callDeferredService(void* object) {
    return destroy(seenAs<DeferredService>(object), {});
}

Names callJsonSerializer(void* object) {
    auto& serializer = seenAs<json::JsonSerializer>(object);
    serializer.registerMessage("name", typeid(int), {}, {});
    serializer.unregisterMessage(typeid(int));
    return destroy(serializer, {"registerMessage", "unregisterMessage"});
}

Names callAdministration(void* object) {
    auto& administration = seenAs<administration::Administration>(object);
    administration.registerCommand({});
    administration.unregisterCommand("name");
    return destroy(administration, {"registerCommand", "unregisterCommand"});
}

Names callCommandProvider(void* object) {
    return destroy(seenAs<administration::CommandProvider>(object), {});
}

Names callConfiguration(void* object) {
    auto& store = seenAs<configuration::Configuration>(object);
    store.get("key");
    store.getOption("key");
    store.set("key", 1);
    store.set("key", 1, "source");
    store.has("key");
    store.keys();
    store.watchOption("key");
    store.addPropertyFileSource("name", "group", 1, true, u"path");
    store.addInMemorySource("name", "group", 1, true, {});
    store.addEnvironmentSource("name", "group", 1);
    store.removeSource("name");
    store.getPtr();
    return destroy(store, {"get", "getOption", "set", "set in source", "has", "keys", "watchOption",
                           "addPropertyFileSource", "addInMemorySource", "addEnvironmentSource",
                           "removeSource", "getPtr"});
}

Names callConfigurationSource(void* object) {
    auto& source = seenAs<configuration::ConfigurationSource>(object);
    source.get("key");
    source.set("key", 1);
    source.has("key");
    source.setChangeListener({});
    source.keys();
    return destroy(source, {"get", "set", "has", "setChangeListener", "keys"});
}

Names callConfigurationServiceProvider(void* object) {
    auto& provider = seenAs<configuration::ConfigurationServiceProvider>(object);
    handle<configuration::ConfigurationGet>(provider);
    handle<configuration::ConfigurationSet>(provider);
    handle<configuration::ConfigurationKeys>(provider);
    handle<configuration::AddPropertyFileSource>(provider);
    return destroy(provider, {"handle get", "handle set", "handle keys", "handle file"});
}

}  // namespace velkor::testing
