#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "fuzz/settings/ModelStore.hpp"
#include "fuzz/settings/System.hpp"

namespace velkor::fuzz::settings {

/// How one key stands.
struct ModelStanding {
    std::string value;
    std::string source;
};

/// What becomes of the values of the keys of a setting.
struct ModelVerdict {
    bool holds = true;
    std::vector<ModelStanding> standings{};
    std::string complaints{};

    void complain(const std::string& text) {
        complaints += (complaints.empty() ? "" : "; ") + text;
    }
    void refuse(const std::string& text) {
        complain(text);
        holds = false;
    }
};

using ModelOptions = std::vector<std::optional<configuration::Option>>;

/// What was declared: its keys, and what becomes of their values; `first`: there are none yet.
struct ModelRule {
    std::vector<std::string> keys;
    std::function<ModelVerdict(const ModelOptions& options, bool first)> judge;
    bool isSecret = false;
};

/// A setting, and what it has taken last.
struct ModelSetting {
    using Callback = std::function<void(const std::string& before, const std::string& now)>;
    struct Listener {
        int id;
        Callback callback;
    };

    void begin(const std::shared_ptr<ModelStore>& store);
    void end();
    void take(const ModelChange& change);
    void deliver(std::uint64_t newVersion, const ModelOptions& options);
    void tellOf(const std::string& before);
    std::string value() const;
    std::string spelled() const;

    ModelRule rule;
    std::weak_ptr<ModelStore> followed{};
    std::shared_ptr<class ModelHub> hub{};
    std::uint64_t version = 0;
    bool hasValue = false;
    bool hasEnded = false;
    std::vector<ModelStanding> standings{};
    std::optional<std::string> complaint{};
    std::vector<Listener> listeners{};
    int lastListener = 0;
};

/// The settings that follow a store, as long as there are any.
class ModelHub final : public ModelListener {
public:
    static std::shared_ptr<ModelHub> of(ModelStore& store);

    ~ModelHub() override { hasEnded = true; }

    std::vector<std::shared_ptr<ModelSetting>> settings{};

protected:
    void take(const ModelChange& change) override;
};

/// The model of settings, as docs/settings.md and the headers say, for one thread. What the values
/// of the store mean as other types is not looked at here: others do so.
class ModelSettings final : public System {
public:
    void end() override;

private:
    struct Override {
        std::shared_ptr<ModelStore> store;
        ModelStore::Tables::iterator table;
        std::string key;
    };
    struct Handle {
        std::weak_ptr<ModelSetting> setting{};
        int id = 0;
    };

    std::string carryOut(const Step& step) override;
    std::string change(ModelStore& open, const Step& step);
    std::string watch(const Step& step);
    void make(const Step& step);
    void beginOverride(const Step& step);
    void endSetting(std::size_t slot);
    static void endOverride(std::optional<Override>& place);
    static void endHandle(const Handle& handle);

    std::shared_ptr<ModelStore> store = std::make_shared<ModelStore>();
    std::array<std::optional<Override>, overrides> overriding{};
    std::array<std::shared_ptr<ModelSetting>, slots> settings{};
    std::array<std::array<Handle, 2>, slots> handles{};
};

}  // namespace velkor::fuzz::settings
