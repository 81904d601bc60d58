#include "fuzz/settings/ModelSettings.hpp"

#include <algorithm>
#include <sstream>
#include <stdexcept>
#include <utility>

#include "configuration/admin/ValueFormat.hpp"
#include "settings/Conversion.hpp"

namespace velkor::fuzz::settings {

using configuration::ConfigurationValue;
using configuration::Option;
using velkor::settings::Conversion;

namespace {

// ---- What was declared

/// What was declared of one key. `check` gives what is wrong with a value, and may throw.
template <class T>
struct Key {
    std::string name;
    std::optional<T> usual{};
    std::function<std::string(const T&)> check{};
    bool isSecret = false;
    bool orDefault = false;
};

std::string textOf(const ConfigurationValue& value) {
    std::ostringstream text;
    text << std::boolalpha;
    configuration::formatValue(text, value);
    return text.str();
}

template <class T>
std::string wrongWith(const Key<T>& key, const T& value) {
    try {
        return key.check ? key.check(value) : "";
    } catch (const std::exception& error) {
        return std::string("the check has failed: ") + error.what();
    }
}

/// The value of the key, and why there is none.
template <class T>
std::optional<T> judge(const Key<T>& key, const std::optional<Option>& option, bool first,
                       ModelVerdict& verdict) {
    const auto usual = [&] {
        if (key.usual) verdict.standings.push_back({Conversion<T>::show(*key.usual), ""});
        return key.usual;
    };
    if (!option) {
        if (!key.usual) verdict.refuse(key.name + ": no value, and no default");
        return usual();
    }
    const auto read = Conversion<T>::from(option->value);
    const std::string wrong = read ? wrongWith(key, read.value()) : read.reason().text;
    if (wrong.empty()) {
        verdict.standings.push_back({Conversion<T>::show(read.value()), option->source});
        return read.value();
    }
    const std::string text = key.name + ": " + (key.isSecret ? "•••" : textOf(option->value)) +
                             " from source \"" + option->source + "\" is no " +
                             Conversion<T>::typeName() + ": " + wrong;
    if (first && key.orDefault) {
        verdict.complain(text);
        return usual();
    }
    verdict.refuse(text);
    return std::nullopt;
}

template <class T>
ModelRule oneKey(Key<T> key) {
    if (key.usual) {
        const std::string wrong = wrongWith(key, *key.usual);
        if (!wrong.empty()) {
            throw std::runtime_error(key.name + ": the default " + Conversion<T>::show(*key.usual) +
                                     " is not right: " + wrong);
        }
    }
    ModelRule rule{{key.name}, {}, key.isSecret};
    rule.judge = [key](const ModelOptions& options, bool first) {
        ModelVerdict verdict;
        judge(key, options.front(), first, verdict);
        return verdict;
    };
    return rule;
}

ModelVerdict judgeBoth(const ModelOptions& options, bool first) {
    ModelVerdict verdict;
    const auto a = judge(Key<int>{"a", 1}, options.front(), first, verdict);
    judge(Key<std::string>{"b", "z"}, options.back(), first, verdict);
    if (!verdict.holds) return verdict;
    if (*a == 4) verdict.refuse(": a is four");
    if (*a == 5) verdict.refuse(": the check has failed: five");
    return verdict;
}

std::string fromZeroToFive(int number) {
    return number >= 0 && number <= 5 ? "" : "not between 0 and 5";
}

ModelRule ruleOf(std::size_t kind, const std::string& key) {
    switch (kind) {
        case 0:
            return oneKey<int>({key, 3, fromZeroToFive});
        case 1:
            return oneKey<int>({key, {}, {}, true});
        case 2:
            return oneKey<std::string>(
                {key, "d", [](const auto& text) { return text.empty() ? "empty" : ""; }, false,
                 true});
        case 3:
            return oneKey<bool>({key});
        case 4:
            return oneKey<std::optional<int>>({key, std::optional<int>(), [](const auto& number) {
                                                   return number && *number < 3 ? "not at least 3"
                                                                                : "";
                                               }});
        case 5:
            return {{"a", "b"}, judgeBoth};
        case 6:
            return oneKey<int>({key, 9, fromZeroToFive});
        default:
            return oneKey<std::vector<int>>(
                {key, std::vector<int>(), [](const std::vector<int>& all) {
                     if (all == std::vector<int>{9}) throw std::runtime_error("nine");
                     return all.size() < 2 ? "" : "not short";
                 }});
    }
}

}  // namespace

// ---- A setting

void ModelSetting::begin(const std::shared_ptr<ModelStore>& store) {
    followed = store;
    hub = ModelHub::of(*store);
    ModelOptions options;
    for (const auto& key : rule.keys) options.push_back(store->find(key));
    deliver(store->version(), options);
    if (!hasValue) throw std::runtime_error(complaint.value_or(""));
}

void ModelSetting::end() {
    hasEnded = true;
    listeners.clear();
    const auto left = std::exchange(hub, nullptr);
    if (left == nullptr) return;
    auto& all = left->settings;
    all.erase(std::remove_if(all.begin(), all.end(),
                             [this](const auto& each) { return each.get() == this; }),
              all.end());
}

void ModelSetting::take(const ModelChange& change) {
    if (rule.keys.size() == 1) return deliver(change.version, {change.option});
    const auto store = followed.lock();
    if (store == nullptr || (hasValue && change.version <= version)) return;
    deliver(store->version(), {store->find("a"), store->find("b")});
}

void ModelSetting::deliver(std::uint64_t newVersion, const ModelOptions& options) {
    if (hasEnded || newVersion < version) return;
    ModelVerdict verdict = rule.judge(options, !hasValue);
    version = newVersion;
    if (!verdict.holds) {
        complaint = verdict.complaints;
        return;
    }
    complaint.reset();
    if (!verdict.complaints.empty()) complaint = verdict.complaints;
    const std::string before = value();
    standings = verdict.standings;
    if (std::exchange(hasValue, true) && value() != before) tellOf(before);
}

void ModelSetting::tellOf(const std::string& before) {
    const std::string now = value();
    const auto told = listeners;
    for (const Listener& each : told) {
        const bool isThere = std::any_of(listeners.begin(), listeners.end(),
                                         [&](const auto& other) { return other.id == each.id; });
        try {
            if (isThere) each.callback(before, now);
        } catch (const std::exception&) {
            continue;  // it is logged
        }
    }
}

std::string ModelSetting::value() const {
    std::string text;
    for (const auto& each : standings)
        text += (&each == &standings.front() ? "" : "|") + each.value;
    return text;
}

std::string ModelSetting::spelled() const {
    std::string text = value();
    for (const auto& each : standings) {
        text += ", " + spelledStatus(rule.isSecret ? "•••" : each.value, each.source);
    }
    return text + (complaint ? ", but " + *complaint : "") +
           (followed.expired() ? ", store gone" : "");
}

std::shared_ptr<ModelHub> ModelHub::of(ModelStore& store) {
    auto known = std::dynamic_pointer_cast<ModelHub>(store.listener.lock());
    if (known == nullptr) {
        known = std::make_shared<ModelHub>();
        store.listener = known;
    }
    return known;
}

void ModelHub::take(const ModelChange& change) {
    std::vector<std::shared_ptr<ModelSetting>> told;
    for (const auto& each : settings) {
        const auto& keys = each->rule.keys;
        if (std::find(keys.begin(), keys.end(), change.key) != keys.end()) told.push_back(each);
    }
    for (const auto& each : told) each->take(change);
}

// ---- What is done

std::string ModelSettings::carryOut(const Step& step) {
    const auto open = store;  // it may be given up meanwhile
    switch (step.operation) {
        case 'm':
            setManner(step);
            return "";
        case 'D':
            store.reset();
            return "";
        case 'q':
            endOverride(overriding.at(step.number));
            return "";
        case 'e':
            endSetting(step.slot);
            return "";
        case 'h':
            endHandle(std::exchange(handles.at(step.slot).at(step.number), {}));
            return "";
        case 't':
            return settings.at(step.slot) ? settings.at(step.slot)->spelled() : "no setting";
        case 'c':
            return watch(step);
        default:
            return open == nullptr ? "no store" : change(*open, step);
    }
}

std::string ModelSettings::watch(const Step& step) {
    const auto setting = settings.at(step.slot);
    if (setting == nullptr) return "no setting";
    setting->listeners.push_back(
        {++setting->lastListener, [this, slot = step.slot, number = step.number](
                                      const std::string& before, const std::string& now) {
             call(slot, number, before, now);
         }});
    endHandle(std::exchange(handles.at(step.slot).at(step.number),
                            Handle{setting, setting->lastListener}));
    return "";
}

std::string ModelSettings::change(ModelStore& open, const Step& step) {
    switch (step.operation) {
        case 's':
            open.set("override", step.key, step.value);
            return "";
        case 'd':
            open.set("default", step.key, step.value);
            return "";
        case 'u':
            open.unset(step.key);
            return "";
        case 'y':
            open.setBoth(step.value, step.other);
            return "";
        case 'o':
            beginOverride(step);
            return "";
        case 'n':
            make(step);
            return "";
        default:
            break;
    }
    const auto hub = std::dynamic_pointer_cast<ModelHub>(open.listener.lock());
    const bool isSecret =
        hub != nullptr &&
        std::any_of(hub->settings.begin(), hub->settings.end(), [&](const auto& each) {
            return each->rule.isSecret && each->rule.keys.front() == step.key;
        });
    return isSecret ? "secret" : "open";
}

void ModelSettings::make(const Step& step) {
    endSetting(step.slot);
    const auto setting = std::make_shared<ModelSetting>();
    setting->rule = ruleOf(step.kind, step.key);
    try {
        setting->begin(store);
    } catch (const std::exception&) {
        setting->end();
        throw;
    }
    setting->hub->settings.push_back(setting);
    settings.at(step.slot) = setting;
}

void ModelSettings::beginOverride(const Step& step) {
    auto& place = overriding.at(step.number);
    endOverride(place);
    if (store == nullptr) return;
    const auto open = store;
    const auto table = open->add(step.key, step.value);
    auto before = std::exchange(place, Override{open, table, step.key});
    endOverride(before);
}

void ModelSettings::endOverride(std::optional<Override>& place) {
    const auto ended = std::exchange(place, std::nullopt);
    if (ended) ended->store->remove(ended->table, ended->key);
}

void ModelSettings::endHandle(const Handle& handle) {
    const auto setting = handle.setting.lock();
    if (setting == nullptr) return;
    auto& all = setting->listeners;
    all.erase(std::remove_if(all.begin(), all.end(),
                             [&](const auto& each) { return each.id == handle.id; }),
              all.end());
}

void ModelSettings::endSetting(std::size_t slot) {
    const auto ended = std::exchange(settings.at(slot), nullptr);
    if (ended != nullptr) ended->end();
}

void ModelSettings::end() {
    store.reset();
    for (auto& each : overriding) endOverride(each);
    for (std::size_t slot = 0; slot < slots; ++slot) endSetting(slot);
}

}  // namespace velkor::fuzz::settings
