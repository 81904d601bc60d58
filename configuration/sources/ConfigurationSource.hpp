#pragma once

#include <functional>
#include <set>
#include <string>

#include "configuration/ConfigurationValue.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// Told by a source that the value of a source-relative key has changed.
using ChangeListener = std::function<void(const std::string&)>;

/// One layer of configuration: a flat table of values.
///
/// Keys are relative to the group under which the store registered the source. The store calls a
/// source only while it holds its own mutex, so a source that is written through the store alone
/// needs no lock. A source may call back into the store. `TableSource` is a base for sources that
/// keep their values in a table.
///
/// A source that changes by itself, on a thread of its own (`layers/LiveSource.hpp` is a base that
/// keeps these rules),
/// - guards its values by a mutex of its own, since its thread changes them without the store's;
/// - doesn't hold that mutex while it calls the listener: the listener takes the store's mutex, and
///   the store calls the source with that mutex held;
/// - makes the new value readable before it calls the listener, once for each changed key, and
///   calls it for a key that has gone as well;
/// - calls the listener only while the store is alive: it holds a shared pointer to the store for
///   the time of the call, or is stopped before the last one goes. The store's destructor takes the
///   listener back with an empty one, and a copy that is called later calls into nothing;
/// - is stopped before it is removed if it is to outlive the store: a removed source keeps its
///   listener.
class VELKOR_EXPORT ConfigurationSource {
public:
    virtual ~ConfigurationSource() = 0;

    /// The value of `key`. Answers whenever `has(key)` does; otherwise it may throw anything.
    virtual ConfigurationValue get(const std::string& key) = 0;

    /// Stores `value`, calls the change listener, and returns the value that was replaced, or
    /// `value` itself when the key is new. A source that can't be written throws.
    virtual ConfigurationValue set(const std::string& key, ConfigurationValue value) = 0;

    /// Whether there is a value for `key`.
    virtual bool has(const std::string& key) = 0;

    /// Replaces the listener; an empty one detaches. That of a registered source belongs to the
    /// store.
    virtual void setChangeListener(ChangeListener listener) = 0;

    /// All keys.
    virtual std::set<std::string> keys() = 0;
};

}  // namespace velkor::configuration
