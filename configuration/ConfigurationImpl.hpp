#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "configuration/Configuration.hpp"
#include "configuration/sources/ConfigurationSource.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

class ValueTable;
class WatchList;

/// How a source is registered.
struct SourceDescription {
    std::string name;
    std::string group;  ///< Empty, or ending in ".".
    int order;
    bool readOnly;
};

/// The store. A fresh one holds two writable sources without a group: "override" (order 0), which
/// takes ordinary writes, and "default" (order 2147483647), the layer of last resort.
///
/// Thread-safe: one recursive mutex, taken by every operation to its end, guards all state; sources
/// are called under it and may call back into the store. It is released while watchers are told of
/// a source that was added or removed and of a watch's first value; a write keeps it.
/// Lock order: store, publisher, future state. What the store lets go of (sources, publishers) is
/// destroyed after the mutex has been released.
///
/// Owned by a shared pointer; without one, `watchOption` and `getPtr` throw `std::bad_weak_ptr`.
class VELKOR_EXPORT ConfigurationImpl : public Configuration,
                                        public std::enable_shared_from_this<Configuration> {
public:
    /// One registered source.
    struct ConfigurationSourceMap {
        ConfigurationSourceMap(std::string sourceName, std::string keyPrefix, int precedence,
                               bool isReadOnly, std::shared_ptr<ConfigurationSource> layer);

        std::string name;
        std::string group;  ///< Normalised: empty, or ending in ".".
        int order;
        bool readOnly;
        std::shared_ptr<ConfigurationSource> source;
    };

    ConfigurationImpl();
    ConfigurationImpl(const ConfigurationImpl&) = delete;
    ConfigurationImpl& operator=(const ConfigurationImpl&) = delete;

    /// Detaches from every source, then ends every watch and releases the sources. A failure there
    /// ends the process.
    ~ConfigurationImpl() override;

    Future<ConfigurationValue> get(const std::string& key) override;
    Future<Option> getOption(const std::string& key) override;
    Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value) override;
    Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value,
                                   const std::string& sourceName) override;
    Future<bool> has(const std::string& key) override;
    Future<std::set<std::string>> keys() override;
    std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> watchOption(
        const std::string& key) override;
    Future<bool> addPropertyFileSource(const std::string& name, const std::string& group, int order,
                                       bool readOnly, const std::u16string& path) override;
    Future<bool> addInMemorySource(const std::string& name, const std::string& group, int order,
                                   bool readOnly, ValueMap&& values) override;
    Future<bool> addEnvironmentSource(const std::string& name, const std::string& group,
                                      int order) override;
    Future<bool> removeSource(const std::string& name) override;
    std::shared_ptr<Configuration> getPtr() override;

    /// Registers `source` under `name`, in front of the sources of the same or a greater `order`;
    /// gives true. `group` becomes a key prefix: a "." is added to its end where there is none.
    /// Watchers of the source's keys are told the value that is effective now.
    ///
    /// Fails with `std::invalid_argument` "Source with the requested name already exists: " and the
    /// name. A null source throws `std::invalid_argument` "A configuration source must not be
    /// null." before anything else happens. What the source's `keys` throws leaves the call; the
    /// source stays registered then, without a listener.
    ///
    /// Lifetime: the source gets a change listener that points to this store without owning it. The
    /// store takes it back when it is destroyed, not when the source is removed, so a source that
    /// others still write after its removal must not outlive the store.
    Future<bool> addSource(const std::string& name, const std::string& group, int order,
                           bool readOnly, std::shared_ptr<ConfigurationSource> source);

    /// All sources in order of precedence.
    Future<std::vector<SourceDescription>> describeSources();

    /// Every source that holds `key` with the value it gives, in order of precedence: the first is
    /// the effective one. Empty when there is none.
    Future<std::vector<Option>> explain(const std::string& key);

protected:
    // These take the caller's lock on the store's mutex, which is held: the caller's only level, or
    // one within an operation of the store.

    /// Whether any source has `key`.
    bool doHas(std::unique_lock<std::recursive_mutex>& lock, const std::string& key);

    /// The effective value; `std::runtime_error` "No option value for key: " and the key.
    ConfigurationValue doGet(std::unique_lock<std::recursive_mutex>& lock, const std::string& key);

    /// The value with its source; `std::runtime_error` "No option for key: " and the key.
    Option doGetOption(std::unique_lock<std::recursive_mutex>& lock, const std::string& key);

    /// Publishes the effective value of `key`, if there is one, to the watchers of exactly that
    /// key, with one level of the mutex released. On return the lock is held again.
    void updatePublishers(std::unique_lock<std::recursive_mutex>& lock, const std::string& key);

    /// Forgets one watch; does nothing when there is none with that number.
    void removeStream(std::uint64_t streamId);

    /// Guards everything below.
    std::recursive_mutex mutex;

private:
    /// A registered source and, if it is one of this library's own, the table it reads from.
    struct RegisteredSource : ConfigurationSourceMap {
        explicit RegisteredSource(ConfigurationSourceMap entry);

        const ValueTable* table;
    };

    using SourceList = std::vector<RegisteredSource>;
    using Retired = std::vector<std::shared_ptr<const void>>;

    class Operation;
    class ScratchKey;

    /// The layer that decides a key, the key as its source knows it, and the value if it is in the
    /// source's table.
    struct Layer {
        const ConfigurationSourceMap* entry;
        const std::string& relativeKey;
        const ConfigurationValue* held;

        ConfigurationValue value() const { return held ? *held : entry->source->get(relativeKey); }
        explicit operator bool() const { return entry != nullptr; }
    };

    Layer findLayer(const std::string& key, ScratchKey& scratch);
    const ConfigurationSourceMap* findTarget(const std::string& key,
                                             const std::string* sourceName) const;
    Future<ConfigurationValue> write(const ConfigurationSourceMap& target, const std::string& key,
                                     ConfigurationValue&& value);
    ConfigurationValue readValue(const Layer& layer, const std::string& key);
    Option readOption(const Layer& layer, const std::string& key);
    bool changesAreNoticed() const noexcept;
    void onSourceChanged(const std::string& group, const std::string& key);
    const ConfigurationSourceMap* findSource(const std::string& name) const;
    void insertSource(ConfigurationSourceMap entry);
    void eraseSource(const std::string& name);
    void replaceSources(SourceList changed);
    void updateRunsForeignCode();
    void retire(std::shared_ptr<const void> object);
    void giveBackLevel(Retired& released) noexcept;

    std::atomic<std::uint64_t> nextStreamId{0};
    // In order of precedence. Never changed in place: a walk goes on over the list it began with
    // when a source that it calls adds or removes sources.
    std::shared_ptr<const SourceList> sources;
    // Sources that are not this library's own.
    bool hasForeignSources = false;
    std::unique_ptr<WatchList> publishers;
    // There are watchers or foreign sources. Only then can an operation lose the store to a
    // callback, and does a change of a source concern anybody. Read without the mutex by sources'
    // listeners.
    std::atomic<bool> runsForeignCode{false};
    // Levels of the mutex that are held by operations, and what these have let go of. The thread
    // that gives the last level back destroys that itself, without the mutex: a source may wait in
    // its destructor for any other thread that uses the store.
    std::size_t heldLevels = 0;
    Retired retired;
    // Lists that a walk may still go on over.
    std::vector<std::shared_ptr<const SourceList>> pastSources;
    // Buffers for keys with a group removed or added. Lent out, so that a source that calls back
    // into the store gets another one.
    std::vector<std::string> scratchKeys;
};

}  // namespace velkor::configuration
