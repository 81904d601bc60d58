#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace velkor::testing {

/// A source of a store, as it is registered: keys are without the group.
struct ModelLayer {
    std::string name{};
    std::string group{};  ///< Empty, or ending in ".".
    int order = 0;
    bool readOnly = false;
    std::map<std::string, int> values{};
};

/// What a store is asked, by name, with all that the call takes.
struct StoreCall {
    enum class Kind {
        get,
        has,
        getOption,
        keys,
        keysFrom,
        explain,
        read,
        describe,
        dryRun,
        set,
        unset,
        apply,
        add,
        remove,
    };

    /// One of the changes of `apply`; no value unsets, no source is any that can be written.
    struct Change {
        std::string key;
        std::optional<int> value{};
        std::optional<std::string> source{};
    };

    Kind kind;
    std::string key{};                    ///< Also the first key of `keysFrom`.
    int value = 0;                        ///< Of `set`.
    std::optional<std::string> source{};  ///< Where `set` and `unset` go; the name for `remove`.
    std::vector<std::string> keys{};      ///< Of `read`.
    std::vector<Change> changes{};        ///< Of `apply` and `dryRun`.
    ModelLayer layer{};                   ///< Of `add`.
};

/// A store as one would write it on a page, for one thread: a list of tables that are searched from
/// the front. Its values are numbers. Answers are spelled as `StoreSubject` spells those of the
/// store.
class StoreModel {
public:
    using Call = StoreCall;

    /// A fresh store. Each key has `watchers` watchers, who are told of every `set` and `unset`.
    explicit StoreModel(std::size_t watchersOfAKey = 0);

    static bool isRead(const Call& call);
    std::string read(const Call& call) const;
    std::string write(const Call& call);
    std::string state() const;
    static std::string textOf(const Call& call);

private:
    using Change = StoreCall::Change;

    struct Found {
        std::string source;
        int value;
    };

    std::vector<Found> holders(const std::string& key) const;
    std::string option(const std::string& key) const;
    std::vector<std::string> allKeys() const;
    const ModelLayer* target(const std::string& key, const std::optional<std::string>& name) const;
    ModelLayer* target(const std::string& key, const std::optional<std::string>& name);
    static std::string refusal(const Change& change);
    std::string outcome(const std::vector<Change>& changes) const;
    std::string set(const Change& change);
    std::string unset(const Change& change);
    std::string apply(const std::vector<Change>& changes);
    std::string add(const ModelLayer& layer);
    std::string remove(const std::string& name);
    std::string told(const std::string& key) const;

    std::vector<ModelLayer> layers;  // in order of precedence
    std::size_t watchers;
};

}  // namespace velkor::testing
