#include "configuration/service/ConfigurationMessages.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <type_traits>
#include <typeinfo>
#include <utility>
#include <vector>

#include "configuration/service/ConfigurationServiceProvider.hpp"
#include "tests/configuration/service/MessageClasses.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::configuration {
namespace {

using velkor::testing::EveryMessageClass;
using velkor::testing::EveryRequestClass;
using velkor::testing::textOf;

/// Notes which of its operations was called, and with what; keeps the request if told to.
class NotingProvider : public ConfigurationServiceProvider {
public:
    Future<std::unique_ptr<Message>> handle(std::unique_ptr<ConfigurationGet>&& request,
                                            Address&& from,
                                            std::shared_ptr<Context>&& context) override {
        return note("get", std::move(request), std::move(from), std::move(context));
    }
    Future<std::unique_ptr<Message>> handle(std::unique_ptr<ConfigurationSet>&& request,
                                            Address&& from,
                                            std::shared_ptr<Context>&& context) override {
        return note("set", std::move(request), std::move(from), std::move(context));
    }
    Future<std::unique_ptr<Message>> handle(std::unique_ptr<ConfigurationKeys>&& request,
                                            Address&& from,
                                            std::shared_ptr<Context>&& context) override {
        return note("keys", std::move(request), std::move(from), std::move(context));
    }
    Future<std::unique_ptr<Message>> handle(std::unique_ptr<AddPropertyFileSource>&& request,
                                            Address&& from,
                                            std::shared_ptr<Context>&& context) override {
        return note("add", std::move(request), std::move(from), std::move(context));
    }

    std::vector<std::string> calls;
    std::unique_ptr<Message> kept;
    std::string sender;
    std::shared_ptr<Context> given;

private:
    Future<std::unique_ptr<Message>> note(const char* call, std::unique_ptr<Message> request,
                                          Address&& from, std::shared_ptr<Context>&& context) {
        calls.emplace_back(call);
        kept = std::move(request);
        sender = std::move(from.value);
        given = std::move(context);
        return makeReadyFuture<std::unique_ptr<Message>>(nullptr);
    }
};

template <class M>
const char* operationFor = nullptr;
template <>
const char* operationFor<ConfigurationGet> = "get";
template <>
const char* operationFor<ConfigurationSet> = "set";
template <>
const char* operationFor<ConfigurationKeys> = "keys";
template <>
const char* operationFor<AddPropertyFileSource> = "add";

template <class M>
class Request : public ::testing::Test {
protected:
    std::shared_ptr<NotingProvider> provider = std::make_shared<NotingProvider>();
};

TYPED_TEST_SUITE(Request, EveryRequestClass, );

TYPED_TEST(Request, ReachesItsOperationAndNoOther) {
    auto* const request = new TypeParam;
    std::unique_ptr<Message> self(request);
    request->dispatch(this->provider, std::move(self), Address(), nullptr);
    EXPECT_EQ(this->provider->calls, std::vector<std::string>{operationFor<TypeParam>});
    EXPECT_EQ(this->provider->kept.get(), request);
    EXPECT_EQ(self, nullptr);
}

TYPED_TEST(Request, CarriesAddressAndContextAlong) {
    const auto context = std::make_shared<Context>();
    auto* const request = new TypeParam;
    std::unique_ptr<Message> self(request);
    request->dispatch(this->provider, std::move(self), Address{"sender"},
                      std::shared_ptr<Context>(context));
    EXPECT_EQ(this->provider->sender, "sender");
    EXPECT_EQ(this->provider->given, context);
}

TYPED_TEST(Request, IsAMessageForConfigurationServices) {
    const std::unique_ptr<Message> message = std::make_unique<TypeParam>();
    EXPECT_NE(dynamic_cast<ServiceMessage<ConfigurationServiceProvider>*>(message.get()), nullptr);
}

template <class M>
class EveryMessage : public ::testing::Test {};

TYPED_TEST_SUITE(EveryMessage, EveryMessageClass, );

TYPED_TEST(EveryMessage, IsAMovableValueWithAVirtualDestructor) {
    EXPECT_TRUE(std::is_nothrow_move_constructible_v<TypeParam>);
    EXPECT_TRUE(std::is_move_assignable_v<TypeParam>);
    EXPECT_TRUE(std::is_default_constructible_v<TypeParam>);
    EXPECT_TRUE(std::has_virtual_destructor_v<TypeParam>);
}

TYPED_TEST(EveryMessage, IsKnownByItsRunTimeType) {
    const std::unique_ptr<Message> message = std::make_unique<TypeParam>();
    const Message& object = *message;
    EXPECT_EQ(typeid(object), typeid(TypeParam));
}

TEST(DispatchOfAnotherMessage, NamesBothTypesAndCallsNobody) {
    const auto provider = std::make_shared<NotingProvider>();
    ConfigurationGet request;
    std::unique_ptr<Message> self = std::make_unique<ConfigurationKeys>();
    auto reply = request.dispatch(provider, std::move(self), Address(), nullptr);
    try {
        reply.get();
        FAIL() << "no exception";
    } catch (const std::invalid_argument& error) {
        EXPECT_EQ(std::string(error.what()),
                  std::string("Unable to deliver to service. Incorrect message type. Expected: ") +
                      typeid(ConfigurationGet).name() + " but found " +
                      typeid(ConfigurationKeys).name());
    }
    EXPECT_TRUE(provider->calls.empty());
}

TEST(Responses, AreNoServiceMessages) {
    const std::unique_ptr<Message> option = std::make_unique<ConfigurationOptionResponse>();
    const std::unique_ptr<Message> keys = std::make_unique<ConfigurationKeysResponse>();
    using ForService = ServiceMessage<ConfigurationServiceProvider>;
    EXPECT_EQ(dynamic_cast<ForService*>(option.get()), nullptr);
    EXPECT_EQ(dynamic_cast<ForService*>(keys.get()), nullptr);
}

TEST(ConfigurationSetMessage, TakesKeyValueAndSource) {
    const ConfigurationSet request("k", 5, "s");
    EXPECT_EQ(request.key, "k");
    EXPECT_EQ(request.source, "s");
    EXPECT_EQ(textOf(request.value), "int 5");
}

TEST(ConfigurationGetMessage, TakesItsKey) {
    EXPECT_EQ(ConfigurationGet("k").key, "k");
}

TEST(ConfigurationKeysMessage, StartsEmpty) {
    EXPECT_EQ(ConfigurationKeys().filter, "");
}

TEST(AddPropertyFileSourceMessage, TakesItsFieldsInOrder) {
    const AddPropertyFileSource request("n", "g", -3, false, u"p");
    EXPECT_EQ(request.name, "n");
    EXPECT_EQ(request.group, "g");
    EXPECT_EQ(request.order, -3);
    EXPECT_FALSE(request.readOnly);
    EXPECT_EQ(request.path, u"p");
}

TEST(AddPropertyFileSourceMessage, IsReadOnlyUnlessSaidOtherwise) {
    EXPECT_TRUE(AddPropertyFileSource().readOnly);
}

TEST(ConfigurationOptionResponseMessage, WithoutOptionIsValid) {
    EXPECT_EQ(ConfigurationOptionResponse().option, nullptr);
}

TEST(ConfigurationOptionResponseMessage, OwnsItsOption) {
    const ConfigurationOptionResponse response(std::make_unique<Option>("k", "s", 1));
    EXPECT_EQ(response.option->key, "k");
    EXPECT_EQ(response.option->source, "s");
    EXPECT_EQ(textOf(response.option->value), "int 1");
}

TEST(ConfigurationKeysResponseMessage, HoldsEachKeyOnceInByteOrder) {
    const ConfigurationKeysResponse response({"b", "a", "b", "B"});
    EXPECT_EQ(std::vector<std::string>(response.keys.begin(), response.keys.end()),
              (std::vector<std::string>{"B", "a", "b"}));
}

}  // namespace
}  // namespace velkor::configuration
