#include "fuzz/store/ModelStore.hpp"

#include <algorithm>
#include <limits>
#include <stdexcept>

#include "fuzz/Values.hpp"

namespace velkor::fuzz::store {

// ---- Sources

ModelSource::Value ModelSource::set(const std::string& key, const Value& value) {
    if (fromFile) throw std::runtime_error(configuration::store_errors::writingNotSupported);
    temper.require(Mood::refusesSet);
    const auto present = values.find(key);
    const Value answer = present == values.end() ? value : present->second;
    values[key] = value;
    changed(key);
    return answer;
}

std::optional<ModelSource::Value> ModelSource::unset(const std::string& key) {
    temper.require(Mood::refusesSet);
    const auto present = values.find(key);
    if (present == values.end()) return std::nullopt;
    const Value removed = present->second;
    values.erase(present);
    changed(key);
    return removed;
}

void ModelSource::listen(ModelStore* store, const std::string& group) {
    if (system != nullptr) {
        system->note("source " + std::to_string(number) + (store ? " listened to" : " left"));
    }
    told = store;
    prefix = group;
}

void ModelSource::changed(const std::string& key) {
    if (system != nullptr) {
        temper.react(*system);
        temper.require(Mood::failsAfterSet);
        if (!system->hasStore()) return;
    }
    if (told == nullptr) return;
    const std::string fullKey = prefix + key;
    told->report(fullKey);
}

// ---- The store

ModelStore::ModelStore(Record recordLine, Record noteError)
    : record(std::move(recordLine)), error(std::move(noteError)) {
    const auto addFirst = [&](const char* name, int order) {
        const auto source = std::make_shared<ModelSource>(configuration::ValueMap{}, false);
        layers.push_back(std::make_shared<Layer>(Layer{name, "", order, false, source, true}));
        source->listen(this, "");
    };
    addFirst("override", 0);
    addFirst("default", std::numeric_limits<int>::max());
}

ModelStore::~ModelStore() {
    for (const auto& layer : std::vector<LayerPtr>(layers)) layer->source->listen(nullptr, "");
    while (!watches.empty()) {
        const auto ended = watches.front().publisher;
        watches.erase(watches.begin());
    }
    while (!changeWatches.empty()) {
        const auto ended = changeWatches.front().publisher;
        changeWatches.erase(changeWatches.begin());
    }
}

bool ModelStore::applies(const Layer& layer, const std::string& key) {
    return key.substr(0, layer.group.size()) == layer.group;
}

std::string ModelStore::within(const Layer& layer, const std::string& key) {
    return key.substr(layer.group.size());
}

ModelStore::LayerPtr ModelStore::find(const std::string& name) const {
    for (const auto& layer : layers) {
        if (layer->name == name) return layer;
    }
    return nullptr;
}

ModelStore::LayerPtr ModelStore::holder(const std::string& key) const {
    for (const auto& layer : layers) {
        if (applies(*layer, key) && layer->source->has(within(*layer, key))) return layer;
    }
    return nullptr;
}

ModelStore::LayerPtr ModelStore::writable(const std::string& key,
                                          const std::string* sourceName) const {
    for (const auto& layer : layers) {
        const bool isMeant = sourceName == nullptr || layer->name == *sourceName;
        if (isMeant && !layer->readOnly && applies(*layer, key)) return layer;
    }
    return nullptr;
}

std::set<std::string> ModelStore::allKeys() const {
    std::set<std::string> all;
    for (const auto& layer : layers) {
        for (const auto& key : layer->source->keys()) all.insert(layer->group + key);
    }
    return all;
}

ModelStore::Value ModelStore::valueFrom(const Layer& layer, const std::string& key) {
    record("get: " + key + " from " + layer.name);
    return layer.source->get(within(layer, key));
}

// ---- Reading

std::string ModelStore::get(const std::string& key) {
    const auto keepAlive = shared_from_this();
    const LayerPtr layer = holder(key);
    if (!layer) return "fails No option with the specified key was found: " + key;
    return exactly(valueFrom(*layer, key));
}

std::string ModelStore::optionFrom(const Layer& layer, const std::string& key) {
    record("get option: " + key + " from " + layer.name);
    return spelledOption({key, layer.name, layer.source->get(within(layer, key))});
}

std::string ModelStore::option(const std::string& key) {
    const auto keepAlive = shared_from_this();
    const LayerPtr layer = holder(key);
    if (!layer) return "fails No option with the specified key was found: " + key;
    return optionFrom(*layer, key);
}

std::string ModelStore::has(const std::string& key) {
    return spelledBool(holder(key) != nullptr);
}

std::string ModelStore::explain(const std::string& key) {
    std::string all;
    for (const auto& layer : layers) {
        if (!applies(*layer, key) || !layer->source->has(within(*layer, key))) continue;
        all += spelledOption({key, layer->name, layer->source->get(within(*layer, key))}) + "; ";
    }
    return all;
}

std::string ModelStore::keys() {
    return spelledTexts(allKeys());
}

std::string ModelStore::keysFrom(const std::string& first) {
    const auto all = allKeys();
    return spelledTexts(std::vector<std::string>(all.lower_bound(first), all.end()));
}

std::string ModelStore::describe() {
    std::string all;
    for (const auto& layer : layers) {
        all += layer->name + '|' + layer->group + '|' + std::to_string(layer->order) + '|' +
               spelledBool(layer->readOnly) + ' ';
    }
    return all;
}

std::string ModelStore::read(const std::vector<std::string>& keys) {
    const auto keepAlive = shared_from_this();
    std::string all;
    for (const auto& key : keys) {
        const LayerPtr layer = holder(key);
        all += (layer == nullptr ? "nothing" : optionFrom(*layer, key)) + "; ";
    }
    return all;
}

// ---- Writing

std::string ModelStore::refusal(const Change& change, const LayerPtr& target) {
    if (target == nullptr && change.source) {
        return "Source not found or not writable: " + change.key + ", " + *change.source;
    }
    if (target == nullptr) return "No writable configuration source for key: " + change.key;
    if (change.value || target->source->forgets()) return "";
    return "Configuration source can't forget keys: " + change.key + ", " + target->name;
}

void ModelStore::awaitReport(const Layer& layer, const std::string& key,
                             const std::function<bool()>& write) {
    const bool reports = layer.reports;
    awaited.emplace_back(key, false);
    try {
        // The store looks after what a source without a listener is not there to say.
        if (write() && !reports && !awaited.back().second) report(key);
    } catch (...) {
        awaited.pop_back();
        throw;
    }
    awaited.pop_back();
}

std::string ModelStore::set(const Step& step, const std::string* sourceName) {
    const auto keepAlive = shared_from_this();
    record("set: " + step.key + (sourceName ? ", " + *sourceName : ""));
    const LayerPtr target = writable(step.key, sourceName);
    const std::optional<std::string> source =
        sourceName ? std::optional<std::string>(*sourceName) : std::nullopt;
    const std::string refused = refusal({step.key, step.value, source}, target);
    if (!refused.empty()) return "fails " + refused;
    record("set: " + step.key + '@' + target->name);
    Value answer;
    awaitReport(*target, step.key, [&] {
        answer = target->source->set(within(*target, step.key), step.value);
        return true;
    });
    return exactly(answer);
}

std::string ModelStore::unset(const Step& step, const std::string* sourceName) {
    const auto keepAlive = shared_from_this();
    record("unset: " + step.key + (sourceName ? ", " + *sourceName : ""));
    const LayerPtr target = writable(step.key, sourceName);
    const std::optional<std::string> source =
        sourceName ? std::optional<std::string>(*sourceName) : std::nullopt;
    const std::string refused = refusal({step.key, std::nullopt, source}, target);
    if (!refused.empty()) return "fails " + refused;
    record("unset: " + step.key + '@' + target->name);
    bool known = false;
    awaitReport(*target, step.key, [&] {
        known = target->source->unset(within(*target, step.key)).has_value();
        return known;
    });
    return spelledBool(known);
}

std::string ModelStore::apply(const std::vector<Change>& changes, bool dryRun) {
    const auto keepAlive = shared_from_this();
    record((dryRun ? "apply, dry run: " : "apply: ") + std::to_string(changes.size()));
    std::vector<LayerPtr> targets;
    std::string refusals;
    for (const Change& change : changes) {
        targets.push_back(writable(change.key, change.source ? &*change.source : nullptr));
        const std::string refused = refusal(change, targets.back());
        if (!refused.empty()) refusals += (refusals.empty() ? "" : "; ") + refused;
    }
    if (!refusals.empty()) return "fails Changes refused: " + refusals;
    std::vector<std::optional<Value>> before;
    std::string outcome;
    for (std::size_t i = 0; i < changes.size(); ++i) {
        const std::string key = within(*targets[i], changes[i].key);
        const bool isHeld = targets[i]->source->has(key);
        before.push_back(isHeld ? std::optional<Value>(targets[i]->source->get(key))
                                : std::nullopt);
        outcome += changes[i].key + " in " + targets[i]->name + " was " +
                   (isHeld ? exactly(*before.back()) : "nothing") + "; ";
    }
    if (!dryRun) writeAll(changes, targets, before);
    return outcome;
}

void ModelStore::writeOne(const Change& change, const Layer& target,
                          const std::optional<Value>& value) {
    record((value ? "set: " : "unset: ") + change.key + '@' + target.name);
    const std::string key = within(target, change.key);
    if (value) {
        target.source->set(key, *value);
    } else if (target.source->forgets()) {
        target.source->unset(key);
    }
}

void ModelStore::writeAll(const std::vector<Change>& changes, const std::vector<LayerPtr>& targets,
                          const std::vector<std::optional<Value>>& before) {
    // Its own keys come before what else changes meanwhile.
    std::vector<std::string> changed;
    for (std::size_t i = 0; i < changes.size(); ++i) {
        if (changes[i].value || before[i]) changed.push_back(changes[i].key);
    }
    auto* const outer = std::exchange(deferred, &changed);
    for (std::size_t i = 0; i < changes.size(); ++i) {
        try {
            writeOne(changes[i], *targets[i], changes[i].value);
        } catch (...) {
            for (std::size_t j = i + 1; j-- > 0;) {
                try {
                    writeOne(changes[j], *targets[j], before[j]);
                } catch (...) {
                    continue;
                }
            }
            deferred = outer;
            throw;
        }
    }
    deferred = outer;
    tell(changed);
}

// ---- Watching

void ModelStore::tell(const std::vector<std::string>& keys) {
    std::vector<std::string> told;
    for (const std::string& key : keys) {
        if (std::find(told.begin(), told.end(), key) == told.end()) told.push_back(key);
    }
    if (deferred != nullptr) {
        deferred->insert(deferred->end(), told.begin(), told.end());
        return;
    }
    std::vector<ChangeWatch> due;
    for (const std::string& key : told) keepChange(key, due);
    serve(due);
    for (const std::string& key : told) update(key);
}

void ModelStore::report(const std::string& key) {
    const auto keepAlive = weak_from_this().lock();
    for (auto& [awaitedKey, hasCome] : awaited) {
        if (awaitedKey == key) hasCome = true;
    }
    if (deferred != nullptr) return deferred->push_back(key);
    std::vector<ChangeWatch> due;
    keepChange(key, due);
    serve(due);
    update(key);
}

// Streams of changes keep the change first, all of them, and are then served.
void ModelStore::keepChange(const std::string& key, std::vector<ChangeWatch>& due) {
    const auto isTold = [&](const ChangeWatch& watch) {
        return key.substr(0, watch.prefix.size()) == watch.prefix;
    };
    if (std::none_of(changeWatches.begin(), changeWatches.end(), isTold)) return;
    configuration::OptionChange change;
    change.key = key;
    std::exception_ptr failure;
    try {
        const LayerPtr layer = holder(key);
        if (layer != nullptr) {
            const Value value = layer->source->get(within(*layer, key));
            change.option = configuration::Option{key, layer->name, value};
        }
    } catch (...) {
        failure = std::current_exception();
    }
    const auto isSameKey = [&](const auto& kept) { return kept.key == key; };
    for (ChangeWatch& watch : changeWatches) {
        if (!isTold(watch)) continue;
        if (watch.failure == nullptr) watch.failure = failure;
        if (watch.failure == nullptr) watch.publisher->keep(change, isSameKey);
        const auto isNoted = [&](const ChangeWatch& noted) { return noted.number == watch.number; };
        const auto noted = std::find_if(due.begin(), due.end(), isNoted);
        if (noted == due.end()) {
            due.push_back(watch);
        } else {
            noted->failure = watch.failure;
        }
    }
}

void ModelStore::serve(const std::vector<ChangeWatch>& due) {
    for (const ChangeWatch& watch : due) {
        try {
            if (watch.failure) {
                watch.publisher->fail(watch.failure);
            } else {
                watch.publisher->deliver();
            }
        } catch (...) {
            error("Error in configuration change subscriber: " + watch.prefix);
        }
    }
}

void ModelStore::tellOfChanges(const std::set<std::string>& keys, const std::string& group) {
    std::vector<ChangeWatch> due;
    for (const auto& key : keys) keepChange(group + key, due);
    serve(due);
}

void ModelStore::update(const std::string& key) {
    record("updatePublishers: " + key);
    const LayerPtr layer = holder(key);
    if (layer == nullptr) return;
    const Value value = valueFrom(*layer, key);
    std::vector<Watch> snapshot;
    for (const Watch& watch : watches) {
        if (watch.key == key) snapshot.push_back(watch);
    }
    for (const Watch& watch : snapshot) {
        try {
            record("notifying watcher: " + key);
            watch.publisher->publish(value);
        } catch (...) {
            error("Error in configuration value subscriber: " + key);
        }
    }
}

std::shared_ptr<ModelPublisher> ModelStore::watch(const std::string& key) {
    std::shared_ptr<ModelPublisher> publisher;
    Value current;
    {
        const auto keepAlive = shared_from_this();
        record("watchOption: " + key);
        const std::uint64_t number = nextWatch++;
        publisher = std::make_shared<ModelPublisher>(1, forgetting(number));
        watches.push_back({publisher, key, number});
        const LayerPtr layer = holder(key);
        if (layer == nullptr) return publisher;
        current = valueFrom(*layer, key);
    }
    publisher->publishFirst(current);
    return publisher;
}

std::shared_ptr<ModelChanges> ModelStore::watchChanges(const std::string& prefix) {
    const auto keepAlive = shared_from_this();
    record("watchChanges: " + prefix);
    const std::uint64_t number = nextWatch++;
    auto publisher = std::make_shared<ModelChanges>(std::numeric_limits<std::uint64_t>::max(),
                                                    forgetting(number));
    changeWatches.push_back({publisher, prefix, number});
    return publisher;
}

std::function<void()> ModelStore::forgetting(std::uint64_t number) {
    return [weak = weak_from_this(), number] {
        if (const auto store = weak.lock()) store->forget(number);
    };
}

void ModelStore::forget(std::uint64_t number) {
    const auto isIt = [&](const auto& watch) { return watch.number == number; };
    const auto found = std::find_if(watches.begin(), watches.end(), isIt);
    if (found != watches.end()) watches.erase(found);
    const auto change = std::find_if(changeWatches.begin(), changeWatches.end(), isIt);
    if (change != changeWatches.end()) changeWatches.erase(change);
}

// ---- The list of layers

std::string ModelStore::add(const Step& step, std::shared_ptr<ModelSource> source) {
    const auto keepAlive = shared_from_this();
    record("addSource: " + step.name + ", " + step.group + ", " + std::to_string(step.order) +
           ", " + (step.flag ? "1" : "0"));
    if (find(step.name) != nullptr) {
        return "fails Source with the requested name already exists: " + step.name;
    }
    std::string group = step.group;
    if (!group.empty() && group.back() != '.') group += '.';
    const auto position = std::find_if(layers.begin(), layers.end(), [&](const auto& layer) {
        return layer->order >= step.order;
    });
    const auto added =
        std::make_shared<Layer>(Layer{step.name, group, step.order, step.flag, source});
    layers.insert(position, added);
    const auto keys = source->keys();
    tellOfChanges(keys, group);
    for (const auto& key : keys) update(group + key);
    source->listen(this, group);
    added->reports = true;
    return "true";
}

std::string ModelStore::remove(const std::string& name) {
    const auto keepAlive = shared_from_this();
    record("removeSource: " + name);
    const LayerPtr removed = find(name);
    if (removed == nullptr) return "false";
    const auto keys = removed->source->keys();
    const std::string group = removed->group;
    layers.erase(std::find(layers.begin(), layers.end(), removed));
    tellOfChanges(keys, group);
    for (const auto& key : keys) update(key);
    return "true";
}

}  // namespace velkor::fuzz::store
