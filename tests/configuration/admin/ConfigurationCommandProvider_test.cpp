#include "configuration/admin/ConfigurationCommandProvider.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstddef>
#include <functional>
#include <memory>
#include <new>
#include <set>
#include <stdexcept>
#include <string>
#include <thread>
#include <tuple>
#include <type_traits>
#include <vector>

#include "tests/configuration/admin/CommandTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/HookedSource.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using testing::RecordingAdministration;
using ::testing::StrEq;
using testing::textOf;
using ::testing::ThrowsMessage;

static_assert(std::is_base_of_v<administration::CommandProvider, ConfigurationCommandProvider>);
static_assert(!std::is_copy_constructible_v<ConfigurationCommandProvider>);

using CommandRegistration = testing::CommandTest;

TEST_F(CommandRegistration, RegistersSetGetAndListInThisOrder) {
    EXPECT_THAT(registry->events, ElementsAre("register velkor.configuration.set",
                                              "register velkor.configuration.get",
                                              "register velkor.configuration.list"));
}

TEST_F(CommandRegistration, WithdrawsThemInTheSameOrder) {
    registry->events.clear();
    provider.reset();
    EXPECT_THAT(registry->events, ElementsAre("unregister velkor.configuration.set",
                                              "unregister velkor.configuration.get",
                                              "unregister velkor.configuration.list"));
}

TEST_F(CommandRegistration, DescribesSet) {
    const auto& command = registry->command("velkor.configuration.set");
    EXPECT_EQ(command.description, "Set a configuration value.");
    EXPECT_EQ(command.minimumArguments, 2);
    EXPECT_EQ(command.maximumArguments, 2);
}

TEST_F(CommandRegistration, DescribesGet) {
    const auto& command = registry->command("velkor.configuration.get");
    EXPECT_EQ(command.description, "Get a specific configuration value.");
    EXPECT_EQ(command.minimumArguments, 1);
    EXPECT_EQ(command.maximumArguments, 1);
}

TEST_F(CommandRegistration, DescribesList) {
    const auto& command = registry->command("velkor.configuration.list");
    EXPECT_EQ(command.description, "List all configuration options.");
    EXPECT_EQ(command.minimumArguments, 0);
    EXPECT_EQ(command.maximumArguments, 0xFF);
}

TEST_F(CommandRegistration, HandlersShareTheStore) {
    const long handlers = static_cast<long>(registry->commands.size());
    EXPECT_EQ(store.use_count(), 2 + handlers) << "the test, the provider and the handlers";
}

TEST_F(CommandRegistration, ProviderReleasesTheRegistryAndTheStore) {
    provider.reset();
    EXPECT_EQ(registry.use_count(), 1);
    registry->commands.clear();
    EXPECT_EQ(store.use_count(), 1);
}

// Notes in which order the provider lets go of what it was given.
template <class Base>
class Noted : public Base {
public:
    Noted(std::vector<std::string>& log, std::string name) : noted(log), ownName(std::move(name)) {}
    ~Noted() override { noted.push_back(ownName); }

private:
    std::vector<std::string>& noted;
    std::string ownName;
};

TEST_F(CommandRegistration, ReleasesTheRegistryFirst) {
    std::vector<std::string> events;
    {
        const ConfigurationCommandProvider local(
            std::make_shared<Noted<ConfigurationImpl>>(events, "store"),
            std::make_shared<Noted<RecordingAdministration>>(events, "registry"));
    }
    EXPECT_THAT(events, ElementsAre("registry", "store"));
}

TEST_F(CommandRegistration, HandlerOutlivesTheProvider) {
    store->set("a", 1);
    const auto handler = registry->command("velkor.configuration.get").handler;
    provider.reset();
    registry.reset();
    EXPECT_EQ(handler({"a"}), "1");
}

TEST_F(CommandRegistration, HandlerKeepsTheStoreAlive) {
    store->set("a", 1);
    const auto handler = registry->command("velkor.configuration.get").handler;
    provider.reset();
    registry.reset();
    const std::weak_ptr<ConfigurationImpl> alive = store;
    store.reset();
    EXPECT_FALSE(alive.expired());
    EXPECT_EQ(handler({"a"}), "1");
}

TEST_F(CommandRegistration, ProviderMayBeDestroyedWhileAHandlerRuns) {
    const auto source = std::make_shared<testing::HookedSource>(
        testing::HookedSource::Table{{"a", ConfigurationValue(1)}});
    store->addSource("extra", "", 5, false, source);
    source->whenHas = [this] { provider.reset(); };
    EXPECT_EQ(run("get", {"a"}), "1");
    EXPECT_EQ(provider, nullptr);
    EXPECT_EQ(registry->events.size(), 2 * registry->commands.size());
}

// A registry whose answers never come, or fail.
class SilentAdministration : public RecordingAdministration {
public:
    Future<bool> registerCommand(administration::CommandDescriptor) override {
        ++calls;
        return pending.emplace_back().getFuture();
    }
    Future<bool> unregisterCommand(const std::string&) override {
        ++calls;
        return makeFailedFuture<bool>(std::make_exception_ptr(std::runtime_error("refused")));
    }

    std::size_t calls = 0;
    std::vector<Promise<bool>> pending;
};

TEST_F(CommandRegistration, AnswersOfTheRegistryAreNotWaitedFor) {
    const auto silent = std::make_shared<SilentAdministration>();
    EXPECT_TRUE(testing::completes(
        [this, silent] { const ConfigurationCommandProvider local(store, silent); }));
    EXPECT_EQ(silent->calls, 2 * registry->commands.size());
}

using GetCommand = testing::CommandTest;

TEST_F(GetCommand, AbsentKeyIsAnAnswerWithoutALineBreak) {
    EXPECT_EQ(run("get", {"missing"}), "No configuration option with key: missing");
}

TEST_F(GetCommand, AbsentEmptyKeyIsAnAnswer) {
    EXPECT_EQ(run("get", {""}), "No configuration option with key: ");
}

TEST_F(GetCommand, ShowsTheValueAlone) {
    store->set("a", 42);
    EXPECT_EQ(run("get", {"a"}), "42");
}

TEST_F(GetCommand, ShowsTheEffectiveValue) {
    store->set("a", 1, "default");
    store->set("a", 2);
    EXPECT_EQ(run("get", {"a"}), "2");
}

TEST_F(GetCommand, IgnoresFurtherArguments) {
    store->set("a", 42);
    EXPECT_EQ(run("get", {"a", "b"}), "42");
}

TEST_F(GetCommand, WithoutArgumentsThrowsOutOfRange) {
    EXPECT_THROW(run("get"), std::out_of_range);
}

using ListCommand = testing::CommandTest;

TEST_F(ListCommand, OfAnEmptyStoreIsEmpty) {
    EXPECT_EQ(run("list"), "");
}

TEST_F(ListCommand, ShowsALineForEachKeyInByteOrder) {
    store->set("b", 2);
    store->set("a", true);
    EXPECT_EQ(run("list"), "a = true\nb = 2\n");
}

TEST_F(ListCommand, ShowsKeysWithTheirGroups) {
    store->addInMemorySource("net", "net", 5, false, {{"port", 80}});
    store->set("B", std::string("x"));
    store->set("", 0);
    EXPECT_EQ(run("list"), " = 0\nB = 'x'\nnet.port = 80\n");
}

TEST_F(ListCommand, IgnoresItsArguments) {
    store->set("a", 1);
    EXPECT_EQ(run("list", {"b", "c"}), "a = 1\n");
}

TEST_F(ListCommand, ShowsKeysAndValuesAsTheyAre) {
    store->set("a\nb", std::string("it's\n\x1B[0m"));
    EXPECT_EQ(run("list"), "a\nb = 'it's\n\x1B[0m'\n");
}

using SetCommand = testing::CommandTest;

TEST_F(SetCommand, AnswersNothing) {
    EXPECT_EQ(run("set", {"a", "1"}), "");
    EXPECT_EQ(run("set", {"a", "true"}), "");
    EXPECT_EQ(run("set", {"a", "text"}), "");
}

TEST_F(SetCommand, WritesIntoTheFirstWritableSource) {
    run("set", {"a", "1"});
    EXPECT_EQ(store->getOption("a").get().source, "override");
}

TEST_F(SetCommand, RefusedWriteIsNotReported) {
    store->removeSource("override");
    store->removeSource("default");
    EXPECT_EQ(run("set", {"a", "1"}), "");
    EXPECT_EQ(run("set", {"a", "true"}), "");
    EXPECT_EQ(run("set", {"a", "text"}), "");
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(SetCommand, WithTooFewArgumentsThrowsOutOfRange) {
    EXPECT_THROW(run("set"), std::out_of_range);
    EXPECT_THROW(run("set", {"a"}), std::out_of_range);
    EXPECT_FALSE(store->has("a").get());
}

TEST_F(SetCommand, IgnoresFurtherArguments) {
    run("set", {"a", "1", "2"});
    EXPECT_EQ(textOf(store->get("a").get()), "int 1");
}

TEST_F(SetCommand, HandlersRunConcurrently) {
    testing::Latch start(3);
    std::vector<std::thread> threads;
    for (int number = 0; number < 3; ++number) {
        threads.emplace_back([&, number] {
            EXPECT_TRUE(start.arriveAndWait());
            for (int round = 0; round < 200; ++round) {
                run("set", {"key" + std::to_string(number), "0.5"});
                EXPECT_EQ(run("get", {"key" + std::to_string(number)}), "0.5");
                run("list");
            }
        });
    }
    for (auto& thread : threads) thread.join();
    EXPECT_EQ(run("list"), "key0 = 0.5\nkey1 = 0.5\nkey2 = 0.5\n");
}

// A store that answers as the test says; whatever else is asked fails the test.
class ScriptedConfiguration : public Configuration {
public:
    std::function<Future<ConfigurationValue>(const std::string&)> whenGet;
    std::function<Future<ConfigurationValue>(const ConfigurationValue&)> whenSet;
    std::function<Future<bool>(const std::string&)> whenHas;
    std::function<Future<std::set<std::string>>()> whenKeys;
    std::vector<std::string> calls;

    Future<ConfigurationValue> get(const std::string& key) override {
        calls.push_back("get " + key);
        return whenGet(key);
    }
    Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value) override {
        calls.push_back("set " + key + " " + textOf(value));
        return whenSet(value);
    }
    Future<bool> has(const std::string& key) override {
        calls.push_back("has " + key);
        return whenHas(key);
    }
    Future<std::set<std::string>> keys() override {
        calls.emplace_back("keys");
        return whenKeys();
    }
    Future<Option> getOption(const std::string&) override { throw unexpected(); }
    Future<ConfigurationValue> set(const std::string&, ConfigurationValue,
                                   const std::string&) override {
        throw unexpected();
    }
    std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> watchOption(
        const std::string&) override {
        throw unexpected();
    }
    Future<bool> addPropertyFileSource(const std::string&, const std::string&, int, bool,
                                       const std::u16string&) override {
        throw unexpected();
    }
    Future<bool> addInMemorySource(const std::string&, const std::string&, int, bool,
                                   ValueMap&&) override {
        throw unexpected();
    }
    Future<bool> addEnvironmentSource(const std::string&, const std::string&, int) override {
        throw unexpected();
    }
    Future<bool> removeSource(const std::string&) override { throw unexpected(); }
    std::shared_ptr<Configuration> getPtr() override { throw unexpected(); }

private:
    static std::logic_error unexpected() { return std::logic_error("unexpected call"); }
};

template <class T>
Future<T> failed(const std::string& message) {
    return makeFailedFuture<T>(std::make_exception_ptr(std::runtime_error(message)));
}

class FailingStore : public ::testing::Test {
protected:
    std::string run(const std::string& verb, std::vector<std::string> arguments = {}) {
        return registry->command("velkor.configuration." + verb).handler(std::move(arguments));
    }

    auto throwsFrom(const std::string& verb, const std::vector<std::string>& arguments = {}) {
        return [this, verb, arguments] { run(verb, arguments); };
    }

    std::shared_ptr<ScriptedConfiguration> scripted = std::make_shared<ScriptedConfiguration>();
    std::shared_ptr<RecordingAdministration> registry = std::make_shared<RecordingAdministration>();
    ConfigurationCommandProvider provider{scripted, registry};
};

TEST_F(FailingStore, FailedHasLeavesGet) {
    scripted->whenHas = [](const std::string&) { return failed<bool>("no answer"); };
    EXPECT_THAT(throwsFrom("get", {"a"}), ThrowsMessage<std::runtime_error>(StrEq("no answer")));
    EXPECT_THAT(scripted->calls, ElementsAre("has a"));
}

TEST_F(FailingStore, FailedGetLeavesGet) {
    scripted->whenHas = [](const std::string&) { return makeReadyFuture(true); };
    scripted->whenGet = [](const std::string&) { return failed<ConfigurationValue>("gone"); };
    EXPECT_THAT(throwsFrom("get", {"a"}), ThrowsMessage<std::runtime_error>(StrEq("gone")));
    EXPECT_THAT(scripted->calls, ElementsAre("has a", "get a"));
}

TEST_F(FailingStore, AbsentKeyIsNotRead) {
    scripted->whenHas = [](const std::string&) { return makeReadyFuture(false); };
    EXPECT_EQ(run("get", {"a"}), "No configuration option with key: a");
    EXPECT_THAT(scripted->calls, ElementsAre("has a"));
}

TEST_F(FailingStore, InvalidFutureLeavesGetWithItsText) {
    scripted->whenHas = [](const std::string&) { return Future<bool>(); };
    EXPECT_THAT(throwsFrom("get", {"a"}),
                ThrowsMessage<std::runtime_error>(StrEq("Future state isn't valid!")));
}

TEST_F(FailingStore, AnswerThatComesLaterIsWaitedFor) {
    Promise<bool> promise;
    scripted->whenHas = [&](const std::string&) { return promise.getFuture(); };
    std::thread answering([&] { promise.setValue(false); });
    EXPECT_EQ(run("get", {"a"}), "No configuration option with key: a");
    answering.join();
}

TEST_F(FailingStore, FailedKeysLeaveList) {
    scripted->whenKeys = [] { return failed<std::set<std::string>>("no keys"); };
    EXPECT_THAT(throwsFrom("list"), ThrowsMessage<std::runtime_error>(StrEq("no keys")));
}

TEST_F(FailingStore, OneFailingKeyAbortsTheList) {
    scripted->whenKeys = [] { return makeReadyFuture(std::set<std::string>{"a", "b", "c"}); };
    scripted->whenGet = [](const std::string& key) {
        return key == "b" ? failed<ConfigurationValue>("gone")
                          : makeReadyFuture(ConfigurationValue(1));
    };
    EXPECT_THAT(throwsFrom("list"), ThrowsMessage<std::runtime_error>(StrEq("gone")));
    EXPECT_THAT(scripted->calls, ElementsAre("keys", "get a", "get b"));
}

TEST_F(FailingStore, ListAsksForEachKeyOnce) {
    scripted->whenKeys = [] { return makeReadyFuture(std::set<std::string>{"a", "b"}); };
    scripted->whenGet = [](const std::string&) { return makeReadyFuture(ConfigurationValue(1)); };
    EXPECT_EQ(run("list"), "a = 1\nb = 1\n");
    EXPECT_THAT(scripted->calls, ElementsAre("keys", "get a", "get b"));
}

TEST_F(FailingStore, FailedFutureOfSetIsDropped) {
    scripted->whenSet = [](const ConfigurationValue&) {
        return failed<ConfigurationValue>("refused");
    };
    EXPECT_EQ(run("set", {"a", "5"}), "");
    EXPECT_THAT(scripted->calls, ElementsAre("set a int 5"));
}

TEST_F(FailingStore, PendingFutureOfSetIsNotWaitedFor) {
    Promise<ConfigurationValue> promise;
    scripted->whenSet = [&](const ConfigurationValue&) { return promise.getFuture(); };
    EXPECT_EQ(run("set", {"a", "5"}), "");
}

TEST_F(FailingStore, ThrowForANumberStoresTheTextInstead) {
    scripted->whenSet = [](const ConfigurationValue& value) {
        if (value.which() != 5) throw std::logic_error("texts only");
        return makeReadyFuture(value);
    };
    EXPECT_EQ(run("set", {"a", "5"}), "");
    EXPECT_EQ(run("set", {"a", "0.5"}), "");
    EXPECT_THAT(scripted->calls, ElementsAre("set a int 5", "set a string 5", "set a double 0.5",
                                             "set a string 0.5"));
}

TEST_F(FailingStore, ForeignThrowForANumberStoresTheTextInstead) {
    scripted->whenSet = [](const ConfigurationValue& value) {
        if (value.which() != 5) throw 7;
        return makeReadyFuture(value);
    };
    EXPECT_EQ(run("set", {"a", "5"}), "");
    EXPECT_THAT(scripted->calls, ElementsAre("set a int 5", "set a string 5"));
}

TEST_F(FailingStore, LackOfMemoryForANumberStoresTheTextInstead) {
    scripted->whenSet = [](const ConfigurationValue& value) {
        if (value.which() != 5) throw std::bad_alloc();
        return makeReadyFuture(value);
    };
    EXPECT_EQ(run("set", {"a", "5"}), "");
    EXPECT_THAT(scripted->calls, ElementsAre("set a int 5", "set a string 5"));
}

TEST_F(FailingStore, ThrowForABoolLeavesSet) {
    scripted->whenSet = [](const ConfigurationValue&) -> Future<ConfigurationValue> {
        throw std::logic_error("no room");
    };
    EXPECT_THAT(throwsFrom("set", {"a", "true"}),
                ThrowsMessage<std::logic_error>(StrEq("no room")));
    EXPECT_THAT(throwsFrom("set", {"a", "false"}),
                ThrowsMessage<std::logic_error>(StrEq("no room")));
    EXPECT_THAT(scripted->calls, ElementsAre("set a bool true", "set a bool false"));
}

TEST_F(FailingStore, ThrowForATextLeavesSet) {
    scripted->whenSet = [](const ConfigurationValue&) -> Future<ConfigurationValue> {
        throw std::logic_error("no room");
    };
    EXPECT_THAT(throwsFrom("set", {"a", "text"}),
                ThrowsMessage<std::logic_error>(StrEq("no room")));
    EXPECT_THAT(scripted->calls, ElementsAre("set a string text"));
}

TEST_F(FailingStore, ThrowForTheTextOfANumberLeavesSet) {
    scripted->whenSet = [](const ConfigurationValue& value) -> Future<ConfigurationValue> {
        throw std::logic_error(textOf(value));
    };
    EXPECT_THAT(throwsFrom("set", {"a", "5"}), ThrowsMessage<std::logic_error>(StrEq("string 5")));
}

// Throws at one registration, counted from 0, before or after it took the command.
class ThrowingAdministration : public RecordingAdministration {
public:
    ThrowingAdministration(std::size_t throwingRegistration, bool takesBeforeItThrows)
        : failing(throwingRegistration), takes(takesBeforeItThrows) {}

    Future<bool> registerCommand(administration::CommandDescriptor command) override {
        const bool fails = commands.size() == failing;
        if (!fails || takes) registered.insert(command.name);
        auto accepted = RecordingAdministration::registerCommand(std::move(command));
        if (fails) throw std::length_error("full");
        return accepted;
    }

    Future<bool> unregisterCommand(const std::string& name) override {
        registered.erase(name);
        auto withdrawn = RecordingAdministration::unregisterCommand(name);
        if (throwsAtWithdrawals) throw std::logic_error("no");
        return withdrawn;
    }

    std::set<std::string> registered;
    bool throwsAtWithdrawals = false;

private:
    const std::size_t failing;
    const bool takes;
};

class ThrowingRegistry : public ::testing::TestWithParam<std::tuple<std::size_t, bool>> {
protected:
    void construct() const {
        ConfigurationCommandProvider(std::make_shared<ConfigurationImpl>(), registry);
    }

    const std::shared_ptr<ThrowingAdministration> registry =
        std::make_shared<ThrowingAdministration>(std::get<0>(GetParam()), std::get<1>(GetParam()));
};

TEST_P(ThrowingRegistry, KeepsNoCommand) {
    EXPECT_THAT([this] { construct(); }, ThrowsMessage<std::length_error>(StrEq("full")));
    EXPECT_THAT(registry->registered, IsEmpty());
}

TEST_P(ThrowingRegistry, IsAskedToWithdrawEachCommandAlsoWhenItThrowsThere) {
    registry->throwsAtWithdrawals = true;
    EXPECT_THAT([this] { construct(); }, ThrowsMessage<std::length_error>(StrEq("full")));
    EXPECT_THAT(registry->registered, IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(Registrations, ThrowingRegistry,
                         ::testing::Combine(::testing::Values(0U, 1U, 2U), ::testing::Bool()),
                         [](const auto& tested) {
                             return std::string(std::get<1>(tested.param) ? "After" : "Before") +
                                    std::to_string(std::get<0>(tested.param));
                         });

}  // namespace
}  // namespace velkor::configuration
