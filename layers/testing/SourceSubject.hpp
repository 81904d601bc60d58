#pragma once

#include <chrono>
#include <memory>
#include <optional>
#include <string>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/sources/ConfigurationSource.hpp"

namespace velkor::layers::testing {

/// What `SourceContract` has to know of a source. The author of the source derives from it.
///
/// An object stands for one source: `make` is called once. The contract makes many of them, with
/// the default constructor, and keeps each for as long as its source. A file or whatever else the
/// source needs is a member.
class SourceSubject {
public:
    virtual ~SourceSubject() = default;

    /// A new source that holds exactly `values`, which `canHold` has accepted. Keys consist of
    /// lower-case letters, digits and dots.
    virtual std::shared_ptr<configuration::ConfigurationSource> make(
        const configuration::ValueMap& values) = 0;

    /// Whether values can be written. The `set` of a source that can't throws.
    virtual bool isWritable() const { return true; }

    /// Whether the source keeps `value` exactly. One that holds texts only says so here.
    virtual bool canHold(const configuration::ConfigurationValue& /*value*/) const { return true; }

    /// How long to wait for what a right source does soon. Only a wrong one takes that long.
    virtual std::chrono::milliseconds patience() const { return std::chrono::seconds(20); }
};

/// The same for a source that changes by itself.
class ChangingSubject : public SourceSubject {
public:
    /// Brings about that the source finds `value` for `key`, or that `key` has gone. Need not wait
    /// for it. Called on any thread, one at a time, when the source has been registered.
    virtual void change(const std::string& key,
                        const std::optional<configuration::ConfigurationValue>& value) = 0;

    /// Whether a key can go by `change`.
    virtual bool losesKeys() const { return true; }
};

}  // namespace velkor::layers::testing
