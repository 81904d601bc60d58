#pragma once

#include <cstring>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "configuration/Option.hpp"
#include "configuration/detail/KeyBuffer.hpp"
#include "configuration/sources/AttachedSource.hpp"
#include "configuration/sources/ConfigurationSourceMap.hpp"
#include "configuration/sources/ForgettingSource.hpp"
#include "configuration/sources/GroupingSource.hpp"
#include "configuration/sources/MonitoredSource.hpp"
#include "configuration/sources/SourceDescription.hpp"
#include "configuration/sources/TextTable.hpp"
#include "configuration/sources/ValueTable.hpp"

namespace velkor::configuration::detail {

/// `group` with the separator at its end that makes it a prefix of keys; an empty one stays so.
std::string normalisedGroup(std::string group);

/// A registered source with what the store knows of it.
struct RegisteredSource : ConfigurationSourceMap {
    explicit RegisteredSource(ConfigurationSourceMap entry);

    /// Whether it answers from a table, which is looked up without it.
    bool hasTable() const { return table != nullptr || texts != nullptr; }

    /// Whether the keys of the source may be asked for `key`.
    bool appliesTo(const std::string& key) const {
        return group.empty() || (key.size() >= group.size() &&
                                 std::memcmp(key.data(), group.data(), group.size()) == 0);
    }

    const ValueTable* table;           ///< What it answers from; null: not from such a table.
    const TextTable* texts;            ///< The same for texts. Neither: the source itself is asked.
    ForgettingSource* forgetting;      ///< The source, if keys can be taken out of it; else null.
    const MonitoredSource* monitored;  ///< The source, if it says how it stands; else null.
    GroupingSource* grouping;     ///< The source, if it makes several writes as one; else null.
    AttachedSource* attached;     ///< The source, if it is told of its registration; else null.
    bool foreign;                 ///< It is not of one of this library's own classes.
    bool reportsChanges = false;  ///< The store's listener is installed.
};

/// The layer that decides a key, the key as its source knows it, and the value if it stands in a
/// table of the source.
struct Layer {
    const std::shared_ptr<RegisteredSource>* position = nullptr;  ///< In the list; null: none.
    const std::string* relativeKey = nullptr;
    const ConfigurationValue* held = nullptr;
    const TextTable::Property* text = nullptr;

    const RegisteredSource& entry() const { return **position; }
    ConfigurationValue value() const {
        if (held != nullptr) return *held;
        if (text != nullptr) return std::string(entry().texts->valueOf(*text));
        return entry().source->get(*relativeKey);
    }
    explicit operator bool() const { return position != nullptr; }
};

/// The sources of a store in order of precedence. Not thread-safe: used with the store's mutex
/// held. A source that is called during a walk may change the registry: the walk goes on over the
/// list that it began with, which whoever changes the registry keeps alive (see `list`).
class SourceRegistry {
public:
    using SourcePtr = std::shared_ptr<RegisteredSource>;
    using SourceList = std::vector<SourcePtr>;

    /// A registry without sources.
    SourceRegistry();

    /// The sources as they are now. Never changed in place: to be kept until every walk is over by
    /// who calls `insert` or `erase`.
    const std::shared_ptr<const SourceList>& list() const noexcept { return current; }

    /// Whether there are sources that run code of others: not one of this library's own classes.
    bool hasForeignSources() const noexcept { return foreign; }

    /// Whether there are sources that see it when they are asked: that answer from no table.
    bool hasAskedSources() const noexcept { return asked; }

    /// The source called `name`, or null.
    const RegisteredSource* find(const std::string& name) const;

    /// Adds `entry` in front of the sources of the same or a greater order.
    std::shared_ptr<RegisteredSource> insert(ConfigurationSourceMap entry);

    /// Removes `entry`, if it is still there.
    void erase(const RegisteredSource& entry);

    /// The first writable source whose group begins `key`, of those called `sourceName` if that is
    /// not null; or null.
    const RegisteredSource* firstWritable(const std::string& key,
                                          const std::string* sourceName) const;

    /// The layer that decides `key`, if any. Lives as long as `buffer` and the list.
    Layer firstHolder(const std::string& key, KeyBuffer& buffer) const;

    /// Strings for keys with a group removed or added.
    KeyBufferPool& keyBuffers() noexcept { return buffers; }

    /// Every layer that holds `key`, in order of precedence.
    std::vector<Option> holders(const std::string& key);

    /// How `sources` are registered and stand, in order of precedence. Asks them: to be called
    /// without the store's mutex.
    static std::vector<SourceDescription> describe(const SourceList& sources);

    /// All keys of all sources, with their groups.
    std::set<std::string> keys() const;

    /// The `most` smallest keys of all sources that are not less than `first`, with their groups;
    /// fewer where several sources hold the same one, and none only where there are none.
    std::vector<std::string> keysFrom(const std::string& first, std::size_t most) const;

private:
    static Layer nextHolder(const SourcePtr* from, const SourcePtr* end, const std::string& key,
                            KeyBuffer& buffer);
    void replace(SourceList changed);

    std::shared_ptr<const SourceList> current;
    bool foreign = false;
    bool asked = false;
    KeyBufferPool buffers;
};

}  // namespace velkor::configuration::detail
