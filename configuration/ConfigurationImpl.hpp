#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "configuration/Changes.hpp"
#include "configuration/Configuration.hpp"
#include "configuration/detail/SourceRegistry.hpp"
#include "configuration/detail/StoreLock.hpp"
#include "configuration/sources/AttachedSource.hpp"
#include "configuration/sources/ConfigurationSource.hpp"
#include "configuration/sources/ConfigurationSourceMap.hpp"
#include "configuration/sources/SourceDescription.hpp"
#include "framework/common/Export.hpp"
#include "framework/common/Mutex.hpp"

namespace velkor::configuration {

namespace detail {
class AwaitedReport;
class ChangeList;
class WatchList;
}  // namespace detail

/// The store. A fresh one holds two writable sources without a group: "override" (order 0), which
/// takes ordinary writes, and "default" (order 2147483647), the layer of last resort.
///
/// Thread-safe: one recursive mutex guards all state, and sources are called under it; what each
/// operation holds, runs and waits for stands in docs/concurrency.md. What the store lets go of
/// (sources, publishers) is destroyed after the mutex has been released.
///
/// Owned by a shared pointer; without one, `watchOption` and `getPtr` throw `std::bad_weak_ptr`.
class VELKOR_EXPORT ConfigurationImpl : public Configuration,
                                        public std::enable_shared_from_this<Configuration> {
public:
    using ConfigurationSourceMap = configuration::ConfigurationSourceMap;

    ConfigurationImpl();
    ConfigurationImpl(const ConfigurationImpl&) = delete;
    ConfigurationImpl& operator=(const ConfigurationImpl&) = delete;

    /// Detaches from every source, then ends every watch and releases the sources. A failure there
    /// ends the process.
    ~ConfigurationImpl() override;

    Future<ConfigurationValue> get(const std::string& key) override;
    Future<Option> getOption(const std::string& key) override;
    using Configuration::set;
    Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value) override;
    Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value,
                                   const std::string& sourceName) override;
    Future<bool> has(const std::string& key) override;
    Future<std::set<std::string>> keys() override;
    std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> watchOption(
        const std::string& key) override;
    using Configuration::addPropertyFileSource;
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
    /// null." before anything else happens. What the source throws, and lack of memory, leaves the
    /// call; the source may be registered by then, with or without a listener.
    ///
    /// An `AttachedSource` is attached before it is registered; what it throws then leaves the
    /// call, and nothing has changed.
    ///
    /// The listener is installed last. As long as there is none, watchers are told of what is
    /// written to the source through the store by the store itself.
    ///
    /// Lifetime: the source gets a change listener that points to this store without owning it. The
    /// store takes it back when it is destroyed, not when the source is removed, so a source that
    /// others still write after its removal must not outlive the store, unless it is an
    /// `AttachedSource`: that is told of its removal and of the end of the store. A source that is
    /// registered while the store is destroyed gets no listener.
    Future<bool> addSource(const std::string& name, const std::string& group, int order,
                           bool readOnly, std::shared_ptr<ConfigurationSource> source);

    /// All sources in order of precedence, with the states of those that tell theirs. What a
    /// source's `state` throws passes on; it runs with no mutex held.
    Future<std::vector<SourceDescription>> describeSources();

    /// The source that is registered under `name`; null when there is none. Its groups and order
    /// are the store's: its keys are without the group.
    Future<std::shared_ptr<ConfigurationSource>> findSource(const std::string& name);

    /// The first keys, at most `most` and that is one at least, of all sources that are not less
    /// than `first` byte by byte, sorted; with their groups. Empty only where there are no more of
    /// them. For who goes through a large store: takes time in proportion to all keys, and memory
    /// to those that it gives.
    Future<std::vector<std::string>> keysFrom(const std::string& first, std::size_t most);

    /// Every source that holds `key` with the value it gives, in order of precedence: the first is
    /// the effective one. Empty when there is none.
    Future<std::vector<Option>> explain(const std::string& key);

    /// The effective values of several keys at one moment, with the version of the store then.
    Future<Reading> read(const std::vector<std::string>& keys);

    /// Takes `key` out of the source that `set` would write it to; gives whether it was there.
    /// Watchers are told what is effective then, if anything is, as by `set`. Fails with
    /// `std::runtime_error` as `set` does, or with "Configuration source can't forget keys: ", the
    /// key, ", " and the name of the source when it is no `ForgettingSource`.
    Future<bool> unset(const std::string& key);
    Future<bool> unset(const std::string& key, const std::string& sourceName);

    /// Makes all `changes` or none, in their order: first the source of each is found, then all are
    /// written, then all watchers are told, who find every key changed. With `dryRun` nothing is
    /// written. Gives what was changed, or would be, and where.
    ///
    /// Fails with `std::runtime_error` "Changes refused: " and the texts of all refusals, as `set`
    /// and `unset` give them, separated by "; "; nothing has changed then. When a source throws,
    /// what was written is taken back, as far as the sources let it, nobody is told, and the
    /// exception leaves the call.
    Future<std::vector<AppliedChange>> apply(const std::vector<Change>& changes,
                                             bool dryRun = false);

    /// A stream for one subscriber of what changes among the keys that `prefix` begins: for each
    /// change the key and what is effective for it now, or that nothing is. Begins with the next
    /// change. Keys that go with their source are told as well, with its group.
    ///
    /// Holds one undelivered change for each key, the newest: a slow subscriber misses those in
    /// between and ends on the truth for every key. Changes of one key arrive in the order of their
    /// versions, one at a time, on the thread that changes the store or asks for more. They were
    /// read with the store locked. What `watchOption` says of that thread, of errors ("Error in
    /// configuration change subscriber: " and the prefix) and of the end of the stream holds here
    /// too. When a change can't be read or kept, the stream fails with the reason.
    std::shared_ptr<reactive_streams::PublisherAPI<OptionChange>> watchChanges(
        const std::string& prefix);

protected:
    // The first four take the caller's lock on the store's mutex, which is held: the caller's only
    // level, or one within an operation of the store. `removeStream` takes the mutex itself.

    /// Whether any source has `key`.
    bool doHas(std::unique_lock<std::recursive_mutex>& lock, const std::string& key);

    /// The effective value; `std::runtime_error` "No option value for key: " and the key.
    ConfigurationValue doGet(std::unique_lock<std::recursive_mutex>& lock, const std::string& key);

    /// The value with its source; `std::runtime_error` "No option for key: " and the key.
    Option doGetOption(std::unique_lock<std::recursive_mutex>& lock, const std::string& key);

    /// Publishes the effective value of `key`, if there is one, to the watchers of exactly that
    /// key, with one level of the mutex released. On return the lock is held again. Throws
    /// `std::system_error` when `lock` can't be released or taken again.
    void updatePublishers(std::unique_lock<std::recursive_mutex>& lock, const std::string& key);

    /// Forgets one watch; does nothing when there is none with that number.
    void removeStream(std::uint64_t streamId);

    /// Guards all state but the atomic members, which are read without it.
    std::recursive_mutex mutex;

private:
    class Operation;
    class Host;

    Future<ConfigurationValue> write(const detail::RegisteredSource& target, const std::string& key,
                                     ConfigurationValue&& value) VELKOR_REQUIRES(storeLock);
    Future<bool> forget(const Change& change, const detail::RegisteredSource* target)
        VELKOR_REQUIRES(storeLock);
    std::shared_ptr<detail::RegisteredSource> insert(ConfigurationSourceMap entry)
        VELKOR_REQUIRES(storeLock);
    void changeTogether(const std::function<void()>& change);
    void reportChange(const std::string& group, const std::string& key);
    void onSourceChanged(const std::string& group, const std::string& key);
    void tellStreams(detail::StoreLock::Level& level, const std::string& group,
                     const std::set<std::string>& keys) VELKOR_REQUIRES(storeLock);
    void tellAll(detail::StoreLock::Level& level, const std::vector<std::string>& keys)
        VELKOR_REQUIRES(storeLock);
    std::function<void()> forgetting(std::uint64_t streamId);
    std::uint64_t currentVersion() const noexcept {
        return version.load(std::memory_order_acquire);
    }
    bool foreignCodeMayRun() const noexcept;
    void updateHasForeignCode() VELKOR_REQUIRES(storeLock);

    detail::StoreLock storeLock{mutex};
    std::atomic<std::uint64_t> nextStreamId{0};
    detail::SourceRegistry sources VELKOR_GUARDED_BY(storeLock);
    std::unique_ptr<detail::WatchList> publishers VELKOR_GUARDED_BY(storeLock);
    std::unique_ptr<detail::ChangeList> changeStreams VELKOR_GUARDED_BY(storeLock);
    // What sources are attached to; made with the first of them.
    std::unique_ptr<SourceHost> host VELKOR_GUARDED_BY(storeLock);
    // Where changes are collected instead of being told while several are made together.
    std::vector<std::string>* deferred VELKOR_GUARDED_BY(storeLock) = nullptr;
    // What writes to sources without a listener wait for.
    detail::AwaitedReport* awaited VELKOR_GUARDED_BY(storeLock) = nullptr;
    // Grows with every change. Counted by sources that change by themselves without the mutex.
    std::atomic<std::uint64_t> version{0};
    // There are watchers or sources of other libraries. Read without the mutex by the listeners.
    std::atomic<bool> hasForeignCode{false};
    // The destructor has begun: no source is given a listener any more.
    bool closing VELKOR_GUARDED_BY(storeLock) = false;
};

}  // namespace velkor::configuration
