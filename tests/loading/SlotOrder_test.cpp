#include "tests/loading/SlotOrder.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "configuration/Configuration.hpp"
#include "configuration/service/ConfigurationServiceProvider.hpp"
#include "configuration/sources/ConfigurationSource.hpp"
#include "framework/DeferredService.hpp"
#include "framework/administration/Administration.hpp"
#include "framework/administration/CommandProvider.hpp"
#include "framework/json/JsonSerializer.hpp"
#include "framework/reactive_streams/Publisher.hpp"

namespace {

using velkor::Address;
using velkor::Context;
using velkor::Future;
using velkor::Message;
using velkor::configuration::ConfigurationValue;
using velkor::configuration::Option;
using velkor::testing::Names;

using Reply = Future<std::unique_ptr<Message>>;

/// Notes in `names`, which outlives it, what is called.
template <class Interface>
class Noting : public Interface {
public:
    explicit Noting(Names& calls) : names(calls) {}
    ~Noting() override { note("destroyed"); }

protected:
    void note(const char* name) { names.push_back(name); }

    template <class Result>
    Result noted(const char* name) {
        note(name);
        return Result();
    }

private:
    Names& names;
};

class NotingSubscription final : public Noting<velkor::reactive_streams::Subscription> {
public:
    using Noting::Noting;
    void request(std::uint64_t) override { note("request"); }
    void cancel() override { note("cancel"); }
};

class NotingSubscriber final : public Noting<velkor::reactive_streams::Subscriber<int>> {
public:
    using Noting::Noting;
    void onSubscribe(std::weak_ptr<velkor::reactive_streams::Subscription>) override {
        note("onSubscribe");
    }
    void onComplete() override { note("onComplete"); }
    void onNext(const int&) override { note("onNext kept"); }
    void onNext(int&&) override { note("onNext given"); }
    void onError(const std::exception_ptr&) override { note("onError"); }
};

class NotingPublisher final : public Noting<velkor::reactive_streams::PublisherAPI<int>> {
public:
    using Noting::Noting;
    Future<bool> getCompletionFuture() override {
        return noted<Future<bool>>("getCompletionFuture");
    }
    void subscribe(std::shared_ptr<velkor::reactive_streams::Subscriber<int>>) override {
        note("subscribe");
    }
};

class NotingMessage final : public Noting<velkor::ServiceMessage<int>> {
public:
    using Noting::Noting;
    Reply dispatch(std::shared_ptr<int>, std::unique_ptr<Message>&&, Address&&,
                   std::shared_ptr<Context>&&) override {
        return noted<Reply>("dispatch");
    }
};

class NotingProvider final : public Noting<velkor::ServiceProvider> {
public:
    using Noting::Noting;
    void onStart() override { note("onStart"); }
    void onStop() override { note("onStop"); }
    Reply deliver(std::unique_ptr<Message>&&, Address&&, std::shared_ptr<Context>&&) override {
        return noted<Reply>("deliver");
    }
};

class NotingSerializer final : public Noting<velkor::json::JsonSerializer> {
public:
    using Noting::Noting;
    void registerMessage(const std::string&, const std::type_info&, Serialise,
                         Deserialise) override {
        note("registerMessage");
    }
    void unregisterMessage(const std::type_info&) override { note("unregisterMessage"); }
};

class NotingAdministration final : public Noting<velkor::administration::Administration> {
public:
    using Noting::Noting;
    Future<bool> registerCommand(velkor::administration::CommandDescriptor) override {
        return noted<Future<bool>>("registerCommand");
    }
    Future<bool> unregisterCommand(const std::string&) override {
        return noted<Future<bool>>("unregisterCommand");
    }
};

class NotingStore final : public Noting<velkor::configuration::Configuration> {
public:
    using Noting::Noting;
    using Answer = Future<ConfigurationValue>;
    Answer get(const std::string&) override { return noted<Answer>("get"); }
    Future<Option> getOption(const std::string&) override {
        return noted<Future<Option>>("getOption");
    }
    Answer set(const std::string&, ConfigurationValue) override { return noted<Answer>("set"); }
    Answer set(const std::string&, ConfigurationValue, const std::string&) override {
        return noted<Answer>("set in source");
    }
    Future<bool> has(const std::string&) override { return noted<Future<bool>>("has"); }
    Future<std::set<std::string>> keys() override {
        return noted<Future<std::set<std::string>>>("keys");
    }
    std::shared_ptr<velkor::reactive_streams::PublisherAPI<ConfigurationValue>> watchOption(
        const std::string&) override {
        note("watchOption");
        return nullptr;
    }
    Future<bool> addPropertyFileSource(const std::string&, const std::string&, int, bool,
                                       const std::u16string&) override {
        return noted<Future<bool>>("addPropertyFileSource");
    }
    Future<bool> addInMemorySource(const std::string&, const std::string&, int, bool,
                                   velkor::configuration::ValueMap&&) override {
        return noted<Future<bool>>("addInMemorySource");
    }
    Future<bool> addEnvironmentSource(const std::string&, const std::string&, int) override {
        return noted<Future<bool>>("addEnvironmentSource");
    }
    Future<bool> removeSource(const std::string&) override {
        return noted<Future<bool>>("removeSource");
    }
    std::shared_ptr<Configuration> getPtr() override {
        note("getPtr");
        return nullptr;
    }
};

class NotingSource final : public Noting<velkor::configuration::ConfigurationSource> {
public:
    using Noting::Noting;
    ConfigurationValue get(const std::string&) override { return noted<ConfigurationValue>("get"); }
    ConfigurationValue set(const std::string&, ConfigurationValue) override {
        return noted<ConfigurationValue>("set");
    }
    bool has(const std::string&) override { return noted<bool>("has"); }
    void setChangeListener(velkor::configuration::ChangeListener) override {
        note("setChangeListener");
    }
    std::set<std::string> keys() override { return noted<std::set<std::string>>("keys"); }
};

class NotingConfigurationProvider final
    : public Noting<velkor::configuration::ConfigurationServiceProvider> {
public:
    using Noting::Noting;
    Reply handle(std::unique_ptr<velkor::configuration::ConfigurationGet>&&, Address&&,
                 std::shared_ptr<Context>&&) override {
        return noted<Reply>("handle get");
    }
    Reply handle(std::unique_ptr<velkor::configuration::ConfigurationSet>&&, Address&&,
                 std::shared_ptr<Context>&&) override {
        return noted<Reply>("handle set");
    }
    Reply handle(std::unique_ptr<velkor::configuration::ConfigurationKeys>&&, Address&&,
                 std::shared_ptr<Context>&&) override {
        return noted<Reply>("handle keys");
    }
    Reply handle(std::unique_ptr<velkor::configuration::AddPropertyFileSource>&&, Address&&,
                 std::shared_ptr<Context>&&) override {
        return noted<Reply>("handle file");
    }
};

/// What `call` says it has called, and what `Object` has seen of it.
template <class Interface, class Object>
void expectTheSame(Names (*call)(void*)) {
    Names seen;
    Interface* const object = new Object(seen);  // destroyed by the one that is called
    const Names called = call(object);
    EXPECT_EQ(seen, called);
}

// Programs that were compiled long ago, with the slots of then, go on calling what they mean.
TEST(SlotOrder, IsThatOfIndependentDeclarations) {
    using namespace velkor;
    using namespace velkor::testing;
    expectTheSame<reactive_streams::Subscription, NotingSubscription>(callSubscription);
    expectTheSame<reactive_streams::Subscriber<int>, NotingSubscriber>(callSubscriber);
    expectTheSame<reactive_streams::PublisherAPI<int>, NotingPublisher>(callPublisher);
    expectTheSame<ServiceMessage<int>, NotingMessage>(callServiceMessage);
    expectTheSame<ServiceProvider, NotingProvider>(callServiceProvider);
    expectTheSame<DeferredService, Noting<DeferredService>>(callDeferredService);
    expectTheSame<json::JsonSerializer, NotingSerializer>(callJsonSerializer);
    expectTheSame<administration::Administration, NotingAdministration>(callAdministration);
    expectTheSame<administration::CommandProvider, Noting<administration::CommandProvider>>(
        callCommandProvider);
    expectTheSame<configuration::Configuration, NotingStore>(callConfiguration);
    expectTheSame<configuration::ConfigurationSource, NotingSource>(callConfigurationSource);
    expectTheSame<configuration::ConfigurationServiceProvider, NotingConfigurationProvider>(
        callConfigurationServiceProvider);
}

}  // namespace
