// Settings, whose sources, constraints, validators and callbacks throw, and which meet a want of
// memory: they are made or not, and follow their store from the next change on in any case.

#include <string>
#include <vector>

#include "settings/Bound.hpp"
#include "settings/Describe.hpp"
#include "settings/Secrets.hpp"
#include "settings/Setting.hpp"
#include "settings/testing/Override.hpp"
#include "tests/failing/StoreScene.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationValue;
using settings::Bound;
using settings::ChangeHandle;
using settings::Setting;
using settings::SettingError;

const std::string portKey = "far.port";
const std::string hostKey = "far.host";
constexpr int oldPort = 1;
constexpr int newPort = 2;

bool isRight(int /*port*/) {
    foreignCall();
    return true;
}

bool isRightHost(const std::string& /*host*/) {
    foreignCall();
    return true;
}

struct Server {
    int port = 0;
    std::string host{};
};

std::string check(const Server& /*server*/) {
    foreignCall();
    return "";
}

/// A store whose source holds what the settings below are of.
class SettingScene {
public:
    SettingScene() {
        // The first record makes what Boost.Log keeps for each thread.
        static const common::DiagnosticLogger log("velkor::settings");
        log.write(common::error, "begins");
        store->addSource("foreign", "far.", 1, false, source);
    }

    Setting<int> port() const { return {store, portKey, settings::matching("right", isRight)}; }
    Setting<std::string> host() const {
        return {store, hostKey, settings::matching("right", isRightHost)};
    }
    Bound<Server> server() const {
        return {store, "far", settings::fields(&Server::port, "port", &Server::host, "host"),
                check};
    }

    /// No lock is held.
    void expectFree() {
        store->has(portKey).get();
        onAnotherThread([this] { store->findSource("foreign").get(); });
    }

    ForeignStandardError standardError;
    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    std::shared_ptr<ForeignSource> source = std::make_shared<ForeignSource>(
        std::map<std::string, ConfigurationValue>{{"port", oldPort}, {"host", longText("old")}});
};

/// Runs `operation` and says whether it got through; a constraint that has thrown refuses.
template <class Operation>
bool isDone(Trial& trial, Operation operation) {
    bool isRefused = false;
    const bool passed = trial.passes([&] {
        try {
            operation();
        } catch (const SettingError&) {
            isRefused = true;
        }
    });
    EXPECT_TRUE(!isRefused || trial.hasStruck());
    return passed && !isRefused;
}

// ---- Making and ending

/// Makes what `make` makes of a scene, in trouble, and afterwards again.
template <class Make>
void tryMaking(Trial& trial, Make make) {
    SettingScene scene;
    isDone(trial, [&] { make(scene); });
    scene.expectFree();
    EXPECT_NO_THROW(make(scene));
}

void makeASmallSetting(Trial& trial) {
    tryMaking(trial, [](auto& scene) { EXPECT_EQ(scene.port().get(), oldPort); });
}

void makeATextSetting(Trial& trial) {
    tryMaking(trial, [](auto& scene) { EXPECT_EQ(scene.host().get(), longText("old")); });
}

void makeASettingOfNothing(Trial& trial) {
    tryMaking(trial, [](auto& scene) {
        const Setting<std::string> setting(scene.store, longText("nowhere"), longText("default"),
                                           settings::description(longText("described")));
        EXPECT_EQ(setting.get(), longText("default"));
    });
}

void makeAListSetting(Trial& trial) {
    tryMaking(trial, [](auto& scene) {
        const Setting<std::vector<std::string>> setting(scene.store, hostKey);
        EXPECT_EQ(setting.get(), std::vector<std::string>{longText("old")});
    });
}

void refuseASetting(Trial& trial) {
    SettingScene scene;
    bool isRefused = false;
    const bool passed = trial.passes([&] {
        try {
            const Setting<int> setting(scene.store, hostKey);
        } catch (const SettingError&) {
            isRefused = true;
        }
    });
    EXPECT_EQ(passed, isRefused);
    scene.expectFree();
}

void makeABound(Trial& trial) {
    tryMaking(trial, [](auto& scene) { EXPECT_EQ(scene.server().snapshot()->port, oldPort); });
}

void endASetting(Trial& trial) {
    SettingScene scene;
    auto setting = std::make_unique<Setting<std::string>>(scene.store, hostKey,
                                                          settings::matching("right", isRightHost));
    const ChangeHandle handle = setting->onChange([](const auto&, const auto&) { foreignCall(); });
    EXPECT_TRUE(trial.passes([&] { setting.reset(); }));
    scene.expectFree();
    EXPECT_TRUE(settings::describe(scene.store).empty());
}

void endAHandle(Trial& trial) {
    SettingScene scene;
    auto setting = scene.port();
    int calls = 0;
    ChangeHandle handle = setting.onChange([&](int, int) { ++calls; });
    EXPECT_TRUE(trial.passes([&] { handle = ChangeHandle(); }));
    scene.store->set(portKey, newPort, "foreign");
    EXPECT_EQ(calls, 0);
    EXPECT_EQ(setting.get(), newPort);
}

void outliveTheStore(Trial& trial) {
    SettingScene scene;
    const auto setting = scene.host();
    EXPECT_TRUE(trial.passes([&] { scene.store.reset(); }));
    EXPECT_EQ(setting.get(), longText("old"));
    EXPECT_TRUE(setting.status().storeGone);
}

// ---- Following

/// Settings of both kinds and a struct, each with a callback.
class FollowingScene : public SettingScene {
public:
    /// Whether all of them have what the store holds.
    bool agrees() const {
        const auto held = source->values;
        const auto& port = boost::get<int>(held.at("port"));
        const auto& host = boost::get<std::string>(held.at("host"));
        const auto snapshot = server.snapshot();
        return small.get() == port && text.get() == host && snapshot->port == port &&
               snapshot->host == host;
    }

    /// Whether those that have not what the store holds say why.
    bool isExplained() const {
        return agrees() || small.status().error || text.status().error || server.status().error;
    }

    /// What is changed now reaches everybody.
    void expectFollowing() {
        expectFree();
        const int callsBefore = calls;
        store->set(portKey, 7, "foreign");
        store->set(hostKey, ConfigurationValue(longText("newest")), "foreign");
        EXPECT_TRUE(agrees());
        EXPECT_FALSE(small.status().error || text.status().error || server.status().error);
        EXPECT_EQ(text.status().value, longText("newest"));
        EXPECT_GE(calls, callsBefore + 3);  // of a struct that lacks a key once less
    }

    Setting<int> small = port();
    Setting<std::string> text = host();
    Bound<Server> server = SettingScene::server();
    int calls = 0;
    const ChangeHandle ofSmall = small.onChange([this](int, int) { count(); });
    const ChangeHandle ofText = text.onChange([this](const auto&, const auto&) { count(); });
    const ChangeHandle ofServer = server.onChange([this](const auto&, const auto&) { count(); });

private:
    void count() {
        ++calls;
        foreignCall();
    }
};

/// Runs `change` of a scene. A setting that has not followed says why, or the change has thrown, or
/// standard error says so; and each follows the next change.
template <class Change>
void tryFollowing(Trial& trial, Change change) {
    FollowingScene scene;
    const bool passed = trial.passes([&] { change(scene); });
    // While there is no memory at all nobody can be told; that is made up for with the next change.
    const bool isSilent = trial.isOfMemory() && trial.isLasting();
    if (passed && !isSilent && scene.standardError.lines == 0) {
        EXPECT_TRUE(scene.isExplained());
    }
    scene.expectFollowing();
}

void followASmallValue(Trial& trial) {
    tryFollowing(trial, [](auto& scene) { scene.store->set(portKey, newPort, "foreign"); });
}

void followAText(Trial& trial) {
    const ConfigurationValue value(longText("new"));
    tryFollowing(trial, [&](auto& scene) { scene.store->set(hostKey, value, "foreign"); });
}

void followSeveralKeys(Trial& trial) {
    const std::vector<configuration::Change> changes{{portKey, newPort, "foreign"},
                                                     {hostKey, longText("new"), "foreign"}};
    tryFollowing(trial, [&](auto& scene) { scene.store->apply(changes); });
}

void refuseAValue(Trial& trial) {
    FollowingScene scene;
    const ConfigurationValue value(longText("no number"));
    trial.passes([&] { scene.store->set(portKey, value, "foreign"); });
    EXPECT_EQ(scene.small.get(), oldPort);
    scene.expectFollowing();
}

void loseAValue(Trial& trial) {
    FollowingScene scene;
    trial.passes([&] { scene.store->unset(hostKey, "foreign"); });
    EXPECT_EQ(scene.text.get(), longText("old"));
    scene.expectFollowing();
}

void tellOfAChange(Trial& trial) {
    FollowingScene scene;
    ChangeHandle handle;
    int calls = 0;
    const bool passed = trial.passes(
        [&] { handle = scene.text.onChange([&](const auto&, const auto&) { ++calls; }); });
    scene.store->set(hostKey, longText("new"), "foreign");
    EXPECT_EQ(calls, passed ? 1 : 0);
    scene.expectFollowing();
}

// ---- Asking

template <class Ask>
void tryAsking(Trial& trial, Ask ask) {
    FollowingScene scene;
    bool isRight = false;
    if (trial.passes([&] { isRight = ask(scene); })) {
        EXPECT_TRUE(isRight);
    }
    scene.expectFollowing();
}

void get(Trial& trial) {
    tryAsking(trial, [](auto& scene) { return scene.text.get() == longText("old"); });
}

void read(Trial& trial) {
    tryAsking(trial, [](auto& scene) {
        auto reader = scene.text.reader();
        return reader.get() == longText("old") && scene.server.reader().get().port == oldPort;
    });
}

void askForStatus(Trial& trial) {
    tryAsking(trial, [](auto& scene) {
        return scene.text.status().value == longText("old") &&
               scene.server.status().fields.size() == 2;
    });
}

void describe(Trial& trial) {
    tryAsking(trial, [](auto& scene) {
        return settings::describe(scene.store).size() == 4 &&
               settings::describe(scene.store, hostKey).size() == 2;
    });
}

void askForUndeclaredKeys(Trial& trial) {
    FollowingScene scene;
    scene.store->set("far.hort", ConfigurationValue(longText("meant")));
    bool isRight = false;
    if (trial.passes([&] {
            const auto keys = settings::undeclaredKeys(scene.store);
            isRight = keys.size() == 1 && keys[0].meant;
        })) {
        EXPECT_TRUE(isRight);
    }
    scene.expectFollowing();
}

void askForSecrets(Trial& trial) {
    SettingScene scene;
    const Setting<std::string> setting(scene.store, hostKey, settings::secret());
    bool isRight = false;
    if (trial.passes([&] {
            isRight = settings::secretKeys(scene.store).count(hostKey) == 1 &&
                      settings::isSecret(scene.store, hostKey);
        })) {
        EXPECT_TRUE(isRight);
    }
    scene.expectFree();
}

// ---- Overriding

void overrideAKey(Trial& trial) {
    FollowingScene scene;
    trial.passes([&] {
        const settings::testing::Override none(scene.store, "far.other", longText("other"));
        foreignCall();
    });
    // Without memory it is not always taken back.
    EXPECT_TRUE(trial.isOfMemory() || !scene.store->has("far.other").get());
    scene.expectFollowing();
}

void endAnOverride(Trial& trial) {
    FollowingScene scene;
    auto overridden =
        std::make_unique<settings::testing::Override>(scene.store, hostKey, longText("other"));
    EXPECT_TRUE(trial.passes([&] { overridden.reset(); }));
    const auto held = scene.store->getOption(hostKey).get();
    if (held.source == "foreign") {
        scene.expectFollowing();
    } else {
        EXPECT_TRUE(trial.isOfMemory());
    }
}

constexpr Row settingsMade[] = {
    {"MakeASmallSetting", makeASmallSetting},
    {"MakeATextSetting", makeATextSetting},
    {"MakeAListSetting", makeAListSetting},
    {"MakeASettingOfNothing", makeASettingOfNothing},
    {"RefuseASetting", refuseASetting},
    {"MakeABound", makeABound},
    {"EndASetting", endASetting},
    {"EndAHandle", endAHandle},
    {"OutliveTheStore", outliveTheStore},
    {"OverrideAKey", overrideAKey},
    {"EndAnOverride", endAnOverride},
};
VELKOR_FAILING_ROWS(FailingSettings, settingsMade);

constexpr Row settingsFollowing[] = {
    {"FollowASmallValue", followASmallValue},
    {"FollowAText", followAText},
    {"FollowSeveralKeys", followSeveralKeys},
    {"RefuseAValue", refuseAValue},
    {"LoseAValue", loseAValue},
    {"OnChange", tellOfAChange},
    {"Get", get},
    {"Read", read},
    {"Status", askForStatus},
    {"Describe", describe},
    {"UndeclaredKeys", askForUndeclaredKeys},
    {"Secrets", askForSecrets},
};
VELKOR_FAILING_ROWS(FailingFollowers, settingsFollowing);

}  // namespace
}  // namespace velkor::testing
