#pragma once

#include <cstring>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "configuration/Option.hpp"
#include "configuration/detail/KeyBuffer.hpp"
#include "configuration/sources/ConfigurationSourceMap.hpp"
#include "configuration/sources/ForgettingSource.hpp"
#include "configuration/sources/SourceDescription.hpp"
#include "configuration/sources/ValueTable.hpp"

namespace velkor::configuration::detail {

/// `group` with the separator at its end that makes it a prefix of keys; an empty one stays so.
std::string normalisedGroup(std::string group);

/// A registered source with what the store knows of it.
struct RegisteredSource : ConfigurationSourceMap {
    explicit RegisteredSource(ConfigurationSourceMap entry);

    /// Whether the keys of the source may be asked for `key`.
    bool appliesTo(const std::string& key) const {
        return group.empty() || (key.size() >= group.size() &&
                                 std::memcmp(key.data(), group.data(), group.size()) == 0);
    }

    const ValueTable* table;       ///< What it answers from; null: the source itself is asked.
    ForgettingSource* forgetting;  ///< The source, if keys can be taken out of it; else null.
    bool reportsChanges = false;   ///< The store's listener is installed.
};

/// The layer that decides a key, the key as its source knows it, and the value if it stands in the
/// source's table.
struct Layer {
    const RegisteredSource* entry = nullptr;
    const std::string* relativeKey = nullptr;
    const ConfigurationValue* held = nullptr;

    ConfigurationValue value() const { return held ? *held : entry->source->get(*relativeKey); }
    explicit operator bool() const { return entry != nullptr; }
};

/// The sources of a store in order of precedence. Not thread-safe: used with the store's mutex
/// held. A source that is called during a walk may change the registry: the walk goes on over the
/// list that it began with, which whoever changes the registry keeps alive (see `list`).
class SourceRegistry {
public:
    using SourceList = std::vector<std::shared_ptr<RegisteredSource>>;

    /// A registry without sources.
    SourceRegistry();

    /// The sources as they are now. Never changed in place: to be kept until every walk is over by
    /// who calls `insert` or `erase`.
    const std::shared_ptr<const SourceList>& list() const noexcept { return current; }

    /// Whether there are sources that don't answer from a table.
    bool hasForeignSources() const noexcept { return foreign; }

    /// The source called `name`, or null.
    const RegisteredSource* find(const std::string& name) const;

    /// Adds `entry` in front of the sources of the same or a greater order.
    std::shared_ptr<RegisteredSource> insert(ConfigurationSourceMap entry);

    /// Removes the source called `name`, if there is one.
    void erase(const std::string& name);

    /// The first writable source whose group begins `key`, of those called `sourceName` if that is
    /// not null; or null.
    const RegisteredSource* firstWritable(const std::string& key,
                                          const std::string* sourceName) const;

    /// The layer that decides `key`, if any. Lives as long as `buffer` and the list.
    Layer firstHolder(const std::string& key, KeyBuffer& buffer) const;

    /// Calls `visit` with each layer that holds `key`, in order of precedence, until it gives true.
    template <class Visit>
    void visitHolders(const std::string& key, KeyBuffer& buffer, Visit&& visit) const {
        const SourceList& layers = *current;
        for (const auto& entry : layers) {
            if (!entry->appliesTo(key)) continue;
            const std::string& relativeKey = buffer.within(entry->group, key);
            const ConfigurationValue* held =
                entry->table ? entry->table->find(relativeKey) : nullptr;
            if (held == nullptr && (entry->table || !entry->source->has(relativeKey))) continue;
            if (visit(Layer{entry.get(), &relativeKey, held})) return;
        }
    }

    /// Strings for keys with a group removed or added.
    KeyBufferPool& keyBuffers() noexcept { return buffers; }

    /// Every layer that holds `key`, in order of precedence.
    std::vector<Option> holders(const std::string& key);

    /// How the sources are registered, in order of precedence.
    std::vector<SourceDescription> describe() const;

    /// All keys of all sources, with their groups.
    std::set<std::string> keys() const;

private:
    void replace(SourceList changed);

    std::shared_ptr<const SourceList> current;
    bool foreign = false;
    KeyBufferPool buffers;
};

}  // namespace velkor::configuration::detail
