#include "fuzz/settings/RealSettings.hpp"

#include <algorithm>
#include <stdexcept>
#include <utility>
#include <vector>

#include "settings/Bound.hpp"
#include "settings/Secrets.hpp"
#include "settings/Setting.hpp"

namespace velkor::fuzz::settings {

using configuration::ConfigurationImpl;
using velkor::settings::Bound;
using velkor::settings::ChangeHandle;
using velkor::settings::Conversion;
using velkor::settings::Setting;
using namespace std::string_literals;

namespace {

using StorePtr = std::shared_ptr<ConfigurationImpl>;

std::string spelledEnd(const std::optional<std::string>& error, bool storeGone) {
    return (error ? ", but " + *error : "") + (storeGone ? ", store gone" : "");
}

template <class T>
class OneKey final : public AnySetting {
public:
    template <class... Arguments>
    explicit OneKey(Arguments&&... arguments) : setting(std::forward<Arguments>(arguments)...) {}

    std::string spelled() const override {
        const auto status = setting.status();
        return Conversion<T>::show(setting.get()) + ", " +
               spelledStatus(status.value, status.source) +
               spelledEnd(status.error, status.storeGone);
    }

    ChangeHandle onChange(Callback callback) override {
        return setting.onChange([callback = std::move(callback)](const T& before, const T& now) {
            callback(Conversion<T>::show(before), Conversion<T>::show(now));
        });
    }

private:
    Setting<T> setting;
};

struct Pair {
    int a = 0;
    std::string b;
};

std::string shown(const Pair& pair) {
    return std::to_string(pair.a) + '|' + pair.b;
}

class BothKeys final : public AnySetting {
public:
    explicit BothKeys(const StorePtr& store)
        : bound(store, "", velkor::settings::fields(&Pair::a, "a", 1, &Pair::b, "b", "z"s),
                [](const Pair& pair) -> std::string {
                    if (pair.a == 5) throw std::runtime_error("five");
                    return pair.a == 4 ? "a is four" : "";
                }) {}

    std::string spelled() const override {
        const auto status = bound.status();
        std::string text = shown(*bound.snapshot());
        for (const auto& [key, field] : status.fields) {
            text += ", " + spelledStatus(field.value, field.source);
        }
        return text + spelledEnd(status.error, status.storeGone);
    }

    ChangeHandle onChange(Callback callback) override {
        return bound.onChange(
            [callback = std::move(callback)](const Pair& before, const Pair& now) {
                callback(shown(before), shown(now));
            });
    }

private:
    Bound<Pair> bound;
};

// The sources of overrides are numbered throughout the process.
std::string withoutNumbers(std::string text) {
    const std::string name = "test override";
    for (auto found = text.find(name); found != std::string::npos;
         found = text.find(name, found + 1)) {
        const std::size_t begin = found + name.size();
        const std::size_t end = std::min(text.find_first_not_of(" 0123456789", begin), text.size());
        text.erase(begin, end - begin);
    }
    return text;
}

std::shared_ptr<AnySetting> made(std::size_t kind, const StorePtr& store, const std::string& key) {
    using namespace velkor::settings;
    switch (kind) {
        case 0:
            return std::make_shared<OneKey<int>>(store, key, 3, between(0, 5));
        case 1:
            return std::make_shared<OneKey<int>>(store, key, secret());
        case 2:
            return std::make_shared<OneKey<std::string>>(store, key, "d"s, notEmpty(), orDefault());
        case 3:
            return std::make_shared<OneKey<bool>>(store, key);
        case 4:
            return std::make_shared<OneKey<std::optional<int>>>(store, key, atLeast(3));
        case 5:
            return std::make_shared<BothKeys>(store);
        case 6:
            return std::make_shared<OneKey<int>>(store, key, 9, between(0, 5));
        default:
            return std::make_shared<OneKey<std::vector<int>>>(
                store, key, std::vector<int>{}, matching("short", [](const std::vector<int>& all) {
                    if (all.size() == 1 && all.front() == 9) throw std::runtime_error("nine");
                    return all.size() < 2;
                }));
    }
}

}  // namespace

RealSettings::RealSettings() : store(std::make_shared<ConfigurationImpl>()) {}

std::string RealSettings::carryOut(const Step& step) {
    try {
        return withoutNumbers(answer(step));
    } catch (const std::exception& error) {
        throw std::runtime_error(withoutNumbers(error.what()));
    }
}

std::string RealSettings::answer(const Step& step) {
    const StorePtr open = store;  // it may be given up meanwhile
    switch (step.operation) {
        case 'm':
            setManner(step);
            return "";
        case 'D':
            store.reset();
            return "";
        case 'q':
            std::exchange(overriding.at(step.number), nullptr);
            return "";
        case 'e':
            std::exchange(settings.at(step.slot), nullptr);
            return "";
        case 'h':
            handles.at(step.slot).at(step.number) = {};
            return "";
        case 't':
            return settings.at(step.slot) ? settings.at(step.slot)->spelled() : "no setting";
        case 'c':
            return watch(step);
        default:
            return open == nullptr ? "no store" : change(*open, step);
    }
}

std::string RealSettings::watch(const Step& step) {
    const auto setting = settings.at(step.slot);
    if (setting == nullptr) return "no setting";
    handles.at(step.slot).at(step.number) =
        setting->onChange([this, slot = step.slot, number = step.number](const std::string& before,
                                                                         const std::string& now) {
            call(slot, number, before, now);
        });
    return "";
}

std::string RealSettings::change(ConfigurationImpl& open, const Step& step) {
    switch (step.operation) {
        case 's':
            open.set(step.key, step.value).get();
            return "";
        case 'd':
            open.set(step.key, step.value, "default").get();
            return "";
        case 'u':
            open.apply({{step.key, std::nullopt, "override"}}).get();
            return "";
        case 'y':
            open.apply({{"a", step.value}, {"b", step.other}}).get();
            return "";
        case 'k':
            return velkor::settings::isSecret(store, step.key) ? "secret" : "open";
        case 'o':
            beginOverride(step);
            return "";
        default:
            std::exchange(settings.at(step.slot), nullptr);
            const auto setting = made(step.kind, store, step.key);
            settings.at(step.slot) = setting;
            return "";
    }
}

// One that is there ends before the next one begins.
void RealSettings::beginOverride(const Step& step) {
    auto& place = overriding.at(step.number);
    std::exchange(place, nullptr);
    if (store == nullptr) return;
    auto begun = std::make_unique<velkor::settings::testing::Override>(store, step.key, step.value);
    std::exchange(place, std::move(begun));
}

void RealSettings::end() {
    store.reset();
    for (auto& each : overriding) std::exchange(each, nullptr);
    for (auto& setting : settings) std::exchange(setting, nullptr);
    for (auto& both : handles) both = {};
}

}  // namespace velkor::fuzz::settings
