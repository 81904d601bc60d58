#include "configuration/service/ConfigurationServiceProviderImpl.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <exception>
#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <thread>
#include <typeinfo>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/configuration/service/MockConfiguration.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::configuration {
namespace {

using ::testing::_;
using ::testing::ByMove;
using ::testing::Return;
using ::testing::StrictMock;
using velkor::testing::MockConfiguration;
using velkor::testing::textOf;

template <class T>
Future<T> failed(const std::string& text) {
    return makeFailedFuture<T>(std::make_exception_ptr(std::runtime_error(text)));
}

template <class Reply>
std::unique_ptr<Reply> as(std::unique_ptr<Message> message) {
    const Message& object = *message;
    if (typeid(object) != typeid(Reply)) throw std::bad_cast();
    return std::unique_ptr<Reply>(static_cast<Reply*>(message.release()));
}

template <class M>
std::unique_ptr<Message> message(M content) {
    return std::make_unique<M>(std::move(content));
}

std::string thrownBy(Future<std::unique_ptr<Message>> reply) {
    try {
        reply.get();
    } catch (const std::exception& error) {
        return error.what();
    }
    return "nothing thrown";
}

class ServiceOverAMock : public ::testing::Test {
protected:
    ServiceOverAMock() { provider->setRunning(true); }

    Future<std::unique_ptr<Message>> deliver(std::unique_ptr<Message> request) {
        return provider->deliver(std::move(request), Address{"sender"},
                                 std::make_shared<Context>());
    }

    std::shared_ptr<StrictMock<MockConfiguration>> store =
        std::make_shared<StrictMock<MockConfiguration>>();
    std::shared_ptr<ConfigurationServiceProviderImpl> provider =
        std::make_shared<ConfigurationServiceProviderImpl>(store);
};

// ---- Get

TEST_F(ServiceOverAMock, GetRepliesWithTheOptionOfTheStore) {
    EXPECT_CALL(*store, has("k")).WillOnce(Return(ByMove(makeReadyFuture(true))));
    EXPECT_CALL(*store, getOption("k"))
        .WillOnce(Return(ByMove(makeReadyFuture(Option("k", "override", 5)))));
    const auto reply =
        as<ConfigurationOptionResponse>(deliver(message(ConfigurationGet("k"))).get());
    ASSERT_NE(reply->option, nullptr);
    EXPECT_EQ(reply->option->key, "k");
    EXPECT_EQ(reply->option->source, "override");
    EXPECT_EQ(textOf(reply->option->value), "int 5");
}

TEST_F(ServiceOverAMock, GetOfAnUnknownKeyNeverAsksForTheOption) {
    EXPECT_CALL(*store, has("k")).WillOnce(Return(ByMove(makeReadyFuture(false))));
    EXPECT_CALL(*store, getOption(_)).Times(0);
    const auto reply =
        as<ConfigurationOptionResponse>(deliver(message(ConfigurationGet("k"))).get());
    EXPECT_EQ(reply->option, nullptr);
}

TEST_F(ServiceOverAMock, GetThrowsWhatHasFailsWith) {
    EXPECT_CALL(*store, has("k")).WillOnce(Return(ByMove(failed<bool>("broken"))));
    EXPECT_THROW(deliver(message(ConfigurationGet("k"))), std::runtime_error);
}

TEST_F(ServiceOverAMock, GetThrowsWhatGetOptionFailsWith) {
    EXPECT_CALL(*store, has("k")).WillOnce(Return(ByMove(makeReadyFuture(true))));
    EXPECT_CALL(*store, getOption("k")).WillOnce(Return(ByMove(failed<Option>("gone"))));
    EXPECT_THROW(deliver(message(ConfigurationGet("k"))), std::runtime_error);
}

TEST_F(ServiceOverAMock, GetThrowsTheErrorOfAnInvalidFuture) {
    EXPECT_CALL(*store, has("k")).WillOnce(Return(ByMove(Future<bool>())));
    try {
        deliver(message(ConfigurationGet("k")));
        FAIL() << "no exception";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "Future state isn't valid!");
    }
}

TEST_F(ServiceOverAMock, GetThrowsTheErrorOfACancelledFuture) {
    Promise<bool> promise;
    Future<bool> future = promise.getFuture();
    future.cancel();
    EXPECT_CALL(*store, has("k")).WillOnce(Return(ByMove(std::move(future))));
    try {
        deliver(message(ConfigurationGet("k")));
        FAIL() << "no exception";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "Future has been cancelled.");
    }
}

TEST_F(ServiceOverAMock, GetThrowsTheErrorOfAFutureThatGaveItsValueAlready) {
    Future<bool> spent = makeReadyFuture(true);
    spent.get();
    EXPECT_CALL(*store, has("k")).WillOnce(Return(ByMove(std::move(spent))));
    try {
        deliver(message(ConfigurationGet("k")));
        FAIL() << "no exception";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(),
                     "Future already returned it's value or has an associated continuation.");
    }
}

TEST_F(ServiceOverAMock, GetWaitsForTheStore) {
    Promise<bool> promise;
    EXPECT_CALL(*store, has("k")).WillOnce(Return(ByMove(promise.getFuture())));
    std::atomic<bool> resolved{false};
    std::thread producer([&] {
        resolved = true;
        promise.setValue(false);
    });
    const auto reply = deliver(message(ConfigurationGet("k"))).get();
    EXPECT_TRUE(resolved);
    producer.join();
}

// ---- Set

TEST_F(ServiceOverAMock, SetWithoutSourceUsesTheTwoArgumentForm) {
    EXPECT_CALL(*store, set("k", ConfigurationValue(5)))
        .WillOnce(Return(ByMove(makeReadyFuture(ConfigurationValue(5)))));
    const auto reply =
        as<ConfigurationOptionResponse>(deliver(message(ConfigurationSet("k", 5, ""))).get());
    EXPECT_EQ(reply->option->key, "k");
    EXPECT_EQ(reply->option->source, "");
}

TEST_F(ServiceOverAMock, SetWithSourceUsesTheThreeArgumentForm) {
    EXPECT_CALL(*store, set("k", ConfigurationValue(5), "x"))
        .WillOnce(Return(ByMove(makeReadyFuture(ConfigurationValue(5)))));
    const auto reply =
        as<ConfigurationOptionResponse>(deliver(message(ConfigurationSet("k", 5, "x"))).get());
    EXPECT_EQ(reply->option->key, "k");
    EXPECT_EQ(reply->option->source, "x");
}

TEST_F(ServiceOverAMock, SetRepliesWithTheValueOfTheStoreNotTheOneSent) {
    EXPECT_CALL(*store, set("k", ConfigurationValue(5)))
        .WillOnce(Return(ByMove(makeReadyFuture(ConfigurationValue(std::string("old"))))));
    const auto reply =
        as<ConfigurationOptionResponse>(deliver(message(ConfigurationSet("k", 5, ""))).get());
    EXPECT_EQ(textOf(reply->option->value), "string old");
}

TEST_F(ServiceOverAMock, SetCarriesEveryKindOfValueBothWaysUnchanged) {
    const std::vector<ConfigurationValue> values{
        true,
        -1,
        1U,
        0.5,
        std::u16string(1, char16_t(0xd800)),
        std::string("\xff\0", 2),
        std::vector<bool>{true, false},
        std::vector<int>{-1},
        std::vector<unsigned int>{1},
        std::vector<double>{-0.5},
        std::vector<std::string>{"", "a"},
        std::vector<std::u16string>{u"", u"\u20ac"},
    };
    ASSERT_EQ(values.size(), typeTags.size());
    for (const ConfigurationValue& value : values) {
        EXPECT_CALL(*store, set("k", value))
            .WillOnce(Return(ByMove(makeReadyFuture(ConfigurationValue(value)))));
        const auto reply = as<ConfigurationOptionResponse>(
            deliver(message(ConfigurationSet("k", value, ""))).get());
        EXPECT_TRUE(reply->option->value == value) << textOf(value);
    }
}

TEST_F(ServiceOverAMock, SetWithSourceThrowsWhatTheStoreRefusesWith) {
    EXPECT_CALL(*store, set("k", _, "x"))
        .WillOnce(Return(ByMove(failed<ConfigurationValue>("refused"))));
    EXPECT_THROW(deliver(message(ConfigurationSet("k", 5, "x"))), std::runtime_error);
}

TEST_F(ServiceOverAMock, SetLeavesTheRequestItsValue) {
    EXPECT_CALL(*store, set("k", _))
        .WillOnce(Return(ByMove(makeReadyFuture(ConfigurationValue()))));
    auto request = std::make_unique<ConfigurationSet>("k", std::string("text"), "");
    provider->handle(std::move(request), Address(), nullptr);
    ASSERT_NE(request, nullptr);
    EXPECT_EQ(textOf(request->value), "string text");
}

TEST_F(ServiceOverAMock, SetThrowsWhatTheStoreRefusesWith) {
    EXPECT_CALL(*store, set("k", _))
        .WillOnce(Return(ByMove(failed<ConfigurationValue>("refused"))));
    EXPECT_THROW(deliver(message(ConfigurationSet("k", 5, ""))), std::runtime_error);
}

// ---- Keys

TEST_F(ServiceOverAMock, KeysRepliesWithTheKeysOfTheStore) {
    EXPECT_CALL(*store, keys())
        .WillOnce(Return(ByMove(makeReadyFuture(std::set<std::string>{"a", "b"}))));
    const auto reply = as<ConfigurationKeysResponse>(deliver(message(ConfigurationKeys())).get());
    EXPECT_EQ(reply->keys, (std::set<std::string>{"a", "b"}));
}

TEST_F(ServiceOverAMock, KeysOfAnEmptyStoreAreNone) {
    EXPECT_CALL(*store, keys()).WillOnce(Return(ByMove(makeReadyFuture(std::set<std::string>()))));
    EXPECT_TRUE(
        as<ConfigurationKeysResponse>(deliver(message(ConfigurationKeys())).get())->keys.empty());
}

TEST_F(ServiceOverAMock, KeysThrowsWhatTheStoreFailsWith) {
    EXPECT_CALL(*store, keys()).WillOnce(Return(ByMove(failed<std::set<std::string>>("broken"))));
    EXPECT_THROW(deliver(message(ConfigurationKeys())), std::runtime_error);
}

// ---- Add property file source

TEST_F(ServiceOverAMock, AddPropertyFileSourcePassesItsFieldsOn) {
    EXPECT_CALL(*store, addPropertyFileSource("n", "g", -2, true, std::u16string(u"p")))
        .WillOnce(Return(ByMove(makeReadyFuture(true))));
    deliver(message(AddPropertyFileSource("n", "g", -2, true, u"p"))).get();
}

TEST_F(ServiceOverAMock, AddPropertyFileSourceRepliesWithAPlainMessageWhateverTheStoreGives) {
    for (const bool added : {true, false}) {
        EXPECT_CALL(*store, addPropertyFileSource(_, _, _, _, _))
            .WillOnce(Return(ByMove(makeReadyFuture(bool(added)))));
        const auto reply = deliver(message(AddPropertyFileSource())).get();
        const Message& object = *reply;
        EXPECT_EQ(typeid(object), typeid(Message));
    }
}

TEST_F(ServiceOverAMock, AddPropertyFileSourceThrowsWhatTheStoreFailsWith) {
    EXPECT_CALL(*store, addPropertyFileSource(_, _, _, _, _))
        .WillOnce(Return(ByMove(failed<bool>("taken"))));
    EXPECT_THROW(deliver(message(AddPropertyFileSource())), std::runtime_error);
}

TEST_F(ServiceOverAMock, AddPropertyFileSourceThrowsWhatTheStoreThrows) {
    EXPECT_CALL(*store, addPropertyFileSource(_, _, _, _, _))
        .WillOnce(::testing::Throw(std::out_of_range("file")));
    EXPECT_THROW(deliver(message(AddPropertyFileSource())), std::out_of_range);
}

// ---- Routing: the strict mock fails these tests when the store is touched

TEST_F(ServiceOverAMock, NotRunningFailsTheFutureAndLeavesTheMessage) {
    provider->setRunning(false);
    std::unique_ptr<Message> request = message(ConfigurationGet("k"));
    Message* const owned = request.get();
    EXPECT_EQ(thrownBy(provider->deliver(std::move(request), Address(), nullptr)),
              "Service exists but is not running.");
    EXPECT_EQ(request.get(), owned);
}

TEST_F(ServiceOverAMock, NotRunningIsNoticedBeforeAMissingMessage) {
    provider->setRunning(false);
    EXPECT_EQ(thrownBy(deliver(nullptr)), "Service exists but is not running.");
}

TEST_F(ServiceOverAMock, NewProviderIsNotRunning) {
    const auto fresh = std::make_shared<ConfigurationServiceProviderImpl>(store);
    EXPECT_EQ(thrownBy(fresh->deliver(message(ConfigurationKeys()), Address(), nullptr)),
              "Service exists but is not running.");
}

TEST_F(ServiceOverAMock, ResponseIsTheWrongMessage) {
    EXPECT_EQ(thrownBy(deliver(message(ConfigurationKeysResponse()))),
              std::string("Incorrect message type. Expected: ") +
                  typeid(ServiceMessage<ConfigurationServiceProvider>).name() + " but found " +
                  typeid(ConfigurationKeysResponse).name());
}

TEST_F(ServiceOverAMock, StartAndStopDoNothing) {
    provider->onStart();
    provider->onStop();
    EXPECT_TRUE(provider->isRunning());
}

TEST_F(ServiceOverAMock, ReleasesTheStoreWithItself) {
    const std::weak_ptr<MockConfiguration> observer = store;
    store.reset();
    EXPECT_FALSE(observer.expired());
    provider.reset();
    EXPECT_TRUE(observer.expired());
}

// ---- Over a real store

class ServiceOverAStore : public ::testing::Test {
protected:
    ServiceOverAStore() { provider->setRunning(true); }

    Future<std::unique_ptr<Message>> deliver(std::unique_ptr<Message> request) {
        return provider->deliver(std::move(request), Address(), nullptr);
    }

    std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    std::shared_ptr<ConfigurationServiceProviderImpl> provider =
        std::make_shared<ConfigurationServiceProviderImpl>(store);
};

TEST_F(ServiceOverAStore, SecondSetRepliesWithTheReplacedValue) {
    deliver(message(ConfigurationSet("k", 1, ""))).get();
    const auto reply =
        as<ConfigurationOptionResponse>(deliver(message(ConfigurationSet("k", 2, ""))).get());
    EXPECT_EQ(textOf(reply->option->value), "int 1");
}

TEST_F(ServiceOverAStore, GetAfterSetNamesTheSource) {
    deliver(message(ConfigurationSet("k", 1, "default"))).get();
    const auto reply =
        as<ConfigurationOptionResponse>(deliver(message(ConfigurationGet("k"))).get());
    EXPECT_EQ(reply->option->source, "default");
}

TEST_F(ServiceOverAStore, RefusedSetThrowsTheErrorOfTheStore) {
    try {
        deliver(message(ConfigurationSet("k", 1, "nowhere")));
        FAIL() << "no exception";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "Source not found or not writable: k, nowhere");
    }
}

TEST_F(ServiceOverAStore, SetWithoutWritableSourceThrows) {
    store->removeSource("override");
    store->removeSource("default");
    try {
        deliver(message(ConfigurationSet("k", 1, "")));
        FAIL() << "no exception";
    } catch (const std::runtime_error& error) {
        EXPECT_STREQ(error.what(), "No writable configuration source for key: k");
    }
}

TEST_F(ServiceOverAStore, AnswersSeveralThreadsWhileItIsSwitchedOnAndOff) {
    std::vector<std::thread> clients;
    std::atomic<int> unexpected{0};
    for (int client = 0; client < 3; ++client) {
        clients.emplace_back([&, client] {
            for (int i = 0; i < 200; ++i) {
                const std::string error =
                    thrownBy(deliver(message(ConfigurationSet(std::to_string(client), i, ""))));
                const bool expected =
                    error == "nothing thrown" || error == "Service exists but is not running.";
                if (!expected) ++unexpected;
            }
        });
    }
    for (int i = 0; i < 200; ++i) provider->setRunning(i % 2 == 0);
    for (auto& client : clients) client.join();
    EXPECT_EQ(unexpected, 0);
}

}  // namespace
}  // namespace velkor::configuration
