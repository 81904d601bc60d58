#pragma once

#include <filesystem>
#include <memory>
#include <set>
#include <string>
#include <type_traits>
#include <utility>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/Option.hpp"
#include "framework/Future.hpp"
#include "framework/common/Export.hpp"
#include "framework/reactive_streams/Publisher.hpp"

namespace velkor::configuration {

/// A layered store of settings.
///
/// Settings come from named sources, each with a group (a key prefix that ends in "."), an order
/// (smaller wins; among equal orders the source added last) and a read-only flag. The first source
/// in that order that has a key decides its value.
///
/// Thread-safe. All futures are resolved when they are returned. Expected failures (a missing key,
/// no writable source, a name already taken) are in the future; what a source throws, and a file
/// that can't be opened, leaves the call as an exception.
class VELKOR_EXPORT Configuration {
    template <class Text>
    using EnableForText = std::enable_if_t<std::is_same_v<std::decay_t<Text>, const char*> ||
                                           std::is_same_v<std::decay_t<Text>, char*>>;

    template <class Path>
    using EnableForPath = std::enable_if_t<std::is_convertible_v<Path&&, std::filesystem::path> &&
                                           !std::is_convertible_v<Path&&, std::u16string>>;

public:
    virtual ~Configuration();

    /// The effective value of `key`. Fails with `std::runtime_error` "No option with the specified
    /// key was found: " followed by the key.
    virtual Future<ConfigurationValue> get(const std::string& key) = 0;

    /// The effective value of `key` and the source that supplies it; fails as `get`.
    virtual Future<Option> getOption(const std::string& key) = 0;

    /// Writes into the first source that is writable and whose group begins `key`, whether or not
    /// it holds the key. Gives the value that was replaced there, or `value` when the key was new.
    /// Fails with `std::runtime_error` "No writable configuration source for key: " and the key.
    ///
    /// Watchers of the key are told before this returns, on this thread, with the store locked
    /// against other threads: see `watchOption`.
    virtual Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value) = 0;

    /// Writes into the source called `sourceName`; otherwise as above. Fails with
    /// `std::runtime_error` "Source not found or not writable: ", the key, ", " and the name when
    /// there is no such source, it is read-only, or its group doesn't begin the key.
    virtual Future<ConfigurationValue> set(const std::string& key, ConfigurationValue value,
                                           const std::string& sourceName) = 0;

    /// As above, with the characters up to the NUL that ends `text` as narrow text. Chosen for
    /// character literals and pointers to characters, which would become a bool otherwise. A null
    /// pointer throws `std::invalid_argument` "A text must not be null.". A class that overrides
    /// `set` says `using Configuration::set`, or hides this.
    template <class Text, class = EnableForText<Text>>
    Future<ConfigurationValue> set(const std::string& key, Text&& text) {
        return set(key, ConfigurationValue(narrowText(text)));
    }

    template <class Text, class = EnableForText<Text>>
    Future<ConfigurationValue> set(const std::string& key, Text&& text,
                                   const std::string& sourceName) {
        return set(key, ConfigurationValue(narrowText(text)), sourceName);
    }

    /// Whether any source has `key`.
    virtual Future<bool> has(const std::string& key) = 0;

    /// All keys of all sources, with their groups, sorted byte by byte.
    virtual Future<std::set<std::string>> keys() = 0;

    /// A stream for one subscriber that delivers the effective value of `key`, if there is one, and
    /// then the effective value after every change, equal or not. It holds the newest undelivered
    /// value until the subscriber asks for it. A key that disappears is not signalled.
    ///
    /// The watch lives until its subscription is cancelled or the store is destroyed, which
    /// completes the stream; dropping the publisher alone ends nothing.
    ///
    /// Values are delivered on the thread that makes the change. During a `set` that thread holds
    /// the store: a subscriber may call the store, but must not wait for another thread that does.
    /// Deliveries made by two threads may overlap, and a write from inside `onNext` is delivered
    /// nested. The older value may then come last, also when a single writer changes the key while
    /// this watch is being subscribed to or asked for more: a subscriber that needs the newest
    /// value in all cases asks the store with `get`.
    /// What a subscriber throws is reported on standard error as "Error in configuration value
    /// subscriber: " followed by the key; the others are served.
    /// Throws `std::bad_weak_ptr` when no shared pointer owns the store.
    virtual std::shared_ptr<reactive_streams::PublisherAPI<ConfigurationValue>> watchOption(
        const std::string& key) = 0;

    /// Adds the property file at `path` as a source; gives true. A file that can't be opened throws
    /// `std::runtime_error` "Property file could not be opened: " followed by the path; then a name
    /// already taken fails as in `addInMemorySource`. `readOnly` keeps the source out of writes,
    /// which it refuses in any case.
    virtual Future<bool> addPropertyFileSource(const std::string& name, const std::string& group,
                                               int order, bool readOnly,
                                               const std::u16string& path) = 0;

    /// As above, for a `std::filesystem::path` and what converts to one. The path is UTF-8.
    template <class Path, class = EnableForPath<Path>>
    Future<bool> addPropertyFileSource(const std::string& name, const std::string& group, int order,
                                       bool readOnly, Path&& path) {
        return addPropertyFileSource(name, group, order, readOnly,
                                     wideText(std::forward<Path>(path)));
    }

    /// Adds a source that holds `values`; gives true. Fails with `std::invalid_argument` "Source
    /// with the requested name already exists: " followed by the name.
    virtual Future<bool> addInMemorySource(const std::string& name, const std::string& group,
                                           int order, bool readOnly, ValueMap&& values) = 0;

    /// There is no source of environment variables: adds nothing and gives false.
    virtual Future<bool> addEnvironmentSource(const std::string& name, const std::string& group,
                                              int order) = 0;

    /// Removes the source called `name`; gives whether there was one. Watchers of the keys as the
    /// source itself names them, without its group, are told the value that is effective now.
    virtual Future<bool> removeSource(const std::string& name) = 0;

    /// A shared pointer to this store; `std::bad_weak_ptr` when no shared pointer owns it.
    virtual std::shared_ptr<Configuration> getPtr() = 0;

private:
    static std::string narrowText(const char* text);
    static std::u16string wideText(const std::filesystem::path& path);
};

}  // namespace velkor::configuration
