#include "configuration/ConfigurationImpl.hpp"

#include <algorithm>
#include <cstring>
#include <exception>
#include <iostream>
#include <limits>
#include <stdexcept>
#include <typeinfo>
#include <utility>

#include "configuration/Loggers.hpp"
#include "configuration/StoreErrors.hpp"
#include "configuration/WatchList.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "configuration/sources/PropertyFileSource.hpp"

namespace velkor::configuration {

namespace {

constexpr char groupSeparator = '.';

// Keys are put together for as many levels of calls between store and sources without a new buffer.
constexpr std::size_t pooledScratchKeys = 4;

bool appliesTo(const std::string& group, const std::string& key) {
    return group.empty() ||
           (key.size() >= group.size() && std::memcmp(key.data(), group.data(), group.size()) == 0);
}

std::string normalised(std::string group) {
    if (!group.empty() && group.back() != groupSeparator) group += groupSeparator;
    return group;
}

// Exactly these classes: one that derives from them may answer differently.
const ValueTable* tableOf(const ConfigurationSource& source) {
    if (typeid(source) == typeid(InMemorySource)) {
        return &static_cast<const InMemorySource&>(source).table();
    }
    if (typeid(source) == typeid(PropertyFileSource)) {
        return &static_cast<const PropertyFileSource&>(source).table();
    }
    return nullptr;
}

template <class T, class Error = std::runtime_error>
Future<T> failed(const std::string& message) {
    return makeFailedFuture<T>(std::make_exception_ptr(Error(message)));
}

template <class T>
Future<T> noSuchOption(const std::string& key) {
    return failed<T>(store_errors::noSuchOption + key);
}

void reportSubscriberError(const std::string& key) noexcept {
    try {
        std::cerr << "Error in configuration value subscriber: " + key + '\n' << std::flush;
    } catch (...) {
        // A broken standard error must not keep the other watchers from being served, and there is
        // nowhere left to report to.
        return;
    }
}

}  // namespace

/// One level of the store's mutex, held by one operation.
class ConfigurationImpl::Operation {
public:
    explicit Operation(ConfigurationImpl& owner) : store(owner), held(owner.mutex) {
        if (store.heldLevels++ == 0 && store.changesAreNoticed())
            keepAlive = store.weak_from_this().lock();
    }

    ~Operation() { store.giveBackLevel(released); }

    Operation(const Operation&) = delete;
    Operation& operator=(const Operation&) = delete;

    std::unique_lock<std::recursive_mutex>& lock() { return held; }

private:
    // Destroyed from the last to the first: the level is given back, then goes what the store has
    // let go of, then perhaps the store itself.
    std::shared_ptr<const Configuration> keepAlive;
    Retired released;
    ConfigurationImpl& store;
    std::unique_lock<std::recursive_mutex> held;
};

/// A buffer of the store for a form of one key that is not the caller's own string. Used with the
/// mutex held.
class ConfigurationImpl::ScratchKey {
public:
    explicit ScratchKey(ConfigurationImpl& owner) : pool(owner.scratchKeys) {}

    ~ScratchKey() {
        if (borrowed && pool.size() < pool.capacity()) pool.push_back(std::move(text));
    }

    ScratchKey(const ScratchKey&) = delete;
    ScratchKey& operator=(const ScratchKey&) = delete;

    /// `key` without `group`, which it begins with. Groups of the same size cut off the same.
    const std::string& within(const std::string& group, const std::string& key) {
        if (group.empty()) return key;
        if (group.size() != cutOff) {
            cutOff = group.size();
            buffer().assign(key, cutOff, std::string::npos);
        }
        return text;
    }

    /// `key` with `group` in front.
    const std::string& joined(const std::string& group, const std::string& key) {
        return group.empty() ? key : buffer().assign(group).append(key);
    }

private:
    std::string& buffer() {
        if (!borrowed && !pool.empty()) {
            text = std::move(pool.back());
            pool.pop_back();
        }
        borrowed = true;
        return text;
    }

    std::vector<std::string>& pool;
    std::string text;
    std::size_t cutOff = 0;
    bool borrowed = false;
};

ConfigurationImpl::ConfigurationSourceMap::ConfigurationSourceMap(
    std::string sourceName, std::string keyPrefix, int precedence, bool isReadOnly,
    std::shared_ptr<ConfigurationSource> layer)
    : name(std::move(sourceName)),
      group(std::move(keyPrefix)),
      order(precedence),
      readOnly(isReadOnly),
      source(std::move(layer)) {}

ConfigurationImpl::RegisteredSource::RegisteredSource(ConfigurationSourceMap entry)
    : ConfigurationSourceMap(std::move(entry)), table(tableOf(*source)) {}

ConfigurationImpl::ConfigurationImpl()
    : sources(std::make_shared<SourceList>()), publishers(std::make_unique<WatchList>()) {
    scratchKeys.reserve(pooledScratchKeys);
    ConfigurationImpl::addInMemorySource("default", "", std::numeric_limits<int>::max(), false, {});
    ConfigurationImpl::addInMemorySource("override", "", 0, false, {});
}

ConfigurationImpl::~ConfigurationImpl() {
    {
        // A source may change the registry even now: the walk keeps the list that it began with.
        std::shared_ptr<const SourceList> layers;
        const std::unique_lock<std::recursive_mutex> lock(mutex);
        layers = sources;
        for (const auto& entry : *layers) entry.source->setChangeListener({});
    }
    while (publishers->removeOldest() != nullptr) continue;
}

Future<ConfigurationValue> ConfigurationImpl::get(const std::string& key) {
    const Operation operation(*this);
    ScratchKey scratch(*this);
    const Layer layer = findLayer(key, scratch);
    if (!layer) return noSuchOption<ConfigurationValue>(key);
    return makeReadyFuture(readValue(layer, key));
}

Future<Option> ConfigurationImpl::getOption(const std::string& key) {
    const Operation operation(*this);
    ScratchKey scratch(*this);
    const Layer layer = findLayer(key, scratch);
    if (!layer) return noSuchOption<Option>(key);
    return makeReadyFuture(readOption(layer, key));
}

Future<ConfigurationValue> ConfigurationImpl::set(const std::string& key,
                                                  ConfigurationValue value) {
    storeLogger.write(common::debug, "set: ", key);
    const Operation operation(*this);
    const auto* target = findTarget(key, nullptr);
    if (target == nullptr) {
        return failed<ConfigurationValue>(store_errors::noWritableSource + key);
    }
    return write(*target, key, std::move(value));
}

Future<ConfigurationValue> ConfigurationImpl::set(const std::string& key, ConfigurationValue value,
                                                  const std::string& sourceName) {
    storeLogger.write(common::debug, "set: ", key, ", ", sourceName);
    const Operation operation(*this);
    const auto* target = findTarget(key, &sourceName);
    if (target == nullptr) {
        return failed<ConfigurationValue>(store_errors::sourceNotWritable + key + ", " +
                                          sourceName);
    }
    return write(*target, key, std::move(value));
}

Future<bool> ConfigurationImpl::has(const std::string& key) {
    const Operation operation(*this);
    ScratchKey scratch(*this);
    return makeReadyFuture(static_cast<bool>(findLayer(key, scratch)));
}

Future<std::set<std::string>> ConfigurationImpl::keys() {
    const Operation operation(*this);
    const SourceList& layers = *sources;
    std::set<std::string> all;
    for (const auto& entry : layers) {
        auto layerKeys = entry.source->keys();
        if (entry.group.empty()) {
            if (all.empty()) all.swap(layerKeys);
            all.merge(layerKeys);
            continue;
        }
        while (!layerKeys.empty()) {
            auto node = layerKeys.extract(layerKeys.begin());
            node.value().insert(0, entry.group);
            all.insert(std::move(node));
        }
    }
    return makeReadyFuture(std::move(all));
}

std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> ConfigurationImpl::watchOption(
    const std::string& key) {
    storeLogger.write(common::debug, "watchOption: ", key);
    std::shared_ptr<WatchPublisher> publisher;
    ConfigurationValue current;
    {
        const Operation operation(*this);
        const std::uint64_t streamId = nextStreamId.fetch_add(1);
        const std::weak_ptr<ConfigurationImpl> store =
            std::static_pointer_cast<ConfigurationImpl>(shared_from_this());
        const auto forget = [store, streamId] {
            if (const auto alive = store.lock()) alive->removeStream(streamId);
        };
        publisher = std::make_shared<WatchPublisher>(1, forget);
        publishers->add(publisher, key, streamId);
        updateRunsForeignCode();
        ScratchKey scratch(*this);
        const Layer layer = findLayer(key, scratch);
        if (!layer) return publisher;
        current = readValue(layer, key);
    }
    publisher->publishFirst(current);
    return publisher;
}

Future<bool> ConfigurationImpl::addPropertyFileSource(const std::string& name,
                                                      const std::string& group, int order,
                                                      bool readOnly, const std::u16string& path) {
    return addSource(name, group, order, readOnly, std::make_shared<PropertyFileSource>(path));
}

Future<bool> ConfigurationImpl::addInMemorySource(const std::string& name, const std::string& group,
                                                  int order, bool readOnly, ValueMap&& values) {
    return addSource(name, group, order, readOnly,
                     std::make_shared<InMemorySource>(std::move(values)));
}

Future<bool> ConfigurationImpl::addEnvironmentSource(const std::string&, const std::string&, int) {
    return makeReadyFuture(false);
}

Future<bool> ConfigurationImpl::addSource(const std::string& name, const std::string& group,
                                          int order, bool readOnly,
                                          std::shared_ptr<ConfigurationSource> source) {
    if (source == nullptr) {
        throw std::invalid_argument(store_errors::nullSource);
    }
    const ConfigurationSource& dynamicSource = *source;
    storeLogger.write(common::debug, "addSource: ", name, ", ", group, ", ", order, ", ", readOnly,
                      ", ", typeid(dynamicSource).name());
    const auto keepAlive = weak_from_this().lock();
    Operation operation(*this);
    if (findSource(name) != nullptr) {
        return failed<bool, std::invalid_argument>(store_errors::duplicateSource + name);
    }
    const std::string prefix = normalised(group);
    insertSource(ConfigurationSourceMap(name, prefix, order, readOnly, source));
    const auto keys = source->keys();
    if (changesAreNoticed()) {
        for (const auto& key : keys) updatePublishers(operation.lock(), prefix + key);
    }
    source->setChangeListener([this, prefix](const std::string& key) {
        if (changesAreNoticed()) onSourceChanged(prefix, key);
    });
    return makeReadyFuture(true);
}

Future<bool> ConfigurationImpl::removeSource(const std::string& name) {
    storeLogger.write(common::debug, "removeSource: ", name);
    Operation operation(*this);
    const auto* entry = findSource(name);
    if (entry == nullptr) return makeReadyFuture(false);
    const auto keys = entry->source->keys();
    eraseSource(name);
    // Watchers of prefixed keys are deliberately left alone: see Configuration::removeSource.
    for (const auto& key : keys) updatePublishers(operation.lock(), key);
    return makeReadyFuture(true);
}

std::shared_ptr<Configuration> ConfigurationImpl::getPtr() {
    return shared_from_this();
}

Future<std::vector<SourceDescription>> ConfigurationImpl::describeSources() {
    const Operation operation(*this);
    std::vector<SourceDescription> descriptions;
    descriptions.reserve(sources->size());
    for (const auto& entry : *sources) {
        descriptions.push_back({entry.name, entry.group, entry.order, entry.readOnly});
    }
    return makeReadyFuture(std::move(descriptions));
}

Future<std::vector<Option>> ConfigurationImpl::explain(const std::string& key) {
    const Operation operation(*this);
    ScratchKey scratch(*this);
    const SourceList& layers = *sources;
    std::vector<Option> holders;
    for (const auto& entry : layers) {
        if (!appliesTo(entry.group, key)) continue;
        const std::string& relativeKey = scratch.within(entry.group, key);
        if (!entry.source->has(relativeKey)) continue;
        holders.emplace_back(key, entry.name, entry.source->get(relativeKey));
    }
    return makeReadyFuture(std::move(holders));
}

bool ConfigurationImpl::doHas(std::unique_lock<std::recursive_mutex>&, const std::string& key) {
    const Operation operation(*this);
    ScratchKey scratch(*this);
    return static_cast<bool>(findLayer(key, scratch));
}

ConfigurationValue ConfigurationImpl::doGet(std::unique_lock<std::recursive_mutex>&,
                                            const std::string& key) {
    const Operation operation(*this);
    ScratchKey scratch(*this);
    const Layer layer = findLayer(key, scratch);
    if (!layer) throw std::runtime_error(store_errors::noOptionValue + key);
    return readValue(layer, key);
}

Option ConfigurationImpl::doGetOption(std::unique_lock<std::recursive_mutex>&,
                                      const std::string& key) {
    const Operation operation(*this);
    ScratchKey scratch(*this);
    const Layer layer = findLayer(key, scratch);
    if (!layer) throw std::runtime_error(store_errors::noOption + key);
    return readOption(layer, key);
}

ConfigurationImpl::Layer ConfigurationImpl::findLayer(const std::string& key, ScratchKey& scratch) {
    const SourceList& layers = *sources;
    for (const auto& entry : layers) {
        if (!appliesTo(entry.group, key)) continue;
        const std::string& relativeKey = scratch.within(entry.group, key);
        if (entry.table != nullptr) {
            const ConfigurationValue* held = entry.table->find(relativeKey);
            if (held != nullptr) return {&entry, relativeKey, held};
        } else if (entry.source->has(relativeKey)) {
            return {&entry, relativeKey, nullptr};
        }
    }
    return {nullptr, key, nullptr};
}

ConfigurationValue ConfigurationImpl::readValue(const Layer& layer, const std::string& key) {
    storeLogger.write(common::debug, "get: ", key, " from ", layer.entry->name);
    return layer.value();
}

Option ConfigurationImpl::readOption(const Layer& layer, const std::string& key) {
    storeLogger.write(common::debug, "get option: ", key, " from ", layer.entry->name);
    return Option(key, layer.entry->name, layer.value());
}

const ConfigurationImpl::ConfigurationSourceMap* ConfigurationImpl::findTarget(
    const std::string& key, const std::string* sourceName) const {
    for (const auto& entry : *sources) {
        if (entry.readOnly || !appliesTo(entry.group, key)) continue;
        if (sourceName == nullptr || entry.name == *sourceName) return &entry;
    }
    return nullptr;
}

Future<ConfigurationValue> ConfigurationImpl::write(const ConfigurationSourceMap& target,
                                                    const std::string& key,
                                                    ConfigurationValue&& value) {
    storeLogger.write(common::debug, "set: ", key, "@", target.name);
    ScratchKey scratch(*this);
    return makeReadyFuture(target.source->set(scratch.within(target.group, key), std::move(value)));
}

bool ConfigurationImpl::changesAreNoticed() const noexcept {
    return runsForeignCode.load(std::memory_order_relaxed) || storeLogger.isEnabled(common::debug);
}

void ConfigurationImpl::onSourceChanged(const std::string& group, const std::string& key) {
    Operation operation(*this);
    ScratchKey scratch(*this);
    updatePublishers(operation.lock(), scratch.joined(group, key));
}

void ConfigurationImpl::updatePublishers(std::unique_lock<std::recursive_mutex>& lock,
                                         const std::string& key) {
    storeLogger.write(common::debug, "updatePublishers: ", key);
    // Reading a value for nobody is left out where neither the log nor a source would show it.
    const bool noticed = hasForeignSources || storeLogger.isEnabled(common::debug);
    WatchList::Publishers watchers;
    if (!noticed) {
        watchers = publishers->watching(key);
        if (watchers.empty()) return;
    }
    ConfigurationValue value;
    {
        ScratchKey scratch(*this);
        const Layer layer = findLayer(key, scratch);
        if (!layer) return;
        value = readValue(layer, key);
    }
    // A source or a log sink may have added or cancelled watches meanwhile.
    if (noticed) watchers = publishers->watching(key);
    if (watchers.empty()) return;

    const bool counted = heldLevels > 0;
    Retired released;
    if (counted) giveBackLevel(released);
    lock.unlock();
    released.clear();
    for (const auto& publisher : watchers) {
        try {
            storeLogger.write(common::debug, "notifying watcher: ", key);
            publisher->publish(value);
        } catch (...) {
            reportSubscriberError(key);
        }
    }
    // The last reference to a watch that was cancelled meanwhile is given up without the lock.
    watchers.clear();
    lock.lock();
    if (counted) ++heldLevels;
}

void ConfigurationImpl::removeStream(std::uint64_t streamId) {
    const Operation operation(*this);
    if (auto publisher = publishers->remove(streamId)) retire(std::move(publisher));
    updateRunsForeignCode();
}

const ConfigurationImpl::ConfigurationSourceMap* ConfigurationImpl::findSource(
    const std::string& name) const {
    const auto found = std::find_if(sources->begin(), sources->end(),
                                    [&](const auto& entry) { return entry.name == name; });
    return found == sources->end() ? nullptr : &*found;
}

void ConfigurationImpl::insertSource(ConfigurationSourceMap entry) {
    SourceList changed = *sources;
    const auto position = std::find_if(changed.begin(), changed.end(), [&](const auto& present) {
        return present.order >= entry.order;
    });
    changed.insert(position, RegisteredSource(std::move(entry)));
    replaceSources(std::move(changed));
}

void ConfigurationImpl::eraseSource(const std::string& name) {
    SourceList changed = *sources;
    const auto removed = std::find_if(changed.begin(), changed.end(),
                                      [&](const auto& entry) { return entry.name == name; });
    if (removed == changed.end()) return;
    retire(std::move(removed->source));
    changed.erase(removed);
    replaceSources(std::move(changed));
}

void ConfigurationImpl::replaceSources(SourceList changed) {
    auto next = std::make_shared<const SourceList>(std::move(changed));
    pastSources.push_back(sources);
    sources = std::move(next);
    hasForeignSources = std::any_of(sources->begin(), sources->end(),
                                    [](const auto& entry) { return entry.table == nullptr; });
    updateRunsForeignCode();
}

void ConfigurationImpl::updateRunsForeignCode() {
    runsForeignCode = hasForeignSources || !publishers->empty();
}

void ConfigurationImpl::retire(std::shared_ptr<const void> object) {
    retired.push_back(std::move(object));
}

void ConfigurationImpl::giveBackLevel(Retired& released) noexcept {
    if (--heldLevels > 0) return;
    // No walk needs these any more. Removed sources are retired, so none is destroyed here.
    pastSources.clear();
    released.swap(retired);
}

}  // namespace velkor::configuration
