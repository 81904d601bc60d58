#include "configuration/ConfigurationImpl.hpp"

#include <limits>
#include <stdexcept>
#include <typeinfo>
#include <utility>

#include "configuration/Loggers.hpp"
#include "configuration/StoreErrors.hpp"
#include "configuration/detail/AwaitedReport.hpp"
#include "configuration/detail/ChangeList.hpp"
#include "configuration/detail/Lookup.hpp"
#include "configuration/detail/StoreOperation.hpp"
#include "configuration/detail/WatchList.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "configuration/sources/PropertyFileSource.hpp"

namespace velkor::configuration {

namespace {

using detail::Lookup, detail::StoreLock, detail::WatchList;

}  // namespace

ConfigurationImpl::ConfigurationImpl()
    : publishers(std::make_unique<WatchList>()),
      changeStreams(std::make_unique<detail::ChangeList>()) {
    ConfigurationImpl::addInMemorySource("default", "", std::numeric_limits<int>::max(), false, {});
    ConfigurationImpl::addInMemorySource("override", "", 0, false, {});
}

ConfigurationImpl::~ConfigurationImpl() {
    {
        // A source may change the registry even now: the walk keeps the list that it began with.
        std::shared_ptr<const detail::SourceRegistry::SourceList> layers;
        const StoreLock::Level level(storeLock);
        closing = true;
        layers = sources.list();
        for (const auto& entry : *layers) {
            entry->source->setChangeListener({});
            if (entry->attached != nullptr) entry->attached->detach();
        }
    }
    while (publishers->removeOldest() != nullptr) continue;
    while (changeStreams->removeOldest() != nullptr) continue;
}

Future<ConfigurationValue> ConfigurationImpl::get(const std::string& key) {
    const Operation operation(*this);
    const Lookup layer(sources, key);
    if (!layer) return failed<ConfigurationValue>(store_errors::noSuchOption + key);
    return makeReadyFuture(layer.value());
}

Future<Option> ConfigurationImpl::getOption(const std::string& key) {
    const Operation operation(*this);
    const Lookup layer(sources, key);
    if (!layer) return failed<Option>(store_errors::noSuchOption + key);
    return makeReadyFuture(layer.option());
}

Future<ConfigurationValue> ConfigurationImpl::set(const std::string& key,
                                                  ConfigurationValue value) {
    const Operation operation(*this, "set: ", key);
    const auto* target = sources.firstWritable(key, nullptr);
    if (target == nullptr) return failed<ConfigurationValue>(store_errors::noWritableSource + key);
    return write(*target, key, std::move(value));
}

Future<ConfigurationValue> ConfigurationImpl::set(const std::string& key, ConfigurationValue value,
                                                  const std::string& sourceName) {
    const Operation operation(*this, "set: ", key, ", ", sourceName);
    const auto* target = sources.firstWritable(key, &sourceName);
    if (target == nullptr) {
        return failed<ConfigurationValue>(store_errors::sourceNotWritable + key + ", " +
                                          sourceName);
    }
    return write(*target, key, std::move(value));
}

Future<bool> ConfigurationImpl::has(const std::string& key) {
    const Operation operation(*this);
    return makeReadyFuture(static_cast<bool>(Lookup(sources, key)));
}

Future<std::set<std::string>> ConfigurationImpl::keys() {
    const Operation operation(*this);
    return makeReadyFuture(sources.keys());
}

std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> ConfigurationImpl::watchOption(
    const std::string& key) {
    std::shared_ptr<detail::WatchPublisher> publisher;
    ConfigurationValue current;
    {
        const Operation operation(*this, "watchOption: ", key);
        const std::uint64_t streamId = nextStreamId.fetch_add(1);
        publisher = std::make_shared<detail::WatchPublisher>(1, forgetting(streamId));
        publishers->add(publisher, key, streamId);
        updateHasForeignCode();
        const Lookup layer(sources, key);
        if (!layer) return publisher;
        current = layer.value();
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
    if (source == nullptr) throw std::invalid_argument(store_errors::nullSource);
    const ConfigurationSource& dynamicSource = *source;
    const auto keepAlive = weak_from_this().lock();  // the source may be the first foreign code
    Operation operation(*this, "addSource: ", name, ", ", group, ", ", order, ", ", readOnly, ", ",
                        typeid(dynamicSource).name());
    if (sources.find(name) != nullptr) {
        return failed<bool, std::invalid_argument>(store_errors::duplicateSource + name);
    }
    const std::string prefix = detail::normalisedGroup(group);
    storeLock.retire(sources.list());
    const auto entry = insert(ConfigurationSourceMap(name, prefix, order, readOnly, source));
    version.fetch_add(1, std::memory_order_release);
    updateHasForeignCode();
    const auto keys = source->keys();
    if (foreignCodeMayRun()) {
        tellStreams(operation.mutexLevel(), prefix, keys);
        for (const auto& key : keys)
            publishers->update(operation.mutexLevel(), sources, prefix + key);
    }
    if (closing) return makeReadyFuture(true);
    source->setChangeListener(
        [this, prefix](const std::string& key) { reportChange(prefix, key); });
    entry->reportsChanges = true;
    return makeReadyFuture(true);
}

Future<bool> ConfigurationImpl::removeSource(const std::string& name) {
    Operation operation(*this, "removeSource: ", name);
    const auto* entry = sources.find(name);
    if (entry == nullptr) return makeReadyFuture(false);
    const auto keys = entry->source->keys();
    const std::string prefix = entry->group;
    storeLock.retire(sources.list());
    sources.erase(*entry);
    if (entry->attached != nullptr) entry->attached->detach();
    version.fetch_add(1, std::memory_order_release);
    updateHasForeignCode();
    tellStreams(operation.mutexLevel(), prefix, keys);
    // Watchers of prefixed keys are deliberately left alone: see Configuration::removeSource.
    for (const auto& key : keys) publishers->update(operation.mutexLevel(), sources, key);
    return makeReadyFuture(true);
}

std::shared_ptr<Configuration> ConfigurationImpl::getPtr() {
    return shared_from_this();
}

bool ConfigurationImpl::doHas(std::unique_lock<std::recursive_mutex>& lock,
                              const std::string& key) {
    const StoreLock::Level level(storeLock, lock);
    return static_cast<bool>(Lookup(sources, key));
}

ConfigurationValue ConfigurationImpl::doGet(std::unique_lock<std::recursive_mutex>& lock,
                                            const std::string& key) {
    const StoreLock::Level level(storeLock, lock);
    const Lookup layer(sources, key);
    if (!layer) throw std::runtime_error(store_errors::noOptionValue + key);
    return layer.value();
}

Option ConfigurationImpl::doGetOption(std::unique_lock<std::recursive_mutex>& lock,
                                      const std::string& key) {
    const StoreLock::Level level(storeLock, lock);
    const Lookup layer(sources, key);
    if (!layer) throw std::runtime_error(store_errors::noOption + key);
    return layer.option();
}

void ConfigurationImpl::updatePublishers(std::unique_lock<std::recursive_mutex>& lock,
                                         const std::string& key) {
    StoreLock::Level level(storeLock, lock);
    publishers->update(level, sources, key);
}

void ConfigurationImpl::removeStream(std::uint64_t streamId) {
    const Operation operation(*this);
    // Whoever cancels the watch holds another reference to it: it can be dropped here.
    storeLock.retireOrDrop(publishers->remove(streamId));
    storeLock.retireOrDrop(changeStreams->remove(streamId));
    updateHasForeignCode();
}

Future<ConfigurationValue> ConfigurationImpl::write(const detail::RegisteredSource& target,
                                                    const std::string& key,
                                                    ConfigurationValue&& value) {
    storeLogger.write(common::debug, "set: ", key, "@", target.name);
    detail::KeyBuffer buffer(sources.keyBuffers());
    const std::string& relativeKey = buffer.within(target.group, key);
    Answer<ConfigurationValue> answer;
    if (target.reportsChanges) {
        return answer.with(target.source->set(relativeKey, std::move(value)));
    }
    const detail::AwaitedReport report(awaited, key);
    ConfigurationValue replaced = target.source->set(relativeKey, std::move(value));
    if (!report.hasCome()) reportChange("", key);
    return answer.with(std::move(replaced));
}

// Called for each change of a source: by the listener in it, or by the store where there is none.
void ConfigurationImpl::reportChange(const std::string& group, const std::string& key) {
    version.fetch_add(1, std::memory_order_release);
    if (foreignCodeMayRun()) onSourceChanged(group, key);
}

// Whether anything but this store can notice an operation, or end the store during it.
bool ConfigurationImpl::foreignCodeMayRun() const noexcept {
    return hasForeignCode.load(std::memory_order_relaxed) || storeLogger.isEnabled(common::debug);
}

void ConfigurationImpl::updateHasForeignCode() {
    hasForeignCode = sources.hasForeignSources() || !publishers->empty() || !changeStreams->empty();
}

}  // namespace velkor::configuration
