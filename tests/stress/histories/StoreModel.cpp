#include "tests/stress/histories/StoreModel.hpp"

#include <algorithm>
#include <limits>
#include <set>

namespace velkor::testing {

namespace {

using Kind = StoreCall::Kind;

std::string joined(const std::vector<std::string>& parts, const char* separator = ",") {
    std::string text;
    for (const std::string& part : parts) text += (text.empty() ? "" : separator) + part;
    return text;
}

bool begins(const std::string& group, const std::string& key) {
    return key.compare(0, group.size(), group) == 0;
}

std::string textOf(const StoreCall::Change& change) {
    return change.key + (change.value ? "=" + std::to_string(*change.value) : "!") +
           (change.source ? "@" + *change.source : "");
}

std::string textOf(const ModelLayer& layer) {
    std::vector<std::string> values;
    for (const auto& [key, value] : layer.values) {
        values.push_back(key + "=" + std::to_string(value));
    }
    return layer.name + "(" + layer.group + "," + std::to_string(layer.order) +
           (layer.readOnly ? ",ro" : "") + "){" + joined(values) + "}";
}

template <class T>
std::string joinedTexts(const std::vector<T>& items) {
    std::vector<std::string> texts;
    for (const T& item : items) texts.push_back(textOf(item));
    return joined(texts);
}

}  // namespace

StoreModel::StoreModel(std::size_t watchersOfAKey)
    : layers{{"override", "", 0}, {"default", "", std::numeric_limits<int>::max()}},
      watchers(watchersOfAKey) {}

bool StoreModel::isRead(const Call& call) {
    return call.kind < Kind::set;
}

std::string StoreModel::read(const Call& call) const {
    switch (call.kind) {
        case Kind::get: {
            const auto found = holders(call.key);
            if (found.empty()) return "No option with the specified key was found: " + call.key;
            return std::to_string(found.front().value);
        }
        case Kind::has:
            return holders(call.key).empty() ? "false" : "true";
        case Kind::getOption: {
            const std::string found = option(call.key);
            if (found == "-") return "No option with the specified key was found: " + call.key;
            return found;
        }
        case Kind::keys:
            return joined(allKeys());
        case Kind::keysFrom: {
            const auto keys = allKeys();
            const auto first = std::lower_bound(keys.begin(), keys.end(), call.key);
            return first == keys.end() ? "" : *first;
        }
        case Kind::explain: {
            std::vector<std::string> texts;
            for (const Found& found : holders(call.key)) {
                texts.push_back(std::to_string(found.value) + "@" + found.source);
            }
            return joined(texts);
        }
        case Kind::read: {
            std::vector<std::string> texts;
            for (const std::string& key : call.keys) texts.push_back(option(key));
            return joined(texts);
        }
        case Kind::describe: {
            std::vector<std::string> texts;
            for (ModelLayer layer : layers) {
                layer.values.clear();
                texts.push_back(testing::textOf(layer));
            }
            return joined(texts);
        }
        default:
            return outcome(call.changes);
    }
}

std::string StoreModel::write(const Call& call) {
    switch (call.kind) {
        case Kind::set:
            return set({call.key, call.value, call.source});
        case Kind::unset:
            return unset({call.key, std::nullopt, call.source});
        case Kind::apply:
            return apply(call.changes);
        case Kind::add:
            return add(call.layer);
        default:
            return remove(call.source.value());
    }
}

std::string StoreModel::state() const {
    return joinedTexts(layers);
}

std::string StoreModel::textOf(const Call& call) {
    static const std::vector<std::string> names{
        "get",      "has",    "getOption", "keys",  "keysFrom", "explain", "read",
        "describe", "dryRun", "set",       "unset", "apply",    "add",     "remove"};
    std::string text = names.at(static_cast<std::size_t>(call.kind));
    if (!call.key.empty()) text += " " + call.key;
    if (call.kind == Kind::set) text += "=" + std::to_string(call.value);
    if (call.source) text += "@" + *call.source;
    if (!call.keys.empty()) text += " " + joined(call.keys);
    if (!call.changes.empty()) text += " " + joinedTexts(call.changes);
    if (call.kind == Kind::add) text += " " + testing::textOf(call.layer);
    return text;
}

std::vector<StoreModel::Found> StoreModel::holders(const std::string& key) const {
    std::vector<Found> found;
    for (const ModelLayer& layer : layers) {
        if (!begins(layer.group, key)) continue;
        const auto entry = layer.values.find(key.substr(layer.group.size()));
        if (entry != layer.values.end()) found.push_back({layer.name, entry->second});
    }
    return found;
}

std::string StoreModel::option(const std::string& key) const {
    const auto found = holders(key);
    if (found.empty()) return "-";
    return std::to_string(found.front().value) + "@" + found.front().source;
}

std::vector<std::string> StoreModel::allKeys() const {
    std::set<std::string> keys;
    for (const ModelLayer& layer : layers) {
        for (const auto& entry : layer.values) keys.insert(layer.group + entry.first);
    }
    return {keys.begin(), keys.end()};
}

const ModelLayer* StoreModel::target(const std::string& key,
                                     const std::optional<std::string>& name) const {
    const auto found = std::find_if(layers.begin(), layers.end(), [&](const ModelLayer& layer) {
        return !layer.readOnly && begins(layer.group, key) && (!name || *name == layer.name);
    });
    return found == layers.end() ? nullptr : &*found;
}

ModelLayer* StoreModel::target(const std::string& key, const std::optional<std::string>& name) {
    const auto* const found = static_cast<const StoreModel*>(this)->target(key, name);
    return found == nullptr ? nullptr : &layers[static_cast<std::size_t>(found - layers.data())];
}

std::string StoreModel::refusal(const Change& change) {
    if (!change.source) return "No writable configuration source for key: " + change.key;
    return "Source not found or not writable: " + change.key + ", " + *change.source;
}

// What `apply` answers, now, before it changes anything.
std::string StoreModel::outcome(const std::vector<Change>& changes) const {
    std::vector<std::string> refusals;
    std::vector<std::string> applied;
    for (const Change& change : changes) {
        const ModelLayer* const layer = target(change.key, change.source);
        if (layer == nullptr) {
            refusals.push_back(refusal(change));
            continue;
        }
        const auto entry = layer->values.find(change.key.substr(layer->group.size()));
        const bool known = entry != layer->values.end();
        applied.push_back(change.key + "@" + layer->name + ":" +
                          (known ? std::to_string(entry->second) : "-"));
    }
    if (!refusals.empty()) return "Changes refused: " + joined(refusals, "; ");
    return joined(applied);
}

std::string StoreModel::set(const Change& change) {
    ModelLayer* const layer = target(change.key, change.source);
    if (layer == nullptr) return refusal(change);
    const auto [entry, isNew] =
        layer->values.emplace(change.key.substr(layer->group.size()), *change.value);
    const int answer = entry->second;
    entry->second = *change.value;
    return std::to_string(answer) + told(change.key);
}

std::string StoreModel::unset(const Change& change) {
    ModelLayer* const layer = target(change.key, change.source);
    if (layer == nullptr) return refusal(change);
    const bool known = layer->values.erase(change.key.substr(layer->group.size())) > 0;
    return known ? "true" + told(change.key) : "false";
}

std::string StoreModel::apply(const std::vector<Change>& changes) {
    const std::string answer = outcome(changes);
    if (answer.rfind("Changes refused", 0) == 0) return answer;
    for (const Change& change : changes) change.value ? set(change) : unset(change);
    return answer;
}

std::string StoreModel::add(const ModelLayer& layer) {
    const auto isNamed = [&](const ModelLayer& other) { return other.name == layer.name; };
    if (std::any_of(layers.begin(), layers.end(), isNamed)) {
        return "Source with the requested name already exists: " + layer.name;
    }
    const auto behind = std::find_if(layers.begin(), layers.end(), [&](const ModelLayer& other) {
        return other.order >= layer.order;
    });
    layers.insert(behind, layer);
    return "true";
}

std::string StoreModel::remove(const std::string& name) {
    const auto found = std::find_if(layers.begin(), layers.end(),
                                    [&](const ModelLayer& layer) { return layer.name == name; });
    if (found == layers.end()) return "false";
    layers.erase(found);
    return "true";
}

// The effective value, if there is one, once for each watcher.
std::string StoreModel::told(const std::string& key) const {
    const auto found = holders(key);
    if (watchers == 0 || found.empty()) return "";
    std::string text = " told";
    for (std::size_t i = 0; i < watchers; ++i) text += " " + std::to_string(found.front().value);
    return text;
}

}  // namespace velkor::testing
