// Sources that are read from the environment, and those that change by themselves. The layers that
// keep files and talk to servers have failing disks, memory and servers of their own beside them.

#include <string>
#include <utility>
#include <vector>

#include "layers/LiveSource.hpp"
#include "layers/environment/EnvironmentNames.hpp"
#include "layers/environment/EnvironmentSource.hpp"
#include "tests/failing/StoreScene.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationValue;
using layers::EnvironmentNames;
using layers::EnvironmentSource;

void readTheEnvironment(Trial& trial) {
    const std::string variable = "VELKOR_A__B=" + longText("value");
    const char* const variables[] = {variable.c_str(), "OTHER=1", nullptr};
    bool isRight = false;
    if (trial.passes([&] {
            EnvironmentSource source(EnvironmentNames("VELKOR_", {longText("spelled")}), variables);
            isRight = source.get("a.b") == ConfigurationValue(longText("value"));
        })) {
        EXPECT_TRUE(isRight);
    }
}

void nameAKey(Trial& trial) {
    const EnvironmentNames names("VELKOR_");
    bool isRight = false;
    if (trial.passes([&] {
            const auto name = names.nameOf("some.key_that_is_longer_than_a_short_text");
            isRight = name && names.keyOf(*name);
        })) {
        EXPECT_TRUE(isRight);
    }
}

/// A source that a test changes as a source's own thread would.
class LiveTable final : public layers::LiveSource {
public:
    struct Entry {
        std::string key;
        std::string text;
    };

    explicit LiveTable(configuration::ValueMap initial)
        : LiveSource(typeid(LiveTable), std::move(initial)) {}

    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        change([&](configuration::ValueTable& table) -> Keys {
            Keys changed{key};
            table.find(key)->swap(value);
            return changed;
        });
        return value;
    }

    /// Changes keys that are there, all or none.
    void tick(std::vector<Entry> entries) {
        Keys changed;
        std::vector<ConfigurationValue> newValues;
        for (auto& entry : entries) {
            changed.push_back(entry.key);
            newValues.emplace_back(std::move(entry.text));
        }
        change([&](configuration::ValueTable& table) -> Keys {
            for (std::size_t i = 0; i < newValues.size(); ++i) {
                table.find(changed[i])->swap(newValues[i]);
            }
            return std::move(changed);
        });
    }

private:
    void started() override { foreignCall(); }
};

/// A store with a source that changes by itself below "live.", whose key is watched.
struct LiveScene : StoreScene {
    LiveScene() {
        store->addSource("live", "live.", 1, false, live);
        watch.open(store->watchOption("live." + farKey));
        watch.subscriber->values = 0;
    }

    /// Whether the source and the store hold `text`.
    bool holds(const std::string& text) const {
        return live->get(farKey) == ConfigurationValue(text) &&
               store->get("live." + farKey).get() == ConfigurationValue(text);
    }

    /// The source changes, and who watches it is told.
    void expectLive() {
        live->tick({{farKey, longText("newest")}});
        EXPECT_TRUE(holds(longText("newest")));
        expectAlive();
        onAnotherThread([this] { live->has(farKey); });
    }

    std::shared_ptr<LiveTable> live = std::make_shared<LiveTable>(configuration::ValueMap{
        {longText("key"), longText("old")}, {longText("other"), longText("old")}});
    Watched<ConfigurationValue> watch;
};

// All of a change or nothing of it; whoever watches is told of it, by standard error if need be.
void changeByItself(Trial& trial) {
    LiveScene scene;
    const std::string text = longText("new");
    const bool passed = trial.passes([&] {
        scene.live->tick({{scene.farKey, text}, {longText("other"), text}});
    });
    if (passed) {
        EXPECT_TRUE(scene.holds(text));
        scene.expectTold(scene.watch);
    }
    scene.expectLive();
}

void writeALiveSource(Trial& trial) {
    LiveScene scene;
    trial.passes([&] { scene.store->set("live." + scene.farKey, scene.newValue, "live"); });
    scene.expectLive();
}

void addALiveSource(Trial& trial) {
    LiveScene scene;
    scene.store->removeSource("live");
    const auto add = [&] { scene.store->addSource("live", "live.", 1, false, scene.live); };
    trial.passes(add);
    // It is registered, or can be.
    if (!scene.store->findSource("live").get()) add();
    scene.store->removeSource("live");
    add();
    scene.watch.subscriber->values = 0;
    scene.live->tick({{scene.farKey, longText("told")}});
    EXPECT_EQ(scene.watch.subscriber->values, 1);
    scene.expectLive();
}

void removeALiveSource(Trial& trial) {
    LiveScene scene;
    trial.passes([&] { scene.store->removeSource("live"); });
    if (!scene.store->findSource("live").get()) {
        scene.store->addSource("live", "live.", 1, false, scene.live);
    }
    scene.expectLive();
}

void replaceTheListener(Trial& trial) {
    LiveScene scene;
    scene.store->removeSource("live");
    int calls = 0;
    const auto listen = [&] {
        scene.live->setChangeListener([&](const std::string&) {
            ++calls;
            foreignCall();
        });
    };
    if (!trial.passes(listen)) listen();
    scene.live->tick({{scene.farKey, longText("told")}});
    EXPECT_EQ(calls, 1);
    scene.live->setChangeListener({});
}

void tellTheListener(Trial& trial) {
    LiveScene scene;
    scene.store->removeSource("live");
    const auto held = scene.live->get(scene.farKey);
    int calls = 0;
    scene.live->setChangeListener([&](const std::string&) {
        ++calls;
        foreignCall();
    });
    trial.passes([&] { scene.live->tick({{scene.farKey, longText("told")}}); });
    // What has been changed is told.
    EXPECT_EQ(calls, scene.live->get(scene.farKey) == held ? 0 : 1);
    scene.live->setChangeListener({});
}

constexpr Row layerRows[] = {
    {"ReadTheEnvironment", readTheEnvironment}, {"NameAKey", nameAKey},
    {"ChangeByItself", changeByItself},         {"WriteALiveSource", writeALiveSource},
    {"AddALiveSource", addALiveSource},         {"RemoveALiveSource", removeALiveSource},
    {"ReplaceTheListener", replaceTheListener}, {"TellTheListener", tellTheListener},
};
VELKOR_FAILING_ROWS(FailingLayers, layerRows);

}  // namespace
}  // namespace velkor::testing
