// The ways to a store by commands and by messages, and the log that they and the store write.

#include <algorithm>
#include <string>
#include <vector>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationServiceProviderImpl.hpp"
#include "configuration/service/MessageTypes.hpp"
#include "framework/common/DiagnosticLogger.hpp"
#include "tests/failing/StoreScene.hpp"
#include "tests/support/LogCapture.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationCommandProvider;
using configuration::ConfigurationImpl;
using configuration::ConfigurationServiceProviderImpl;
using configuration::ConfigurationValue;

// ---- Commands

/// A registry that may refuse a command, and forgets one whatever happens.
class ForeignAdministration final : public administration::Administration {
public:
    Future<bool> registerCommand(administration::CommandDescriptor command) override {
        foreignCall();
        auto answer = makeReadyFuture(true);
        commands.push_back(std::move(command));
        return answer;
    }

    Future<bool> unregisterCommand(const std::string& name) override {
        commands.erase(std::remove_if(commands.begin(), commands.end(),
                                      [&](const auto& each) { return each.name == name; }),
                       commands.end());
        return {};
    }

    std::string run(const std::string& verb, std::vector<std::string> arguments) const {
        for (const auto& each : commands) {
            if (each.name == "velkor.configuration." + verb) {
                return each.handler(std::move(arguments));
            }
        }
        return "no such command";
    }

    std::vector<administration::CommandDescriptor> commands;
};

struct CommandScene : StoreScene {
    std::shared_ptr<ForeignAdministration> registry = std::make_shared<ForeignAdministration>();
};

void offerCommands(Trial& trial) {
    CommandScene scene;
    std::unique_ptr<ConfigurationCommandProvider> provider;
    const auto offer = [&] {
        provider = std::make_unique<ConfigurationCommandProvider>(scene.store, scene.registry);
    };
    if (!trial.passes(offer)) {
        EXPECT_TRUE(scene.registry->commands.empty());
        offer();
    }
    EXPECT_EQ(scene.registry->commands.size(), 3U);
    provider.reset();
    scene.expectAlive();
}

void withdrawCommands(Trial& trial) {
    CommandScene scene;
    auto provider = std::make_unique<ConfigurationCommandProvider>(scene.store, scene.registry);
    EXPECT_TRUE(trial.passes([&] { provider.reset(); }));
    EXPECT_TRUE(scene.registry->commands.empty());
    scene.expectAlive();
}

/// Runs a command whose arguments are ready; its answer is whole.
void tryCommand(Trial& trial, const std::string& verb, const std::vector<std::string>& arguments,
                const std::string& answer) {
    CommandScene scene;
    const ConfigurationCommandProvider provider(scene.store, scene.registry);
    std::string said;
    if (trial.passes([&] { said = scene.registry->run(verb, arguments); })) {
        EXPECT_EQ(said, answer);
    }
    scene.expectAlive();
}

void getByCommand(Trial& trial) {
    tryCommand(trial, "get", {longText("near")}, "'" + longText("old") + "'");
}

void getMissingByCommand(Trial& trial) {
    tryCommand(trial, "get", {longText("missing")},
               "No configuration option with key: " + longText("missing"));
}

void listByCommand(Trial& trial) {
    tryCommand(trial, "list", {},
               "far." + longText("key") + " = '" + longText("old") + "'\n" + longText("near") +
                   " = '" + longText("old") + "'\n");
}

// A number that could not be stored becomes a text, whatever kept it from being stored.
void setByCommand(Trial& trial) {
    CommandScene scene;
    const ConfigurationCommandProvider provider(scene.store, scene.registry);
    const std::vector<std::string> arguments{scene.near, "5"};
    const bool passed = trial.passes([&] { scene.registry->run("set", arguments); });
    const std::string now = scene.textIn(scene.near);
    const bool isStored = now == "int 5" || now == "string 5";
    EXPECT_TRUE(isStored || (!passed && now == textOf(scene.oldValue))) << now;
    scene.expectAlive();
}

constexpr Row commands[] = {
    {"OfferCommands", offerCommands},
    {"WithdrawCommands", withdrawCommands},
    {"Get", getByCommand},
    {"GetMissing", getMissingByCommand},
    {"List", listByCommand},
    {"Set", setByCommand},
};
VELKOR_FAILING_ROWS(FailingCommands, commands);

// ---- Messages

struct ServiceScene : StoreScene {
    ServiceScene() { provider->setRunning(true); }

    template <class Request, class... Content>
    static std::unique_ptr<Message> request(Content&&... content) {
        return std::make_unique<Request>(std::forward<Content>(content)...);
    }

    std::shared_ptr<ConfigurationServiceProviderImpl> provider =
        std::make_shared<ConfigurationServiceProviderImpl>(store);
};

/// Delivers `request`; expects what `isRight` says of the reply.
template <class IsRight>
void tryDelivery(Trial& trial, ServiceScene& scene, std::unique_ptr<Message> request,
                 IsRight isRight) {
    bool answered = false;
    if (trial.passes([&] {
            auto reply = scene.provider->deliver(std::move(request), Address(), nullptr);
            answered = isRight(reply);
        })) {
        EXPECT_TRUE(answered);
    }
    scene.expectAlive();
}

void deliverGet(Trial& trial) {
    ServiceScene scene;
    tryDelivery(trial, scene, scene.request<configuration::ConfigurationGet>(scene.far),
                [](auto& reply) { return reply.get() != nullptr; });
}

void deliverSet(Trial& trial) {
    ServiceScene scene;
    tryDelivery(
        trial, scene,
        scene.request<configuration::ConfigurationSet>(scene.far, scene.newValue, "foreign"),
        [](auto& reply) { return reply.get() != nullptr; });
}

void deliverKeys(Trial& trial) {
    ServiceScene scene;
    tryDelivery(trial, scene, scene.request<configuration::ConfigurationKeys>(),
                [](auto& reply) { return reply.get() != nullptr; });
}

void deliverToAStoppedService(Trial& trial) {
    ServiceScene scene;
    scene.provider->setRunning(false);
    tryDelivery(trial, scene, scene.request<configuration::ConfigurationKeys>(), [](auto& reply) {
        try {
            reply.get();
        } catch (const std::runtime_error&) {
            return true;
        }
        return false;
    });
}

void deliverWhatIsNoRequest(Trial& trial) {
    ServiceScene scene;
    tryDelivery(trial, scene, scene.request<Message>(), [](auto& reply) {
        try {
            reply.get();
        } catch (const std::invalid_argument&) {
            return true;
        }
        return false;
    });
}

/// A registry of message types that may refuse one.
class ForeignSerializer final : public json::JsonSerializer {
public:
    void registerMessage(const std::string& name, const std::type_info& /*type*/,
                         Serialise /*serialise*/, Deserialise /*deserialise*/) override {
        foreignCall();
        names.push_back(name);
    }
    void unregisterMessage(const std::type_info& /*type*/) override { names.pop_back(); }

    std::vector<std::string> names;
};

void registerMessages(Trial& trial) {
    const auto registry = std::make_shared<ForeignSerializer>();
    std::unique_ptr<configuration::ConfigurationJsonSerialization> serialization;
    const auto offer = [&] {
        serialization = std::make_unique<configuration::ConfigurationJsonSerialization>(registry);
    };
    if (!trial.passes(offer)) {
        EXPECT_TRUE(registry->names.empty());
        offer();
    }
    EXPECT_EQ(registry->names.size(), 6U);
}

constexpr Row deliveries[] = {
    {"Get", deliverGet},
    {"Set", deliverSet},
    {"Keys", deliverKeys},
    {"NotRunning", deliverToAStoppedService},
    {"NoRequest", deliverWhatIsNoRequest},
    {"RegisterMessages", registerMessages},
};
VELKOR_FAILING_ROWS(FailingDeliveries, deliveries);

// ---- The log

constexpr const char* channel = "velkor::failing";

void makeALogger(Trial& trial) {
    const std::string name = longText(channel);
    trial.passes([&] { const common::DiagnosticLogger logger(name); });
    EXPECT_TRUE(common::DiagnosticLogger(name).isEnabled(common::error));
}

void enableAChannel(Trial& trial) {
    const std::string name = longText(channel);
    common::DiagnosticLogger::enable(name, everySeverity);
    const bool passed = trial.passes([&] { common::DiagnosticLogger::enable(name, 0); });
    EXPECT_EQ(common::DiagnosticLogger(name).isEnabled(common::error), !passed);
    common::DiagnosticLogger::enable(name, everySeverity);
}

// A record arrives whole or not at all.
void writeARecord(Trial& trial) {
    static const common::DiagnosticLogger logger(channel);
    const std::string text = longText("text");
    LogCapture log(channel);
    logger.write(common::error, "before");
    log.whenRecorded([](const LogRecord&) { foreignCall(); });
    const bool passed = trial.passes([&] { logger.write(common::error, text, 5); });
    log.whenRecorded(nullptr);
    logger.write(common::error, "after");
    const auto messages = log.messages();
    EXPECT_EQ(messages.front(), "before");
    EXPECT_EQ(messages.back(), "after");
    if (passed || messages.size() == 3) {
        EXPECT_EQ(messages.at(1), text + "5");
    }
}

/// An operation of a store whose log is written to.
template <class Operation>
void tryLogged(Trial& trial, Operation operation) {
    StoreScene scene;
    {
        LogCapture log("velkor::configuration");
        scene.store->set(scene.near, scene.oldValue);
        log.whenRecorded([](const LogRecord&) { foreignCall(); });
        trial.passes([&] { operation(scene); });
        log.whenRecorded(nullptr);
    }
    scene.store->removeSource("added");
    scene.expectAlive();
}

void readLogged(Trial& trial) {
    tryLogged(trial, [](auto& scene) { scene.store->get(scene.near).get(); });
}

void writeLogged(Trial& trial) {
    tryLogged(trial, [](auto& scene) { scene.store->set(scene.near, scene.newValue).get(); });
}

void applyLogged(Trial& trial) {
    tryLogged(trial, [](auto& scene) {
        scene.store->apply({{scene.near, scene.newValue}, {scene.far, scene.newValue, "foreign"}});
    });
}

void addLogged(Trial& trial) {
    tryLogged(trial, [](auto& scene) {
        scene.store->addInMemorySource("added", "", -1, true, {{scene.near, scene.newValue}});
        scene.store->removeSource("added");
    });
}

void watchLogged(Trial& trial) {
    tryLogged(trial, [](auto& scene) {
        scene.store->watchOption(scene.near);
        scene.store->watchChanges(scene.near);
    });
}

constexpr Row logging[] = {
    {"MakeALogger", makeALogger}, {"Enable", enableAChannel},   {"Write", writeARecord},
    {"ReadLogged", readLogged},   {"WriteLogged", writeLogged}, {"ApplyLogged", applyLogged},
    {"AddLogged", addLogged},     {"WatchLogged", watchLogged},
};
VELKOR_FAILING_ROWS(FailingLog, logging);

}  // namespace
}  // namespace velkor::testing
